# Compares the symbols that a library exports with a list, one name on a line.
#   cmake -DNM=nm -DLIBRARY=libvmq.so -DLIST=exported_symbols -P exported_symbols.cmake
execute_process(COMMAND ${NM} --dynamic --defined-only --format=posix ${LIBRARY}
  OUTPUT_VARIABLE output COMMAND_ERROR_IS_FATAL ANY)
string(REGEX REPLACE " [^\n]*" "" exported "${output}")
file(READ ${LIST} expected)
if(NOT exported STREQUAL expected)
  message(FATAL_ERROR "${LIBRARY} exports\n${exported}instead of\n${expected}")
endif()
