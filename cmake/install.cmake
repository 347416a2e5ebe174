# Installs the library, its headers, a CMake package and a pkg-config file.
include(CMakePackageConfigHelpers)

# Components follow the Debian split: "runtime" is the shared object alone,
# "development" the headers, the link, the CMake package and tessaline.pc.
install(TARGETS tessaline
  EXPORT TessalineTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
    COMPONENT runtime
    NAMELINK_COMPONENT development
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(DIRECTORY ${PROJECT_SOURCE_DIR}/include/tessaline
  DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
  COMPONENT development)

set(TESSALINE_CMAKE_DIR ${CMAKE_INSTALL_LIBDIR}/cmake/Tessaline)
install(EXPORT TessalineTargets
  NAMESPACE Tessaline::
  DESTINATION ${TESSALINE_CMAKE_DIR}
  COMPONENT development)
configure_package_config_file(
  ${PROJECT_SOURCE_DIR}/cmake/TessalineConfig.cmake.in
  ${PROJECT_BINARY_DIR}/TessalineConfig.cmake
  INSTALL_DESTINATION ${TESSALINE_CMAKE_DIR})
write_basic_package_version_file(
  ${PROJECT_BINARY_DIR}/TessalineConfigVersion.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES
  ${PROJECT_BINARY_DIR}/TessalineConfig.cmake
  ${PROJECT_BINARY_DIR}/TessalineConfigVersion.cmake
  DESTINATION ${TESSALINE_CMAKE_DIR}
  COMPONENT development)

# The .pc file finds its prefix relative to itself, so a staged or relocated
# install (cmake --install --prefix, dpkg -x) works as well as the real one.
file(RELATIVE_PATH TESSALINE_PC_TO_PREFIX
  /${CMAKE_INSTALL_LIBDIR}/pkgconfig /)
configure_file(${PROJECT_SOURCE_DIR}/cmake/tessaline.pc.in
  ${PROJECT_BINARY_DIR}/tessaline.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/tessaline.pc
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig
  COMPONENT development)
