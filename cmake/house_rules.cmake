# What every target of ours is compiled with.
set(CMAKE_CXX_STANDARD 17)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_C_STANDARD 99)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)

# Stack protection turns a text that is longer than our buffer into an abort, which is a known end.
add_library(house_rules INTERFACE)
target_include_directories(house_rules INTERFACE ${PROJECT_SOURCE_DIR})
target_compile_options(house_rules INTERFACE
  -Wall -Wextra -Wpedantic -Wshadow -Wconversion -Wformat=2 -Werror
  $<$<COMPILE_LANGUAGE:CXX>:-Wold-style-cast>
  -fstack-protector-strong)

# A static library of the program: one folder, its sources listed by name.
#   add_program_library(loader SOURCES module_loader.cpp USES support)
function(add_program_library name)
  cmake_parse_arguments(ARG "" "" "SOURCES;USES" ${ARGN})
  add_library(${name} STATIC ${ARG_SOURCES})
  target_link_libraries(${name} PUBLIC house_rules ${ARG_USES})
  if(VSTTORTURE_TIDY)
    set_target_properties(${name} PROPERTIES CXX_CLANG_TIDY "clang-tidy;--quiet;--warnings-as-errors=*")
  endif()
endfunction()

# A shared object that tests and ./run load as a plug-in. Sanitizers stay out: real plug-ins have none either.
#   add_sample_plugin(well_behaved_effect SOURCES well_behaved_effect/well_behaved_effect.cpp)
function(add_sample_plugin name)
  cmake_parse_arguments(ARG "" "" "SOURCES;USES" ${ARGN})
  add_library(${name} MODULE ${ARG_SOURCES})
  target_link_libraries(${name} PRIVATE house_rules vst2 ${ARG_USES})
  target_compile_options(${name} PRIVATE -fno-sanitize=all)
  target_link_options(${name} PRIVATE -fno-sanitize=all -Wl,--no-undefined)
  set_target_properties(${name} PROPERTIES
    PREFIX "" SUFFIX ".so" CXX_VISIBILITY_PRESET hidden
    LIBRARY_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/plugins)
endfunction()
