# Installs the build into a prefix, moves the installed tree elsewhere, and builds and runs a
# consumer against the moved tree with find_package(Corvexa).
set(work ${WORK_DIR})
file(REMOVE_RECURSE ${work})
function(run)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE rc OUTPUT_VARIABLE out ERROR_VARIABLE err)
  if(NOT rc EQUAL 0)
    message(FATAL_ERROR "failed (${rc}): ${ARGN}\n${out}\n${err}")
  endif()
  message(STATUS "${out}")
endfunction()
run(${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${work}/first)
file(RENAME ${work}/first ${work}/moved)
# A sanitized library needs its runtime in the consumer too.
set(consumer_flags "")
if(SANITIZE)
  set(consumer_flags "-DCMAKE_EXE_LINKER_FLAGS=-fsanitize=address,undefined")
endif()
run(${CMAKE_COMMAND} -S ${SOURCE_DIR} -B ${work}/build -DCMAKE_PREFIX_PATH=${work}/moved ${consumer_flags})
run(${CMAKE_COMMAND} --build ${work}/build)
run(${work}/build/consumer)
# The modern interface's program, in a folder of its own with the installed sample data.
set(data ${work}/moved/share/corvexa/examples)
file(COPY ${data}/inventory.xml ${data}/inventory.xsd DESTINATION ${work}/run)
execute_process(COMMAND ${work}/build/inventory WORKING_DIRECTORY ${work}/run
                RESULT_VARIABLE rc OUTPUT_VARIABLE out ERROR_VARIABLE err)
message(STATUS "${out}${err}")
if(NOT rc EQUAL 0 OR NOT out MATCHES "Bolt: number quantity weight tags photo supplier diameter stainless lengths\n"
   OR NOT out MATCHES "\n3 parts\n$" OR NOT EXISTS ${work}/run/inventory.bin)
  message(FATAL_ERROR "the installed program failed (${rc})")
endif()
