# What others build against: a pkg-config file and a CMake package, both free to be moved with the
# tree that they are installed in.
include(CMakePackageConfigHelpers)

set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/velksharing)
file(RELATIVE_PATH VELK_PREFIX_FROM_PKGCONFIG
     ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig ${CMAKE_INSTALL_PREFIX})

configure_file(cmake/velksharing.pc.in velksharing.pc @ONLY)
configure_package_config_file(cmake/velksharing-config.cmake.in velksharing-config.cmake
                              INSTALL_DESTINATION ${package_dir})
write_basic_package_version_file(velksharing-config-version.cmake COMPATIBILITY SameMajorVersion)

install(FILES ${CMAKE_CURRENT_BINARY_DIR}/velksharing.pc
        DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/velksharing-config.cmake
              ${CMAKE_CURRENT_BINARY_DIR}/velksharing-config-version.cmake
        DESTINATION ${package_dir})
install(EXPORT velksharing-targets NAMESPACE velksharing:: DESTINATION ${package_dir})
