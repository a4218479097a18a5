# Fails unless LIBRARY's dynamic symbol table defines exactly the JNI entry
# points of NativeDecoder and NativeEncoder.
execute_process(COMMAND ${NM} -D --defined-only ${LIBRARY} OUTPUT_VARIABLE symbols
                RESULT_VARIABLE status)
if(NOT status EQUAL 0)
  message(FATAL_ERROR "nm failed on ${LIBRARY}")
endif()
string(REGEX MATCHALL "[^\n]+" lines "${symbols}")
set(exported)
foreach(line ${lines})
  # "address type name": keep text symbols.
  if(line MATCHES "^[0-9a-f]+ T (.+)$")
    list(APPEND exported ${CMAKE_MATCH_1})
  endif()
endforeach()
list(SORT exported)
set(prefix_d Java_com_velmar_android_orv_audiomodem_NativeDecoder_)
set(prefix_e Java_com_velmar_android_orv_audiomodem_NativeEncoder_)
set(expected
  ${prefix_d}nativeDetectBroadcaster ${prefix_d}nativeGetMaxSafeInputSize
  ${prefix_d}nativeGetTokens ${prefix_d}nativeInitializeDsss ${prefix_d}nativeInitializeDtmf
  ${prefix_d}nativeProcessSamples ${prefix_d}nativeProcessSamplesWithZintar
  ${prefix_d}nativeRelease ${prefix_d}nativeWipeInternalData
  ${prefix_e}nativeEncode ${prefix_e}nativeInitializeDsss ${prefix_e}nativeInitializeDtmf
  ${prefix_e}nativeRelease)
list(SORT expected)
if(NOT exported STREQUAL expected)
  message(FATAL_ERROR "libVesk.so exports\n  ${exported}\nbut should export\n  ${expected}")
endif()
message(STATUS "libVesk.so exports the 13 entry points and nothing else")
