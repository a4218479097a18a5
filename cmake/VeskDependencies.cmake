# Locates the project's external dependencies. Every one of them is an
# installed package (Debian's on a host build, the NDK's or a prefix given with
# CMAKE_PREFIX_PATH on an Android build); nothing is vendored.

# The WebAssembly build has dependencies of its own.
if(EMSCRIPTEN)
  include(VeskWasmDependencies)
  return()
endif()

# kissfft, single-precision float build.
find_package(kissfft CONFIG QUIET COMPONENTS SHARED float)
if(TARGET kissfft::kissfft-float)
  add_library(vesk_kissfft INTERFACE)
  target_link_libraries(vesk_kissfft INTERFACE kissfft::kissfft-float)
else()
  # Android builds (or hosts without the CMake package): a kissfft built for
  # the target ABI, found through CMAKE_PREFIX_PATH or KISSFFT_ROOT.
  find_path(KISSFFT_INCLUDE_DIR kiss_fft.h
            HINTS ${KISSFFT_ROOT} PATH_SUFFIXES include/kissfft include kissfft)
  find_library(KISSFFT_LIBRARY NAMES kissfft-float kissfft HINTS ${KISSFFT_ROOT}
               PATH_SUFFIXES lib)
  if(NOT KISSFFT_INCLUDE_DIR OR NOT KISSFFT_LIBRARY)
    message(FATAL_ERROR "kissfft (float) not found: install libkissfft-dev, or set "
                        "KISSFFT_ROOT to a kissfft built for this ABI")
  endif()
  add_library(vesk_kissfft INTERFACE)
  target_include_directories(vesk_kissfft INTERFACE ${KISSFFT_INCLUDE_DIR})
  target_compile_definitions(vesk_kissfft INTERFACE kiss_fft_scalar=float)
  target_link_libraries(vesk_kissfft INTERFACE ${KISSFFT_LIBRARY})
endif()

# Android's liblog: part of the NDK; on Debian hosts android-liblog-dev
# installs the same API under an "android" subdirectory.
if(ANDROID)
  find_library(VESK_LIBLOG log REQUIRED)
  add_library(vesk_liblog INTERFACE)
  target_link_libraries(vesk_liblog INTERFACE ${VESK_LIBLOG})
else()
  find_path(VESK_LIBLOG_INCLUDE_DIR android/log.h PATH_SUFFIXES android REQUIRED)
  find_library(VESK_LIBLOG log PATH_SUFFIXES android REQUIRED)
  get_filename_component(_vesk_liblog_dir ${VESK_LIBLOG} DIRECTORY)
  add_library(vesk_liblog INTERFACE)
  target_include_directories(vesk_liblog INTERFACE ${VESK_LIBLOG_INCLUDE_DIR})
  target_link_libraries(vesk_liblog INTERFACE ${VESK_LIBLOG})
  # The Debian library lives outside the loader's default path.
  target_link_options(vesk_liblog INTERFACE "LINKER:-rpath,${_vesk_liblog_dir}")
endif()

# JNI headers: from the NDK sysroot on Android, from the JDK on hosts. Only
# the headers are needed (the library is loaded by a JVM, never links one), so
# the same JDK serves the 32-bit build.
add_library(vesk_jni_headers INTERFACE)
if(NOT ANDROID)
  find_path(VESK_JNI_INCLUDE_DIR jni.h
            HINTS $ENV{JAVA_HOME}/include /usr/lib/jvm/default-java/include
                  /usr/lib/jvm/java-17-openjdk-amd64/include
            NO_CMAKE_FIND_ROOT_PATH REQUIRED)
  target_include_directories(vesk_jni_headers INTERFACE ${VESK_JNI_INCLUDE_DIR}
                                                        ${VESK_JNI_INCLUDE_DIR}/linux)
endif()

if(VESK_BUILD_TESTS)
  find_package(GTest REQUIRED)
  include(GoogleTest)
endif()
if(VESK_BUILD_BENCHMARKS)
  find_package(benchmark REQUIRED)
endif()
