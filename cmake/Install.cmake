# Headers keep their folders under include/qztessel, so that a consumer writes
# the same #include lines as the library itself.
include(CMakePackageConfigHelpers)

set(headerFolder ${CMAKE_INSTALL_INCLUDEDIR}/qztessel)
set(packageFolder ${CMAKE_INSTALL_LIBDIR}/cmake/qztessel)

install(
  TARGETS qztessel_core
  EXPORT qztessel-targets
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  FILE_SET HEADERS
  DESTINATION ${headerFolder})
if(TARGET qztessel)
  install(
    TARGETS qztessel
    EXPORT qztessel-targets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR})
endif()
if(EXISTS ${PROJECT_SOURCE_DIR}/binding/HostInterface.hpp)
  install(FILES binding/HostInterface.hpp DESTINATION ${headerFolder}/binding)
endif()

install(
  EXPORT qztessel-targets
  NAMESPACE qztessel::
  DESTINATION ${packageFolder})
configure_package_config_file(
  cmake/qztessel-config.cmake.in ${PROJECT_BINARY_DIR}/qztessel-config.cmake
  INSTALL_DESTINATION ${packageFolder}
  NO_SET_AND_CHECK_MACRO)
write_basic_package_version_file(
  ${PROJECT_BINARY_DIR}/qztessel-config-version.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/qztessel-config.cmake
              ${PROJECT_BINARY_DIR}/qztessel-config-version.cmake
        DESTINATION ${packageFolder})

# The package may be moved as a whole, so its prefix is relative.
file(RELATIVE_PATH pcPrefix "/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/")
configure_file(cmake/qztessel.pc.in ${PROJECT_BINARY_DIR}/qztessel.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/qztessel.pc
        DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
