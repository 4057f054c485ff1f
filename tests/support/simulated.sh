# shellcheck shell=bash
# Sourced by tests in bash that run programs under a simulated machine, see
# simulated_machine/machine.h. $bin is the folder of dravik-host; $asUser what gives permissions away.
simulated() { # PROGRAM ARGUMENT...: under the machine that the file machine describes
    local under=("SIMULATED_MACHINE=machine" "LD_PRELOAD=$bin/../tests/libsimulated_machine.so"
        ${LIBRARIES:+"LD_LIBRARY_PATH=$LIBRARIES"})
    if [ -n "${EMULATOR:-}" ]; then
        echo emulator >> machine
        under=("QEMU_SET_ENV=$(IFS=,; echo "${under[*]}")")
    fi
    ${asUser:-} env ASAN_OPTIONS="${ASAN_OPTIONS:-}:verify_asan_link_order=0" "${under[@]}" "$@"
}
