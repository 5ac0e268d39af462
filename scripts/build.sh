# SPDX-License-Identifier: MIT
# What ./run, ./check, .ci/run and the other scripts share. It is sourced; its functions work in the source folder,
# except for those that say otherwise.
# shellcheck shell=bash

# The oldest CMake that reads CMakePresets.json.
oldest_cmake=3.21

# The status of ./run and ./check when the program could not be built. No run of the program ends with it unless the
# plug-in itself calls exit(125).
# shellcheck disable=SC2034 # The scripts that source this file use it.
could_not_build=125

# A relative folder is meant from where the user is.
[[ -z ${VSTTORTURE_BUILD:-} || $VSTTORTURE_BUILD == /* ]] || export VSTTORTURE_BUILD=$PWD/$VSTTORTURE_BUILD

# say TEXT...: one line on standard error that names the script. Works everywhere.
say() { echo "$(basename "$0"): $*" >&2; }

# stop_when_interrupted: Ctrl-C ends the shell with 130 even when the command under way (apt, for one) catches the
# signal and ends by itself. A subshell has to call it again: it does not inherit traps.
stop_when_interrupted() {
  trap 'exit 130' INT
  trap 'exit 143' TERM
}

# run_as_root COMMAND...
run_as_root() {
  if [[ $(id -u) -eq 0 ]]; then env "$@"; else sudo env "$@"; fi
}

# is_there TOOL: a command in the path or a file. A C++ compiler is what CMake takes for one: $CXX, c++ or g++.
is_there() {
  case $1 in
    /*) [[ -e $1 ]] ;;
    g++) command -v "${CXX:-c++}" >/dev/null || { [[ -z ${CXX:-} ]] && command -v g++ >/dev/null; } ;;
    *) command -v "$1" >/dev/null ;;
  esac
}

# is_installed PACKAGE
is_installed() {
  [[ $(dpkg-query -W -f '${db:Status-Status}' "$1" 2>/dev/null) == installed ]]
}

# install_packages PURPOSE PACKAGE...: installs Debian packages. Says so before it starts, or says what to type.
install_packages() {
  local purpose=$1
  shift
  local install=(apt-get install --no-install-recommends "$@")
  if ! command -v apt-get >/dev/null; then
    say "$* missing, wanted $purpose (these are the names of Debian's packages). Install them, then start again."
    return 1
  fi
  if [[ $(id -u) -ne 0 ]] && ! command -v sudo >/dev/null; then
    say "$* missing, wanted $purpose. Type as root, then start again:"
    say "  apt-get update && ${install[*]}"
    return 1
  fi
  say "installing $* with apt-get, wanted $purpose"
  if ! run_as_root apt-get update -qq ||
    ! run_as_root DEBIAN_FRONTEND=noninteractive apt-get install -qq --no-install-recommends "$@"; then
    say "apt-get failed. What it should do is:  apt-get update && ${install[*]}"
    return 1
  fi
}

# need_tools PURPOSE TOOL[=PACKAGE]...: installs the packages of the commands (or files, if they begin with "/") that
# are missing; the package is named like the command if it is not given. Where a command comes from does not matter.
# Without apt a missing file is no error, since CMake may find another.
need_tools() {
  local purpose=$1 tool missing=()
  shift
  for tool; do
    is_there "${tool%%=*}" && continue
    [[ $tool == /* ]] && ! command -v apt-get >/dev/null && continue
    missing+=("${tool##*=}")
  done
  [[ ${#missing[@]} -eq 0 ]] || install_packages "$purpose" "${missing[@]}"
}

# need_packages PURPOSE PACKAGE...: the same for packages that bring more than one command. Without apt, what is there
# has to do.
need_packages() {
  local purpose=$1 package missing=()
  shift
  command -v apt-get >/dev/null || return 0
  for package; do
    is_installed "$package" || missing+=("$package")
  done
  [[ ${#missing[@]} -eq 0 ]] || install_packages "$purpose" "${missing[@]}"
}

# need_build_tools: what building the program takes.
need_build_tools() {
  need_tools "to build the program" g++ cmake ninja=ninja-build || return 1
  local version
  version=$(cmake --version | sed -n '1s/^cmake version \([0-9.]*\).*/\1/p')
  printf '%s\n' "$oldest_cmake" "$version" | sort -V -C && return 0
  say "CMake $oldest_cmake or newer is needed; $(command -v cmake) is version ${version:-unknown}."
  return 1
}

# need_scan_libraries: what building vsttorture-scan takes in addition.
need_scan_libraries() {
  need_tools "to build vsttorture-scan" pkg-config /usr/include/uv.h=libuv1-dev /usr/include/CLI/CLI.hpp=libcli11-dev \
    /usr/include/fmt/format.h=libfmt-dev /usr/include/nlohmann/json.hpp=nlohmann-json3-dev \
    /usr/include/sqlite3.h=libsqlite3-dev /usr/include/pugixml.hpp=libpugixml-dev
}

# take_turn: waits until no other ./run, ./scan or ./check builds this checkout, since two builds in one folder disturb
# each other. The turn lasts until the shell ends, or until end_turn. Without flock (macOS) nobody waits.
take_turn() {
  command -v flock >/dev/null || return 0
  exec 9<.
  flock --nonblock 9 && return 0
  say "waiting for another build of this checkout"
  flock 9 || true
}
end_turn() { exec 9<&-; }

# build_folder PRESET: where its build is: below $VSTTORTURE_BUILD, or else build/.
build_folder() { echo "${VSTTORTURE_BUILD:-$PWD/build}/$1"; }

# cached NAME FOLDER: the value of a variable in a build's cache; empty if there is none.
cached() { sed -n "s/^$1:[A-Z]*=//p" "$2/CMakeCache.txt" 2>/dev/null || true; }

# is_configured PRESET [-DNAME=VALUE...]: a build of this checkout, with these values.
is_configured() {
  local folder option
  folder=$(build_folder "$1")
  shift
  [[ -e $folder/build.ninja && $(cached CMAKE_HOME_DIRECTORY "$folder") == "$PWD" ]] || return 1
  for option; do
    option=${option#-D}
    [[ $(cached "${option%%=*}" "$folder") == "${option#*=}" ]] || return 1
  done
}

# configure PRESET [-DNAME=VALUE...]: only where it is needed; ninja sees to the rest. A build of a checkout that has
# been moved since is configured anew.
configure() {
  local preset=$1 folder project
  folder=$(build_folder "$preset")
  shift
  is_configured "$preset" "$@" && [[ $folder/build.ninja -nt CMakePresets.json ]] && return 0
  if ! mkdir -p "$folder" 2>/dev/null || [[ ! -w $folder ]]; then
    say "cannot write to $folder. Name another folder for the build:  VSTTORTURE_BUILD=/some/folder $0"
    return 1
  fi
  if [[ -e $folder/CMakeCache.txt && $(cached CMAKE_HOME_DIRECTORY "$folder") != "$PWD" ]]; then
    project=$(cached CMAKE_PROJECT_NAME "$folder")
    if [[ $project != vsttorture ]]; then
      say "$folder holds a build of another project (${project:-unknown}). Name another folder in VSTTORTURE_BUILD."
      return 1
    fi
    rm -rf "$folder/CMakeCache.txt" "$folder/CMakeFiles"
  fi
  cmake --preset "$preset" -B "$folder" "$@"
}

# build PRESET [ARGUMENT...]: arguments are those of cmake --build.
build() {
  local folder
  folder=$(build_folder "$1")
  shift
  cmake --build "$folder" "$@"
}
