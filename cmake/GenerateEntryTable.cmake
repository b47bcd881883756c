# Generates the forwarding stubs, the entry table, the linker export list and
# a C++ listing for the tests from the one list of exported names.
#
#   cmake -DLIST=exports.list -DOUT_DIR=dir -P GenerateEntryTable.cmake
#
# Fails when the list is not sorted byte-wise or holds a name twice.

file(STRINGS "${LIST}" lines)
set(names "")
set(impls "")
set(previous "")
foreach(line IN LISTS lines)
  string(STRIP "${line}" line)
  if(line STREQUAL "" OR line MATCHES "^#")
    continue()
  endif()
  if(line MATCHES "^([A-Za-z_][A-Za-z0-9_]*)[ \t]*=[ \t]*([A-Za-z_][A-Za-z0-9_]*)$")
    set(name "${CMAKE_MATCH_1}")
    set(impl "${CMAKE_MATCH_2}")
  elseif(line MATCHES "^([A-Za-z_][A-Za-z0-9_]*)$")
    set(name "${CMAKE_MATCH_1}")
    set(impl "${CMAKE_MATCH_1}")
  else()
    message(FATAL_ERROR "${LIST}: cannot read line '${line}'")
  endif()
  if(NOT previous STREQUAL "")
    string(COMPARE LESS "${previous}" "${name}" ordered)
    if(NOT ordered)
      message(FATAL_ERROR "${LIST}: '${name}' must come before '${previous}' (byte-wise order, no repeats)")
    endif()
  endif()
  set(previous "${name}")
  list(APPEND names "${name}")
  list(APPEND impls "${impl}")
endforeach()
list(LENGTH names count)

set(stubs "")
set(slots "")
set(listing "")
set(exports "")
math(EXPR last "${count} - 1")
foreach(i RANGE ${last})
  list(GET names ${i} name)
  list(GET impls ${i} impl)
  string(APPEND stubs "ZELCV_STUB(${name}, ${i})\n")
  string(APPEND slots "  ZELCV_SLOT(zelcvImpl_${impl})\n")
  string(APPEND listing "  {\"${name}\", \"${impl}\"},\n")
  string(APPEND exports "    ${name};\n")
endforeach()

file(WRITE "${OUT_DIR}/entry_table.S.tmp" "\
/* Generated from exports.list: do not edit. */
/* Each export is a 16-byte stub that jumps through its slot of the table. */
#if defined(__x86_64__)
#  define ZELCV_SLOT(impl) .quad impl
#  define ZELCV_STUB(name, index) \\
     .globl name; .type name, @function; .p2align 4; \\
     name: jmp *(zelcvEntryTable + 8 * index)(%rip); .size name, . - name
#elif defined(__i386__)
#  define ZELCV_SLOT(impl) .long impl
#  define ZELCV_STUB(name, index) \\
     .globl name; .type name, @function; .p2align 4; \\
     name: call zelcvPcThunk; \\
     9: jmp *(zelcvEntryTable + 4 * index - 9b)(%eax); .size name, . - name
#else
#  error \"zelcv's entry stubs are written for x86 and x86-64\"
#endif

  .section .data.rel.ro, \"aw\"
  .p2align 6
  .globl zelcvEntryTable
  .hidden zelcvEntryTable
  .type zelcvEntryTable, @object
zelcvEntryTable:
${slots}  .size zelcvEntryTable, . - zelcvEntryTable

  .globl zelcvEntryCount
  .hidden zelcvEntryCount
  .type zelcvEntryCount, @object
  .p2align 2
zelcvEntryCount:
  .long ${count}
  .size zelcvEntryCount, 4

  .text
#if defined(__i386__)
  /* Returns the caller's return address in %eax (eax carries no argument). */
  .p2align 4
  .type zelcvPcThunk, @function
zelcvPcThunk:
  movl (%esp), %eax
  ret
  .size zelcvPcThunk, . - zelcvPcThunk
#endif
${stubs}
  .section .note.GNU-stack, \"\", @progbits
")

file(WRITE "${OUT_DIR}/exports.map.tmp" "{\n  global:\n${exports}  local: *;\n};\n")

file(WRITE "${OUT_DIR}/export_listing.inc.tmp" "\
// Generated from exports.list: do not edit. {export name, implementation name}
${listing}")

foreach(f entry_table.S exports.map export_listing.inc)
  file(COPY_FILE "${OUT_DIR}/${f}.tmp" "${OUT_DIR}/${f}" ONLY_IF_DIFFERENT)
  file(REMOVE "${OUT_DIR}/${f}.tmp")
endforeach()
