# Flags that every target of the project shares, and the way a library of it is declared.

add_library(kor_flags INTERFACE)
target_compile_features(kor_flags INTERFACE cxx_std_20)
# A result is the same to the last bit on every processor: no fused multiply-add, not even of
# intrinsics, which g++ would fuse too.
target_compile_options(kor_flags INTERFACE -ffp-contract=off -fno-math-errno
  -Wall -Wextra -Wpedantic -Wshadow -Wnon-virtual-dtor -Woverloaded-virtual -Wcast-qual
  -Wduplicated-cond -Wlogical-op -Wundef $<$<BOOL:${KOR_WARNINGS_AS_ERRORS}>:-Werror>)
target_compile_definitions(kor_flags INTERFACE KOR_HARDENED=$<BOOL:${KOR_HARDENED}>)

# kor_add_library(NAME SOURCE...): the library libkor or libkor_NAME, exported as kor::NAME.
function(kor_add_library NAME)
  set(TARGET ${NAME})
  if(NOT NAME STREQUAL "kor")
    set(TARGET kor_${NAME})
  endif()
  add_library(${TARGET} ${ARGN})
  add_library(kor::${NAME} ALIAS ${TARGET})
  set_target_properties(${TARGET} PROPERTIES EXPORT_NAME ${NAME} POSITION_INDEPENDENT_CODE ON
    VERSION ${PROJECT_VERSION} SOVERSION ${PROJECT_VERSION_MAJOR}.${PROJECT_VERSION_MINOR})
  target_compile_features(${TARGET} PUBLIC cxx_std_20)
  target_link_libraries(${TARGET} PRIVATE $<BUILD_INTERFACE:kor_flags>)
  target_include_directories(${TARGET} PUBLIC
    $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}> $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}/kor>)
endfunction()
