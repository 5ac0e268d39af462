# SPDX-License-Identifier: MIT
# Gives the files that cpack is about to pack the form that Debian wants: folders open to everybody, whatever the
# umask, and man page and changelog compressed (-n: without the time of day). Finds out which packages the program
# needs.
cmake_policy(SET CMP0054 NEW)

# debian_dependencies(PROGRAM RESULT): what dpkg-shlibdeps says, as the field Depends wants it.
#
# A 32-bit program on a 64-bit machine uses 32-bit libraries out of packages for 64-bit machines (libc6-i386,
# lib32stdc++6). On a 32-bit machine the same versions of the same libraries come in packages with the usual names.
function(debian_dependencies program result)
  find_program(DPKG_SHLIBDEPS dpkg-shlibdeps)
  if(NOT DPKG_SHLIBDEPS)
    message(FATAL_ERROR "dpkg-shlibdeps is needed to make Debian packages (Debian: dpkg-dev)")
  endif()
  set(folder ${CPACK_TEMPORARY_DIRECTORY}/../shlibdeps)
  file(WRITE ${folder}/debian/control "Source: vsttorture\n\nPackage: vsttorture\nArchitecture: any\n")
  execute_process(
    COMMAND ${DPKG_SHLIBDEPS} -O -e${program}
    WORKING_DIRECTORY ${folder} OUTPUT_VARIABLE output COMMAND_ERROR_IS_FATAL ANY)
  if(NOT output MATCHES "shlibs:Depends=([^\n]+)")
    message(FATAL_ERROR "dpkg-shlibdeps finds no libraries that ${program} needs: ${output}")
  endif()
  string(REGEX REPLACE "lib32(stdc\\+\\+6|gcc-s1)" "lib\\1" packages "${CMAKE_MATCH_1}")
  string(REPLACE "libc6-i386" "libc6" packages "${packages}")
  string(REPLACE ", " ";" packages "${packages}")
  list(SORT packages)
  list(JOIN packages ", " packages)
  set(${result} "${packages}" PARENT_SCOPE)
endfunction()

if(CPACK_GENERATOR STREQUAL "DEB")
  set(tree ${CPACK_TEMPORARY_DIRECTORY}${CPACK_PACKAGING_INSTALL_PREFIX})
  file(CHMOD_RECURSE ${tree} DIRECTORY_PERMISSIONS
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
  execute_process(
    COMMAND gzip -9n ${tree}/share/man/man1/vsttorture.1 ${tree}/share/doc/vsttorture/changelog
    COMMAND_ERROR_IS_FATAL ANY)
  debian_dependencies(${tree}/bin/vsttorture CPACK_DEBIAN_PACKAGE_DEPENDS)
endif()
