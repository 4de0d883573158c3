# The project's own words for what it is made of: a floor of the library, the
# tests of a floor, a benchmark, a fuzz entry.

# korvane_find(<package> [version] [COMPONENTS <name>...] [PKGCONFIG <module>...])
#
# An outside library that the library's sources use, found by find_package. The
# PKGCONFIG names are those of its .pc files. Both are remembered for those who
# link the static library: KorvaneConfig.cmake and korvane.pc name them.
macro(korvane_find)
  cmake_parse_arguments(_korvane "" "" "PKGCONFIG" ${ARGN})
  find_package(${_korvane_UNPARSED_ARGUMENTS} REQUIRED)
  list(JOIN _korvane_UNPARSED_ARGUMENTS " " _korvane_find_line)
  set_property(GLOBAL APPEND PROPERTY KORVANE_DEPENDENCIES "find_dependency(${_korvane_find_line})")
  set_property(GLOBAL APPEND PROPERTY KORVANE_PC_REQUIRES ${_korvane_PKGCONFIG})
endmacro()

# korvane_find_pkgconfig(<module> [condition])
#
# The same for a library that has no CMake package: PkgConfig::<module>, by
# pkg-config. The condition reads like ">=3.0".
macro(korvane_find_pkgconfig module)
  find_package(PkgConfig REQUIRED)
  pkg_check_modules(${module} REQUIRED IMPORTED_TARGET GLOBAL "${module}${ARGN}")
  set_property(GLOBAL APPEND PROPERTY KORVANE_DEPENDENCIES
    "find_dependency(PkgConfig)"
    "if(NOT TARGET PkgConfig::${module})\n  pkg_check_modules(${module} REQUIRED QUIET IMPORTED_TARGET \"${module}${ARGN}\")\nendif()")
  set_property(GLOBAL APPEND PROPERTY KORVANE_PC_REQUIRES ${module})
endmacro()

# korvane_subsystem(<name> [FLOORS <name>...] [LIBRARIES <target>...]
#                   SOURCES <file>... [HEADERS <file>...])
#
# One floor of the library as an object library, korvane_<name>. FLOORS are the
# floors it stands on: their include directories and definitions come along, and
# tests/house checks that no file includes from a floor that is not below its own.
# LIBRARIES are the outside libraries that its sources use; they stay private.
#
# A header belongs to the floor of the source beside it; one without a source to
# the floor that has the folder's name. HEADERS names those where that is not so.
function(korvane_subsystem name)
  cmake_parse_arguments(ARG "" "" "FLOORS;LIBRARIES;SOURCES;HEADERS" ${ARGN})
  add_library(korvane_${name} OBJECT ${ARG_SOURCES})
  target_include_directories(korvane_${name} PUBLIC
    $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}> $<BUILD_INTERFACE:${PROJECT_BINARY_DIR}/include>)
  target_compile_definitions(korvane_${name} PRIVATE KORVANE_BUILDING)
  if(NOT BUILD_SHARED_LIBS)
    target_compile_definitions(korvane_${name} PRIVATE KORVANE_STATIC)
  endif()
  foreach(floor IN LISTS ARG_FLOORS)
    target_link_libraries(korvane_${name} PUBLIC korvane_${floor})
  endforeach()
  target_link_libraries(korvane_${name} PRIVATE ${ARG_LIBRARIES})
  set_property(GLOBAL APPEND PROPERTY KORVANE_SUBSYSTEMS ${name})
  set_property(GLOBAL APPEND PROPERTY KORVANE_LIBRARIES ${ARG_LIBRARIES})

  set(files ${ARG_SOURCES} ${ARG_HEADERS})
  list(TRANSFORM files PREPEND "${CMAKE_CURRENT_SOURCE_DIR}/")
  list(JOIN ARG_FLOORS " " floors)
  set(lines "floor ${name} ${floors}")
  foreach(file IN LISTS files)
    cmake_path(NORMAL_PATH file)
    cmake_path(RELATIVE_PATH file BASE_DIRECTORY "${PROJECT_SOURCE_DIR}")
    list(APPEND lines "file ${name} ${file}")
  endforeach()
  set_property(GLOBAL APPEND PROPERTY KORVANE_FLOOR_LINES ${lines})
endfunction()

# korvane_tests(<subsystem> [THREADED] SOURCES <file>... [LIBRARIES <target>...])
#
# The tests of one subsystem: the program <subsystem>_tests, each case known to
# CTest by its own name. Tests see public headers only. THREADED says that threads
# meet in some of them; a build for the thread sanitizer has only those programs.
function(korvane_tests name)
  cmake_parse_arguments(ARG "THREADED" "" "SOURCES;LIBRARIES" ${ARGN})
  if(KORVANE_SANITIZE MATCHES "thread" AND NOT ARG_THREADED)
    return()
  endif()
  add_executable(${name}_tests ${ARG_SOURCES})
  target_link_libraries(${name}_tests PRIVATE
    Korvane::korvane GTest::gmock GTest::gtest_main ${ARG_LIBRARIES})
  target_include_directories(${name}_tests PRIVATE "${PROJECT_SOURCE_DIR}/tests")
  target_compile_definitions(${name}_tests PRIVATE
    KORVANE_SOURCE_DIR="${PROJECT_SOURCE_DIR}" KORVANE_TEST_DATA="${PROJECT_SOURCE_DIR}/tests/data")
  gtest_discover_tests(${name}_tests DISCOVERY_MODE PRE_TEST PROPERTIES TIMEOUT 300)
endfunction()

# korvane_bench(<Name> SOURCES <file>... [LIBRARIES <target>...])
#
# One benchmark program. A peer measured beside it is a LIBRARY of this program
# alone, never of the library. bench/<Name>.targets holds the ratios to reach.
function(korvane_bench name)
  cmake_parse_arguments(ARG "" "" "SOURCES;LIBRARIES" ${ARGN})
  add_executable(${name} ${ARG_SOURCES})
  target_link_libraries(${name} PRIVATE
    Korvane::korvane benchmark::benchmark benchmark::benchmark_main ${ARG_LIBRARIES})
endfunction()

# korvane_fuzz(<Name> SOURCES <file>... [LIBRARIES <target>...])
#
# One fuzz entry, <Name>Fuzz: a libFuzzer program where KORVANE_FUZZ is on, else a
# program that runs the entry over files. Either way the test fuzz.<Name> runs it
# over fuzz/corpus/<Name>.
function(korvane_fuzz name)
  cmake_parse_arguments(ARG "" "" "SOURCES;LIBRARIES" ${ARGN})
  if(KORVANE_SANITIZE MATCHES "thread")
    return()
  endif()
  set(corpus "${PROJECT_SOURCE_DIR}/fuzz/corpus/${name}")
  add_executable(${name}Fuzz ${ARG_SOURCES})
  target_link_libraries(${name}Fuzz PRIVATE Korvane::korvane ${ARG_LIBRARIES})
  if(KORVANE_FUZZ)
    target_link_options(${name}Fuzz PRIVATE -fsanitize=fuzzer)
    add_test(NAME fuzz.${name} COMMAND ${name}Fuzz -runs=0 "${corpus}")
  else()
    target_sources(${name}Fuzz PRIVATE "${PROJECT_SOURCE_DIR}/fuzz/replay.cpp")
    add_test(NAME fuzz.${name} COMMAND ${name}Fuzz "${corpus}")
  endif()
  set_tests_properties(fuzz.${name} PROPERTIES TIMEOUT 300)
endfunction()
