# SPDX-License-Identifier: MIT
# Functions that make the targets of the program and the sample plug-ins.

# A static library of the program: one folder, its sources listed by name.
#   add_program_library(loader SOURCES module_loader.cpp USES support)
function(add_program_library name)
  cmake_parse_arguments(ARG "" "" "SOURCES;USES" ${ARGN})
  add_library(${name} STATIC ${ARG_SOURCES})
  target_link_libraries(${name} PUBLIC project_options ${ARG_USES} PRIVATE program_hardening)
  if(NOT name MATCHES "^scanner_")
    # Tests link programs in which a source of their own stands for a single one of the library's.
    set_target_properties(${name} PROPERTIES UNITY_BUILD OFF)
  endif()
  if(VSTTORTURE_TIDY)
    set_target_properties(${name} PROPERTIES CXX_CLANG_TIDY "clang-tidy;--quiet;--warnings-as-errors=*")
  endif()
endfunction()

# Sanitizers and coverage stay out of plug-ins: real ones have none either.
set(sample_plugin_options -fno-sanitize=all)
if(VSTTORTURE_COVERAGE)
  list(APPEND sample_plugin_options -fno-profile-arcs -fno-test-coverage)
endif()

# Code that several sample plug-ins share; each takes a copy of its own.
#   add_sample_plugin_library(sample_plugin_base SOURCES base/sample_plugin.cpp)
function(add_sample_plugin_library name)
  cmake_parse_arguments(ARG "" "" "SOURCES;USES" ${ARGN})
  add_library(${name} STATIC ${ARG_SOURCES})
  target_link_libraries(${name} PRIVATE project_options PUBLIC vst2 ${ARG_USES})
  target_compile_options(${name} PRIVATE ${sample_plugin_options})
  set_target_properties(${name} PROPERTIES CXX_VISIBILITY_PRESET hidden VISIBILITY_INLINES_HIDDEN ON)
endfunction()

# A shared object that tests and ./run load as a plug-in. It shows its entry points and nothing else.
#   add_sample_plugin(well_behaved_effect SOURCES well_behaved_effect/entry.cpp USES sample_plugin_base)
function(add_sample_plugin name)
  cmake_parse_arguments(ARG "" "" "SOURCES;USES" ${ARGN})
  set(exported_names ${PROJECT_SOURCE_DIR}/plugins/base/exported_names.map)
  add_library(${name} MODULE ${ARG_SOURCES})
  target_link_libraries(${name} PRIVATE project_options vst2 ${ARG_USES})
  target_compile_options(${name} PRIVATE ${sample_plugin_options})
  target_link_options(${name} PRIVATE -fno-sanitize=all -Wl,--no-undefined
    -Wl,--version-script=${exported_names})
  set_target_properties(${name} PROPERTIES
    PREFIX "" SUFFIX ".so" CXX_VISIBILITY_PRESET hidden VISIBILITY_INLINES_HIDDEN ON
    LINK_DEPENDS ${exported_names}
    LIBRARY_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/plugins)
  add_dependencies(sample_plugins ${name})
endfunction()
