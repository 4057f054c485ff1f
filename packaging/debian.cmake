# Debian packages, made by scripts/package: the library with its default documents, what a host is
# built with, and the reference host.
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_CONTACT "dravik developers <dravik@localhost>")
set(CPACK_DEBIAN_PACKAGE_SECTION libs)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_ARCHITECTURE ${DRAVIK_DEBIAN_ARCHITECTURE})
set(CPACK_STRIP_FILES ON)
# Whoever builds them, with whatever umask.
set(CPACK_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)

set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_ALL library development host)
set(same_version "(= ${PROJECT_VERSION})")
set(run_time "libc6 (>= 2.34), libgcc-s1, libstdc++6 (>= 11), libcjson1 (>= 1.7.15)")

find_package(Boost REQUIRED)   # for its version
set(CPACK_DEBIAN_LIBRARY_PACKAGE_NAME libdravik1)
set(CPACK_DEBIAN_LIBRARY_PACKAGE_DEPENDS
    "${run_time}, libboost-filesystem${Boost_VERSION_STRING}")
set(CPACK_COMPONENT_LIBRARY_DESCRIPTION 
    "The library that a time synchronisation daemon loads, and its default documents.")
set(CPACK_DEBIAN_LIBRARY_PACKAGE_CONTROL_EXTRA ${CMAKE_CURRENT_LIST_DIR}/triggers)

set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME libdravik-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS "libdravik1 ${same_version}")
set(CPACK_COMPONENT_DEVELOPMENT_DESCRIPTION 
    "What a host is built with: headers, pkg-config file, CMake package.")

set(CPACK_DEBIAN_HOST_PACKAGE_NAME dravik-host)
set(CPACK_DEBIAN_HOST_PACKAGE_SECTION utils)
set(CPACK_DEBIAN_HOST_PACKAGE_DEPENDS "libdravik1 ${same_version}, ${run_time}, libfmt9")
set(CPACK_COMPONENT_HOST_DESCRIPTION 
    "The reference host: simulates, replays and disciplines clocks; tunes, measures and plots.")

include(CPack)
