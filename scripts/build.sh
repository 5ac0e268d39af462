# SPDX-License-Identifier: MIT
# What ./run, ./check and .ci/run share. Sourced by them; functions work in the source folder.
# shellcheck shell=bash

# install_packages NAME...: asks apt for the Debian packages that are missing. Without apt, what is there has
# to do.
install_packages() {
  command -v apt-get >/dev/null || return 0
  local package missing=() as_root=(env)
  for package; do
    [[ $(dpkg-query -W -f '${db:Status-Status}' "$package" 2>/dev/null) == installed ]] || missing+=("$package")
  done
  [[ ${#missing[@]} -gt 0 ]] || return 0

  echo "Installing ${missing[*]}"
  [[ $(id -u) -eq 0 ]] || as_root=(sudo env)
  "${as_root[@]}" apt-get update -qq
  "${as_root[@]}" DEBIAN_FRONTEND=noninteractive apt-get install -qq --no-install-recommends "${missing[@]}"
}

# configure PRESET [OPTION...]: only where it never was done or the presets are newer; ninja sees to the rest.
configure() {
  [[ build/$1/build.ninja -nt CMakePresets.json ]] || cmake --preset "$@"
}
