# qztessel_options carries what every target of ours is compiled with and no
# consumer should inherit: warnings and sanitizers. Link it PRIVATE.
add_library(qztessel_options INTERFACE)

target_compile_options(
  qztessel_options
  INTERFACE -Wall
            -Wextra
            -Wpedantic
            -Wconversion
            -Wsign-conversion
            -Wshadow
            -Wnon-virtual-dtor
            -Wold-style-cast
            $<$<CXX_COMPILER_ID:Clang>:-Wthread-safety>
            $<$<BOOL:${QZTESSEL_WERROR}>:-Werror>)

# Release keeps the containers unchecked. Elsewhere an index outside a vector
# ends the program, also where no sanitizer would see it.
target_compile_definitions(
  qztessel_options
  INTERFACE $<$<NOT:$<CONFIG:Release,MinSizeRel>>:_GLIBCXX_ASSERTIONS>)

# What makes a fault harder to exploit. A test reads it back from what was built.
if(NOT QZTESSEL_SANITIZE)
  target_compile_options(qztessel_options INTERFACE -fstack-protector-strong)
  # Works on optimized code only.
  target_compile_definitions(
    qztessel_options INTERFACE $<$<CONFIG:Release,RelWithDebInfo>:_FORTIFY_SOURCE=2>)
  target_link_options(qztessel_options INTERFACE LINKER:-z,relro LINKER:-z,now
                      LINKER:-z,noexecstack)
endif()

# In a unit of several sources, each of them looks like a header to this warning.
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  target_compile_options(
    qztessel_options
    INTERFACE $<$<BOOL:$<TARGET_PROPERTY:UNITY_BUILD>>:-Wno-subobject-linkage>)
endif()

if(QZTESSEL_SANITIZE)
  set(sanitizers -fsanitize=${QZTESSEL_SANITIZE} -fno-sanitize-recover=all)
  if(QZTESSEL_SANITIZE MATCHES "undefined")
    # Path numbers arrive as floating point; not every compiler's group has it.
    list(APPEND sanitizers -fsanitize=float-cast-overflow)
  endif()
  target_compile_options(
    qztessel_options INTERFACE -fno-omit-frame-pointer ${sanitizers})
  # Tests do without these three checks, and compile in two thirds of the time. They
  # look at each access to memory, and the address sanitizer finds most of the same
  # faults. Our libraries keep them.
  if(QZTESSEL_SANITIZE MATCHES "address" AND QZTESSEL_SANITIZE MATCHES "undefined")
    target_compile_options(
      qztessel_options
      INTERFACE $<$<BOOL:$<TARGET_PROPERTY:QZTESSEL_IS_TEST>>:-fno-sanitize=null,alignment,vptr>
    )
  endif()
  target_link_options(qztessel_options INTERFACE ${sanitizers})
endif()

# Counts which lines and branches of ours are run. Tests and the headers of
# others are not counted, which makes the counting cheap. Threads count, too, so
# counters are atomic.
if(CMAKE_BUILD_TYPE STREQUAL "Coverage")
  set(rooms packing pathtree coder archive paths binding)
  list(JOIN rooms "|" rooms)
  target_compile_options(
    qztessel_options
    INTERFACE --coverage -fprofile-update=prefer-atomic
              "-fprofile-filter-files=(^|/)(${rooms})/[^/]*$"
              "-fprofile-exclude-files=/tests/")
  target_link_options(qztessel_options INTERFACE --coverage)
endif()
