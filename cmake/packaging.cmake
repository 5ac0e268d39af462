# SPDX-License-Identifier: MIT
# What `cmake --install` puts in place, and the two Debian packages that `cpack` makes of it in the build's folder:
#
# - vsttorture-workers: the programs that load plug-ins, below the folder of their architecture in the library path.
#   A program loads plug-ins of its own word size only, so amd64's and i386's packages install side by side
#   (Multi-Arch: same). Outside that folder they hold files only that are the same for every architecture.
# - vsttorture: links to these programs in the path, the scan where it is built, and everything to read.
#
# The component "programs" is in no package: it is where a plain `cmake --install` has the programs.
include(GNUInstallDirs)
set(programs vsttorture vsttorture-worker vsttorture-describe)
install(TARGETS ${programs} RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT programs)
install(FILES docs/vsttorture.1 docs/vsttorture-worker.1 docs/vsttorture-describe.1
        DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT vsttorture)
install(FILES docs/PROTOCOL.md docs/FLIGHT_RECORD.md docs/WHEN_A_PLUGIN_FAILS.md docs/changelog docs/copyright
        DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT vsttorture)
install(FILES docs/schema/plugin-description.schema.json
        DESTINATION ${CMAKE_INSTALL_DOCDIR}/schema COMPONENT vsttorture)
# The examples are where the links in the documents expect them.
install(FILES docs/examples/try_plugin.cpp DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples COMPONENT vsttorture)
install(PROGRAMS docs/examples/try_plugin.py docs/examples/explain_plugin.py
        DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples COMPONENT vsttorture)
if(TARGET vsttorture-scan)
  install(TARGETS vsttorture-scan RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT vsttorture)
  install(FILES docs/vsttorture-scan.1 DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT vsttorture)
  install(FILES docs/VERDICTS.md docs/RESULTS_DATABASE.md docs/BREAKS_MY_SESSION.md docs/IN_YOUR_CI.md docs/IN_YOUR_HOST.md
          DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT vsttorture)
  install(FILES docs/examples/read_scan.cpp DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples COMPONENT vsttorture)
  install(PROGRAMS docs/examples/read_scan.py DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples COMPONENT vsttorture)
  install(PROGRAMS docs/examples/ci/torture.sh DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples/ci COMPONENT vsttorture)
  install(FILES docs/examples/ci/github-workflow.yml docs/examples/ci/gitlab-ci.yml
          DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples/ci COMPONENT vsttorture)
  install(PROGRAMS docs/examples/many_machines/scan_array.sh docs/examples/many_machines/scan_on_hosts.sh
          DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples/many_machines COMPONENT vsttorture)
  install(FILES docs/schema/scan-events.schema.json DESTINATION ${CMAKE_INSTALL_DOCDIR}/schema COMPONENT vsttorture)
  install(FILES completions/vsttorture-scan.bash DESTINATION ${CMAKE_INSTALL_DATADIR}/bash-completion/completions
          RENAME vsttorture-scan COMPONENT vsttorture)
endif()
if(APPLE)
  return()
endif()

# From here on: what only the packages hold, and what they say about themselves.
#
# The folder of the architecture as gcc names it: i386-linux-gnu with -m32, for which CMAKE_LIBRARY_ARCHITECTURE is
# empty. Empty, too, where the compiler knows no such folders.
separate_arguments(flags NATIVE_COMMAND "${CMAKE_CXX_FLAGS}")
execute_process(COMMAND ${CMAKE_CXX_COMPILER} ${flags} -print-multiarch
                OUTPUT_VARIABLE architecture_folder OUTPUT_STRIP_TRAILING_WHITESPACE ERROR_QUIET)
cmake_path(APPEND workers_folder lib ${architecture_folder} vsttorture)
install(TARGETS ${programs} RUNTIME DESTINATION ${workers_folder} COMPONENT workers EXCLUDE_FROM_ALL)
install(FILES docs/changelog docs/copyright
        DESTINATION ${CMAKE_INSTALL_DATAROOTDIR}/doc/vsttorture-workers COMPONENT workers EXCLUDE_FROM_ALL)
foreach(program IN LISTS programs)
  set(link ${PROJECT_BINARY_DIR}/links_of_the_package/${program})
  file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/links_of_the_package)
  file(CREATE_LINK ../${workers_folder}/${program} ${link} SYMBOLIC)
  install(FILES ${link} DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT vsttorture EXCLUDE_FROM_ALL)
endforeach()

set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_DIRECTORY ${PROJECT_BINARY_DIR})
set(CPACK_PACKAGE_VENDOR "The vsttorture developers")
set(CPACK_PACKAGE_CONTACT "The vsttorture developers <maintainers@vsttorture.invalid>")
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_STRIP_FILES ON)
set(CPACK_COMPONENTS_ALL vsttorture workers)
set(CPACK_DEB_COMPONENT_INSTALL ON)
# Makes the files what Debian wants, and sets the field Depends of both packages.
set(CPACK_PRE_BUILD_SCRIPTS ${CMAKE_CURRENT_LIST_DIR}/debian_tree.cmake)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SECTION sound)
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY "")  # Each description begins with a summary of its own.
set(CPACK_DEBIAN_VSTTORTURE_PACKAGE_NAME vsttorture)
set(CPACK_DEBIAN_VSTTORTURE_DESCRIPTION "${PROJECT_DESCRIPTION}
An audio host starts this tool as a child process before it loads a plug-in
into its own. A faulty plug-in then harms only the child, whose lines and exit
status say in which step it failed.")
if(TARGET vsttorture-scan)
  string(APPEND CPACK_DEBIAN_VSTTORTURE_DESCRIPTION "
.
vsttorture-scan finds plug-ins, tries each in a process of its own, and says
which fail, where and why. With bubblewrap it confines them, and with
vsttorture-workers of another architecture it tries that one's plug-ins, too.")
  set(CPACK_DEBIAN_VSTTORTURE_PACKAGE_RECOMMENDS bubblewrap)
endif()
set(CPACK_DEBIAN_WORKERS_PACKAGE_NAME vsttorture-workers)
# On purpose: a second field in the value of the first. CPack has no variable for it before CMake 3.31.
set(CPACK_DEBIAN_WORKERS_PACKAGE_SOURCE "vsttorture\nMulti-Arch: same")
set(CPACK_DEBIAN_WORKERS_DESCRIPTION "Programs of vsttorture that load VST 2.x plug-ins
The programs that the package vsttorture puts in the path. They load plug-ins
of their own architecture only; the packages of several architectures can be
installed side by side.")
if(CMAKE_SIZEOF_VOID_P EQUAL 4 AND CMAKE_SYSTEM_PROCESSOR MATCHES "x86_64|i.86")
  set(CPACK_DEBIAN_PACKAGE_ARCHITECTURE i386)
endif()
include(CPack)
