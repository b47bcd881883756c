# Generates the forwarding stubs, the entry table, the linker export lists
# (a version script for ELF, a .def file for Windows) and a C++ listing for the
# tests from the one list of exported names.
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
set(def_exports "")
math(EXPR last "${count} - 1")
foreach(i RANGE ${last})
  list(GET names ${i} name)
  list(GET impls ${i} impl)
  string(APPEND stubs "  ZELCV_STUB(${name}, ${i})\n")
  string(APPEND slots "  ZELCV_SLOT(zelcvImpl_${impl})\n")
  string(APPEND listing "  {\"${name}\", \"${impl}\"},\n")
  string(APPEND exports "    ${name};\n")
  string(APPEND def_exports "  ${name}\n")
endforeach()

# The stubs and the table are top-level assembly inside a C file, so that the
# C compiler's flags (-m32 above all) decide the target, as for every other
# object of the library.
file(WRITE "${OUT_DIR}/entry_table.c.tmp" "\
/* Generated from exports.list: do not edit. */
/* Each export is a 16-byte stub that jumps through its slot of the table. */
#define ZELCV_STR2(x) #x
#define ZELCV_STR(x) ZELCV_STR2(x)
/* C names carry the platform's label prefix (an underscore on 32-bit Windows). */
#define ZELCV_SYM(name) ZELCV_STR(__USER_LABEL_PREFIX__) #name
#define ZELCV_TABLE ZELCV_SYM(zelcvEntryTable)

#if defined(_WIN32)
/* PE/COFF: the .def file decides what is exported; the table's absolute
 * addresses get base relocations. */
#  define ZELCV_SYMBOL_START(name) \\
     \".globl \" ZELCV_SYM(name) \"\\n.def \" ZELCV_SYM(name) \"; .scl 2; .type 32; .endef\\n\"
#  define ZELCV_SYMBOL_END(name) \"\"
#  define ZELCV_DATA_START(name) \".globl \" ZELCV_SYM(name) \"\\n\"
#  define ZELCV_DATA_END(name) \"\"
#  define ZELCV_RODATA \".section .rdata, \\\"dr\\\"\\n\"
#else
#  define ZELCV_SYMBOL_START(name) \\
     \".globl \" ZELCV_SYM(name) \"\\n.type \" ZELCV_SYM(name) \", @function\\n\"
#  define ZELCV_SYMBOL_END(name) \".size \" ZELCV_SYM(name) \", . - \" ZELCV_SYM(name) \"\\n\"
#  define ZELCV_DATA_START(name) \\
     \".globl \" ZELCV_SYM(name) \"\\n.hidden \" ZELCV_SYM(name) \"\\n.type \" ZELCV_SYM(name) \", @object\\n\"
#  define ZELCV_DATA_END(name) ZELCV_SYMBOL_END(name)
#  define ZELCV_RODATA \".section .data.rel.ro, \\\"aw\\\"\\n\"
#endif

#if defined(__x86_64__)
#  define ZELCV_SLOT(impl) \".quad \" ZELCV_SYM(impl) \"\\n\"
#  define ZELCV_JUMP(index) \"jmp *(\" ZELCV_TABLE \" + 8 * \" #index \")(%rip)\\n\"
#elif defined(__i386__) && defined(_WIN32)
/* A DLL is relocated by the loader: the slot's absolute address is fine. */
#  define ZELCV_SLOT(impl) \".long \" ZELCV_SYM(impl) \"\\n\"
#  define ZELCV_JUMP(index) \"jmp *(\" ZELCV_TABLE \" + 4 * \" #index \")\\n\"
#elif defined(__i386__)
/* Position-independent: the thunk returns the address after the call in eax,
 * which carries no argument. */
#  define ZELCV_SLOT(impl) \".long \" ZELCV_SYM(impl) \"\\n\"
#  define ZELCV_JUMP(index) \\
     \"call zelcvPcThunk\\n9: jmp *(\" ZELCV_TABLE \" + 4 * \" #index \" - 9b)(%eax)\\n\"
#else
#  error \"zelcv's entry stubs are written for x86 and x86-64\"
#endif

#define ZELCV_STUB(name, index) \\
  ZELCV_SYMBOL_START(name) \".p2align 4\\n\" ZELCV_SYM(name) \":\\n\" ZELCV_JUMP(index) ZELCV_SYMBOL_END(name)

__asm__(
  ZELCV_RODATA
  \".p2align 6\\n\"
  ZELCV_DATA_START(zelcvEntryTable)
  ZELCV_TABLE \":\\n\"
${slots}  ZELCV_DATA_END(zelcvEntryTable)
  \".p2align 2\\n\"
  ZELCV_DATA_START(zelcvEntryCount)
  ZELCV_SYM(zelcvEntryCount) \":\\n\"
  \".long ${count}\\n\"
  ZELCV_DATA_END(zelcvEntryCount)
  \".text\\n\"
#if defined(__i386__) && !defined(_WIN32)
  \".p2align 4\\n\"
  \".type zelcvPcThunk, @function\\n\"
  \"zelcvPcThunk:\\n\"
  \"movl (%esp), %eax\\n\"
  \"ret\\n\"
  \".size zelcvPcThunk, . - zelcvPcThunk\\n\"
#endif
${stubs});
")

file(WRITE "${OUT_DIR}/exports.map.tmp" "{\n  global:\n${exports}  local: *;\n};\n")

# Windows: the module definition file of zelcv.dll; import libraries are made
# from it (by the MinGW linker here, by MSVC's lib /def for MSVC callers).
file(WRITE "${OUT_DIR}/zelcv.def.tmp" "; Generated from exports.list: do not edit.\nLIBRARY zelcv.dll\nEXPORTS\n${def_exports}")

file(WRITE "${OUT_DIR}/export_listing.inc.tmp" "\
// Generated from exports.list: do not edit. {export name, implementation name}
${listing}")

foreach(f entry_table.c exports.map zelcv.def export_listing.inc)
  file(COPY_FILE "${OUT_DIR}/${f}.tmp" "${OUT_DIR}/${f}" ONLY_IF_DIFFERENT)
  file(REMOVE "${OUT_DIR}/${f}.tmp")
endforeach()
