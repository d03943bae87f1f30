# The installed tree: libraries, public headers side by side as <tavosso/NAME.h>, a CMake package, pkg-config files.
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

# Found from where the file itself lies, so that the tree may be installed under any prefix, or moved.
file(RELATIVE_PATH prefix_from_pkgconfig /${CMAKE_INSTALL_LIBDIR}/pkgconfig /)
# Programs find a library under a private prefix by a run path. Under /usr the loader finds it.
if(NOT CMAKE_INSTALL_PREFIX STREQUAL /usr)
    set(pkgconfig_run_path " -Wl,-rpath,\${libdir}")
endif()
configure_file(cmake/tavosso.pc.in tavosso.pc @ONLY)
configure_file(cmake/tavosso-web.pc.in tavosso-web.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/tavosso.pc ${PROJECT_BINARY_DIR}/tavosso-web.pc
        DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
