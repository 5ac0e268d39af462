# SPDX-License-Identifier: MIT
# Sets SCAN_UNDER_TEST: what the tests start as vsttorture-scan. In a build with a sanitizer that is a script, which gives
# it what the sanitizer needs, since the tests clear the environment.
set(SCAN_UNDER_TEST $<TARGET_FILE:vsttorture-scan>)
if(VSTTORTURE_SANITIZE)
  set(sanitized_scan_folder ${PROJECT_BINARY_DIR}/sanitized_scan)
  set(SCAN_UNDER_TEST ${sanitized_scan_folder}/vsttorture-scan)
  # The scan itself must not leak. In what loads plug-ins, an instance that throws while it is created is never closed, and
  # one that crashes neither.
  foreach(program IN ITEMS vsttorture-worker vsttorture-describe)
    file(WRITE ${sanitized_scan_folder}/options.${program} "detect_leaks=0\n")
  endforeach()
  # %b is the name of the program that reads the option. A status of 99 is none of the scan's own.
  # What has been freed is kept back for a while, but not so much that the memory of a long scan is not flat.
  # No run has a limit of memory: the sanitizer reserves terabytes of addresses.
  file(CONFIGURE OUTPUT ${sanitized_scan_folder}/vsttorture-scan.in @ONLY CONTENT [[#!/bin/sh
export ASAN_OPTIONS=use_sigaltstack=0:exitcode=99:quarantine_size_mb=4:include_if_exists=@sanitized_scan_folder@/options.%b
export LSAN_OPTIONS=suppressions=@PROJECT_SOURCE_DIR@/tests/lsan_suppressions.txt:print_suppressions=0
export TSAN_OPTIONS=report_signal_unsafe=0:atexit_sleep_ms=0:exitcode=99:suppressions=@PROJECT_SOURCE_DIR@/tests/fault_matrix/tsan_suppressions.txt
case "${1-} $*" in
  history* | report* | *--memory*) ;;
  *) set -- --memory 1073741824 "$@" ;;
esac
exec $<TARGET_FILE:vsttorture-scan> "$@"
]])
  file(GENERATE OUTPUT ${SCAN_UNDER_TEST} INPUT ${sanitized_scan_folder}/vsttorture-scan.in FILE_PERMISSIONS
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
endif()
