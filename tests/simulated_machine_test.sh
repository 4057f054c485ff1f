#!/usr/bin/env bash
# The simulated machine itself: that no program under it can set a clock of the real one, and that it
# is what its statements say.
# Usage: simulated_machine_test.sh FOLDER, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
bin=$(cd "$1" && pwd)
support=$(cd "$(dirname "$0")/support" && pwd)
# shellcheck source-path=SCRIPTDIR source=support/expect.sh
source "$support/expect.sh"
# shellcheck source-path=SCRIPTDIR source=support/simulated.sh
source "$support/simulated.sh"
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
cd "$scratch" || exit 1

# Past the library the kernel refuses, but for the emulator's, which lacks the permission.
: > machine
if [ -z "${EMULATOR:-}" ]; then
    refused='Operation not permitted'
    expect "refused" "clock_settime: $refused
settimeofday: $refused
adjtimex: $refused
clock_adjtime: $refused
PTP device: $refused
syscall(): $refused
/dev/ptp9: Permission denied
/dev/rtc0: Permission denied" "$(simulated "$bin/../tests/clock_setter")"
    expect "its children too" "adjtimex: $refused" \
        "$(simulated bash -c "'$bin/../tests/clock_setter'" | grep ^adjtimex)"
else
    expect "refused" 1 \
        "$(simulated "$EMULATOR" "$bin/dravik-host" doctor 2>&1 | grep -c 'no CAP_SYS_TIME')"
fi
echo "$checks checks, $failures failures"
exit $((failures > 0))
