# Installs the build tree, then builds and runs the README's example program
# through find_package(zelcv) and through pkg-config.
#   cmake -DBUILD_DIR=... -DSOURCE_DIR=... -DREADME=... -DWORK_DIR=... -P check.cmake
function(run)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE rc OUTPUT_VARIABLE out ERROR_VARIABLE err)
  if(NOT rc EQUAL 0)
    message(FATAL_ERROR "failed: ${ARGN}\n${out}\n${err}")
  endif()
endfunction()

set(prefix ${WORK_DIR}/prefix)
file(REMOVE_RECURSE ${WORK_DIR})

# The consumer's source is the README's C block, so the README cannot drift.
file(READ ${README} readme)
string(FIND "${readme}" "```c\n" first)
if(first LESS 0)
  message(FATAL_ERROR "no C example in ${README}")
endif()
math(EXPR first "${first} + 5")
string(SUBSTRING "${readme}" ${first} -1 rest)
string(FIND "${rest}" "```" last)
string(SUBSTRING "${rest}" 0 ${last} example)
file(WRITE ${WORK_DIR}/consumer/consumer.c "${example}")
file(COPY ${SOURCE_DIR}/CMakeLists.txt DESTINATION ${WORK_DIR}/consumer)
run(${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${prefix})
run(${CMAKE_COMMAND} -S ${WORK_DIR}/consumer -B ${WORK_DIR}/cmake-consumer -DCMAKE_PREFIX_PATH=${prefix})
run(${CMAKE_COMMAND} --build ${WORK_DIR}/cmake-consumer)
run(${WORK_DIR}/cmake-consumer/consumer)

find_program(PKG_CONFIG pkg-config REQUIRED)
set(ENV{PKG_CONFIG_PATH} ${prefix}/lib/pkgconfig)
execute_process(COMMAND ${PKG_CONFIG} --cflags --libs zelcv OUTPUT_VARIABLE flags
                OUTPUT_STRIP_TRAILING_WHITESPACE RESULT_VARIABLE rc)
if(NOT rc EQUAL 0)
  message(FATAL_ERROR "pkg-config does not know zelcv")
endif()
separate_arguments(flags UNIX_COMMAND "${flags}")
run(cc -Wall -Wextra -Werror ${WORK_DIR}/consumer/consumer.c ${flags} -Wl,-rpath,${prefix}/lib -o ${WORK_DIR}/pkg-consumer)
run(${WORK_DIR}/pkg-consumer)
