# Fails the build when exports.list holds a name that the export plan
# (docs/exports.md) does not, so that the plan stays the one list of what the
# library exports. Names planned but not yet exported are fine.
#
#   cmake -DLIST=exports.list -DPLAN=exports.md -DPLANNED=718 -DSTAMP=file -P CheckExportPlan.cmake

file(STRINGS "${PLAN}" plan_rows REGEX "^\\| `zel[A-Za-z0-9_]+` \\|")
set(planned "")
foreach(row IN LISTS plan_rows)
  string(REGEX REPLACE "^\\| `(zel[A-Za-z0-9_]+)` \\|.*" "\\1" name "${row}")
  list(APPEND planned "${name}")
endforeach()
list(LENGTH planned count)
set(unique ${planned})
list(REMOVE_DUPLICATES unique)
list(LENGTH unique unique_count)
if(NOT unique_count EQUAL count)
  message(FATAL_ERROR "${PLAN}: a name is planned twice")
endif()
if(NOT count EQUAL PLANNED)
  message(FATAL_ERROR "${PLAN}: ${count} names planned, the library has ${PLANNED}")
endif()

file(STRINGS "${LIST}" lines)
set(unplanned "")
foreach(line IN LISTS lines)
  if(line MATCHES "^[ \t]*(zel[A-Za-z0-9_]+)")
    list(FIND planned "${CMAKE_MATCH_1}" at)
    if(at EQUAL -1)
      list(APPEND unplanned "${CMAKE_MATCH_1}")
    endif()
  endif()
endforeach()
if(unplanned)
  string(REPLACE ";" "\n  " unplanned "${unplanned}")
  message(FATAL_ERROR "exported but not in the export plan ${PLAN}; plan them there first:\n  ${unplanned}")
endif()
file(WRITE "${STAMP}" "${count}\n")
