# Checks the export table of vox.dll against src/api/export_list.txt (run with cmake -P):
#   -DOBJDUMP=<x86_64-w64-mingw32-objdump> -DDLL=<vox.dll> -DLIST=<export_list.txt>
#   [-DENGINE=<an engine library> -DENGINE_NAMES=<names it must export, ;-separated>]
# Every listed name must be exported exactly as written (no stdcall "@n" decoration, no
# leading underscore added), and nothing else may be exported.
cmake_minimum_required(VERSION 3.25)

function(read_exports file out)
  execute_process(COMMAND ${OBJDUMP} -p ${file} OUTPUT_VARIABLE dump RESULT_VARIABLE failed)
  if(failed)
    message(FATAL_ERROR "${OBJDUMP} -p ${file} failed")
  endif()
  # The table's lines read "[  n] name" after a tab; square brackets would confuse CMake's lists, so
  # the lines become names before anything is split.
  string(REGEX MATCH "\\[Ordinal/Name Pointer\\] Table\n([^\n]+\n)+" table "${dump}")
  string(REPLACE "[Ordinal/Name Pointer] Table\n" "" table "${table}")
  string(REGEX REPLACE "[^\n]*\\[ *[0-9]+\\] ([^\n]+)\n" "\\1;" names "${table}")
  set(${out} ${names} PARENT_SCOPE)
endfunction()

read_exports(${DLL} exported)
file(STRINGS ${LIST} lines)
set(expected)
foreach(line IN LISTS lines)
  string(STRIP "${line}" line)
  if(NOT line STREQUAL "" AND NOT line MATCHES "^#")
    list(APPEND expected "${line}")
  endif()
endforeach()

set(problems)
foreach(name IN LISTS expected)
  if(NOT name IN_LIST exported)
    list(APPEND problems "missing: ${name}")
  endif()
endforeach()
foreach(name IN LISTS exported)
  if(NOT name IN_LIST expected)
    list(APPEND problems "not in the list: ${name}")
  endif()
  if(name MATCHES "@")
    list(APPEND problems "decorated: ${name}")
  endif()
endforeach()
list(LENGTH expected expected_count)
list(LENGTH exported exported_count)

if(ENGINE)
  read_exports(${ENGINE} engine_exports)
  foreach(name IN LISTS ENGINE_NAMES)
    if(NOT name IN_LIST engine_exports)
      list(APPEND problems "${ENGINE} does not export ${name}")
    endif()
  endforeach()
endif()

if(problems)
  list(JOIN problems "\n  " text)
  message(FATAL_ERROR "export table of ${DLL} (${exported_count} names, ${expected_count} listed):\n  ${text}")
endif()
message(STATUS "${DLL}: ${exported_count} exports, as listed")
