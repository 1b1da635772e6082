# Adds the static library qztessel_NAME, which consumers know as
# qztessel::NAME, from the sources and headers of the given rooms. Includes are
# written from the root, here and in the installed package.
function(qztesselAddLibrary name)
  set(target qztessel_${name})
  list(TRANSFORM ARGN APPEND /*.cpp OUTPUT_VARIABLE sourcePatterns)
  list(TRANSFORM ARGN APPEND /*.hpp OUTPUT_VARIABLE headerPatterns)
  list(TRANSFORM sourcePatterns PREPEND ${PROJECT_SOURCE_DIR}/)
  list(TRANSFORM headerPatterns PREPEND ${PROJECT_SOURCE_DIR}/)
  file(GLOB sources CONFIGURE_DEPENDS ${sourcePatterns})
  file(GLOB headers CONFIGURE_DEPENDS ${headerPatterns})

  add_library(${target} STATIC ${sources})
  add_library(qztessel::${name} ALIAS ${target})
  target_sources(
    ${target}
    PUBLIC FILE_SET
           HEADERS
           BASE_DIRS
           ${PROJECT_SOURCE_DIR}
           FILES
           ${headers})
  target_compile_features(${target} PUBLIC cxx_std_20)
  # An installed library must not name a target that is not installed.
  target_link_libraries(${target} PRIVATE $<BUILD_INTERFACE:qztessel_options>)
  if(QZTESSEL_SANITIZE)
    # Sanitized tests spend their time here; a test itself compiles in a third
    # of the time without.
    target_compile_options(${target} PRIVATE -O1)
  endif()
  set_target_properties(
    ${target}
    PROPERTIES EXPORT_NAME ${name}
               CXX_EXTENSIONS OFF
               POSITION_INDEPENDENT_CODE ON
               CXX_VISIBILITY_PRESET hidden
               VISIBILITY_INLINES_HIDDEN ON
               VERIFY_INTERFACE_HEADER_SETS ON)
endfunction()
