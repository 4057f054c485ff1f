#!/usr/bin/env bash
# What the doctor sees of the plug-in, of default documents in all their states, and of clocks of a
# simulated machine.
# Usage: doctor_test.sh FOLDER CC, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
bin=$(cd "$1" && pwd)
support=$(cd "$(dirname "$0")/support" && pwd)
# shellcheck source-path=SCRIPTDIR source=support/expect.sh
source "$support/expect.sh"
# shellcheck source-path=SCRIPTDIR source=support/simulated.sh
source "$support/simulated.sh"
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
cd "$scratch" || exit 1

# As on a target: the manager's folder is there, with one document that is good and one that is not.
servos=$scratch/zv-chronel/servos
mkdir -p "$servos"
echo '{"phaseLockGain": 0.3}' > "$servos/dravik_tr_ptp4l_tab.json"
echo '{"phaseLockGain": 0}' > "$servos/dravik_tr_ptp4l_bc.json"
touch ptp
export RELOCATIONS=multiarchlibdir=$scratch
export LIBRARIES=$bin/../tests/relocations
doctor() { simulatedHost "$1" doctor "${@:2}" > out 2> err; } # STATEMENTS ARGUMENT...

permission="look +permission +no CAP_SYS_TIME"
(($((0x$(sed -n 's/^CapEff:[^0-9a-f]*//p' /proc/self/status))) >> 25 & 1)) && permission="ok +permission +CAP_SYS_TIME"
[ -z "${EMULATOR:-}" ] || permission="(ok|look) +permission" # it does not pass on what this process may

doctor "system status=0 frequency=7ppm;ptp ./ptp quirks=b delay=400ns offset=1000s max=50ppm" ./ptp none
expect "exit status" 1 $?
expect "faults in all" "dravik-host: faults found: 2" "$(cat err)"
while IFS='|' read -r count pattern; do
    expect "$pattern" "$count" "$(grep -cE -- "$pattern" out)"
done << END
1|^ok +words +of (32|64) bits
1|^ok +library +$bin/libdravik.so.1, with all nine functions\$
1|^ok +servo
1|^ok +document +IEEE 802.1AS-2011 TAB: $servos/dravik_tr_ptp4l_tab.json\$
1|^FAULT document +IEEE 1588-2008 BC: $servos/dravik_tr_ptp4l_bc.json: applyMetaData failed
1|^ok +CLOCK_REALTIME said to be synchronised; steered by \+0.000 ppm, up to \+500.000 ppm\$
1|^ok +TAI offset +37 s\$
1|^ok +PTP clock +./ptp: steered up to \+50.000 ppm, read by PTP_SYS_OFFSET within 400 ns, \+1000 s from
1|^FAULT PTP clock +cannot open none: No such file
1|^$permission
10|.
END

rm "$servos/dravik_tr_ptp4l_bc.json"
doctor "system;ptp ./ptp" ./ptp
expect "a document that is not there: exit status" 0 $?
expect "a document that is not there" 1 "$(grep -c "^look .*$servos/dravik_tr_ptp4l_bc.json cannot be read: the built-in" out)"
expect "hardware reads" 1 "$(grep -c 'by PTP_SYS_OFFSET_PRECISE within 0 ns' out)"
expect "not synchronised" 1 "$(grep -c '^ok .*CLOCK_REALTIME nobody says that it is synchronised' out)"

"$2" -shared -fPIC -o other.so -x c /dev/null
doctor system --library ./other.so
expect "not the plug-in" "1 1" "$? $(grep -c '^FAULT library .*is not the plug-in: it has no zvckmservo_initialize' out)"
doctor system --library ./none.so
expect "no plug-in" "1 1" "$? $(grep -c '^FAULT library .*cannot load the plug-in: ./none.so' out)"

echo "$checks checks, $failures failures"
exit $((failures > 0))
