# What every target of this project is compiled with.

set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
set(CMAKE_CXX_VISIBILITY_PRESET hidden)
set(CMAKE_VISIBILITY_INLINES_HIDDEN ON)
set(CMAKE_EXPORT_COMPILE_COMMANDS ON)

if(NOT CMAKE_BUILD_TYPE AND NOT CMAKE_CONFIGURATION_TYPES)
  set(CMAKE_BUILD_TYPE RelWithDebInfo CACHE STRING "" FORCE)
endif()

find_program(CCACHE_PROGRAM ccache)
mark_as_advanced(CCACHE_PROGRAM)
if(CCACHE_PROGRAM AND NOT CMAKE_CXX_COMPILER_LAUNCHER)
  set(CMAKE_CXX_COMPILER_LAUNCHER "${CCACHE_PROGRAM}")
endif()

# A faster linker where there is one.
find_program(MOLD_PROGRAM mold)
find_program(LLD_PROGRAM ld.lld)
mark_as_advanced(MOLD_PROGRAM LLD_PROGRAM)
if(MOLD_PROGRAM)
  add_link_options(-fuse-ld=mold)
elseif(LLD_PROGRAM)
  add_link_options(-fuse-ld=lld)
endif()

# The results of floating-point code are part of the interface: no fused
# multiply-add may be formed behind the source's back.
add_compile_options(-ffp-contract=off)
# The library's calls of its own exported functions are bound as it is built, so they may be inlined.
add_compile_options(-fno-semantic-interposition)
add_compile_options(-Wall -Wextra -Wpedantic -Wshadow -Wnon-virtual-dtor
                    -Woverloaded-virtual -Wcast-qual -Wformat=2)
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU" AND CMAKE_CXX_COMPILER_VERSION VERSION_LESS 13)
  # g++ 12 sees overlaps inside the standard library's strings where there are none.
  add_compile_options(-Wno-restrict)
endif()
if(CMAKE_CXX_COMPILER_ID STREQUAL "Clang")
  # Unlike g++ it warns of a format that is handed on together with a va_list.
  add_compile_options(-Wno-format-nonliteral)
endif()
if(KORVANE_DEVELOPER)
  add_compile_options(-Werror)
endif()

if(KORVANE_FUZZ)
  if(NOT CMAKE_CXX_COMPILER_ID STREQUAL "Clang")
    message(FATAL_ERROR "KORVANE_FUZZ needs clang, for its libFuzzer: -DCMAKE_CXX_COMPILER=clang++")
  endif()
  add_compile_options(-fsanitize=fuzzer-no-link)
  if(NOT KORVANE_SANITIZE)
    set(KORVANE_SANITIZE "address,undefined")
  endif()
endif()
if(KORVANE_SANITIZE)
  add_compile_options(-fsanitize=${KORVANE_SANITIZE} -fno-omit-frame-pointer
                      -fno-sanitize-recover=all)
  if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
    # The sanitizers' own code hides from g++ what is set where.
    add_compile_options(-Wno-maybe-uninitialized)
  endif()
  add_link_options(-fsanitize=${KORVANE_SANITIZE})
endif()
if(KORVANE_COVERAGE)
  add_compile_options(--coverage -fprofile-update=atomic)
  add_link_options(--coverage)
endif()
add_link_options(-Wl,--as-needed)
