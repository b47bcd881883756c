# Fails when an AVX2 or AVX-512 object defines a mergeable (weak) symbol that
# is not its own: the linker keeps one copy of each such symbol, and if it
# keeps the copy compiled for the wider instruction set, the baseline kernels
# run that code on processors without it. Names of an AVX2 file's own code
# contain "avx2::", those of an AVX-512 file's "avx512::".
#   cmake -DNM=<nm> -DOBJECTS=<a|b|c> -P check_wide_objects.cmake
string(REPLACE "|" ";" objects "${OBJECTS}")
set(checked 0)
set(leaks "")
foreach(object IN LISTS objects)
  if(NOT object MATCHES "_(avx2|avx512)\\.cpp\\.o(bj)?$")
    continue()
  endif()
  set(own "${CMAKE_MATCH_1}::")
  math(EXPR checked "${checked} + 1")
  execute_process(COMMAND ${NM} -C --defined-only ${object}
                  OUTPUT_VARIABLE listing RESULT_VARIABLE status)
  if(NOT status EQUAL 0)
    message(FATAL_ERROR "${NM} failed on ${object}")
  endif()
  string(REPLACE "\n" ";" lines "${listing}")
  foreach(line IN LISTS lines)
    if(line MATCHES "^[0-9a-fA-F]+ [WwVvu] (.*)$")
      set(name "${CMAKE_MATCH_1}")
      # DW.ref.* words hold the address of the exception personality routine,
      # the same in every object (sanitizer builds add cleanups that need it),
      # and clang's function-type checks emit type descriptions of the
      # functions they call through pointers: data, not code.
      if(NOT name MATCHES "${own}" AND NOT name MATCHES "^DW\\.ref\\." AND NOT name MATCHES "^typeinfo (name )?for ")
        string(APPEND leaks "\n  ${object}: ${name}")
      endif()
    endif()
  endforeach()
endforeach()
if(checked EQUAL 0)
  message(FATAL_ERROR "no AVX2 or AVX-512 objects among the library's objects")
endif()
if(leaks)
  message(FATAL_ERROR "wide objects define shared inline code:${leaks}")
endif()
message(STATUS "${checked} AVX2 and AVX-512 objects define only their own code")
