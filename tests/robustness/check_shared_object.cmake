# cmake -DLIBRARY=... -DEXPORTS=... -DNM=... -DREADELF=... -P check_shared_object.cmake
# The shared library exports exactly the listed names, needs only the libraries of a device and the
# C library, and imports nothing beyond a short list.
cmake_minimum_required(VERSION 3.18)

function(run_tool out)
  execute_process(COMMAND ${ARGN} OUTPUT_VARIABLE text ERROR_VARIABLE errors RESULT_VARIABLE result)
  if(NOT result EQUAL 0)
    message(FATAL_ERROR "${ARGN}: ${result} ${errors}")
  endif()
  string(REPLACE "\n" ";" lines "${text}")
  set(${out} "${lines}" PARENT_SCOPE)
endfunction()

set(faults)

run_tool(lines ${NM} -D --defined-only ${LIBRARY})
set(exported)
foreach(line IN LISTS lines)
  if(line MATCHES "^[0-9a-fA-F]+ [A-Za-z] ([^@ ]+)")
    list(APPEND exported ${CMAKE_MATCH_1})
  endif()
endforeach()
file(STRINGS ${EXPORTS} listed)
list(LENGTH listed count)
if(count LESS 10)
  list(APPEND faults "only ${count} names in ${EXPORTS}")
endif()
foreach(name IN LISTS exported)
  if(NOT name IN_LIST listed)
    list(APPEND faults "exported but not listed: ${name}")
  endif()
endforeach()
foreach(name IN LISTS listed)
  if(NOT name IN_LIST exported)
    list(APPEND faults "listed but not exported: ${name}")
  endif()
endforeach()

run_tool(lines ${READELF} -dW ${LIBRARY})
set(needed)
foreach(line IN LISTS lines)
  if(line MATCHES "NEEDED.*\\[(.+)\\]")
    list(APPEND needed ${CMAKE_MATCH_1})
    if(NOT CMAKE_MATCH_1 MATCHES "^(libtessel\\.so|libjnigraphics\\.so|libc\\.so\\.6|libm\\.so\\.6)$")
      list(APPEND faults "needs ${CMAKE_MATCH_1}")
    endif()
  elseif(line MATCHES "TEXTREL")
    list(APPEND faults "has text relocations")
  elseif(line MATCHES "SONAME.*\\[(.+)\\]" AND NOT CMAKE_MATCH_1 STREQUAL "libkestrel_postprocess.so")
    list(APPEND faults "is called ${CMAKE_MATCH_1}")
  endif()
endforeach()
if(NOT "libtessel.so" IN_LIST needed)
  list(APPEND faults "does not need libtessel.so")
endif()

set(allowed
  MMemAlloc MMemFree MMemCpy MMemSet  # base library
  AndroidBitmap_getInfo AndroidBitmap_lockPixels AndroidBitmap_unlockPixels
  memcpy memmove memset memcmp gettimeofday fopen fwrite fclose
  __memcpy_chk __memmove_chk __memset_chk __stack_chk_fail
  # Put in by every compiler's start-up files, all weak.
  __cxa_finalize __gmon_start__ _ITM_deregisterTMCloneTable _ITM_registerTMCloneTable)
run_tool(lines ${NM} -D --undefined-only ${LIBRARY})
foreach(line IN LISTS lines)
  if(line MATCHES "^ *[A-Za-z] ([^@ ]+)" AND NOT CMAKE_MATCH_1 IN_LIST allowed)
    list(APPEND faults "imports ${CMAKE_MATCH_1}")
  endif()
endforeach()

if(faults)
  list(JOIN faults "\n  " text)
  message(FATAL_ERROR "${LIBRARY}:\n  ${text}")
endif()
