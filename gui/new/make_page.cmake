# Writes one page from the template and a catalogue of texts. Run by CMake:
#   -DTEMPLATE=FILE -DCATALOGUE=FILE -DLANGUAGE=CODE -DPAGE=FILE
# {{key}} becomes the text of that key, {{*texts}} the whole catalogue for the page's script, {{*language}} the code.
cmake_minimum_required(VERSION 3.25)
file(READ "${TEMPLATE}" page)
file(READ "${CATALOGUE}" catalogue)

string(REPLACE "<" "\\u003c" embedded "${catalogue}") # no text can end the element that it stands in
string(REPLACE "{{*texts}}" "${embedded}" page "${page}")
string(REPLACE "{{*language}}" "${LANGUAGE}" page "${page}")

string(JSON count LENGTH "${catalogue}")
math(EXPR last "${count} - 1")
foreach(i RANGE ${last})
  string(JSON key MEMBER "${catalogue}" ${i})
  string(JSON text GET "${catalogue}" "${key}")
  string(REPLACE "&" "&amp;" text "${text}")
  string(REPLACE "<" "&lt;" text "${text}")
  string(REPLACE "\"" "&quot;" text "${text}")
  string(REPLACE "{{${key}}}" "${text}" page "${page}")
endforeach()

if(page MATCHES "{{[^}]*}}")
  message(FATAL_ERROR "${CATALOGUE} has no text for ${CMAKE_MATCH_0} of ${TEMPLATE}")
endif()
file(WRITE "${PAGE}" "${page}")
