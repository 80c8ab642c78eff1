# kor_extract_readme_example(README SOURCE OUTPUT_REGEX): writes the first ```cpp block of README to
# SOURCE, and sets OUTPUT_REGEX to a regular expression of the ```text block behind it.
function(kor_extract_readme_example README SOURCE OUTPUT_REGEX)
  file(READ ${README} TEXT)
  if(NOT TEXT MATCHES "\n```cpp\n([^`]*)```\n[^`]*```text\n([^`]*)```\n")
    message(FATAL_ERROR "${README} has no block of C++ with the text behind it that it prints")
  endif()
  file(CONFIGURE OUTPUT ${SOURCE} CONTENT "${CMAKE_MATCH_1}" @ONLY)
  string(REGEX REPLACE "([][+.*?()^$|\\])" "\\\\\\1" EXPECTED "${CMAKE_MATCH_2}")
  set(${OUTPUT_REGEX} "${EXPECTED}" PARENT_SCOPE)
endfunction()
