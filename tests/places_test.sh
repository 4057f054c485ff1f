#!/usr/bin/env bash
# Where the plug-in looks for directories and files, and that nothing met there ends the host.
# Usage: places_test.sh PROBE FOLDER, with the relocation libraries in folders of FOLDER
set -uo pipefail
probe=(${EMULATOR:+"$EMULATOR"} "$1") libraries=$2
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
source "$(dirname "$0")/support/expect.sh"

settle() { # VARIABLE=VALUE...: runs the probe with the relocation library
    env LD_LIBRARY_PATH="$libraries/relocations" SHARE_DIR_FILE="$scratch/none" "$@" \
        "${probe[@]}" > "$scratch/out" || expect "exit status with $*" 0 $?
}

value() { sed -n "s/^$1 //p" "$scratch/out"; } # NAME

rows() { # TITLE, then rows of NAME VALUE on stdin
    local name text
    while read -r name text; do
        expect "$1: $name" "$text" "$(value "$name")"
    done
}

# Nothing is relocated: the usual places, unless this machine has a manager of its own.
usual() {
    rows "$1" << END
bindir /usr/bin
localstatedir /var
sharedstatedir /var/lib
multiarchlibdir /usr/lib/arm-linux-gnueabi
runstatedir /var/run
sysconfdir /etc
sharedDir /usr/local/zvcorp/share
sharedDirReads 6
log
baseDir /usr/local/zvcorp/share/Chronel
configGeneratorPath /usr/local/zvcorp/share/Chronel/Config/configGen
commandLineToolPath /usr/local/zvcorp/share/Chronel/zvchronelcli
timeReferencesDir /usr/local/zvcorp/share/Chronel/TimeReferences
timekeepersDir /usr/local/zvcorp/share/Chronel/TimeKeepers
servosDir /usr/local/zvcorp/share/Chronel/Servos
runtimeDir /var/run/zvcorp/Chronel
runtimeFile /var/run/zvcorp/Chronel/runtime_ckm.json
configDir /etc/zvcorp/share/Chronel
stateDir /usr/local/zvcorp/share/Chronel
managerConfigFile /usr/local/zvcorp/share/Chronel/ckm.json
syncConfigFile /var/lib/zv-sync/syncConfig.txt
pidFile /var/run/zvckmd.pid
daemonPath /usr/local/zvcorp/share/Chronel/zvckmd
logFile /var/log/zvckmd.log
END
}
settle RELOCATIONS_LOG="$scratch/asked"
usual "nothing relocated"
expect "asked in order, once" "prefixdir 255 execprefixdir 255 bindir 255 sbindir 255 libdir 255 \
lib32dir 255 lib64dir 255 nativelibdir 255 multiarchlibdir 255 libexecdir 255 sharedstatedir 255 \
datarootdir 255 datadir 255 sysconfdir 255 localstatedir 255 runstatedir 255 includedir 255 \
docdir 255 initddir 255" "$(xargs < "$scratch/asked")"
settle LD_LIBRARY_PATH=
usual "no relocation library"
settle LD_LIBRARY_PATH="$libraries/relocations_without_symbol"
usual "no symbol in it"

# The standard layout, whose own directory may be a file; the daemon is looked for all the same.
mkdir -p "$scratch/bin" "$scratch/lib"
touch "$scratch/lib/zv-chronel" "$scratch/bin/zvckmd"
moved="multiarchlibdir=$scratch/lib:bindir=$scratch/bin/:sysconfdir=:runstatedir=/run"
settle RELOCATIONS="$moved"
rows "standard layout" << END
sysconfdir
runstatedir /run
sharedDirReads 0
baseDir $scratch/lib/zv-chronel
configGeneratorPath $scratch/lib/zv-chronel/configgen
commandLineToolPath $scratch/bin/zvchronelcli
timeReferencesDir $scratch/lib/zv-chronel/timereferences
timekeepersDir $scratch/lib/zv-chronel/timekeepers
servosDir $scratch/lib/zv-chronel/servos
runtimeDir /run/zv-chronel
runtimeFile /run/zv-chronel/runtime_ckm.json
configDir
stateDir /var/lib/zv-chronel
managerConfigFile /var/lib/zv-chronel/ckm.json
syncConfigFile /var/lib/zv-sync/syncConfig.txt
pidFile /run/zvckmd.pid
daemonPath $scratch/bin/zvckmd
logFile /var/log/zvckmd.log
END
expect "default documents" "$scratch/lib/zv-chronel/servos/dravik_tr_ptp4l_bc.json
$scratch/lib/zv-chronel/servos/dravik_tr_ptp4l_tab.json" "$(value default)"
settle RELOCATIONS="multiarchlibdir=$scratch/lib:bindir=/none"
expect "daemon of the shared folder" "/usr/local/zvcorp/share/Chronel/zvckmd" "$(value daemonPath)"
expect "tool is not looked for" "/none/zvchronelcli" "$(value commandLineToolPath)"
touch "$scratch/bin/zvchronelcli"
settle RELOCATIONS="bindir=$scratch/bin"
expect "tool in its place" "$scratch/bin/zvchronelcli" "$(value commandLineToolPath)"

