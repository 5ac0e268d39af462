# SPDX-License-Identifier: MIT
# What `cmake --install` puts in place, and the Debian package that `cpack` makes of it in the build's folder.
#
# Each file names its component; all of them go into one package. A second package needs components of its own and
# CPACK_DEB_COMPONENT_INSTALL.
include(GNUInstallDirs)
install(TARGETS vsttorture RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT vsttorture)
install(FILES docs/vsttorture.1 DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT vsttorture)
# For makers of hosts. The examples are where the links in PROTOCOL.md expect them.
install(FILES docs/PROTOCOL.md docs/changelog docs/copyright
        DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT vsttorture)
install(FILES docs/examples/try_plugin.cpp
        DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples COMPONENT vsttorture)
install(PROGRAMS docs/examples/try_plugin.py DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples COMPONENT vsttorture)

set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_DIRECTORY ${PROJECT_BINARY_DIR})
set(CPACK_PACKAGE_VENDOR "The vsttorture developers")
set(CPACK_PACKAGE_CONTACT "The vsttorture developers <maintainers@vsttorture.invalid>")
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_STRIP_FILES ON)
# Makes the files what Debian wants, and sets CPACK_DEBIAN_PACKAGE_DEPENDS.
set(CPACK_PRE_BUILD_SCRIPTS ${CMAKE_CURRENT_LIST_DIR}/debian_tree.cmake)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SECTION sound)
set(CPACK_DEBIAN_PACKAGE_DESCRIPTION "An audio host starts this tool as a child process before it loads a plug-in
into its own. A faulty plug-in then harms only the child, whose lines and exit
status say in which step it failed.")
if(CMAKE_SIZEOF_VOID_P EQUAL 4 AND CMAKE_SYSTEM_PROCESSOR MATCHES "x86_64|i.86")
  set(CPACK_DEBIAN_PACKAGE_ARCHITECTURE i386)
endif()
include(CPack)
