# SPDX-License-Identifier: MIT
# The options of the build, and the flags with which every target of this project is compiled.
option(VSTTORTURE_WERROR "Treat the compiler's warnings as errors (the presets turn this on)" OFF)
option(VSTTORTURE_HARDENING "Harden the program as Debian does (hardening=+all)" ON)
option(VSTTORTURE_COVERAGE "Count the lines that run (gcov)" OFF)
option(VSTTORTURE_TIDY "Run clang-tidy over the program's sources while they are compiled" OFF)
option(VSTTORTURE_FUZZ "Link the fuzz targets with libFuzzer, which needs clang" OFF)
set(VSTTORTURE_SANITIZE "" CACHE STRING "Sanitizers to build with: address,undefined or thread; none if empty")

set(CMAKE_CXX_STANDARD 17)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_C_STANDARD 99)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
include(CheckPIESupported)
check_pie_supported()  # Without this CMake compiles for a position-independent executable but links no such.

# These two are for all targets, GoogleTest's included.
if(VSTTORTURE_SANITIZE)
  set(sanitize ${VSTTORTURE_SANITIZE})
  if(VSTTORTURE_FUZZ)
    set(sanitize fuzzer-no-link,${sanitize})
  endif()
  add_compile_options(-fsanitize=${sanitize} -fno-sanitize-recover=undefined -fno-omit-frame-pointer)
  add_link_options(-fsanitize=${sanitize})
endif()
if(VSTTORTURE_COVERAGE)
  add_compile_options(--coverage)
  add_link_options(--coverage)
endif()

# What every target of ours is compiled with. Stack protection turns a text that is longer than our buffer into an
# abort, which is a known end.
add_library(project_options INTERFACE)
target_include_directories(project_options INTERFACE ${PROJECT_SOURCE_DIR})
target_compile_options(project_options INTERFACE
  -Wall -Wextra -Wpedantic -Wshadow -Wconversion -Wformat=2
  $<$<BOOL:${VSTTORTURE_WERROR}>:-Werror>
  $<$<COMPILE_LANGUAGE:CXX>:-Wold-style-cast>
  -fstack-protector-strong)
# The presets "asan", "tsan" and "x86" compile several sources of a target as one, which halves the time. "release" does
# not: there each source stands alone. In the joined sources every type looks like a header's, and GCC warns of members
# whose types are local to their source. A source that clashes with another one of its target says so where it is
# listed (SKIP_UNITY_BUILD_INCLUSION).
if(CMAKE_UNITY_BUILD AND CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  target_compile_options(project_options INTERFACE $<$<COMPILE_LANGUAGE:CXX>:-Wno-subobject-linkage>)
endif()
# Files of 2 GiB and more, on 32-bit Linux too.
if(CMAKE_SIZEOF_VOID_P EQUAL 4 AND NOT APPLE)
  target_compile_definitions(project_options INTERFACE _FILE_OFFSET_BITS=64)
endif()

# What the program is compiled and linked with in addition: the rest of Debian's hardening. Checked calls of the C
# library need optimisation, and stay out of sanitized builds, which check more.
add_library(program_hardening INTERFACE)
if(VSTTORTURE_HARDENING AND NOT APPLE)
  set(is_optimised $<CONFIG:Release,RelWithDebInfo,MinSizeRel>)
  if(NOT VSTTORTURE_SANITIZE)
    target_compile_options(program_hardening INTERFACE
      $<${is_optimised}:-U_FORTIFY_SOURCE> $<${is_optimised}:-D_FORTIFY_SOURCE=2>)
  endif()
  target_compile_options(program_hardening INTERFACE -Werror=format-security)
  target_link_options(program_hardening INTERFACE -Wl,-z,relro -Wl,-z,now)
endif()
