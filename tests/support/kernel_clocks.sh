# Sourced by tests that steer clocks of the kernel: builds the library that stands in for them, in
# this folder with the compiler $2, and runs programs under it.
"$2" -O1 -shared -fPIC -o kernel_clocks.so "$support/kernel_clocks.c" -ldl -lm || exit 1

underKernelClocks() { # LETTERS PROGRAM ARGUMENT...; LETTERS as in kernel_clocks.c
    local under=("KERNEL_CLOCKS=$1" "LD_PRELOAD=$PWD/kernel_clocks.so"
        ${LIBRARIES:+"LD_LIBRARY_PATH=$LIBRARIES"})
    [ -z "${EMULATOR:-}" ] || under=("QEMU_SET_ENV=$(IFS=,; echo "${under[*]}")")
    env ASAN_OPTIONS="${ASAN_OPTIONS:-}:verify_asan_link_order=0" "${under[@]}" "${@:2}"
}
