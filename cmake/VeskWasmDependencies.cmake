# Dependencies of the WebAssembly build (Emscripten), which builds the
# libraries and the C interface only.
#
# kissfft: no binary package targets WebAssembly (Debian's libkissfft-dev
# holds host objects), so its float sources, kiss_fft.c and kiss_fftr.c (what
# its own float library holds), are compiled here with this build's flags
# from a source tree that scripts/build-web.sh fetches from Debian's source
# package: the same version, with the same patches, as the host build's.
set(KISSFFT_SOURCE_DIR "" CACHE PATH "kissfft source tree for the WebAssembly build")
if(NOT EXISTS "${KISSFFT_SOURCE_DIR}/kiss_fftr.c")
  message(FATAL_ERROR "KISSFFT_SOURCE_DIR must name a kissfft source tree "
                      "(scripts/build-web.sh fetches one)")
endif()
add_library(vesk_kissfft STATIC ${KISSFFT_SOURCE_DIR}/kiss_fft.c
                                ${KISSFFT_SOURCE_DIR}/kiss_fftr.c)
target_include_directories(vesk_kissfft SYSTEM PUBLIC ${KISSFFT_SOURCE_DIR})
target_compile_definitions(vesk_kissfft PUBLIC kiss_fft_scalar=float)

# liblog: none in a browser; src/base defines vesk_liblog as a stand-in that
# writes to the module's error output.
