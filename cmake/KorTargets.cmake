# Flags that every target of the project shares, and the way a library of it is declared.

add_library(kor_flags INTERFACE)
target_compile_features(kor_flags INTERFACE cxx_std_20)
# A result is the same to the last bit on every processor: no fused multiply-add, not even of
# intrinsics, which g++ would fuse too.
target_compile_options(kor_flags INTERFACE -ffp-contract=off -fno-math-errno
  -Wall -Wextra -Wpedantic -Wshadow -Wnon-virtual-dtor -Woverloaded-virtual -Wcast-qual -Wundef
  $<$<CXX_COMPILER_ID:GNU>:-Wduplicated-cond;-Wlogical-op>
  $<$<BOOL:${KOR_WARNINGS_AS_ERRORS}>:-Werror>)

# kor_add_library(NAME SOURCES file... HEADERS file...): the library libkor or libkor_NAME, exported
# as kor::NAME. HEADERS are relative to the project and are installed in the same tree.
function(kor_add_library NAME)
  cmake_parse_arguments(PARSE_ARGV 1 ARG "" "" "SOURCES;HEADERS")
  set(TARGET ${NAME})
  if(NOT NAME STREQUAL "kor")
    set(TARGET kor_${NAME})
  endif()
  add_library(${TARGET} ${ARG_SOURCES})
  add_library(kor::${NAME} ALIAS ${TARGET})
  target_sources(${TARGET} PUBLIC
    FILE_SET HEADERS BASE_DIRS ${PROJECT_SOURCE_DIR} FILES ${ARG_HEADERS})
  # $ORIGIN: an installed libkor_gdal.so finds the libkor.so beside it.
  set_target_properties(${TARGET} PROPERTIES EXPORT_NAME ${NAME} POSITION_INDEPENDENT_CODE ON
    INSTALL_RPATH "$ORIGIN"
    VERSION ${PROJECT_VERSION} SOVERSION ${PROJECT_VERSION_MAJOR}.${PROJECT_VERSION_MINOR})
  target_compile_features(${TARGET} PUBLIC cxx_std_20)
  target_link_libraries(${TARGET} PRIVATE $<BUILD_INTERFACE:kor_flags>)
endfunction()
