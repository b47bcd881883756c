# Fails when a name of exports.list has no TORTURE(name, ...) line in the
# torture table. Lines for names not (yet) exported are allowed. The table
# is read through the preprocessor, so families may generate lines with
# macros.
#   cmake -DLIST=exports.list -DTABLE=a.cpp|b.cpp -DCXX=compiler -DINCLUDES=dir|dir
#         -DSTAMP=file -P check_described.cmake
string(REPLACE "|" ";" TABLE "${TABLE}")
string(REPLACE "|" ";" INCLUDES "${INCLUDES}")
set(described "")
set(flags "")
foreach(dir IN LISTS INCLUDES)
  list(APPEND flags "-I${dir}")
endforeach()
foreach(file IN LISTS TABLE)
  execute_process(COMMAND "${CXX}" -std=c++17 -E -P ${flags} "${file}"
                  OUTPUT_VARIABLE text RESULT_VARIABLE failed ERROR_VARIABLE errors)
  if(failed)
    message(FATAL_ERROR "cannot preprocess ${file}:\n${errors}")
  endif()
  string(REGEX MATCHALL "describe\\(\"[A-Za-z0-9_]+\"" found "${text}")
  foreach(f IN LISTS found)
    string(REGEX REPLACE "describe\\(\"([A-Za-z0-9_]+)\"" "\\1" name "${f}")
    list(APPEND described "${name}")
  endforeach()
endforeach()

file(STRINGS "${LIST}" lines)
set(missing "")
foreach(line IN LISTS lines)
  if(line MATCHES "^([A-Za-z_][A-Za-z0-9_]*)")
    list(FIND described "${CMAKE_MATCH_1}" at)
    if(at EQUAL -1)
      list(APPEND missing "${CMAKE_MATCH_1}")
    endif()
  endif()
endforeach()
if(missing)
  list(JOIN missing "\n  " text)
  message(FATAL_ERROR "These exports have no line in the torture table (tests/torture/args_*.cpp; "
                      "see tests/torture/README.md):\n  ${text}")
endif()
file(WRITE "${STAMP}" "ok\n")
