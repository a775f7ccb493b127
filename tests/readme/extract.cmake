# Writes the first C++ block of the file `readme` to the file `program`.
file(READ "${readme}" text)
set(opening "\n```cpp\n")
set(closing "\n```\n")

string(FIND "${text}" "${opening}" start)
if(start EQUAL -1)
  message(FATAL_ERROR "${readme} has no C++ block")
endif()
string(LENGTH "${opening}" length)
math(EXPR start "${start} + ${length}")
string(SUBSTRING "${text}" ${start} -1 text)

string(FIND "${text}" "${closing}" end)
if(end EQUAL -1)
  message(FATAL_ERROR "the first C++ block of ${readme} does not end")
endif()
string(SUBSTRING "${text}" 0 ${end} text)
file(WRITE "${program}" "${text}\n")
