# The corvexa tool on the sample data and on files made from it: every subcommand, every exit code,
# every form converted to every other and back with identical content, one clear line per failure.
# Run by ctest: cmake -DTOOL=... -DEXAMPLES=... -DWORK_DIR=... -P ToolTest.cmake
file(REMOVE_RECURSE ${WORK_DIR})
file(MAKE_DIRECTORY ${WORK_DIR})
file(COPY ${EXAMPLES}/inventory.xml ${EXAMPLES}/inventory.xsd DESTINATION ${WORK_DIR})
set(failures 0)

# run(EXIT PATTERN args...): the tool exits with EXIT and its output matches PATTERN ("" for any);
# a failure other than a usage error is one line on standard error.
function(run expected pattern)
  execute_process(COMMAND ${TOOL} ${ARGN} WORKING_DIRECTORY ${WORK_DIR}
                  RESULT_VARIABLE rc OUTPUT_VARIABLE out ERROR_VARIABLE err)
  set(why "")
  if(NOT rc EQUAL expected)
    set(why "exit ${rc}, expected ${expected}")
  elseif(NOT "${pattern}" STREQUAL "" AND NOT "${out}${err}" MATCHES "${pattern}")
    set(why "output does not match '${pattern}'")
  elseif(expected EQUAL 1 OR expected EQUAL 3)
    string(REGEX MATCHALL "\n" lines "${err}")
    list(LENGTH lines count)
    if(NOT count EQUAL 1 AND NOT "${err}" MATCHES "violations")
      set(why "the error takes ${count} lines")
    endif()
  endif()
  if(why)
    message(SEND_ERROR "corvexa ${ARGN}: ${why}\n--- stdout\n${out}--- stderr\n${err}")
  endif()
endfunction()

# Every subcommand's help, and usage errors.
foreach(sub info convert validate diagram dump)
  run(0 "Usage" ${sub} --help)
endforeach()
run(2 "" )
run(2 "" frobnicate inventory.xml)
run(2 "" info no-such-file.xml)
run(2 "not known from its name" convert inventory.xml out.unknown)
run(2 "no class 'Nut'" dump inventory.xml --class Nut)

# info and the forms it recognises by content.
run(0 "XML document, .*class Bolt extends Part: 9 attributes \\(6 inherited\\), 3 instances" info inventory.xml)
run(0 "XSD schema" info inventory.xsd)

# Every form to every other and back: the same document.
run(0 "" convert inventory.xml reference.xml --with-schema --with-state)
run(0 "XML document with its schema" info reference.xml)
foreach(form binary compressed xml)
  run(0 "" convert reference.xml via-${form}.data --to ${form} --with-schema --with-state)
  foreach(back binary compressed)
    run(0 "" convert via-${form}.data ${form}-${back}.bin --to ${back})
    run(0 "" convert ${form}-${back}.bin ${form}-${back}.xml --with-schema --with-state)
    file(READ ${WORK_DIR}/reference.xml expected)
    file(READ ${WORK_DIR}/${form}-${back}.xml actual)
    if(NOT expected STREQUAL actual)
      message(SEND_ERROR "reference.xml through ${form} and ${back} came back different")
    endif()
  endforeach()
endforeach()
run(0 "compressed binary replica" info via-compressed.data)
run(0 "" convert via-binary.data schema.xsd)
run(0 "" convert schema.xsd schema-again.xsd)
file(READ ${WORK_DIR}/schema.xsd expected)
file(READ ${WORK_DIR}/schema-again.xsd actual)
if(NOT expected STREQUAL actual)
  message(SEND_ERROR "schema.xsd written again came back different")
endif()

# dump in each format.
run(0 "Bolt +B-M6 +B-M6 +1000" dump inventory.xml --class Bolt)
run(0 "\"stainless\": true, \"lengths\": \\[10, 20, 30\\]}\n$" dump inventory.xml --format jsonl --class Bolt --limit 1)
run(0 "Part,P-1001,P-1001,240,0.35,\"\\[hinge, brass\\]\"" dump inventory.xml --format csv --class Part)

# validate: valid data, and every problem of a bad file listed.
run(0 "valid" validate inventory.xml)
file(READ ${WORK_DIR}/inventory.xml sample)
string(REGEX REPLACE "<number>P-100[12]</number>|<name>Acme Fasteners</name>" "" bad "${sample}")
file(WRITE ${WORK_DIR}/bad.xml "${bad}")
run(1 "3 violations.*Supplier.name.*Part.number.*Part.number" validate bad.xml)
run(0 "valid" validate reference.xml --schema inventory.xsd)

# diagram: DOT that Graphviz accepts, and pictures through it.
run(0 "\"Bolt\" -> \"Part\" \\[arrowhead=empty\\]" diagram inventory.xml)
run(0 "" diagram inventory.xml -o schema.dot)
find_program(DOT dot)
if(DOT)
  execute_process(COMMAND ${DOT} -Tsvg ${WORK_DIR}/schema.dot -o ${WORK_DIR}/by-dot.svg RESULT_VARIABLE rc)
  if(NOT rc EQUAL 0)
    message(SEND_ERROR "dot refused the diagram")
  endif()
  run(0 "" diagram inventory.xml --format png -o schema.png)
  if(NOT EXISTS ${WORK_DIR}/schema.png)
    message(SEND_ERROR "no schema.png")
  endif()
endif()

# Invalid input: one clear line, exit 1; anything else: exit 3.
execute_process(COMMAND head -c 30 ${WORK_DIR}/via-binary.data OUTPUT_FILE ${WORK_DIR}/truncated.bin)
run(1 "truncated.bin: .*truncated" info truncated.bin)
file(WRITE ${WORK_DIR}/hostile.xml "<?xml version=\"1.0\"?>\n<!DOCTYPE replica [<!ENTITY x SYSTEM \"file:///etc/passwd\">]>\n<replica xmlns=\"urn:corvexa:replica:1\">&x;</replica>\n")
run(1 "hostile.xml" info hostile.xml)
file(WRITE ${WORK_DIR}/other.xml "<other/>")
run(1 "not a replica document, an XSD schema or a binary replica" info other.xml)
run(3 "no-such-dir/out.bin" convert inventory.xml no-such-dir/out.bin)
