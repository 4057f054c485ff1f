#!/usr/bin/env bash
# Unchanged programs of Debian hold the clock of the simulated machine. They run as a user whom the
# kernel allows nothing, should the simulation fail.
# Usage: debian_programs_test.sh FOLDER, the one of dravik-host
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
PATH+=:/usr/sbin
for needed in phc2sys chronyd; do
    command -v "$needed" > /dev/null || { echo "skipped: there is no $needed"; exit 77; }
done
asUser='unshare -Ur'
$asUser true 2> /dev/null || { echo "skipped: unshare -Ur is not allowed here"; exit 77; }

# Figures of the true error from the trace once the clock is held, which both do within a few us.
held() { # AFTER LIMIT, in s and ns
    awk -F, -v after="$1" -v limit="$2" '$2 == "system" && $5 == "" && $1 >= after {
        ++rows; if ($3 > limit || $3 < -limit) ++beyond } END { print rows + 0, beyond + 0 }' trace
}
start='start 1700000000s
seed 7
trace trace pace=1s
system offset=3ms frequency=12ppm white=1ppb wander=0.1ppb'

printf '%s\n' "$start" 'ptp /dev/ptp0 noise=50ns delay=800ns' 'at 300s signal TERM' > machine
simulated phc2sys -s /dev/ptp0 -c CLOCK_REALTIME -O 0 -m > out 2>&1
expect "phc2sys: held" "201 0" "$(held 100 1000)"
expect "phc2sys: its lines" 300 "$(grep -cE 'phc offset +-?[0-9]+ s[012] freq' out)"

printf '%s\n' "$start" 'shm 0 interval=1s noise=1us first=10ms' 'at 3000s signal TERM' > machine
cat > chrony.conf << END
refclock SHM 0 poll 2 dpoll 0
makestep 0.001 3
cmdport 0
port 0
bindcmdaddress /
pidfile $scratch/pid
END
simulated chronyd -d -U -u root -f "$scratch/chrony.conf" > out 2>&1
expect "chronyd: held" "2001 0" "$(held 1000 5000)"
expect "chronyd: stepped" 1 "$(grep -c 'System clock was stepped' out)"

echo "$checks checks, $failures failures"
exit $((failures > 0))
