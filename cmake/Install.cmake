# What cmake --install copies, and as which component (docs/building.md lists
# them). Headers keep their rooms under include/qztessel, so that a consumer
# writes the same #include lines as the library itself. Every path is relative
# to the prefix, which may be chosen at installation, and moved afterwards.
include(CMakePackageConfigHelpers)

set(headerFolder ${CMAKE_INSTALL_INCLUDEDIR}/qztessel)
set(packageFolder ${CMAKE_INSTALL_LIBDIR}/cmake/qztessel)
set(dataFolder ${CMAKE_INSTALL_DATADIR}/qztessel)
set(messageFolder ${dataFolder}/messages)

# ---- The plug-in, for hosts ----

install(
  TARGETS qztessel
  EXPORT qztessel-targets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
          COMPONENT runtime
          NAMELINK_COMPONENT development)
install(
  DIRECTORY hosts/embedded/messages/
  DESTINATION ${messageFolder}
  COMPONENT runtime)

# ---- Libraries and headers, for programs ----

install(
  TARGETS qztessel_core qztessel_paths qztessel_archive qztessel_embedded
  EXPORT qztessel-targets
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT development
  FILE_SET HEADERS
  DESTINATION ${headerFolder}
  COMPONENT development
  FILE_SET headersAlone
  DESTINATION ${headerFolder}
  COMPONENT development
  INCLUDES
  DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(
  FILES binding/HostInterface.hpp
  DESTINATION ${headerFolder}/binding
  COMPONENT development)
install(
  DIRECTORY qztessel/
  DESTINATION ${headerFolder}
  COMPONENT development
  FILES_MATCHING
  PATTERN *.hpp)

# ---- CMake package and pkg-config ----

install(
  EXPORT qztessel-targets
  NAMESPACE qztessel::
  DESTINATION ${packageFolder}
  COMPONENT development)
configure_package_config_file(
  cmake/qztessel-config.cmake.in ${PROJECT_BINARY_DIR}/qztessel-config.cmake
  INSTALL_DESTINATION ${packageFolder}
  PATH_VARS messageFolder
  NO_SET_AND_CHECK_MACRO)
write_basic_package_version_file(
  ${PROJECT_BINARY_DIR}/qztessel-config-version.cmake
  COMPATIBILITY SameMajorVersion)
install(
  FILES ${PROJECT_BINARY_DIR}/qztessel-config.cmake
        ${PROJECT_BINARY_DIR}/qztessel-config-version.cmake
  DESTINATION ${packageFolder}
  COMPONENT development)

file(RELATIVE_PATH pcPrefix "/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/")
# Writes NAME.pc.
#
# requires  other packages, as pkg-config lists them
# libs      the flags that link this library
function(qztesselAddPkgConfig name description requires libs)
  configure_file(cmake/library.pc.in ${PROJECT_BINARY_DIR}/${name}.pc @ONLY)
  install(
    FILES ${PROJECT_BINARY_DIR}/${name}.pc
    DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig
    COMPONENT development)
endfunction()
qztesselAddPkgConfig(qztessel "The coder" zlib "-lqztessel_core -pthread")
qztesselAddPkgConfig(qztessel-paths "Lists that grow, in memory" qztessel
                     -lqztessel_paths)
qztesselAddPkgConfig(
  qztessel-embedded "A host for the plug-in" qztessel-paths
  "-lqztessel_embedded -ldl -Wl,--undefined=VXHostInterface\
 -Wl,--export-dynamic-symbol=VXHostInterface")
qztesselAddPkgConfig(qztessel-archive "Finished lists, in files" qztessel
                     -lqztessel_archive)

# ---- Documents ----

install(
  FILES LICENSE README.md CHANGELOG.md
  DESTINATION ${CMAKE_INSTALL_DOCDIR}
  COMPONENT development)
install(
  DIRECTORY docs/
  DESTINATION ${CMAKE_INSTALL_DOCDIR}/docs
  COMPONENT development
  FILES_MATCHING
  PATTERN *.md)
install(
  DIRECTORY examples/
  DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples
  COMPONENT development
  FILES_MATCHING
  PATTERN *.cpp
  PATTERN *.md)
