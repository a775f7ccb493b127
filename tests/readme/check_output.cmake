# Fails unless `program` succeeds and prints exactly `expected`.
execute_process(COMMAND "${program}" OUTPUT_VARIABLE printed RESULT_VARIABLE status)
if(NOT status EQUAL 0)
  message(FATAL_ERROR "${program} ended with ${status}")
endif()
if(NOT printed STREQUAL expected)
  message(FATAL_ERROR "${program} printed '${printed}', expected '${expected}'")
endif()
