# Installs the libraries, the public headers as <tavosso/NAME.h>, a CMake package and pkg-config files.
set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/tavosso)

set_target_properties(tavosso PROPERTIES INSTALL_RPATH $ORIGIN)
install(TARGETS tavosso tavosso-web EXPORT tavosso
        LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
        ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
        INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(FILES jwt/jwt.h sso/sso.h web/web.h DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/tavosso)
if(TARGET tavoplatform)
    install(TARGETS tavoplatform EXPORT tavosso LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} NAMELINK_SKIP)
endif()

install(EXPORT tavosso NAMESPACE tavosso:: DESTINATION ${package_dir})
configure_package_config_file(cmake/tavossoConfig.cmake.in tavossoConfig.cmake INSTALL_DESTINATION ${package_dir})
write_basic_package_version_file(tavossoConfigVersion.cmake COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/tavossoConfig.cmake ${PROJECT_BINARY_DIR}/tavossoConfigVersion.cmake
        DESTINATION ${package_dir})

# Relative to the pkg-config file, so the tree can be installed under any prefix, or moved.
file(RELATIVE_PATH prefix_from_pkgconfig /${CMAKE_INSTALL_LIBDIR}/pkgconfig /)
# Outside /usr, programs need a run path to find the library.
if(NOT CMAKE_INSTALL_PREFIX STREQUAL /usr)
    set(pkgconfig_run_path " -Wl,-rpath,\${libdir}")
endif()
configure_file(cmake/tavosso.pc.in tavosso.pc @ONLY)
configure_file(cmake/tavosso-web.pc.in tavosso-web.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/tavosso.pc ${PROJECT_BINARY_DIR}/tavosso-web.pc
        DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
