# Adds the static library qztessel_NAME, which consumers know as
# qztessel::NAME, from the sources and headers of the given rooms. Includes are
# written from the root, here and in the installed package.
#
#   qztesselAddLibrary(NAME ROOM... [PUBLIC_HEADERS FILE...])
#
# PUBLIC_HEADERS are those that a consumer may include, and what they include;
# only they are installed. Without the list, all headers are public.
function(qztesselAddLibrary name)
  cmake_parse_arguments(PARSE_ARGV 1 arg "" "" PUBLIC_HEADERS)
  set(target qztessel_${name})
  set(rooms ${arg_UNPARSED_ARGUMENTS})
  list(TRANSFORM rooms APPEND /*.cpp OUTPUT_VARIABLE sourcePatterns)
  list(TRANSFORM rooms APPEND /*.hpp OUTPUT_VARIABLE headerPatterns)
  list(TRANSFORM sourcePatterns PREPEND ${PROJECT_SOURCE_DIR}/)
  list(TRANSFORM headerPatterns PREPEND ${PROJECT_SOURCE_DIR}/)
  file(GLOB sources CONFIGURE_DEPENDS ${sourcePatterns})
  file(GLOB headers CONFIGURE_DEPENDS ${headerPatterns})
  set(publicHeaders ${headers})
  if(arg_PUBLIC_HEADERS)
    set(publicHeaders ${arg_PUBLIC_HEADERS})
    list(TRANSFORM publicHeaders PREPEND ${PROJECT_SOURCE_DIR}/)
  endif()
  list(REMOVE_ITEM headers ${publicHeaders})
  # A header that no source of its name includes first (includes.sh sees to
  # that) is compiled by itself, to show that it needs nothing before it.
  set(headersAlone ${publicHeaders})
  foreach(source IN LISTS sources)
    string(REGEX REPLACE "cpp$" "hpp" header ${source})
    list(REMOVE_ITEM headersAlone ${header})
  endforeach()
  list(REMOVE_ITEM publicHeaders ${headersAlone})

  add_library(${target} STATIC ${sources} ${headers})
  add_library(qztessel::${name} ALIAS ${target})
  target_sources(
    ${target}
    PUBLIC FILE_SET
           HEADERS
           BASE_DIRS
           ${PROJECT_SOURCE_DIR}
           FILES
           ${publicHeaders}
           FILE_SET
           headersAlone
           TYPE
           HEADERS
           BASE_DIRS
           ${PROJECT_SOURCE_DIR}
           FILES
           ${headersAlone})
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
               VERIFY_INTERFACE_HEADER_SETS ON
               INTERFACE_HEADER_SETS_TO_VERIFY headersAlone)
endfunction()

# For a program that is compiled without optimization and linked to libraries of
# ours that are optimized, as the sanitized tests are. The linker keeps the first
# copy of an inline function that it meets. The libraries come before the
# program's own files, so that their copies are kept: tests run five times as
# fast.
function(qztesselPreferCopiesOf target)
  if(QZTESSEL_SANITIZE)
    foreach(library IN LISTS ARGN)
      target_link_options(
        ${target} PRIVATE
        "SHELL:LINKER:--whole-archive $<TARGET_FILE:${library}> LINKER:--no-whole-archive"
      )
    endforeach()
  endif()
endfunction()
