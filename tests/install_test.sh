#!/usr/bin/env bash
# An installation as an integrator has it: its files, and hosts built against nothing else.
# Usage: install_test.sh BUILD EXAMPLES RELOCATIONS CC CMAKE READELF [TOOLCHAIN], with a relocation
# library in the folder RELOCATIONS
set -euo pipefail
build=$1 examples=$2 relocations=$3 cc=$4 cmake=$5 readelf=$6 toolchain=${7:-}
emulator=(${EMULATOR:+"$EMULATOR"})
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
source "$(dirname "$0")/support/expect.sh"

root=$scratch/root
DESTDIR=$root "$cmake" --install "$build" --prefix "$scratch/usr" > /dev/null
usr=$root$scratch/usr
libdir=$(dirname "$(find "$usr" -name libdravik.so.1)")
lib=${libdir#"$usr/"}
expect "files" "$(sort << END
$scratch/usr/bin/dravik-host
$scratch/usr/include/zvckmservo/parameters.h
$scratch/usr/include/zvckmservo/servo.h
$scratch/usr/include/zverr/status.h
$scratch/usr/$lib/cmake/dravik/dravikConfig.cmake
$scratch/usr/$lib/cmake/dravik/dravikConfigVersion.cmake
$scratch/usr/$lib/cmake/dravik/dravikTargets.cmake
$scratch/usr/$lib/libdravik.so
$scratch/usr/$lib/libdravik.so.1
$scratch/usr/$lib/libdravik.so.1.0.0
$scratch/usr/$lib/pkgconfig/dravik.pc
$scratch/usr/share/bash-completion/completions/dravik-host
$scratch/usr/share/doc/dravik-host/examples/dravik-host.service
$scratch/usr/share/man/man1/dravik-host.1
$scratch/usr/share/man/man5/dravik-servo-document.5
/usr/lib/arm-linux-gnueabi/zv-chronel/servos/dravik_tr_ptp4l_bc.json
/usr/lib/arm-linux-gnueabi/zv-chronel/servos/dravik_tr_ptp4l_tab.json
END
)" "$(find "$root" -not -type d -not -name 'dravikTargets-*.cmake' | sed "s|^$root||" | sort)"
expect "soname link" libdravik.so.1.0.0 "$(readlink "$libdir/libdravik.so.1")"
for file in "$libdir/libdravik.so.1" "$usr/bin/dravik-host"; do
    expect "run path of ${file##*/}" 0 "$("$readelf" --dynamic "$file" | grep -cE 'RPATH|RUNPATH' || true)"
done
expect "the host finds the library" 1 "$(env -u DRAVIK_LIBRARY "${emulator[@]}" "$usr/bin/dravik-host" simulate --duration 10s | grep -c '^lock  *after')"

# The default documents are found where they were installed, seen through a relocation.
servos=$root/usr/lib/arm-linux-gnueabi/zv-chronel/servos
for type in 'tab IEEE 802.1AS-2011 TAB' 'bc IEEE 1588-2008 BC'; do
    expect "document of ${type#* }" "$("${emulator[@]}" "$usr/bin/dravik-host" show --config "$servos/dravik_tr_ptp4l_${type%% *}.json")" \
        "$(LD_LIBRARY_PATH=$relocations RELOCATIONS=multiarchlibdir=$root/usr/lib/arm-linux-gnueabi \
            "${emulator[@]}" "$usr/bin/dravik-host" show --reference-type "${type#* }")"
done

# A document that was edited is kept, and who may not write to their directory gets all the rest.
again() { DESTDIR=$1 "$cmake" --install "$build" --prefix "$scratch/usr" "${@:2}" 2>&1 > /dev/null | grep -oE 'Kept|not installed' || true; }
echo '{}' > "$servos/dravik_tr_ptp4l_bc.json"
expect "installed again" Kept "$(again "$root" --component documents)"
expect "edited document" '{}' "$(cat "$servos/dravik_tr_ptp4l_bc.json")"
rm "$servos/dravik_tr_ptp4l_bc.json"
expect "installed once more" "" "$(again "$root" --component documents)"
expect "its default" 1 "$(grep -c phaseLockGain "$servos/dravik_tr_ptp4l_bc.json")"
mkdir -p "$scratch/other/usr"
touch "$scratch/other/usr/lib"
expect "no directory for documents" "not installed" "$(again "$scratch/other")"
expect "the rest" "$(cd "$usr" && find . -not -type d | sort)" "$(cd "$scratch/other$scratch/usr" && find . -not -type d | sort)"

# The example, by pkg-config and by CMake.
export PKG_CONFIG_PATH=$libdir/pkgconfig
# shellcheck disable=SC2046  # flags are words
"$cc" -std=gnu11 -Wall -Wextra -Werror $(pkg-config --cflags dravik) "$examples/minimal_host.c" -o "$scratch/by_pkg_config"
cat > "$scratch/CMakeLists.txt" << END
cmake_minimum_required(VERSION 3.25)
project(example C)
find_package(dravik 1.0 REQUIRED)
add_executable(by_cmake "$examples/minimal_host.c")
target_link_libraries(by_cmake PRIVATE dravik::dravik)
END
"$cmake" -S "$scratch" -B "$scratch" -D CMAKE_FIND_ROOT_PATH="$root" \
    -D CMAKE_PREFIX_PATH="$scratch/usr" -D CMAKE_C_COMPILER="$cc" \
    ${toolchain:+-D CMAKE_TOOLCHAIN_FILE="$toolchain"} > /dev/null
"$cmake" --build "$scratch" > /dev/null
for host in by_pkg_config by_cmake; do
    LD_LIBRARY_PATH=$libdir "${emulator[@]}" "$scratch/$host" > "$scratch/out"
    expect "$host: far off at first" "5000000.0" "$(awk 'NR == 1 {print $4}' "$scratch/out")"
    expect "$host: near in the end" 1 "$(awk 'END {print ($4 < 100 && $4 > -100)}' "$scratch/out")"
done
exit $((failures > 0))
