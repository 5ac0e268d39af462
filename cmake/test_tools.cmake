# SPDX-License-Identifier: MIT
# Decides whether the tests are built: sets BUILD_THE_TESTS.
#
# The program itself needs a compiler only, so a machine without the tests' tools still builds it.
set(VSTTORTURE_TESTS AUTO CACHE STRING "Build the tests: OFF, AUTO (where their tools are found) or ON (insist)")
set_property(CACHE VSTTORTURE_TESTS PROPERTY STRINGS AUTO ON OFF)
set(VSTTORTURE_GOOGLETEST_DIR /usr/src/googletest CACHE PATH "GoogleTest's source folder")

set(BUILD_THE_TESTS OFF)
if(VSTTORTURE_TESTS)
  set(missing_test_tools "")
  if(NOT EXISTS ${VSTTORTURE_GOOGLETEST_DIR}/CMakeLists.txt)
    list(APPEND missing_test_tools "GoogleTest's sources in ${VSTTORTURE_GOOGLETEST_DIR}")
  endif()
  find_package(Python3 3.7 QUIET COMPONENTS Interpreter)
  if(NOT Python3_Interpreter_FOUND)
    list(APPEND missing_test_tools "Python 3")
  endif()

  list(JOIN missing_test_tools " and " missing_test_tools)
  if(NOT missing_test_tools)
    set(BUILD_THE_TESTS ON)
  elseif(VSTTORTURE_TESTS STREQUAL "AUTO")
    message(STATUS "Tests are left out: there is no ${missing_test_tools}")
  else()
    message(FATAL_ERROR "Tests are wanted, but there is no ${missing_test_tools}")
  endif()
endif()
