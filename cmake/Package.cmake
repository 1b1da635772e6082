# Debian packages, made by cpack in the build folder:
#
#   tessel            the command, its pages and completions
#   libqztessel1      the plug-in and its messages
#   libqztessel-dev   libraries, headers, documents, examples
#   python3-qztessel  the Python package
#
# DEBFULLNAME and DEBEMAIL name the maintainer, as for Debian's own tools.
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME qztessel)
# Each package has a summary of its own.
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "")
set(CPACK_PACKAGE_VENDOR "the libqztessel authors")
set(CPACK_PACKAGE_CHECKSUM SHA256)
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_STRIP_FILES ON)
set(CPACK_VERBATIM_VARIABLES ON)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_ALL runtime development)
if(QZTESSEL_BUILD_COMMAND)
  list(APPEND CPACK_COMPONENTS_ALL command)
endif()
if(TARGET qztessel_python)
  list(APPEND CPACK_COMPONENTS_ALL python)
endif()
set(CPACK_COMPONENTS_GROUPING IGNORE)

set(maintainerName "$ENV{DEBFULLNAME}")
set(maintainerAddress "$ENV{DEBEMAIL}")
if(NOT maintainerName)
  set(maintainerName "the libqztessel authors")
endif()
if(NOT maintainerAddress)
  set(maintainerAddress libqztessel@packages.invalid)
endif()
set(CPACK_DEBIAN_PACKAGE_MAINTAINER "${maintainerName} <${maintainerAddress}>")

set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS ON)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)

set(CPACK_DEBIAN_COMMAND_PACKAGE_NAME tessel)
set(CPACK_DEBIAN_COMMAND_PACKAGE_SECTION utils)
set(CPACK_COMPONENT_COMMAND_DESCRIPTION
    "pack, search and fetch very large lists of paths
Keeps a list of ten million paths in fifty megabytes, looks into it, and gets
any of its paths back by number, by text or by pattern, without unpacking.
Order, repeats and every byte of the paths are kept.")

set(CPACK_DEBIAN_RUNTIME_PACKAGE_NAME libqztessel${PROJECT_VERSION_MAJOR})
set(CPACK_DEBIAN_RUNTIME_PACKAGE_SECTION libs)
set(CPACK_DEBIAN_RUNTIME_PACKAGE_CONTROL_EXTRA
    ${PROJECT_SOURCE_DIR}/cmake/debian/triggers)
set(CPACK_COMPONENT_RUNTIME_DESCRIPTION
    "plug-in for very large lists of paths
Adds a class that keeps millions of file paths in two fifths to half of the
memory that their text takes to a host environment that loads it.
.
This package has the shared library and the texts of its messages.")

set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME libqztessel-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS
    "libqztessel${PROJECT_VERSION_MAJOR} (= ${PROJECT_VERSION}), zlib1g-dev")
set(CPACK_COMPONENT_DEVELOPMENT_DESCRIPTION
    "very large lists of paths, kept small: libraries and headers
Keeps millions of file paths in memory, growing by batches, or as a finished
archive that is mapped and answers in a few microseconds.
.
This package has the static libraries, their headers, the CMake package and
the files for pkg-config.")

set(CPACK_DEBIAN_PYTHON_PACKAGE_NAME python3-qztessel)
set(CPACK_DEBIAN_PYTHON_PACKAGE_SECTION python)
set(CPACK_DEBIAN_PYTHON_PACKAGE_DEPENDS
    "python3 (>= 3.11~), python3 (<< 3.12), python3-numpy")
# PathList works without it; HuffmanPaths is its class.
set(CPACK_DEBIAN_PYTHON_PACKAGE_RECOMMENDS
    "libqztessel${PROJECT_VERSION_MAJOR} (= ${PROJECT_VERSION})")
set(CPACK_DEBIAN_PYTHON_PACKAGE_SUGGESTS python3-distributed)
set(CPACK_COMPONENT_PYTHON_DESCRIPTION
    "very large lists of paths that Python's processes share
Keeps millions of file paths in an archive that is mapped, and shows them as a
sequence: slices, shuffles and shards without copying, and searches on all
cores. Worker processes share one copy of the list.")

# ---- What only a Debian package has ----

# The day of the release is in the changelog's heading.
file(STRINGS CHANGELOG.md heading LIMIT_COUNT 1 REGEX "^## ")
if(NOT heading MATCHES "^## ${PROJECT_VERSION} \\(([0-9-]+)\\)$")
  message(FATAL_ERROR "CHANGELOG.md begins with '${heading}', not with"
                      " '## ${PROJECT_VERSION} (DATE)'")
endif()
set(releaseDay ${CMAKE_MATCH_1})
execute_process(
  COMMAND date --utc --rfc-email --date=${releaseDay}
  OUTPUT_VARIABLE releaseDate
  OUTPUT_STRIP_TRAILING_WHITESPACE COMMAND_ERROR_IS_FATAL ANY)
configure_file(cmake/debian/changelog.in ${PROJECT_BINARY_DIR}/debian/changelog)
# Without a name or a time inside, so that equal input gives equal packages.
execute_process(
  COMMAND gzip --best --no-name --force ${PROJECT_BINARY_DIR}/debian/changelog
          COMMAND_ERROR_IS_FATAL ANY)

# What each package holds and needs of others' code.
include(cmake/Sbom.cmake)
set(partsOfAll libc6 libgcc-s1 libstdc++6 libxxhash-dev zlib1g)
set(commandParts ${partsOfAll} libcli11-dev libfmt9 libre2-9 nlohmann-json3-dev)
set(runtimeParts ${partsOfAll})
set(developmentParts libxxhash-dev zlib1g-dev)
set(pythonParts ${partsOfAll} libfmt9 libre2-9 pybind11-dev python3 python3-numpy)

foreach(component IN LISTS CPACK_COMPONENTS_ALL)
  string(TOUPPER ${component} upperComponent)
  set(package ${CPACK_DEBIAN_${upperComponent}_PACKAGE_NAME})
  set(sbom ${PROJECT_BINARY_DIR}/debian/${component}/sbom.spdx.json)
  qztesselWriteSbom(${sbom} ${package} ${releaseDay} ${${component}Parts})
  install(
    FILES cmake/debian/copyright ${PROJECT_BINARY_DIR}/debian/changelog.gz ${sbom}
    DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/${package}
    COMPONENT ${component}
    EXCLUDE_FROM_ALL)
endforeach()

include(CPack)
