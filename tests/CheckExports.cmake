# Checks what the shared library exports: the marker function under its plain name and the API's
# classes, and nothing of its internals (the frame in namespace corvexa, the binding table).
execute_process(COMMAND nm -D -C --defined-only ${LIBRARY} OUTPUT_VARIABLE symbols RESULT_VARIABLE rc)
if(NOT rc EQUAL 0)
  message(FATAL_ERROR "nm failed on ${LIBRARY}")
endif()
foreach(wanted "T VELMORA_QKA2_INTERNAL_Corvexa\n" "VLXKDMReplica::GetName" "VLXKDMJavaObject::_st"
               "corvexa::Replica::read_xml_file" "corvexa::Error::Error")
  string(REGEX MATCH "${wanted}" found "${symbols}")
  if(NOT found)
    message(FATAL_ERROR "${LIBRARY} does not export ${wanted}")
  endif()
endforeach()
# The modern interface's classes are API; anything else in namespace corvexa is the frame's.
string(REGEX REPLACE "[^\n]* (typeinfo name for |typeinfo for |vtable for )?corvexa::(Error|Replica|ClassDef|AttributeDef|Model|Instances|Instance|Columns)(::|\n)[^\n]*" "" remaining "${symbols}")
# Standard-library templates instantiated over those classes are exported with them.
string(REGEX REPLACE "[^\n]* [TWV] ([^ \n]+ )?std::[^\n]*" "" remaining "${remaining}")
string(REGEX MATCHALL "[^\n]*(corvexa::|ReplicaStubs)[^\n]*" internals "${remaining}")
if(internals)
  string(REPLACE ";" "\n" internals "${internals}")
  message(FATAL_ERROR "${LIBRARY} exports internals:\n${internals}")
endif()
message(STATUS "the library exports its API only")
