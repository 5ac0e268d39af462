# SPDX-License-Identifier: MIT
# Gives the files that cpack is about to pack the form that Debian wants: folders open to everybody, whatever the
# umask, and man page and changelog compressed (-n: without the time of day).
if(CPACK_GENERATOR STREQUAL "DEB")
  set(tree ${CPACK_TEMPORARY_DIRECTORY}${CPACK_PACKAGING_INSTALL_PREFIX})
  file(CHMOD_RECURSE ${tree} DIRECTORY_PERMISSIONS
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
  execute_process(
    COMMAND gzip -9n ${tree}/share/man/man1/vsttorture.1 ${tree}/share/doc/vsttorture/changelog
    COMMAND_ERROR_IS_FATAL ANY)
endif()
