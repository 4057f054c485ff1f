# What an installation has: the library, its three headers, a pkg-config file and a CMake package for
# hosts, the default documents, and the reference host. All of it follows DESTDIR.
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/dravik)

install(TARGETS dravik EXPORT dravikTargets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
    COMPONENT library NAMELINK_COMPONENT development
    INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})

install(DIRECTORY include/zvckmservo include/zverr DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
    COMPONENT development)
install(EXPORT dravikTargets NAMESPACE dravik:: DESTINATION ${package_dir} COMPONENT development)
configure_package_config_file(cmake/dravikConfig.cmake.in dravikConfig.cmake
    INSTALL_DESTINATION ${package_dir})
write_basic_package_version_file(dravikConfigVersion.cmake COMPATIBILITY SameMajorVersion)
# Relative, so that an installation can be moved; the full names, as a folder may be an absolute one.
file(RELATIVE_PATH include_from_pkgconfig
    ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig ${CMAKE_INSTALL_FULL_INCLUDEDIR})
configure_file(cmake/dravik.pc.in dravik.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/dravikConfig.cmake ${PROJECT_BINARY_DIR}/dravikConfigVersion.cmake
    DESTINATION ${package_dir} COMPONENT development)
install(FILES ${PROJECT_BINARY_DIR}/dravik.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig
    COMPONENT development)

if(DRAVIK_HOST)
    install(TARGETS dravik_host RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT host)
    install(FILES host/completion/dravik-host
        DESTINATION ${CMAKE_INSTALL_DATADIR}/bash-completion/completions COMPONENT host)
    install(FILES examples/dravik-host.service
        DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/dravik-host/examples COMPONENT host)
    find_program(SCDOC scdoc)
endif()
if(DRAVIK_HOST AND SCDOC)
    foreach(page dravik-host.1 dravik-servo-document.5)
        cmake_path(GET page EXTENSION LAST_ONLY section)
        string(SUBSTRING ${section} 1 -1 section)
        set(source ${PROJECT_SOURCE_DIR}/docs/man/${page}.scd)
        add_custom_command(OUTPUT ${page} DEPENDS ${source} VERBATIM
            COMMAND ${SCDOC} < ${source} > ${page})
        install(FILES ${PROJECT_BINARY_DIR}/${page}
            DESTINATION ${CMAKE_INSTALL_MANDIR}/man${section} COMPONENT host)
        list(APPEND pages ${PROJECT_BINARY_DIR}/${page})
    endforeach()
    add_custom_target(manual ALL DEPENDS ${pages})
endif()

# Last, as it is the one directory outside of the prefix: where the plug-in looks for its default
# documents in the standard layout.
set(DRAVIK_SERVOS_DIR /usr/lib/arm-linux-gnueabi/zv-chronel/servos CACHE PATH
    "Directory of the default documents; empty: they are not installed")
if(DRAVIK_SERVOS_DIR)
    configure_file(cmake/installDocuments.cmake.in installDocuments.cmake @ONLY)
    install(SCRIPT ${PROJECT_BINARY_DIR}/installDocuments.cmake COMPONENT documents)
endif()
