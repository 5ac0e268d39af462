# SPDX-License-Identifier: MIT
# Builds the program for macOS on a machine that is none, to check its sources: clang, libc++'s headers, the C
# library's headers of this machine, and stubs of our own in place of an SDK. What comes out of it never runs.
#
#   VSTTORTURE_MAC_ARCHITECTURE x86_64, i386 or arm64
#   CMAKE_OSX_DEPLOYMENT_TARGET the oldest macOS that the program runs on; the preset sets it
#   VSTTORTURE_MAC_LIBRARIES    where the stubs to link against stand; tests/macos/stubs/sysroot by default
set(CMAKE_SYSTEM_NAME Darwin)
set(CMAKE_TRY_COMPILE_TARGET_TYPE STATIC_LIBRARY)  # there is no system to link a whole program against
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES VSTTORTURE_MAC_ARCHITECTURE)
set(CMAKE_SYSTEM_PROCESSOR ${VSTTORTURE_MAC_ARCHITECTURE})
set(CMAKE_OSX_ARCHITECTURES ${VSTTORTURE_MAC_ARCHITECTURE} CACHE STRING "")

set(stubs ${CMAKE_CURRENT_LIST_DIR}/stubs)
set(VSTTORTURE_MAC_LIBRARIES ${stubs}/sysroot CACHE PATH "Stubs of the libraries to link against")
set(CMAKE_OSX_SYSROOT ${VSTTORTURE_MAC_LIBRARIES})

set(llvm /usr/lib/llvm-14)
set(CMAKE_AR ${llvm}/bin/llvm-ar)
set(CMAKE_RANLIB ${llvm}/bin/llvm-ranlib)
set(CMAKE_INSTALL_NAME_TOOL ${llvm}/bin/llvm-install-name-tool)

# glibc's headers, those of 32-bit x86 among those of x86-64.
if(CMAKE_SYSTEM_PROCESSOR STREQUAL "arm64")
  set(c_headers /usr/aarch64-linux-gnu/include)
else()
  set(c_headers /usr/include/x86_64-linux-gnu /usr/include)
endif()

# libc++ as macOS ships it marks what older systems lack; Debian's configuration leaves the marks out.
file(READ ${llvm}/include/c++/v1/__config_site config_site)
string(REPLACE "#define _LIBCPP_HAS_NO_VENDOR_AVAILABILITY_ANNOTATIONS\n" "" config_site "${config_site}")
set(config_site_directory ${CMAKE_CURRENT_BINARY_DIR}/libcxx_config)
file(CONFIGURE OUTPUT ${config_site_directory}/__config_site CONTENT "${config_site}" @ONLY)

foreach(language C CXX OBJCXX)
  # Without a version: that comes from the deployment target, as on a Mac. For arm64 clang makes it 11 at least.
  set(CMAKE_${language}_COMPILER_TARGET ${VSTTORTURE_MAC_ARCHITECTURE}-apple-macosx)
  set(CMAKE_${language}_STANDARD_INCLUDE_DIRECTORIES ${stubs}/include ${c_headers})
  # The compiler's own __nonnull is in the way of glibc's.
  set(CMAKE_${language}_FLAGS_INIT "-U__nonnull -D_GNU_SOURCE")
endforeach()
set(CMAKE_C_COMPILER ${llvm}/bin/clang)
foreach(language CXX OBJCXX)
  set(CMAKE_${language}_COMPILER ${llvm}/bin/clang++)
  list(PREPEND CMAKE_${language}_STANDARD_INCLUDE_DIRECTORIES ${config_site_directory} ${llvm}/include/c++/v1)
  string(APPEND CMAKE_${language}_FLAGS_INIT " -nostdinc++")
endforeach()
set(CMAKE_EXE_LINKER_FLAGS_INIT "-fuse-ld=lld -stdlib=libc++ -lglibc_spelling -Wno-unused-command-line-argument")
