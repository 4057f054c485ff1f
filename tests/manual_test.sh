#!/usr/bin/env bash
# What is written about the program says what it is: manual pages, completion, the example unit.
# Usage: manual_test.sh FOLDER CC, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
bin=$(cd "$1" && pwd)
host() { ${EMULATOR:+"$EMULATOR"} "$bin/dravik-host" "$@"; }
root=$(cd "$(dirname "$0")/.." && pwd)
source "$root/tests/support/expect.sh"
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
page=$root/docs/man/dravik-host.1.scd

# Each verb has its section, which with the shared one tells all its options.
all=''
verbs=$(host --help | sed -nE '/^Subcommands:/,/^$/s/^  ([a-z]+) .*/\1/p')
expect "verbs" "$(sort <<< "$verbs")" "$(sed -nE 's/^\*dravik-host\* \*([a-z]+)\*.*/\1/p' "$page" | sort)"
options() { grep -oE -- '--[a-z][a-z-]+' | sort -u; }
for verb in $verbs; do
    told=$(sed -nE "/^## $verb$/,/^##? /p" "$page" | options)
    case $verb in
    simulate | replay | run) told+=$'\n'$(sed -n '/^# DISCIPLINING/,/^##/p' "$page" | options) ;;
    esac
    has=$(host "$verb" --help | options | grep -vx -e --help)
    expect "$verb: columns of its help" "" "$(host "$verb" --help | grep -E '.{81}|^  -.{30}[^ ]')"
    expect "$verb: options not told" "" "$(comm -23 <(echo "$has") <(sort -u <<< "$told"))"
    all+=$has$'\n'
done
expect "options of no verb" "" "$(comm -13 <(sort -u <<< "$all") <(options < "$page"))"

# The keys and their built-in values.
document=$root/docs/man/dravik-servo-document.5.scd
while read -r key value; do
    expect "$key" 0 "$(sed -nE "s/.*\*$key\* \(([^()]*); ([^;]*)\).*/\2/p" "$document" |
        awk -v value="$value" '{print $1 - value}')"
done < <(host show | sed -nE 's/^[^"]*"([A-Za-z]+)":[^0-9]*([0-9.e-]+),?$/\1 \2/p')

# The completion, as bash calls it.
source "$root/host/completion/dravik-host"
mkdir "$scratch/bin"
printf '#!/bin/sh\nexec %s "%s" "$@"\n' "${EMULATOR:-}" "$bin/dravik-host" > "$scratch/bin/dravik-host"
chmod +x "$scratch/bin/dravik-host"
PATH=$scratch/bin:$PATH
cd "$root" || exit 1
while IFS='|' read -r line wanted; do
    mapfile -t COMP_WORDS < <(grep -oE "\"[^\"]*|(\\\\.|[^ :=])+|[:=]" <<< "$line")
    [[ $line != *' ' || $line == *'"'* ]] || COMP_WORDS+=('')
    COMP_CWORD=$((${#COMP_WORDS[@]} - 1))
    _dravik_host
    expect "completion of '$line'" "$wanted" "$(IFS=,; echo "${COMPREPLY[*]}")"
done << 'END'
dravik-host s|simulate,show
dravik-host --v|--version
dravik-host run --hold|--holdover-after
dravik-host run --clock |soft,realtime,phc:
dravik-host run --clock=r|realtime
dravik-host run --reference |realtime,phc:,shm:,sock:
dravik-host run --reference s|shm:,sock:
dravik-host run --reference phc:/dev/nul|/dev/null
dravik-host run --reference shm:|0,1,2,3
dravik-host run --reference sock:config/RE|config/README.md
dravik-host run --then |60s=
dravik-host run --then 2min|2min=
dravik-host run --then 60s=config/dravik_tr_ptp4l_t|config/dravik_tr_ptp4l_tab.json
dravik-host run --duration c|
dravik-host simulate --scenario examples/scenarios/qu|examples/scenarios/quiet.scenario
dravik-host run --dry-run --csv CHANGE|CHANGELOG.md
dravik-host show --reference-type |IEEE\ 802.1AS-2011\ TAB,IEEE\ 1588-2008\ BC
dravik-host show --reference-type IEEE\ 1|IEEE\ 1588-2008\ BC
dravik-host show --reference-type "IEEE 8|IEEE 802.1AS-2011 TAB
dravik-host plot trace.csv -o CHANGE|CHANGELOG.md
dravik-host metrics --mask g8273.2-c|g8273.2-c
dravik-host metrics CHANGE|CHANGELOG.md
dravik-host doctor /dev/nul|/dev/null
dravik-host check config/dravik_tr_ptp4l_t|config/dravik_tr_ptp4l_tab.json
END
for verb in metrics plot; do
    masks=$(host "$verb" --mask none x 2>&1 | sed -E 's/.*\{(.*)\}.*/\1/')
    COMP_WORDS=(dravik-host "$verb" --mask '') COMP_CWORD=3
    _dravik_host
    expect "masks of $verb" "$masks" "$(IFS=,; echo "${COMPREPLY[*]}")"
done

# The unit: its options are understood, though there may be no such clock; and it has one capability.
unit=$root/examples/dravik-host.service
eval "words=($(sed -nE 's|/dev/ptp0|/none|; s|^ExecStart=/usr/bin/dravik-host (.*)|\1|p' "$unit"))"
# shellcheck disable=SC2154  # set by eval
expect "unit" 1 "$(host "${words[@]}" --dry-run --duration 1ms > /dev/null 2>&1; echo $?)"
expect "capabilities" "CapabilityBoundingSet=CAP_SYS_TIME" "$(grep Capabilit "$unit")"

echo "$checks checks, $failures failures"
exit $((failures > 0))
