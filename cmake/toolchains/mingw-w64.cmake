# Shared part of the MinGW-w64 toolchain files; they set ZELCV_MINGW_TRIPLE
# and ZELCV_WINE_NAMES first. The "-posix" compilers have the C++ thread
# support that GoogleTest needs (the library itself uses none); the DLLs link
# every runtime statically, so they need no threads DLL either. The plain
# names serve where only those are installed.
set(CMAKE_SYSTEM_NAME Windows)
foreach(lang C CXX)
  if(lang STREQUAL "C")
    set(tool gcc)
  else()
    set(tool g++)
  endif()
  find_program(ZELCV_MINGW_${lang} NAMES ${ZELCV_MINGW_TRIPLE}-${tool}-posix ${ZELCV_MINGW_TRIPLE}-${tool}
               NO_CMAKE_FIND_ROOT_PATH)
  if(NOT ZELCV_MINGW_${lang})
    message(FATAL_ERROR "${ZELCV_MINGW_TRIPLE}-${tool} not found: install the MinGW-w64 toolchain (scripts/deps.sh --windows)")
  endif()
  set(CMAKE_${lang}_COMPILER ${ZELCV_MINGW_${lang}})
endforeach()
set(CMAKE_RC_COMPILER ${ZELCV_MINGW_TRIPLE}-windres)
set(CMAKE_FIND_ROOT_PATH /usr/${ZELCV_MINGW_TRIPLE})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)

# Tests run under Wine where it is installed, in a Wine prefix of the build
# tree's own. Without it the DLLs are still built and their tables checked.
find_program(ZELCV_WINE NAMES ${ZELCV_WINE_NAMES} PATHS /usr/lib/wine NO_DEFAULT_PATH)
if(ZELCV_WINE)
  set(CMAKE_CROSSCOMPILING_EMULATOR
      ${CMAKE_COMMAND} -E env WINEPREFIX=${CMAKE_BINARY_DIR}/wineprefix WINEDEBUG=-all ${ZELCV_WINE})
endif()
