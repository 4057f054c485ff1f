# The target: ARMv7-A, hardware floating point, arguments in integer registers. Builds against
# build/sysroot, which scripts/sysroot makes, and runs what it built through scripts/emulate.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR armv7-a)
set(CMAKE_LIBRARY_ARCHITECTURE arm-linux-gnueabi)

set(target_flags "-march=armv7-a -mfpu=vfpv3-d16 -mfloat-abi=softfp")
set(CMAKE_C_FLAGS_INIT ${target_flags})
# Nothing here meets code of a GCC before 7.1, which passed some arguments otherwise: no notes on that.
set(CMAKE_CXX_FLAGS_INIT "${target_flags} -Wno-psabi")

cmake_path(SET CMAKE_SYSROOT NORMALIZE ${CMAKE_CURRENT_LIST_DIR}/../build/sysroot)
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)

set(CMAKE_CROSSCOMPILING_EMULATOR ${CMAKE_CURRENT_LIST_DIR}/../scripts/emulate)
