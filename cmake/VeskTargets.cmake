# Small helpers so that every subsystem declares its library, tests and
# benchmarks the same way.

# vesk_library(<name> SOURCES <files...> DEPS <targets...>)
# One static library per subsystem; position-independent so that libVesk.so
# can link them all.
function(vesk_library name)
  cmake_parse_arguments(ARG "" "" "SOURCES;DEPS" ${ARGN})
  add_library(${name} STATIC ${ARG_SOURCES})
  target_include_directories(${name} PUBLIC ${VESK_SOURCE_ROOT})
  target_link_libraries(${name} PUBLIC ${ARG_DEPS})
endfunction()

# vesk_test(<name> SOURCES <files...> DEPS <targets...> [LABELS <label>])
# A GoogleTest executable whose tests are registered with CTest one by one.
function(vesk_test name)
  if(NOT VESK_BUILD_TESTS)
    return()
  endif()
  cmake_parse_arguments(ARG "" "" "SOURCES;DEPS;LABELS" ${ARGN})
  add_executable(${name} ${ARG_SOURCES})
  target_link_libraries(${name} PRIVATE ${ARG_DEPS} GTest::gmock GTest::gtest GTest::gtest_main)
  # One label per test ("unit" unless given): discovered tests take their
  # properties as plain key-value pairs.
  set(_label unit)
  if(ARG_LABELS)
    list(GET ARG_LABELS 0 _label)
  endif()
  gtest_discover_tests(${name} DISCOVERY_TIMEOUT 120 PROPERTIES LABELS ${_label})
endfunction()

# vesk_benchmark(<name> SOURCES <files...> DEPS <targets...>)
# A Google Benchmark program; run by hand or by scripts/bench.sh, never by CTest.
function(vesk_benchmark name)
  if(NOT VESK_BUILD_BENCHMARKS)
    return()
  endif()
  cmake_parse_arguments(ARG "" "" "SOURCES;DEPS" ${ARGN})
  add_executable(${name} ${ARG_SOURCES})
  target_link_libraries(${name} PRIVATE ${ARG_DEPS} benchmark::benchmark benchmark::benchmark_main)
endfunction()

# vesk_fuzzer(<name> SOURCES <files...> DEPS <targets...>)
# A libFuzzer target, built only with VESK_FUZZ; scripts/fuzz.sh runs it with
# the seed corpus in <name>_corpus/ beside its source.
function(vesk_fuzzer name)
  if(NOT VESK_FUZZ)
    return()
  endif()
  cmake_parse_arguments(ARG "" "" "SOURCES;DEPS" ${ARGN})
  add_executable(${name} ${ARG_SOURCES})
  target_link_libraries(${name} PRIVATE ${ARG_DEPS})
  target_link_options(${name} PRIVATE -fsanitize=fuzzer)
  set_property(GLOBAL APPEND PROPERTY VESK_FUZZERS
               "${name}=${CMAKE_CURRENT_SOURCE_DIR}/${name}_corpus")
endfunction()
