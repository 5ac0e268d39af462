#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Checks the sources for macOS on Debian 12: compiles them for three kinds of Mac, links them, and runs those
# that differ from Linux on GNUstep. One line for each check; status 1 when one fails. docs/MACOS.md says what is checked.
set -euo pipefail
cd "$(dirname "$(readlink -f "$0")")/.."

. scripts/build.sh

need_packages "to check the sources for macOS" cmake ninja-build python3 g++ g++-multilib clang-14 lld-14 llvm-14 \
  libc++-14-dev libc++abi-14-dev gobjc++ gobjc++-multilib libgnustep-base-dev libc6-dev-arm64-cross

status=0
python3 -B tests/macos/check_build.py || status=1
python3 -B tests/macos/check_exception_handler.py || status=1
if [[ $status -eq 0 ]]; then echo "The sources for macOS pass."; else echo "The sources for macOS FAIL."; fi
exit $status
