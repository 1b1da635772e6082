# Everything about the project that is not behaviour, as tests with the label
# "check": layout, format, clang-tidy, the one-line build of the core, and the
# installed package as seen by a project outside.
find_program(QZTESSEL_CLANG_FORMAT NAMES clang-format-14 clang-format REQUIRED)
find_program(QZTESSEL_CLANG_TIDY NAMES clang-tidy-14 clang-tidy REQUIRED)

# Registers an executable script of cmake/checks as a test.
function(qztesselAddCheck name script)
  add_test(
    NAME check.${name}
    COMMAND ${PROJECT_SOURCE_DIR}/cmake/checks/${script} ${ARGN}
    WORKING_DIRECTORY ${PROJECT_SOURCE_DIR})
  set_tests_properties(check.${name} PROPERTIES LABELS check)
endfunction()

qztesselAddCheck(format format.sh ${QZTESSEL_CLANG_FORMAT})
qztesselAddCheck(includes includes.sh .)
qztesselAddCheck(includes-self-test includes-self-test.sh)
qztesselAddCheck(outside outside.sh ${CMAKE_CXX_COMPILER}
                 ${PROJECT_BINARY_DIR}/outside)
qztesselAddCheck(outside-tree outside-tree.sh ${CMAKE_CXX_COMPILER}
                 ${PROJECT_BINARY_DIR}/outside)
qztesselAddCheck(
  consumer consumer.sh ${CMAKE_COMMAND} ${CMAKE_CXX_COMPILER}
  ${PROJECT_BINARY_DIR} ${PROJECT_BINARY_DIR}/consumer)

qztesselAddCheck(packages packages.sh ${CMAKE_COMMAND}
                 ${PROJECT_BINARY_DIR} ${PROJECT_BINARY_DIR}/packages)

file(
  GLOB pages CONFIGURE_DEPENDS
  RELATIVE ${PROJECT_SOURCE_DIR}
  *.md bench/*.md docs/*.md)
qztesselAddCheck(documents documents.py --run
                 $<TARGET_FILE_DIR:qztessel_console> ${pages})

# One test per file, so that ctest -j spreads the slowest check of all.
file(
  GLOB_RECURSE tidySources CONFIGURE_DEPENDS
  RELATIVE ${PROJECT_SOURCE_DIR}
  archive/*.cpp
  bench/*.cpp
  binding/*.cpp
  coder/*.cpp
  examples/*.cpp
  fuzz/*.cpp
  hosts/*.cpp
  packing/*.cpp
  paths/*.cpp
  pathtree/*.cpp)
foreach(source IN LISTS tidySources)
  add_test(
    NAME tidy.${source}
    COMMAND ${QZTESSEL_CLANG_TIDY} --quiet -p ${PROJECT_BINARY_DIR} ${source}
    WORKING_DIRECTORY ${PROJECT_SOURCE_DIR})
  set_tests_properties(tidy.${source} PROPERTIES LABELS "check;tidy" COST 50)
endforeach()
