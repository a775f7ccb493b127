# Installs the build in BINARY_DIR into PREFIX, by way of a folder from which it is moved: what does not find
# itself again after that is not relocatable.
file(REMOVE_RECURSE ${PREFIX} ${PREFIX}-before)
execute_process(COMMAND ${CMAKE_COMMAND} --install ${BINARY_DIR} --prefix ${PREFIX}-before --config ${CONFIG}
                OUTPUT_QUIET COMMAND_ERROR_IS_FATAL ANY)
file(RENAME ${PREFIX}-before ${PREFIX})

file(GLOB_RECURSE installed RELATIVE ${PREFIX}/${INCLUDE_DIR}/gridmill ${PREFIX}/${INCLUDE_DIR}/gridmill/*)
list(SORT installed)
list(SORT HEADERS)
if(NOT installed STREQUAL HEADERS)
  message(FATAL_ERROR "installed headers: ${installed}\nexpected: ${HEADERS}")
endif()
