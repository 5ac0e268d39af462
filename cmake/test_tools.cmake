# SPDX-License-Identifier: MIT
# Decides whether the tests are built: sets VSTTORTURE_HAS_TESTS. Finds their tools: Python 3 and GoogleTest.
#
# The program itself needs a compiler only, so a machine without these tools still builds it.
option(VSTTORTURE_REQUIRE_TESTS "Stop when the tests' tools are missing; otherwise the tests are left out" OFF)
set(VSTTORTURE_GOOGLETEST_DIR /usr/src/googletest CACHE PATH "GoogleTest's source folder")

# find_test_tools(MISSING): says in MISSING what is missing; empty if nothing is.
# GoogleTest as installed is used where it suits: it has the compiler's usual word size and no sanitizers. Other
# builds make it from its sources.
macro(find_test_tools missing)
  set(${missing} "")
  set(VSTTORTURE_GOOGLETEST_IS_INSTALLED OFF)
  if(NOT VSTTORTURE_SANITIZE)
    find_package(GTest 1.12 QUIET CONFIG)
    if(TARGET GTest::gtest AND TARGET GTest::gmock_main)
      set(VSTTORTURE_GOOGLETEST_IS_INSTALLED ON)
    endif()
  endif()
  if(NOT VSTTORTURE_GOOGLETEST_IS_INSTALLED AND NOT EXISTS ${VSTTORTURE_GOOGLETEST_DIR}/CMakeLists.txt)
    list(APPEND ${missing} "GoogleTest (Debian: libgmock-dev)")
  endif()
  find_package(Python3 3.7 QUIET COMPONENTS Interpreter)
  if(NOT Python3_Interpreter_FOUND)
    list(APPEND ${missing} "Python 3")
  endif()
  list(JOIN ${missing} " and " ${missing})
endmacro()

set(VSTTORTURE_HAS_TESTS OFF)
if(BUILD_TESTING)
  find_test_tools(missing_test_tools)
  if(NOT missing_test_tools)
    set(VSTTORTURE_HAS_TESTS ON)
  elseif(VSTTORTURE_REQUIRE_TESTS)
    message(FATAL_ERROR "The tests cannot be built without ${missing_test_tools}")
  else()
    message(STATUS "The tests are left out: there is no ${missing_test_tools}")
  endif()
elseif(VSTTORTURE_REQUIRE_TESTS)
  message(FATAL_ERROR "VSTTORTURE_REQUIRE_TESTS contradicts BUILD_TESTING=OFF")
endif()
