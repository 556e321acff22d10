# Configures, builds and runs tests/subproject: Corvexa inside another project's build.
file(REMOVE_RECURSE ${WORK_DIR})
foreach(step "-S;${SOURCE_DIR}/tests/subproject;-B;${WORK_DIR};-G;Ninja;-DCORVEXA_SOURCE_DIR=${SOURCE_DIR}"
             "--build;${WORK_DIR};--parallel;2")
  execute_process(COMMAND ${CMAKE_COMMAND} ${step} RESULT_VARIABLE rc OUTPUT_VARIABLE out ERROR_VARIABLE err)
  if(NOT rc EQUAL 0)
    message(FATAL_ERROR "cmake ${step} failed (${rc}):\n${out}\n${err}")
  endif()
endforeach()
execute_process(COMMAND ${WORK_DIR}/consumer RESULT_VARIABLE rc OUTPUT_VARIABLE out ERROR_VARIABLE err)
if(NOT rc EQUAL 0 OR NOT out MATCHES "consumer sees replica 'installed'")
  message(FATAL_ERROR "the consumer failed (${rc}):\n${out}\n${err}")
endif()
