# 32-bit x86 Windows DLLs (SSE2) with Debian's MinGW-w64 toolchain:
#   cmake -S . -B build/win32 -DCMAKE_TOOLCHAIN_FILE=cmake/toolchains/mingw-w64-i686.cmake
# A 32-bit Wine ("wine" from Debian's wine32 package) runs the tests.
set(CMAKE_SYSTEM_PROCESSOR i686)
set(ZELCV_MINGW_TRIPLE i686-w64-mingw32)
set(ZELCV_WINE_NAMES wine)
include(${CMAKE_CURRENT_LIST_DIR}/mingw-w64.cmake)
