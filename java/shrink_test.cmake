# Release build in miniature: shrinks and obfuscates the test app together
# with the library jar under the app's rules and the library's consumer rules,
# then runs the app on the result with the real libVesk.so. Passes when the
# app exits with status 0.
#
# cmake -DPROGUARD=... -DJAVA=... -DLIBRARY_JAR=... -DAPP_JAR=... -DAPP_RULES=...
#       -DCONSUMER_RULES=... -DLIBRARY_DIR=... -DWORK_DIR=... -P shrink_test.cmake
foreach(_var PROGUARD JAVA LIBRARY_JAR APP_JAR APP_RULES CONSUMER_RULES LIBRARY_DIR WORK_DIR)
  if(NOT DEFINED ${_var})
    message(FATAL_ERROR "shrink_test.cmake needs -D${_var}=...")
  endif()
endforeach()

file(REMOVE_RECURSE ${WORK_DIR})
file(MAKE_DIRECTORY ${WORK_DIR})
set(_shrunk ${WORK_DIR}/app-release.jar)
execute_process(
  COMMAND ${PROGUARD} -injars ${LIBRARY_JAR} -injars ${APP_JAR} -outjars ${_shrunk}
          -include ${APP_RULES} -include ${CONSUMER_RULES}
          -printmapping ${WORK_DIR}/mapping.txt
  RESULT_VARIABLE _status
  OUTPUT_VARIABLE _log
  ERROR_VARIABLE _log)
file(WRITE ${WORK_DIR}/proguard.log "${_log}")
if(NOT _status EQUAL 0)
  message(FATAL_ERROR "ProGuard failed (${_status}):\n${_log}")
endif()

execute_process(
  COMMAND ${JAVA} -Djava.library.path=${LIBRARY_DIR} -cp ${_shrunk}
          com.velmar.android.orv.shrinktest.ShrinkTestApp
  RESULT_VARIABLE _status)
if(NOT _status EQUAL 0)
  message(FATAL_ERROR "the shrunk app failed (${_status}); the mapping is in ${WORK_DIR}/mapping.txt")
endif()