# After a failure no further name is asked, and every getter fails from then on.
rm "$scratch/asked"
settle RELOCATIONS_LOG="$scratch/asked" RELOCATIONS_FAIL_AT=3
expect "asked up to the failure" 3 "$(wc -l < "$scratch/asked")"
for name in bindir localstatedir sharedstatedir multiarchlibdir runstatedir sysconfdir; do
    expect "$name fails" "-52006 " "$(value $name)"
done
once="multiarchlibdir bindir runstatedir sysconfdir sharedstatedir runstatedir bindir localstatedir"
warnings=$(for name in $once $once; do echo "4 zvhostq::get_$name() failed"; done)
expect "warnings, shared layout" "$warnings" "$(value log)"
expect "usual places after all" "/var/run/zvcorp/Chronel" "$(value runtimeDir)"
settle LD_LIBRARY_PATH="$libraries/relocations_throwing"
expect "warnings after an exception" "$warnings" "$(value log)"
expect "a getter after an exception" "the relocation library threw" "$(value bindir)"

# The shared directory's file.
shared() { # NAME EXPECTED
    settle SHARE_DIR_FILE="$scratch/share.dir"
    expect "shared directory, $1" "$2" "$(value sharedDir)"
    expect "no warning, $1" "" "$(value log)"
}
printf ' \t/opt/a b/ \r\n' > "$scratch/share.dir"; shared "trimmed" "/opt/a b"
printf '/' > "$scratch/share.dir"; shared "a slash" ""
printf '/opt///\0/\0\n' > "$scratch/share.dir"; shared "zero bytes" "/opt"
: > "$scratch/share.dir"; shared "empty" ""
rm "$scratch/share.dir"; mkdir "$scratch/share.dir"; shared "a folder" "/usr/local/zvcorp/share"

# A probe that cannot tell: no default documents, one warning each, and the host goes on.
ln -s loop "$scratch/loop"
settle RELOCATIONS="multiarchlibdir=$scratch/loop"
expect "no default documents" "" "$(value default)"
expect "a warning each" "4 no default configuration for IEEE 802.1AS-2011 TAB: its place cannot be told
4 no default configuration for IEEE 1588-2008 BC: its place cannot be told" "$(value log)"

# Exhausted memory, in the shared layout: each allocation of the load fails once.
for ((n = 1; ; ++n)); do
    settle FAIL_ALLOCATION=$n RELOCATIONS="multiarchlibdir=$scratch/none"
    [ "$(value allocationFailed)" == 1 ] || break
    [[ "$(value log)" == *"no memory for the default configurations"* ]] && warned=1
    [[ "$(value log)" == *"4 zvhostq::getZVSharedDir() failed"* ]] &&
        [[ "$(value default)" == *"/usr/local/zvcorp/shared/Chronel/Servos/"* ]] && replaced=1
    code=$(value bindir)
    expect "bindir after allocation $n" 1 "$(grep -cE '^(/usr/bin|-52000 .*"line":(32|346),.*)$' <<< "$code")"
done
expect "the load did allocate" 1 $((n > 50))
expect "a table that finds no memory is told" 1 "${warned:-0}"
expect "the shared directory's usual place after all" 1 "${replaced:-0}"

echo "$checks checks, $failures failures, $((n - 1)) allocations"
exit $((failures > 0))
