# The Windows builds (MinGW-w64, x86-64 and i686), included from
# tests/CMakeLists.txt.
#
# What runs: the interface suite (abi/), under Wine when the toolchain file
# found one, three times as on Linux (as the machine is, AVX-512 hidden, AVX2
# hidden); and, always, checks of both DLLs' export and import tables.
# What does not: the unit tests (internal routines, the same code on every
# target, run by the Linux configurations), the build check of the AVX2 and
# AVX-512 objects (it reads ELF symbol kinds; the Linux builds check the same
# sources), the conformity tests (OpenCV is a native test dependency) and the
# package test (it installs and builds with the host's tools).

# Fault injection: zelcv.dll imports zelcore.dll by name, and the loader takes
# the one beside the executable. The tests' directory therefore holds a test
# build of zelcore.dll, which wraps the real services and can be steered, and
# a copy of zelcv.dll.
add_library(zelcore_faults SHARED windows/zelcore_faults.cpp windows/zelcore_faults.def
            ${PROJECT_SOURCE_DIR}/zelcore/zelcore.cpp)
set_source_files_properties(${PROJECT_SOURCE_DIR}/zelcore/zelcore.cpp TARGET_DIRECTORY zelcore_faults
  PROPERTIES COMPILE_DEFINITIONS
  "zelMalloc=realZelMalloc;zelFree=realZelFree;zelGetMaxCacheSizeB=realZelGetMaxCacheSizeB;zelGetEnabledCpuFeatures=realZelGetEnabledCpuFeatures")
target_compile_definitions(zelcore_faults PRIVATE ZELCORE_BUILDING_LIBRARY)
target_include_directories(zelcore_faults PRIVATE ${PROJECT_SOURCE_DIR}/include)
target_compile_options(zelcore_faults PRIVATE ${ZELCV_WARNINGS})
set_target_properties(zelcore_faults PROPERTIES OUTPUT_NAME zelcore PREFIX "" IMPORT_PREFIX "lib"
  RUNTIME_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}
  ARCHIVE_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR})

add_executable(zelcv_tests ${ZELCV_ABI_TESTS} ${ZELCV_TEST_SUPPORT})
target_include_directories(zelcv_tests PRIVATE ${CMAKE_CURRENT_SOURCE_DIR} ${ZELCV_GENERATED})
zelcv_test_compile_options(zelcv_tests)
target_link_libraries(zelcv_tests PRIVATE zelcv zelcore_faults GTest::gtest_main)
add_dependencies(zelcv_tests zelcv_entry_table)
set_target_properties(zelcv_tests PROPERTIES RUNTIME_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR})
add_custom_command(TARGET zelcv_tests POST_BUILD
  COMMAND ${CMAKE_COMMAND} -E copy_if_different $<TARGET_FILE:zelcv> ${CMAKE_CURRENT_BINARY_DIR}/)

if(CMAKE_CROSSCOMPILING_EMULATOR OR NOT CMAKE_CROSSCOMPILING)
  # One process per run: starting a Windows process under Wine costs far more
  # than a test does.
  add_test(NAME abi COMMAND zelcv_tests --gtest_brief=1)
  add_test(NAME avx2/abi COMMAND zelcv_tests --gtest_brief=1)
  set_tests_properties(avx2/abi PROPERTIES ENVIRONMENT "ZELTEST_CPU_FEATURES=0xFFFFE7FF")
  add_test(NAME baseline/abi COMMAND zelcv_tests --gtest_brief=1)
  set_tests_properties(baseline/abi PROPERTIES ENVIRONMENT "ZELTEST_CPU_FEATURES=0xFF")
  # The first run creates the Wine prefix; the others wait for it.
  set_tests_properties(abi PROPERTIES FIXTURES_SETUP wine_prefix)
  set_tests_properties(avx2/abi baseline/abi PROPERTIES FIXTURES_REQUIRED wine_prefix)
  set_tests_properties(abi avx2/abi baseline/abi PROPERTIES TIMEOUT 900)
else()
  message(STATUS "No Wine for this target: the Windows test suite is built but not run")
endif()

# The export and import tables of both DLLs, read from the files.
add_test(NAME Windows.DllTables
         COMMAND ${CMAKE_COMMAND} -DOBJDUMP=${CMAKE_OBJDUMP}
                 -DZELCV=$<TARGET_FILE:zelcv> -DZELCORE=$<TARGET_FILE:zelcore>
                 -DZELCV_DEF=${ZELCV_GENERATED}/zelcv.def
                 -DZELCORE_DEF=${PROJECT_SOURCE_DIR}/zelcore/zelcore.def
                 -P ${CMAKE_CURRENT_SOURCE_DIR}/windows/check_dll_tables.cmake)
