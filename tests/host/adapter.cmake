# Usage: cmake -D DOCUMENT=... -D SOURCE=... -P adapter.cmake
#
# Puts the two C++ blocks of the document, the adapter and the program that
# uses it, into one source file. Fails if the adapter has 150 lines or more.
function(takeBlock text block rest)
  set(open "```cpp\n")
  set(close "\n```")
  string(FIND "${text}" "${open}" begin)
  if(begin EQUAL -1)
    message(FATAL_ERROR "${DOCUMENT} does not have two blocks of C++")
  endif()
  string(LENGTH "${open}" openLength)
  math(EXPR begin "${begin} + ${openLength}")
  string(SUBSTRING "${text}" ${begin} -1 text)
  string(FIND "${text}" "${close}" end)
  string(SUBSTRING "${text}" 0 ${end} inside)
  string(SUBSTRING "${text}" ${end} -1 after)
  set(${block} "${inside}\n" PARENT_SCOPE)
  set(${rest} "${after}" PARENT_SCOPE)
endfunction()

file(READ "${DOCUMENT}" text)
takeBlock("${text}" adapter text)
takeBlock("${text}" program text)

string(REGEX MATCHALL "\n" lines "${adapter}")
list(LENGTH lines lineCount)
if(NOT lineCount LESS 150)
  message(FATAL_ERROR "the adapter in ${DOCUMENT} has ${lineCount} lines")
endif()
file(WRITE "${SOURCE}" "${adapter}${program}")
