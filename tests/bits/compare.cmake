# Runs the program and names the operators whose hash is not the expected one. EMULATOR, which may be empty,
# stands before it, with its arguments.
execute_process(
  COMMAND ${EMULATOR} ${PROGRAM} ${WRITTEN}
  OUTPUT_QUIET # a focus measure prints its sums
  RESULT_VARIABLE result)
if(NOT result EQUAL 0)
  message(FATAL_ERROR "${PROGRAM} failed: ${result}")
endif()

file(STRINGS ${EXPECTED} expected)
file(STRINGS ${WRITTEN} written)
set(others ${written})
list(REMOVE_ITEM others ${expected})
set(missing ${expected})
list(REMOVE_ITEM missing ${written})
list(JOIN others "\n  " others)
list(JOIN missing "\n  " missing)
if(NOT "${written}" STREQUAL "${expected}")
  message(FATAL_ERROR "Hashes differ.\nWritten:\n  ${others}\nExpected:\n  ${missing}")
endif()
