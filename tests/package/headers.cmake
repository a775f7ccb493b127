# Compiles each installed header alone, with COMPILER, as C++17.
set(failed "")
foreach(header IN LISTS HEADERS)
  execute_process(
    COMMAND ${COMPILER} -std=c++17 -Wall -Wextra -Wconversion -Werror -fsyntax-only -I${INCLUDE_ROOT}
            -include ${INCLUDE_ROOT}/${header} -x c++ /dev/null
    RESULT_VARIABLE result ERROR_VARIABLE errors)
  if(NOT result EQUAL 0)
    message("${header}:\n${errors}")
    list(APPEND failed ${header})
  endif()
endforeach()
if(failed)
  message(FATAL_ERROR "do not compile alone: ${failed}")
endif()
