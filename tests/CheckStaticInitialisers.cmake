# Counts the static initialisers of a shared library (the _GLOBAL__sub_I_ functions the compiler
# emits for each unit with dynamic initialisation) and fails unless there is exactly one.
execute_process(COMMAND nm ${LIBRARY} OUTPUT_VARIABLE symbols RESULT_VARIABLE rc)
if(NOT rc EQUAL 0)
  message(FATAL_ERROR "nm failed on ${LIBRARY}")
endif()
# (A function split into hot and cold parts shows twice: count the names without ".cold".)
string(REGEX MATCHALL "_GLOBAL__sub_I_[A-Za-z0-9_]*\\.cpp\n" initialisers "${symbols}")
list(LENGTH initialisers count)
if(NOT count EQUAL 1)
  message(FATAL_ERROR "expected one static initialiser, found ${count}: ${initialisers}")
endif()
message(STATUS "one static initialiser: ${initialisers}")
