# shellcheck shell=bash
# Sourced by tests in bash that run programs under a simulated machine, see
# simulated_machine/machine.h. $bin is the folder of dravik-host; $asUser what gives permissions away.
simulated() { # PROGRAM ARGUMENT...: under the machine that the file machine describes
    # The loader takes blanks and colons of a path as its end.
    [ -e libsimulated_machine.so ] || ln -s "$bin/libsimulated_machine.so" .
    local under=("SIMULATED_MACHINE=machine" "LD_PRELOAD=./libsimulated_machine.so"
        ${LIBRARIES:+"LD_LIBRARY_PATH=$LIBRARIES"})
    if [ -n "${EMULATOR:-}" ]; then
        echo emulator >> machine
        under=("QEMU_SET_ENV=$(IFS=,; echo "${under[*]}")")
    fi
    requireMachine
    ${asUser:-} env ASAN_OPTIONS="${ASAN_OPTIONS:-}:verify_asan_link_order=0" "${under[@]}" "$@"
}

# Without the library a program would have the clocks of the real machine.
requireMachine()
{
    [ ! -e machine.loaded ] || return 0
    env ASAN_OPTIONS="${ASAN_OPTIONS:-}:verify_asan_link_order=0" "${under[@]}" \
        ${EMULATOR:+"$EMULATOR"} "$bin/dravik-host" --version > /dev/null
    [ ! -e machine.loaded ] || return 0
    echo "the simulated machine cannot be loaded: nothing is run" >&2
    kill $$
    exit 1
}

simulatedHost() { # STATEMENTS ARGUMENT...: dravik-host, statements with ; between them
    tr ';' '\n' <<< "reading 0ns;$1" > machine
    simulated ${EMULATOR:+"$EMULATOR"} "$bin/dravik-host" "${@:2}"
}

# Each block of the standard input is a run: == NAME | STATEMENTS | OPTIONS | COMMAND, and all that
# is to be seen: what it prints but its first line and, unless the block has it, the summary; its exit
# status if not 0; what the command prints.
expectRuns() {
    local head='' expected='' line
    while IFS= read -r line; do
        if [[ $line != '== '* ]]; then
            expected+=$line$'\n'
            continue
        fi
        [ -z "$head" ] || expectRun "$head" "$expected"
        head=${line#== } expected=
    done
    expectRun "$head" "$expected"
}

expectRun() { # HEAD EXPECTED
    local name statements options command status
    IFS='|' read -r name statements options command <<< "$1"
    # shellcheck disable=SC2086  # split on purpose
    simulatedHost "$statements" run $options > out 2>&1
    status=$?
    sed -i '/^run: /d' out
    [[ $2 == *'pairs  '* ]] ||
        sed -i '/^pairs  /,/getMaxFrequencyOffset/d; /^WARNING/d; /^            [C-]/d' out
    [ "$status" == 0 ] || echo "exit $status" >> out
    expect "${name% }" "${2%$'\n'}" "$(cat out; eval "$command")"
}
