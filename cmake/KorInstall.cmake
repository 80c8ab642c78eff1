# Installing: headers in their tree under include/kor, the libraries, and the CMake package `kor`.
include(CMakePackageConfigHelpers)

set(KOR_PACKAGE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/kor)
set(KOR_INSTALLED_TARGETS kor)
if(KOR_WITH_GDAL)
  list(APPEND KOR_INSTALLED_TARGETS kor_gdal)
endif()

install(TARGETS ${KOR_INSTALLED_TARGETS} EXPORT korTargets
  FILE_SET HEADERS DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/kor)
install(EXPORT korTargets NAMESPACE kor:: DESTINATION ${KOR_PACKAGE_DIR})

configure_package_config_file(${CMAKE_CURRENT_LIST_DIR}/korConfig.cmake.in
  ${CMAKE_CURRENT_BINARY_DIR}/korConfig.cmake INSTALL_DESTINATION ${KOR_PACKAGE_DIR})
write_basic_package_version_file(${CMAKE_CURRENT_BINARY_DIR}/korConfigVersion.cmake
  COMPATIBILITY SameMinorVersion)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/korConfig.cmake
  ${CMAKE_CURRENT_BINARY_DIR}/korConfigVersion.cmake DESTINATION ${KOR_PACKAGE_DIR})
