# What every target of the project is compiled with: language, warnings, floating point.
set(CMAKE_CXX_EXTENSIONS OFF)
add_library(dravik_flags INTERFACE)
target_compile_features(dravik_flags INTERFACE c_std_11 cxx_std_17)
target_include_directories(dravik_flags INTERFACE ${PROJECT_SOURCE_DIR}/include)
target_compile_options(dravik_flags INTERFACE
    -Wall -Wextra -Wpedantic
    # The same bits on every machine: no fused multiply-add, never fast-math.
    -ffp-contract=off)

# Sanitizers as one list, for example address;undefined.
set(DRAVIK_SANITIZE "" CACHE STRING "Sanitizers to build everything with")
if(DRAVIK_SANITIZE)
    list(JOIN DRAVIK_SANITIZE "," sanitizers)
    target_compile_options(dravik_flags INTERFACE
        -fsanitize=${sanitizers} -fno-sanitize-recover=all -fno-omit-frame-pointer
        # GCC takes what the checks leave of inlined code for uninitialised.
        $<$<CXX_COMPILER_ID:GNU>:-Wno-maybe-uninitialized>)
    target_link_options(dravik_flags INTERFACE -fsanitize=${sanitizers})
endif()
