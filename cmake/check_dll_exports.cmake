# Checks a Windows DLL with objdump: it exports exactly the library's entry points, and it imports
# from system DLLs only, so that nothing of the MinGW runtime has to ship beside it.
#   cmake -DOBJDUMP=... -DDLL=... -P check_dll_exports.cmake
cmake_minimum_required(VERSION 3.22)
set(expected_exports DllSetMemoryErrorHandler ZEL_createServerSession ZEL_destroyServerSession)
set(system_dlls ADVAPI32.dll KERNEL32.dll msvcrt.dll WS2_32.dll)

execute_process(COMMAND ${OBJDUMP} -p ${DLL} OUTPUT_VARIABLE dump RESULT_VARIABLE failed)
if(failed)
  message(FATAL_ERROR "${OBJDUMP} cannot read ${DLL}")
endif()

# The export names follow the "[Ordinal/Name Pointer] Table" line, one "[ n] name" line each.
string(REGEX MATCH "\\[Ordinal/Name Pointer\\] Table\n([^\n]+\n)*" table "${dump}")
string(REGEX MATCHALL "\\[ *[0-9]+\\] [^\n]+" rows "${table}")
set(exports)
foreach(row ${rows})
  string(REGEX REPLACE "\\[ *[0-9]+\\] " "" name "${row}")
  list(APPEND exports ${name})
endforeach()
list(SORT exports)
if(NOT exports STREQUAL expected_exports)
  message(FATAL_ERROR "${DLL} exports [${exports}], expected [${expected_exports}]")
endif()

string(REGEX MATCHALL "DLL Name: [^\n]+" imports "${dump}")
foreach(import ${imports})
  string(REPLACE "DLL Name: " "" name "${import}")
  if(NOT name IN_LIST system_dlls)
    message(FATAL_ERROR "${DLL} imports ${name}, which is not part of Windows")
  endif()
endforeach()
message(STATUS "${DLL}: exports ${exports}; imports system DLLs only")
