#!/usr/bin/env bash
# The reference host from outside: what it prints, what it writes, how it ends.
# Usage: host_test.sh FOLDER CC, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
host=(${EMULATOR:+"$EMULATOR"} "$1/dravik-host") cc=$2
root=$(cd "$(dirname "$0")/.." && pwd)
include=$root/include
scratch=$(mktemp -d)
config=$scratch/config   # names without a space, as rows are split into words
scenarios=$scratch/scenarios
ln -s "$root/config" "$config"
ln -s "$root/examples/scenarios" "$scenarios"
trap 'rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
source "$(dirname "$0")/support/expect.sh"

# A failure has one line on stderr, anything else none; and the pattern is found in the output.
check() { # NAME STATUS PATTERN ARGUMENTS...
    local name=$1 status=$2 pattern=$3 found=0
    shift 3
    "${host[@]}" "$@" > "$scratch/out" 2> "$scratch/err" || found=$?
    expect "$name: exit status" "$status" "$found"
    expect "$name: lines on stderr" $((status > 0)) "$(wc -l < "$scratch/err")"
    cat "$scratch/out" "$scratch/err" > "$scratch/both"
    expect "$name: output with $pattern" 0 "$(grep -qE -- "$pattern" "$scratch/both"; echo $?)"
}

table() { # rows of NAME|STATUS|PATTERN|ARGUMENTS on stdin
    local name status pattern arguments
    while IFS='|' read -r name status pattern arguments; do
        # shellcheck disable=SC2086  # split on purpose
        check "$name" "$status" "$pattern" $arguments
    done
}

