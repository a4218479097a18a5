# Toolchain for the 32-bit x86 build, the closest stand-in on a Debian host for
# the Android x86 ABI: i686 code with SSSE3 and SSE floating point, linked
# against the i386 packages of Debian multiarch.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR i686)
set(CMAKE_C_COMPILER gcc)
set(CMAKE_CXX_COMPILER g++)
set(CMAKE_LIBRARY_ARCHITECTURE i386-linux-gnu)
# Tuned for current processors as the NDK's clang does by default: with
# -march=i686 alone GCC also tunes for the Pentium Pro and splits every
# unaligned vector load in two (the DSSS decoder ran 20-25% slower).
set(_vesk_i686_flags "-m32 -march=i686 -mssse3 -mfpmath=sse -mtune=generic")
set(CMAKE_C_FLAGS_INIT "${_vesk_i686_flags}")
set(CMAKE_CXX_FLAGS_INIT "${_vesk_i686_flags}")
set(CMAKE_EXE_LINKER_FLAGS_INIT "-m32")
set(CMAKE_SHARED_LINKER_FLAGS_INIT "-m32")
set(CMAKE_MODULE_LINKER_FLAGS_INIT "-m32")
# Look for libraries and packages in the i386 multiarch directories only.
set(CMAKE_FIND_ROOT_PATH /usr/lib/i386-linux-gnu)
set(CMAKE_IGNORE_PATH /usr/lib/x86_64-linux-gnu /usr/lib/x86_64-linux-gnu/android
                      /usr/lib/x86_64-linux-gnu/cmake)
set(CMAKE_PREFIX_PATH /usr/lib/i386-linux-gnu/cmake)
# pkg-config must see the i386 packages only (a package missing there, such as
# libsndfile, then leaves its tool out instead of linking the wrong ABI).
set(ENV{PKG_CONFIG_LIBDIR} "/usr/lib/i386-linux-gnu/pkgconfig:/usr/share/pkgconfig")
