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
qztesselAddCheck(
  consumer consumer.sh ${CMAKE_COMMAND} ${CMAKE_CXX_COMPILER}
  ${PROJECT_BINARY_DIR} ${PROJECT_BINARY_DIR}/consumer)

qztesselAddCheck(packages packages.sh ${CMAKE_COMMAND}
                 ${PROJECT_BINARY_DIR} ${PROJECT_BINARY_DIR}/packages)

set(hardened $<TARGET_FILE:qztessel>)
if(QZTESSEL_BUILD_COMMAND)
  list(APPEND hardened $<TARGET_FILE:qztessel_console>)
endif()
if(TARGET qztessel_python)
  list(APPEND hardened $<TARGET_FILE:qztessel_python>
       $<TARGET_FILE:qztessel_python_host>)
endif()
qztesselAddCheck(hardening hardening.sh ${hardened})

# The plug-in only: all of it takes as long as the first build did.
qztesselAddCheck(
  reproducible reproducible.sh ${CMAKE_COMMAND} ${PROJECT_BINARY_DIR}
  ${PROJECT_BINARY_DIR}/reproducible qztessel)

file(
  GLOB pages CONFIGURE_DEPENDS
  RELATIVE ${PROJECT_SOURCE_DIR}
  *.md bench/*.md docs/*.md)
qztesselAddCheck(documents documents.py --run
                 $<TARGET_FILE_DIR:qztessel_console> ${pages})

# clang-tidy. It stops to analyze a function after 20,000 steps, not 225,000: the
# analyzer takes a quarter of the time.
set(tidy ${QZTESSEL_CLANG_TIDY} --quiet)
foreach(word IN ITEMS -analyzer-config max-nodes=20000)
  list(APPEND tidy --extra-arg=-Xclang --extra-arg=${word})
endforeach()

# Runs clang-tidy over all sources of some folders, joined into one file: most of
# its time goes into the headers of libraries, which it reads only once then. So
# names of internal linkage must differ between these sources. Those with a main()
# may have the same names, because each is put into a namespace of its own.
function(qztesselAddTidyTest name)
  list(TRANSFORM ARGN APPEND "/*.cpp" OUTPUT_VARIABLE patterns)
  file(
    GLOB sources CONFIGURE_DEPENDS
    RELATIVE ${PROJECT_SOURCE_DIR}
    ${patterns})
  # It defines what another source of its folder does, if that is not built.
  list(REMOVE_ITEM sources bench/NoRivals.cpp)
  add_test(
    NAME tidy.${name}
    COMMAND
      cmake/checks/tidy.py ${PROJECT_BINARY_DIR}/tidy/${name}.cpp ${sources} --
      ${tidy} --config-file=${PROJECT_SOURCE_DIR}/.clang-tidy -- -std=c++20
      -I${PROJECT_SOURCE_DIR} -DQZTESSEL_PLUGIN="" -DQZTESSEL_MESSAGES=""
      ${systemIncludes}
    WORKING_DIRECTORY ${PROJECT_SOURCE_DIR})
  set_tests_properties(tidy.${name} PROPERTIES LABELS "check;tidy" COST 500)
endfunction()

set(systemIncludes)
if(TARGET qztessel_python)
  list(TRANSFORM QZTESSEL_PYTHON_INCLUDE_DIRS PREPEND -isystem
       OUTPUT_VARIABLE systemIncludes)
  qztesselAddTidyTest(python hosts/python)
  qztesselAddTidyTest(python-host hosts/python/host)
endif()
qztesselAddTidyTest(core packing pathtree coder paths)
qztesselAddTidyTest(archive archive)
qztesselAddTidyTest(hosts binding hosts/embedded hosts/patterns hosts/console)
qztesselAddTidyTest(programs bench examples hosts/embedded/demo hosts/minimal)
qztesselAddTidyTest(fuzz fuzz)
