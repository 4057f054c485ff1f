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
set(CPACK_COMPONENTS_ALL library development)
set(CPACK_COMPONENT_LIBRARY_GROUP run_time)
set(CPACK_DEBIAN_RUN_TIME_PACKAGE_NAME libdravik1)
set(CPACK_COMPONENT_GROUP_RUN_TIME_DESCRIPTION
    "The library that a time synchronisation daemon loads, and its default documents.")
set(CPACK_DEBIAN_RUN_TIME_PACKAGE_CONTROL_EXTRA ${CMAKE_CURRENT_LIST_DIR}/triggers)
if(DRAVIK_SERVOS_DIR)
    # An upgrade keeps a document that was edited.
    list(APPEND CPACK_COMPONENTS_ALL documents)
    set(CPACK_COMPONENT_DOCUMENTS_GROUP run_time)
    file(WRITE ${PROJECT_BINARY_DIR}/conffiles
        "${DRAVIK_SERVOS_DIR}/dravik_tr_ptp4l_bc.json\n${DRAVIK_SERVOS_DIR}/dravik_tr_ptp4l_tab.json\n")
    list(APPEND CPACK_DEBIAN_RUN_TIME_PACKAGE_CONTROL_EXTRA ${PROJECT_BINARY_DIR}/conffiles)
endif()

set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME libdravik-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS "libdravik1 (= ${PROJECT_VERSION})")
set(CPACK_COMPONENT_DEVELOPMENT_DESCRIPTION
    "What a host is built with: headers, pkg-config file, CMake package.")

if(DRAVIK_HOST)
    list(APPEND CPACK_COMPONENTS_ALL host)
    set(CPACK_DEBIAN_HOST_PACKAGE_NAME dravik-host)
    set(CPACK_DEBIAN_HOST_PACKAGE_SECTION utils)
    set(CPACK_COMPONENT_HOST_DESCRIPTION
        "The reference host: simulates, replays and disciplines clocks; tunes, measures and plots.")
endif()

# What library and host need is read from the built files, when the packages are made.
configure_file(${CMAKE_CURRENT_LIST_DIR}/dependencies.cmake.in dependencies.cmake @ONLY)
set(CPACK_PROJECT_CONFIG_FILE ${PROJECT_BINARY_DIR}/dependencies.cmake)

include(CPack)
