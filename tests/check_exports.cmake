# The shared library exports the C interface and its named objects, nothing else.
# cmake -DNM=... -DLIBRARY=... -P check_exports.cmake
execute_process(COMMAND ${NM} -D --defined-only -C ${LIBRARY} OUTPUT_VARIABLE listing RESULT_VARIABLE failed)
if(failed)
  message(FATAL_ERROR "nm failed on ${LIBRARY}")
endif()
set(expected
  "VI_Tactus_Init" "VI_Tactus_SetParameter" "VI_Tactus_SetRoi" "VI_Tactus_SetFrame" "VI_Tactus_SetFrameParameter"
  "VI_Tactus_ProcessFrame" "VI_Tactus_GetGesture" "VI_Tactus_GetRect" "VI_Tactus_GetPoint" "VI_Tactus_GetPoint3d"
  "VI_Tactus_GetFloat" "VI_Tactus_GetParameter" "VI_Tactus_GetFrame" "VI_Tactus_Reset" "VI_Tactus_Release"
  "VI_Tactus_GetVersion()" "VI_Tactus_GetEngineInfo_()" "VI_Tactus_Request_(char const*, void const*)"
  "VI_Tactus_GetDebugImage_(char const*&, unsigned char*&, char const*&, int&, int&, int&, int)"
  "VI_Tactus_GetFrameColorMode_(char const*&, int)"
  "viFrameParameters" "viResult" "possibleColorModes[abi:cxx11]" "zoomTwice" "swapRedBlue"
  "ViInterfaceSingleton::get()::viInterface" "guard variable for ViInterfaceSingleton::get()::viInterface")
string(REPLACE "\n" ";" lines "${listing}")
set(found)
foreach(line ${lines})
  # "address type name": the name may hold blanks
  string(REGEX REPLACE "^[0-9a-fA-F]+ [A-Za-z] " "" name "${line}")
  if(name STREQUAL "")
    continue()
  endif()
  list(FIND expected "${name}" at)
  if(at EQUAL -1)
    message(SEND_ERROR "exported but internal: ${name}")
  endif()
  list(APPEND found "${name}")
endforeach()
foreach(name ${expected})
  list(FIND found "${name}" at)
  if(at EQUAL -1)
    message(SEND_ERROR "not exported: ${name}")
  endif()
endforeach()
list(LENGTH found count)
message(STATUS "${count} exported symbols, all expected")
