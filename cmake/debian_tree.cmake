# SPDX-License-Identifier: MIT
# Gives the files that cpack is about to pack the form that Debian wants: folders open to everybody, whatever the
# umask, and man pages and changelogs compressed (-n: without the time of day, so that the files are the same for every
# architecture). Finds out which packages the programs need.
cmake_policy(SET CMP0054 NEW)

# debian_dependencies(RESULT PROGRAM...): what dpkg-shlibdeps says, as the field Depends wants it.
#
# A 32-bit program on a 64-bit machine uses 32-bit libraries out of packages for 64-bit machines (libc6-i386,
# lib32stdc++6). On a 32-bit machine the same versions of the same libraries come in packages with the usual names.
function(debian_dependencies result)
  find_program(DPKG_SHLIBDEPS dpkg-shlibdeps)
  if(NOT DPKG_SHLIBDEPS)
    message(FATAL_ERROR "dpkg-shlibdeps is needed to make Debian packages (Debian: dpkg-dev)")
  endif()
  set(folder ${CPACK_TEMPORARY_DIRECTORY}/../shlibdeps)
  file(WRITE ${folder}/debian/control "Source: vsttorture\n\nPackage: vsttorture\nArchitecture: any\n")
  execute_process(
    COMMAND ${DPKG_SHLIBDEPS} -O ${ARGN}
    WORKING_DIRECTORY ${folder} OUTPUT_VARIABLE output COMMAND_ERROR_IS_FATAL ANY)
  if(NOT output MATCHES "shlibs:Depends=([^\n]+)")
    message(FATAL_ERROR "dpkg-shlibdeps finds no libraries that ${ARGN} need: ${output}")
  endif()
  string(REGEX REPLACE "lib32(stdc\\+\\+6|gcc-s1)" "lib\\1" packages "${CMAKE_MATCH_1}")
  string(REPLACE "libc6-i386" "libc6" packages "${packages}")
  string(REPLACE ", " ";" packages "${packages}")
  list(SORT packages)
  list(JOIN packages ", " packages)
  set(${result} "${packages}" PARENT_SCOPE)
endfunction()

if(CPACK_GENERATOR STREQUAL "DEB")
  set(links ${CPACK_TEMPORARY_DIRECTORY}/vsttorture${CPACK_PACKAGING_INSTALL_PREFIX})
  set(workers ${CPACK_TEMPORARY_DIRECTORY}/workers${CPACK_PACKAGING_INSTALL_PREFIX})
  execute_process(COMMAND find ${links} ${workers} -type d -exec chmod 755 {} + COMMAND_ERROR_IS_FATAL ANY)
  file(GLOB pages ${links}/share/man/man1/*.1)
  execute_process(
    COMMAND gzip -9n ${pages} ${links}/share/doc/vsttorture/changelog ${workers}/share/doc/vsttorture-workers/changelog
    COMMAND_ERROR_IS_FATAL ANY)

  file(GLOB_RECURSE programs ${workers}/lib/*)
  debian_dependencies(CPACK_DEBIAN_WORKERS_PACKAGE_DEPENDS ${programs})
  set(CPACK_DEBIAN_VSTTORTURE_PACKAGE_DEPENDS "vsttorture-workers (= ${CPACK_PACKAGE_VERSION})")
  if(EXISTS ${links}/bin/vsttorture-scan)
    debian_dependencies(libraries ${links}/bin/vsttorture-scan)
    string(PREPEND CPACK_DEBIAN_VSTTORTURE_PACKAGE_DEPENDS "${libraries}, ")
  endif()
endif()
