# Fails unless LIBRARY's dynamic symbol table defines exactly the functions
# that HEADER declares: every NAME (a regular expression) that follows PREFIX
# (another) and is followed by "(". The linker's own markers are not counted.
#
# cmake -DLIBRARY=... -DNM=... -DHEADER=... -DPREFIX=... -DNAME=... -P CheckExports.cmake
file(READ ${HEADER} header)
string(REGEX MATCHALL "${PREFIX}${NAME}\\(" declarations "${header}")
set(EXPECTED)
foreach(declaration ${declarations})
  string(REGEX MATCH "(${NAME})\\($" name "${declaration}")
  list(APPEND EXPECTED ${CMAKE_MATCH_1})
endforeach()
list(REMOVE_DUPLICATES EXPECTED)
list(SORT EXPECTED)

execute_process(COMMAND ${NM} -D --defined-only ${LIBRARY} OUTPUT_VARIABLE symbols
                RESULT_VARIABLE status)
if(NOT status EQUAL 0)
  message(FATAL_ERROR "nm failed on ${LIBRARY}")
endif()
string(REGEX MATCHALL "[^\n]+" lines "${symbols}")
set(exported)
foreach(line ${lines})
  # "address type name".
  if(line MATCHES "^[0-9a-f]+ [A-Za-z] ([^ ]+)$")
    set(symbol ${CMAKE_MATCH_1})
    if(NOT symbol MATCHES "^(_edata|_end|__bss_start|_init|_fini)$")
      list(APPEND exported ${symbol})
    endif()
  endif()
endforeach()
list(SORT exported)
if(NOT exported STREQUAL EXPECTED)
  message(FATAL_ERROR "${LIBRARY} exports\n  ${exported}\nbut should export\n  ${EXPECTED}")
endif()
list(LENGTH EXPECTED count)
message(STATUS "${LIBRARY} exports the ${count} expected symbols and nothing else")