echo '{"snapTimeThreshold": 10}' > "$scratch/blunt.json"
bad="simulate --outlier-rate 1% --outlier-size 5us"
table << END
lock kept           |0|^lock        after 3\.000 s, lost 0 times, missed 0 times; 297 of 297 pairs locked since$|simulate
behind and slow     |0|^error       RMS [1-4][0-9](\.[0-9]+)? ns|simulate --initial-offset -3ms --frequency-error -12ppm
outlier loses lock  |0|^ +162\.000 s  lock lost, error -5\.[0-9]+ us$|$bad
version             |0|^dravik-host [0-9]+\.[0-9]+\.[0-9]+$|--version
help                |0|^refused document; 2 wrong usage; 3 a limit of metrics is not held\.$|simulate --help
tuned before pair 1 |0|^ +2\.000 s  no step needed, error \+1\.012 ms|simulate --config $scratch/blunt.json
a new servo         |0|"snapTimeThreshold":.1e-06,$|show
tuned               |0|"snapTimeThreshold":.10,$|show --config $scratch/blunt.json
document taken      |0|"snapTimeThreshold":.10,$|check $scratch/blunt.json
default, bridges    |0|"spikeFilterEnabled":.1,$|check $config/dravik_tr_ptp4l_tab.json
default, boundary   |0|"spikeFilterEnabled":.1,$|check $config/dravik_tr_ptp4l_bc.json
END
expect "of an unknown type" "dravik-host: type 'none': loads no default document; the types 'IEEE 802.1AS-2011 TAB' \
and 'IEEE 1588-2008 BC' do" "$("${host[@]}" show --reference-type none 2>&1 > /dev/null)"
echo '{"snapTimeThreshold": 6e-5}' > "$scratch/calm.json"
echo '{"phaseLockGain": 2}' > "$scratch/wild.json"
noisy="simulate --noise 10us --measure-over 10s --config $scratch/calm.json"
table << END
measured over 10 s  |0|^ +10\.000 s  frequency measured: \+11\.9.. ppm|$noisy
held back           |0|^pairs       300 in 299\.000 s; 9 held back$|$noisy
measured once more  |0|^ +2[0-9]\.000 s  frequency measured|simulate --noise 10us --measure-over 10s
tuned later         |0|^ +22\.000 s  tuned by $scratch/calm.json$|$noisy --then 10s=$scratch/calm.json
and still later     |0|^ +72\.000 s  tuned by $scratch/wild.json$|$noisy --then 10s=$scratch/calm.json --then 1min=$scratch/wild.json
first tuning is back|0|s  tuned as at the start$|$noisy --then 10s=$scratch/wild.json
then what           |2|--then: '10s' is not AFTER=FILE|simulate --then 10s
then in order       |2|'5s=b' does not come after|simulate --then 10s=a --then 5s=b
then not there      |1|^dravik-host: cannot read $scratch/none|simulate --then 10s=$scratch/none
then refused        |1|err: refused with -52005: it is not JSON|simulate --then 10s=$scratch/err
END
for file in "$scenarios"/*.scenario; do
    check "$file" 0 "^simulate: .* off, scenario $file, seed 1" simulate --scenario "$file" --duration 20s
done
check "never locked" 0 "^lock        never; missed 0 times$" simulate --frequency-error 600ppm
expect "no RMS without a lock" 0 "$(grep -c RMS "$scratch/out")"

echo "clok" > "$scratch/typo"
table << END
scenario beside it  |2|--noise: not with --scenario|simulate --scenario $scratch/typo --noise 1ns
scenario misspelt   |1|typo:1: unknown statement 'clok'; did|simulate --scenario $scratch/typo
unknown option      |2|^dravik-host: .*--speed|simulate --speed 1
stray argument      |2|^dravik-host: unknown argument x$|show x
no unit             |2|--interval: '12' has no unit; use ns, us, ms, s, min or h|simulate --interval 12
rate above 100 %    |2|--outlier-rate: '101%' is not within|simulate --outlier-rate 101%
negative seed       |2|--seed: '-1'|simulate --seed -1
too fine            |2|--resolution: '0.01ppb' is not within 0.015625ppb to 1ppb|simulate --resolution 0.01ppb
no such resolution  |2|--resolution: 'best' does not start with a number|replay x --resolution best
limits too wide     |0|^ +0.000 s  resolution 0.125 ppb: limits and thresholds allow no finer one|simulate --max-frequency-offset 100000ppm
too many hops       |2|--hops: '51' is not 1 to 50|simulate --hops 51
one text for two    |2|--hops: the standard input is enough|simulate --hops 2 --config -
no such library     |1|^dravik-host: cannot load the plug-in: $scratch/none|simulate --library $scratch/none
another library     |1|libm.* has no zvckmservo_initialize|run --library libm.so.6
no such file        |1|^dravik-host: cannot read $scratch/none: No such|run --config $scratch/none
another for check   |1|^dravik-host: cannot load the plug-in: $scratch/none|check $config/dravik_tr_ptp4l_bc.json --library $scratch/none
not a file          |1|^dravik-host: cannot read /: Is a directory|check /
bad metadata        |1|^dravik-host: $scratch/err: applyMetaData failed with -52005: \{|simulate --metadata $scratch/err
one input twice     |2|standard input is taken by --metadata|show --metadata - --config -
full disk           |1|^dravik-host: cannot write /dev/full: No space|simulate --csv /dev/full --duration 2s
no such folder      |1|^dravik-host: cannot write $scratch/no/file|simulate --csv $scratch/no/file
END
expect "report to a full disk" 1 "$("${host[@]}" simulate > /dev/full 2> /dev/null; echo $?)"
export DRAVIK_LIBRARY=$scratch/named
check "library of the environment" 1 "$scratch/named" simulate
check "the option goes first" 0 "lost 0 times" simulate --library "$1/libdravik.so.1"
unset DRAVIK_LIBRARY

# A refused document: which key, why, and what had been applied. Rows of PATTERN|DOCUMENT on stdin.
while IFS='|' read -r pattern document; do
    printf '%b' "$document" > "$scratch/document"
    check "refused: $document" 1 "^dravik-host: $scratch/document: refused with -52005: $pattern\$" \
        check "$scratch/document"
done << 'END'
it is not JSON, as of line 1|
it is not JSON, as of line 3|{\n"phaseLockGain": 1,\n}
frequencyLockGain is 0, not within 1e-9 to 10; applied before it: nothing|{"PHASELOCKGAIN": 1, "frequencyLockGain": 0}
phaseLockGain is 10.5, not within 1e-9 to 10; applied before it: frequencyLockGain|{"phaseLockGain": 10.5, "frequencyLockGain": 1}
phaseLockCoefficientA is -11, not within -10 to 10; applied before it: nothing|{"phaseLockCoefficientA": -11}
phaseLockCoefficientB is 11, not within -10 to 10; applied before it: nothing|{"phaseLockCoefficientB": 11}
phaseLockCoefficientC is inf, not within -10 to 10; applied before it: nothing|{"phaseLockCoefficientC": 1e999}
snapTimeThreshold is 9e-09, not within 1e-8 to 10 s; applied before it: phaseLockGain|{"SnapTimeThreshold": 9e-9, "phaseLockGain": 1}
spikeFilterEnabled is true, which is not a number; applied before it: snapTimeThreshold|{"spikeFilterEnabled": true, "snapTimeThreshold": 1, "spikeFilterHistorySize": ""}
spikeFilterHistorySize is 1.9, not within 2 to 100 pairs; applied before it: spikeFilterEnabled|{"spikeFilterHistorySize": 1.9, "spikeFilterEnabled": 1}
spikeFilterMaxThreshold is \["a"\], which is not a number; applied before it: nothing|{"spikeFilterMaxThreshold": ["a"], "spikeFilterMinThreshold": null}
spikeFilterMaxThreshold is 11, not within 1e-9 to 10 s/s; applied before it: nothing|{"spikeFilterMaxThreshold": 11}
spikeFilterMinThreshold is 0, not within 1e-9 to 10 s/s; applied before it: nothing|{"spikeFilterMinThreshold": 0}
spikeFilterGrowthFactor is 1, not within 1.001 to 100; applied before it: nothing|{"spikeFilterGrowthFactor": 1}
END
notes() { echo "$1" | "${host[@]}" check - 2>&1 > /dev/null | cut -d' ' -f3-; }
expect "misspelt, repeated, read otherwise" "phaseLockGain stands there twice, and the first one counts
gain is not a key and sets nothing
snaptimethreshhold is not a key and sets nothing; did you mean snapTimeThreshold?
spikeFilterEnabled is 2 and read as off
spikeFilterHistorySize is 5.7 and read as 5" "$(notes '{"PHASELOCKGAIN": 1, "phaseLockGain": 2, "gain": 3,
    "snaptimethreshhold": 1, "spikeFilterEnabled": 2, "spikeFilterHistorySize": 5.7}')"
expect "a flag that is nearly 1" "spikeFilterEnabled is 1.9 and read as 1, on" "$(notes '{"spikeFilterEnabled": 1.9}')"
expect "two objects" "what stands behind the object sets nothing" "$(notes '{"phaseLockGain": 0.5} {"phaseLockGain": 1}')"
expect "no object" "it is not a JSON object, so it sets nothing" "$(notes '[1]')"

# Advice on the loop goes to stderr, beside the document.
echo '{}' > "$scratch/document"
expect "advice" "at one pair every 1 s:
  spike filter off" "$("${host[@]}" check "$scratch/document" --interval 1s --noise 50ns 2>&1 > /dev/null | sed -n '1p;$p')"
expect "noise needs an interval" 2 "$("${host[@]}" check x --noise 1ns 2> /dev/null; echo $?)"

# The CSV file: every pair, every call, exact figures, the same bytes for the same seed.
n=0
for seed in 1 2 1; do
    "${host[@]}" simulate --seed $seed --csv "$scratch/$((++n)).csv" > "$scratch/$n"
done
expect "same seed, same bytes" "" "$(cmp "$scratch/1.csv" "$scratch/3.csv"; cmp "$scratch/1" "$scratch/3")"
expect "another seed, other bytes" 1 "$(cmp -s "$scratch/1.csv" "$scratch/2.csv"; echo $?)"
expect "rows of pairs" 300 "$(grep -c '^pair,' "$scratch/1.csv")"
for call in stepTime getFrequency setFrequency getMaxFrequencyOffset getMinFrequencyOffset; do
    expect "rows of $call" "$(grep -o "$call [0-9]*" "$scratch/1")" \
        "$call $(grep -cE "^call,[0-9.]+,,,,,$call,-?[0-9]+(\.[0-9]{0,5}[1-9])?$" "$scratch/1.csv")"
done
for resolution in finest=0.015625 0.3ppb=0.25 1ppb=1; do
    expect "orders of $resolution" "" "$("${host[@]}" simulate --csv - --resolution "${resolution%=*}" 2> /dev/null |
        awk -F, -v step="${resolution#*=}" '/setFrequency/ { ++rows; parts = $8 / step; odd += parts % 2 != 0
            if (parts != int(parts)) print } END { if (!odd || !rows) print "none" }')"
done
rows() { "${host[@]}" simulate --duration 3s --csv - "$@" 2> /dev/null; }
quiet=(--noise 0 --frequency-noise 0 --frequency-wander 0)
expect "noise to the last digit" "pair,1.000000000,1700000000999999967,1700000001001012008,1012041,1012008.727,," \
    "$(rows --seed 7 --frequency-noise 10ppb | grep '^pair,1')"
expect "fifty years to the nanosecond" "call,2.000000000,,,,,stepTime,-1577880000000000000" \
    "$(rows "${quiet[@]}" --frequency-error 0 --initial-offset 438300h | grep stepTime)"
expect "coarse timestamps" "pair,1.000000000,1700000001000000000,1700000001006000000,6000000,6012000.000,," \
    "$(rows "${quiet[@]}" --granularity 1ms --initial-offset 6ms | grep '^pair,1')"

# Pictures: both kinds, the script for them, and what is wrong with the name or with gnuplot.
"${host[@]}" simulate --noise 400ns --csv "$scratch/it's.csv" > "$scratch/out"
plot() { "${host[@]}" plot "$scratch/it's.csv" "$@" 2>&1; }
plot -o "$scratch/p.svg" --mask 802.1as
plot -o "$scratch/p.png"
expect "an SVG with its text" "1 1 1 1 1" "$(for word in "it's.csv" "not locked" "offset ordered" ADEV "limit of TDEV"; do
    grep -c "$word" "$scratch/p.svg"; done | tr '\n' ' ' | sed 's/ $//')"
expect "a PNG" "$(printf '\211PNG')" "$(head -c 4 "$scratch/p.png")"
plot -o "$scratch/q.svg" --mask 802.1as --script "$scratch/script"
gnuplot "$scratch/script"
expect "the script draws the same" "" "$(cmp "$scratch/p.svg" "$scratch/q.svg" 2>&1)"
expect "no picture" "dravik-host: --output: 'a.gif' does not end in .svg or .png" "$(plot -o a.gif)"
expect "no curve of that mask" 1 "$(plot -o a.svg --mask g8273.2-d | grep -c '^dravik-host: --mask: g8273.2-d not in {')"
expect "too far apart for a mask" "dravik-host: pairs are too far apart for the mask's filter of 0.1 Hz" \
    "$("${host[@]}" simulate --interval 2s --csv - 2> /dev/null | "${host[@]}" plot - -o a.svg --mask g8273.2-a 2>&1)"
expect "nothing moves" 0 "$(printf 'reference_ns,clock_ns\n1000000000,1000000000\n2000000000,2000000000\n3000000000,3000000000\n' |
    "${host[@]}" plot - -o "$scratch/p.svg" 2> /dev/null; echo $?)"
mkdir "$scratch/few" # programs, those that an emulator needs
for program in bash dirname qemu-arm; do ln -s "$(command -v $program)" "$scratch/few/"; done
expect "no gnuplot" "dravik-host: cannot start gnuplot: No such file or directory; --script writes what it would be given" \
    "$(PATH=$scratch/few plot -o "$scratch/a.svg")"
printf '#!/bin/sh\nexit 1\n' > "$scratch/few/gnuplot"
chmod +x "$scratch/few/gnuplot"
"${host[@]}" simulate --duration 3h --csv "$scratch/it's.csv" > "$scratch/out"
expect "gnuplot ends early" "dravik-host: gnuplot did not draw it; what is wrong stands above" \
    "$(PATH=$scratch/few plot -o "$scratch/a.svg")"
expect "no folder" "dravik-host: cannot write /none/a.svg: No such file or directory" "$(plot -o /none/a.svg)"

# A plug-in that exceeds the clock's limits: the clock refuses, and code and payload arrive. It also
# inspects the buffer of the host's status: new, filled, grown, and asked to shrink.
cat > "$scratch/bad.c" << 'END'
#include "zvckmservo/servo.h"
#include <stdlib.h>
#include <string.h>
static int wellFormed(const zverr_Status* s)
{
    size_t i = strlen(s->json);
    while (i + 1 < s->capacity && s->json[i] == 0) ++i;
    return i + 1 == s->capacity && s->json[i] == 'J';
}
void zvckmservo_adjustTime(zvckmservo_HostTable* h, uint64_t r, uint64_t c, zverr_Status* s)
{
    (void)r, (void)c;
    if (!s->reallocJson(s, 1) || strcmp(s->json, "{}") || !wellFormed(s)) abort();
    h->setFrequency(2000000000, s);
    const uint32_t size = s->capacity + 100;
    if (!wellFormed(s) || !s->reallocJson(s, size) || s->capacity != size) abort();
    if (!s->reallocJson(s, 9) || s->capacity != size || !wellFormed(s)) abort();
}
void zvckmservo_initialize(zvckmservo_HostTable* h, zverr_Status* s) { (void)h, (void)s; }
void zvckmservo_finalize(zvckmservo_HostTable* h) { (void)h; }
int zvckmservo_writeServoConfigJson(zvckmservo_HostTable* h, const char* t, zverr_Status* s)
{
    return (void)h, (void)t, (void)s, 0;
}
int zvckmservo_readServoConfigJson(zvckmservo_HostTable* h, char* b, size_t n, zverr_Status* s)
{
    return (void)h, (void)s, strncpy(b, DOCUMENT, n), 0;
}
END
printf '#define DOCUMENT "%s"\n' "$("${host[@]}" show | tr -d '\n' | sed 's/"/\\"/g')" |
    cat - "$scratch/bad.c" > "$scratch/worse.c"
printf 'int zvckmservo_%s;\n' isSeeded clearHistory getTime applyMetaData > "$scratch/rest.c"
"$cc" -shared -fPIC -I "$include" -o "$scratch/bad.so" "$scratch/worse.c" "$scratch/rest.c"
check "refused by the clock" 1 \
    "^dravik-host: an offset of 2000000000 ppb is beyond the clock's 500000 ppb$" \
    simulate --resolution 1ppb --library "$scratch/bad.so"

# A plug-in that gives back all that it was told, in one document of any length.
cat > "$scratch/echo.c" << 'END'
#include "zvckmservo/servo.h"
#include <string.h>
static char told[8192];
void zvckmservo_applyMetaData(zvckmservo_HostTable* h, const char* t, zverr_Status* s)
{
    (void)h, (void)s, strcat(told, t);
}
int zvckmservo_writeServoConfigJson(zvckmservo_HostTable* h, const char* t, zverr_Status* s)
{
    return (void)h, (void)s, strcat(told, t), 0;
}
int zvckmservo_readServoConfigJson(zvckmservo_HostTable* h, char* b, size_t n, zverr_Status* s)
{
    (void)h, (void)s, memcpy(b, told, strlen(told) < n ? strlen(told) : n);
    return 0;
}
void zvckmservo_initialize(zvckmservo_HostTable* h, zverr_Status* s) { (void)h, (void)s; }
void zvckmservo_finalize(zvckmservo_HostTable* h) { (void)h; }
END
printf 'int zvckmservo_%s;\n' isSeeded clearHistory getTime adjustTime > "$scratch/rest.c"
"$cc" -shared -fPIC -I "$include" -o "$scratch/echo.so" "$scratch/echo.c" "$scratch/rest.c"
show() { "${host[@]}" show --library "$scratch/echo.so" "$@"; }
expect "metadata made of a type" \
    '{"selectedTRInstID": "selected", "TRs": {"selected": {"type": "a \"b\" \\ \n"}}}' \
    "$(show --reference-type $'a "b" \\ \n')"
printf '%5000s' end > "$scratch/long"
expect "metadata first, and no limit of length" "meta$(cat "$scratch/long")" \
    "$(printf meta | show --config "$scratch/long" --metadata -)"

echo "$checks checks, $failures failures"
exit $((failures > 0))
