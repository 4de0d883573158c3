# What an installed tree holds: the library, its public headers, and the files by
# which CMake and pkg-config find it. All of them may move together: every path in
# them is relative to where they stand.

include(CMakePackageConfigHelpers)

set(KORVANE_CMAKEDIR "${CMAKE_INSTALL_LIBDIR}/cmake/Korvane")

install(TARGETS korvane EXPORT KorvaneTargets
  LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}" COMPONENT runtime NAMELINK_COMPONENT development
  ARCHIVE DESTINATION "${CMAKE_INSTALL_LIBDIR}" COMPONENT development
  FILE_SET HEADERS DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}" COMPONENT development
  FILE_SET generated_headers DESTINATION "${CMAKE_INSTALL_INCLUDEDIR}" COMPONENT development)
install(EXPORT KorvaneTargets NAMESPACE Korvane:: DESTINATION "${KORVANE_CMAKEDIR}"
  COMPONENT development)

# The static library leaves its own dependencies to whoever links it.
get_property(requires GLOBAL PROPERTY KORVANE_PC_REQUIRES)
get_property(dependencies GLOBAL PROPERTY KORVANE_DEPENDENCIES)
list(REMOVE_DUPLICATES requires)
list(REMOVE_DUPLICATES dependencies)
list(JOIN requires " " requires)
list(JOIN dependencies "\n" dependencies)
set(KORVANE_PC_CFLAGS "")
set(KORVANE_PC_REQUIRES "")
set(KORVANE_PC_LIBS "")
set(KORVANE_CONFIG_DEPENDENCIES "")
if(NOT BUILD_SHARED_LIBS)
  set(KORVANE_PC_CFLAGS " -DKORVANE_STATIC")
  set(KORVANE_PC_REQUIRES "Requires: ${requires}\n")
  set(KORVANE_PC_LIBS " -lstdc++ -lm -pthread -ldl")
  set(KORVANE_CONFIG_DEPENDENCIES "include(CMakeFindDependencyMacro)\n${dependencies}\n")
endif()

configure_package_config_file("${PROJECT_SOURCE_DIR}/cmake/KorvaneConfig.cmake.in"
  "${PROJECT_BINARY_DIR}/KorvaneConfig.cmake" INSTALL_DESTINATION "${KORVANE_CMAKEDIR}")
# Before 1.0 a minor version may change the interface.
write_basic_package_version_file("${PROJECT_BINARY_DIR}/KorvaneConfigVersion.cmake"
  COMPATIBILITY SameMinorVersion)

cmake_path(RELATIVE_PATH CMAKE_INSTALL_FULL_INCLUDEDIR BASE_DIRECTORY "${CMAKE_INSTALL_PREFIX}"
  OUTPUT_VARIABLE KORVANE_PC_INCLUDEDIR)
cmake_path(RELATIVE_PATH CMAKE_INSTALL_FULL_LIBDIR BASE_DIRECTORY "${CMAKE_INSTALL_PREFIX}"
  OUTPUT_VARIABLE KORVANE_PC_LIBDIR)
cmake_path(RELATIVE_PATH CMAKE_INSTALL_PREFIX
  BASE_DIRECTORY "${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig" OUTPUT_VARIABLE KORVANE_PC_PREFIX)
configure_file("${PROJECT_SOURCE_DIR}/cmake/korvane.pc.in" "${PROJECT_BINARY_DIR}/korvane.pc" @ONLY)

install(FILES "${PROJECT_BINARY_DIR}/KorvaneConfig.cmake"
              "${PROJECT_BINARY_DIR}/KorvaneConfigVersion.cmake"
  DESTINATION "${KORVANE_CMAKEDIR}" COMPONENT development)
install(FILES "${PROJECT_BINARY_DIR}/korvane.pc"
  DESTINATION "${CMAKE_INSTALL_LIBDIR}/pkgconfig" COMPONENT development)
