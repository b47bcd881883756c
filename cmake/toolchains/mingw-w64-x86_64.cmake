# x86-64 Windows DLLs with Debian's MinGW-w64 toolchain:
#   cmake -S . -B build/win64 -DCMAKE_TOOLCHAIN_FILE=cmake/toolchains/mingw-w64-x86_64.cmake
set(CMAKE_SYSTEM_PROCESSOR x86_64)
set(ZELCV_MINGW_TRIPLE x86_64-w64-mingw32)
set(ZELCV_WINE_NAMES wine64)
include(${CMAKE_CURRENT_LIST_DIR}/mingw-w64.cmake)
