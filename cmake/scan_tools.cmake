# SPDX-License-Identifier: MIT
# Decides whether vsttorture-scan is built: sets BUILD_THE_SCAN.
#
# The programs that load plug-ins need a compiler only. The scan starts them and loads nothing, so it may use
# libraries; where these are missing, everything else is still built.
set(VSTTORTURE_SCAN AUTO CACHE STRING "Build vsttorture-scan: OFF, AUTO (where its libraries are found) or ON (insist)")
set_property(CACHE VSTTORTURE_SCAN PROPERTY STRINGS AUTO ON OFF)

set(BUILD_THE_SCAN OFF)
if(VSTTORTURE_SCAN)
  set(missing_for_the_scan "")
  if(NOT CMAKE_SYSTEM_NAME STREQUAL "Linux")
    list(APPEND missing_for_the_scan "Linux")
  elseif(NOT CMAKE_SIZEOF_VOID_P EQUAL 8)
    # It starts the workers of both word sizes.
    list(APPEND missing_for_the_scan "64-bit target")
  else()
    find_package(PkgConfig QUIET)
    if(PkgConfig_FOUND)
      pkg_check_modules(libuv QUIET IMPORTED_TARGET libuv)
      pkg_check_modules(sqlite3 QUIET IMPORTED_TARGET sqlite3)
    endif()
    find_package(CLI11 QUIET)
    find_package(fmt QUIET)
    find_package(nlohmann_json QUIET)
    find_package(pugixml QUIET)
    foreach(library IN ITEMS libuv sqlite3 CLI11 fmt nlohmann_json pugixml)
      if(NOT ${library}_FOUND)
        list(APPEND missing_for_the_scan ${library})
      endif()
    endforeach()
  endif()

  list(JOIN missing_for_the_scan " and no " missing_for_the_scan)
  if(NOT missing_for_the_scan)
    set(BUILD_THE_SCAN ON)
  elseif(VSTTORTURE_SCAN STREQUAL "AUTO")
    message(STATUS "vsttorture-scan is left out: there is no ${missing_for_the_scan}")
  else()
    message(FATAL_ERROR "vsttorture-scan is wanted, but there is no ${missing_for_the_scan}")
  endif()
endif()
