# korvane_subsystem(<name> [FLOORS <name>...] [LIBRARIES <target>...] SOURCES <file>...)
#
# One floor of the library as an object library, korvane_<name>. FLOORS are the
# floors it stands on: their include directories and definitions come along, and
# tests/floors checks that no source includes a floor that is not below its own.
# LIBRARIES are the outside libraries that its sources use; they stay private.
function(korvane_subsystem name)
  cmake_parse_arguments(ARG "" "" "FLOORS;LIBRARIES;SOURCES" ${ARGN})
  add_library(korvane_${name} OBJECT ${ARG_SOURCES})
  target_include_directories(korvane_${name} PUBLIC
    $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}> $<BUILD_INTERFACE:${PROJECT_BINARY_DIR}/include>)
  target_compile_definitions(korvane_${name} PRIVATE KORVANE_BUILDING)
  foreach(floor IN LISTS ARG_FLOORS)
    target_link_libraries(korvane_${name} PUBLIC korvane_${floor})
  endforeach()
  target_link_libraries(korvane_${name} PRIVATE ${ARG_LIBRARIES})
  set_property(GLOBAL APPEND PROPERTY KORVANE_SUBSYSTEMS ${name})
  set_property(GLOBAL APPEND PROPERTY KORVANE_LIBRARIES ${ARG_LIBRARIES})
endfunction()

# korvane_tests(<subsystem> SOURCES <file>... [LIBRARIES <target>...])
#
# The tests of one subsystem: the program <subsystem>_tests, each case known to
# CTest by its own name. Tests see public headers only.
function(korvane_tests name)
  cmake_parse_arguments(ARG "" "" "SOURCES;LIBRARIES" ${ARGN})
  add_executable(${name}_tests ${ARG_SOURCES})
  target_link_libraries(${name}_tests PRIVATE
    Korvane::korvane GTest::gmock GTest::gtest_main ${ARG_LIBRARIES})
  target_include_directories(${name}_tests PRIVATE "${PROJECT_SOURCE_DIR}/tests")
  target_compile_definitions(${name}_tests PRIVATE
    KORVANE_SOURCE_DIR="${PROJECT_SOURCE_DIR}" KORVANE_TEST_DATA="${PROJECT_SOURCE_DIR}/tests/data")
  gtest_discover_tests(${name}_tests DISCOVERY_MODE PRE_TEST PROPERTIES TIMEOUT 300)
endfunction()
