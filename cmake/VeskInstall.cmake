# `cmake --install` puts the C interface under the prefix: libvesk, its header
# vesk/vesk.h, a CMake package (find_package(Vesk CONFIG) gives Vesk::vesk)
# and a pkg-config file (vesk.pc). Both package files locate the prefix from
# their own place, so an installed tree may be moved.
include(CMakePackageConfigHelpers)

set(VESK_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/Vesk)

install(TARGETS vesk_c EXPORT VeskTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
install(FILES ${VESK_SOURCE_ROOT}/vesk/vesk.h DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/vesk)
install(EXPORT VeskTargets NAMESPACE Vesk:: DESTINATION ${VESK_CMAKE_DIR})

configure_package_config_file(${CMAKE_CURRENT_LIST_DIR}/VeskConfig.cmake.in
  ${PROJECT_BINARY_DIR}/VeskConfig.cmake INSTALL_DESTINATION ${VESK_CMAKE_DIR})
# Before 1.0 a minor release may change the interface.
write_basic_package_version_file(${PROJECT_BINARY_DIR}/VeskConfigVersion.cmake
  COMPATIBILITY SameMinorVersion)
install(FILES ${PROJECT_BINARY_DIR}/VeskConfig.cmake ${PROJECT_BINARY_DIR}/VeskConfigVersion.cmake
  DESTINATION ${VESK_CMAKE_DIR})

# The path from the pkg-config folder back to the prefix.
file(RELATIVE_PATH VESK_PC_TO_PREFIX /prefix/${CMAKE_INSTALL_LIBDIR}/pkgconfig /prefix)
string(REGEX REPLACE "/$" "" VESK_PC_TO_PREFIX "${VESK_PC_TO_PREFIX}")
configure_file(${CMAKE_CURRENT_LIST_DIR}/vesk.pc.in ${PROJECT_BINARY_DIR}/vesk.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/vesk.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

# The install and both package files, tested from a program outside the
# build (examples/c). Not for cross or sanitizer builds, whose libraries a
# plain host compiler cannot link.
if(VESK_BUILD_TESTS AND NOT CMAKE_CROSSCOMPILING AND NOT VESK_SANITIZE)
  add_test(NAME install_c_example
    COMMAND ${PROJECT_SOURCE_DIR}/examples/c/install_test.sh ${PROJECT_BINARY_DIR})
  set_tests_properties(install_c_example PROPERTIES LABELS unit)
endif()
