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

# clang-tidy, in two passes. The plain checks spend most of their time in the
# headers of libraries, so the source files of a folder are joined into a few
# units for them. The static analyzer finds faults only in the main file of a
# unit, so it is run on each source file alone. It stops at a function after
# 60,000 steps instead of 225,000, which takes a third to a half of the time.
set(plainChecks --config-file=${PROJECT_SOURCE_DIR}/.clang-tidy
                --checks=-clang-analyzer-*)
set(analyzerChecks --checks=-*,clang-analyzer-*)
foreach(word IN ITEMS -analyzer-config max-nodes=60000)
  list(APPEND analyzerChecks --extra-arg=-Xclang --extra-arg=${word})
endforeach()

function(qztesselAddTidyTest name)
  add_test(
    NAME tidy.${name}
    COMMAND ${QZTESSEL_CLANG_TIDY} --quiet ${ARGN}
    WORKING_DIRECTORY ${PROJECT_SOURCE_DIR})
  set_tests_properties(tidy.${name} PROPERTIES LABELS "check;tidy" COST 50)
endfunction()

# The plain checks over a room's sources, in units of at most twelve files.
function(qztesselTidyRoom room)
  file(
    GLOB sources CONFIGURE_DEPENDS
    RELATIVE ${PROJECT_SOURCE_DIR}
    ${PROJECT_SOURCE_DIR}/${room}/*.cpp)
  set(number 0)
  while(sources)
    list(SUBLIST sources 0 12 files)
    list(REMOVE_ITEM sources ${files})
    list(TRANSFORM files REPLACE "(.+)"
         "#include \"\\1\"  // NOLINT(bugprone-suspicious-include)\n")
    string(JOIN "" text ${files})
    set(unit ${PROJECT_BINARY_DIR}/tidy/${room}/unit-${number}.cpp)
    file(CONFIGURE OUTPUT ${unit} CONTENT "${text}" @ONLY)
    qztesselAddTidyTest(${room}-${number} ${plainChecks} ${unit} --
                        -std=c++20 -I${PROJECT_SOURCE_DIR} ${systemIncludes})
    math(EXPR number "${number} + 1")
  endwhile()
endfunction()

set(rooms packing pathtree coder paths archive binding hosts/embedded
          hosts/console hosts/patterns)
set(systemIncludes)
if(TARGET qztessel_python)
  list(APPEND rooms hosts/python hosts/python/host)
  list(TRANSFORM QZTESSEL_PYTHON_INCLUDE_DIRS PREPEND -isystem
       OUTPUT_VARIABLE systemIncludes)
endif()
foreach(room IN LISTS rooms)
  qztesselTidyRoom(${room})
endforeach()

list(TRANSFORM rooms APPEND /*.cpp OUTPUT_VARIABLE patterns)
file(
  GLOB sources CONFIGURE_DEPENDS
  RELATIVE ${PROJECT_SOURCE_DIR}
  ${patterns})
foreach(source IN LISTS sources)
  qztesselAddTidyTest(${source} ${analyzerChecks} -p ${PROJECT_BINARY_DIR}
                      ${source})
endforeach()

# Programs have a main each: all checks, file by file.
file(
  GLOB_RECURSE programs CONFIGURE_DEPENDS
  RELATIVE ${PROJECT_SOURCE_DIR}
  bench/*.cpp
  examples/*.cpp
  fuzz/*.cpp
  hosts/embedded/demo/*.cpp
  hosts/minimal/*.cpp)
foreach(source IN LISTS programs)
  qztesselAddTidyTest(${source} -p ${PROJECT_BINARY_DIR} ${source})
endforeach()
