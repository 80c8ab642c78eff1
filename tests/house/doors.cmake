# Fails when a source includes a library outside the one folder that may. Needs SOURCE_DIR.

# require_door(LIBRARY HEADERS FOLDERS): only files below FOLDERS include HEADERS, both regular
# expressions.
function(require_door LIBRARY HEADERS FOLDERS)
  file(GLOB_RECURSE FILES RELATIVE ${SOURCE_DIR} ${SOURCE_DIR}/basic/* ${SOURCE_DIR}/platform/*
    ${SOURCE_DIR}/processes/* ${SOURCE_DIR}/examples/* ${SOURCE_DIR}/tests/* ${SOURCE_DIR}/bench/*)
  list(FILTER FILES INCLUDE REGEX "\\.(h|cpp)$")
  list(LENGTH FILES COUNT)
  if(COUNT EQUAL 0)
    message(FATAL_ERROR "No sources below ${SOURCE_DIR}")
  endif()
  list(FILTER FILES EXCLUDE REGEX "^(${FOLDERS})")
  foreach(FILE IN LISTS FILES)
    file(STRINGS ${SOURCE_DIR}/${FILE} INCLUDES
      REGEX "^[ \t]*#[ \t]*include[ \t]*[<\"](${HEADERS})")
    if(INCLUDES)
      message(SEND_ERROR "${FILE} includes ${LIBRARY}: ${INCLUDES}")
    endif()
  endforeach()
endfunction()

require_door(GDAL "gdal[_./a-z]|cpl_|ogr"
  "platform/datasources/gdal/|tests/platform/datasources/gdal/")
require_door(Highway "hwy/" "processes/qrdfilters/kernels/|tests/processes/qrdfilters/kernels/")
