# Fails if a file of the layer in FOLDER includes a file of a layer that is not in the list USES:
#
#   cmake -DFOLDER=objectmanager/text "-DUSES=model;classes" -P cmake/CheckLayer.cmake
cmake_minimum_required(VERSION 3.25)

get_filename_component(layer "${FOLDER}" NAME)
get_filename_component(layers "${FOLDER}" DIRECTORY)
file(GLOB files "${FOLDER}/*.h" "${FOLDER}/*.cpp")
if(NOT files)
  message(FATAL_ERROR "found no source files in ${FOLDER}, expected the layer ${layer}")
endif()
foreach(file ${files})
  file(STRINGS "${file}" includes REGEX "^#include \"[a-z]+/")
  foreach(include ${includes})
    string(REGEX REPLACE "^#include \"([a-z]+)/.*" "\\1" used "${include}")
    if(IS_DIRECTORY "${layers}/${used}" AND NOT used STREQUAL layer AND NOT used IN_LIST USES)
      list(JOIN USES ", " allowed)
      get_filename_component(name "${file}" NAME)
      message(SEND_ERROR "${layer}/${name} has ${include}; expected files of the layers that ${layer} uses (${allowed}). "
        "Either move the code, or name ${used} in objectmanager/${layer}/CMakeLists.txt if it stands below ${layer}.")
    endif()
  endforeach()
endforeach()
