#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Checks the Debian packages, amd64 out of build/release and i386 out of build/x86: makes each, looks at what is in it
# (lintian, mandoc, readelf), installs it on a fresh Debian 12 that holds what the package asks for and nothing else,
# runs the program there, and removes it again.
# One line for each check; status 1 when one fails. Works as root, else through sudo. Apart from the two builds, all it
# makes is in a folder of its own, which is removed at the end.
# shellcheck disable=SC2016 # What looks like an expansion in single quotes is apt's or dpkg's own.
set -euo pipefail
cd "$(dirname "$(readlink -f "$0")")/.."
. scripts/build.sh
export LC_ALL=C
ulimit -c 0

as_root=(env)
[[ $(id -u) -eq 0 ]] || as_root=(sudo env)
work=$(mktemp -d)
chmod 755 "$work"
trap 'wait; "${as_root[@]}" rm -rf --one-file-system "$work"' EXIT
failures=0

# check NAME EXPECTED SEEN
check() {
  if [[ $2 == "$3" ]]; then
    echo "ok    $architecture: $1"
  else
    echo "FAIL  $architecture: $1"
    diff --label expected --label seen -u <(echo "$2") <(echo "$3") | sed 's/^/      /' || true
    failures=$((failures + 1))
  fi
}

give_up() {
  echo "FAIL  $*"
  echo "The Debian packages FAIL."
  exit 1
}

# The mirror that this machine has its own packages from; empty when apt knows of none.
mirror() {
  apt-get indextargets --format '$(REPO_URI)' 'Created-By: Packages' 'Codename: bookworm' | head -n 1
}

# build_package PRESET: the umask is one that must not show in the package.
build_package() {
  configure "$1"
  cmake --build --preset "$1" --target vsttorture sample_plugins
  (umask 077 && cpack --config "build/$1/CPackConfig.cmake" -G DEB -B "$work/$1")
}

# The names in the field Depends, without versions.
dependencies() {
  dpkg-deb -f "$package" Depends | sed 's/([^)]*)//g; s/,/ /g'
}

# Debian's essential packages, what the package asks for, and what these need.
make_root() {
  "${as_root[@]}" mmdebstrap --mode=root --variant=essential --architectures="$architecture" \
    --include="$(dependencies)" bookworm "$root" "$mirror"
}

in_root() { "${as_root[@]}" chroot "$root" "$@"; }

# All files, without those in which dpkg and ld.so keep what they know.
files() {
  "${as_root[@]}" find "$root" -xdev -printf '%P\n' |
    grep -Ev '^(var/lib/dpkg/|var/log/dpkg\.log$|var/cache/ldconfig/|etc/ld\.so\.cache$)' | sort
}

# run VARIABLE=VALUE... ARGUMENT...: what the program prints on both outputs, and its status, for an ordinary user.
# The steps that are drawn at random become one line.
run() {
  local variables=() status=0
  while [[ ${1:-} == *=* ]]; do
    variables+=("$1")
    shift
  done
  "${as_root[@]}" chroot --userspec=65534:65534 "$root" /usr/bin/env -i "${variables[@]}" /usr/bin/vsttorture "$@" \
    </dev/null >"$work/out" 2>"$work/err" || status=$?
  awk '
    NR >= 17 && $0 ~ "^" NR - 1 ", (inspect (class info|preset info|parameter info|latency)|testing setting states)$" {
      if (NR == 66) print "16 to 65, tests drawn at random"
      next
    }
    { print }' "$work/out"
  sed 's/^/stderr: /' "$work/err"
  echo "exit status $status"
}

check_contents() {
  check "the package says what it is and what it needs" \
    "Package: vsttorture
Version: $version
Architecture: $architecture
Section: sound
Priority: optional
Depends: libc6 (>= 2.34), libgcc-s1 (>= any), libstdc++6 (>= 9)" \
    "$(dpkg-deb -f "$package" Package Version Architecture Section Priority Depends |
      sed 's/libgcc-s1 (>= [0-9.]*)/libgcc-s1 (>= any)/')"

  check "it holds the program, its man page and what makers of hosts read" \
    "drwxr-xr-x root/root ./usr/
drwxr-xr-x root/root ./usr/bin/
-rwxr-xr-x root/root ./usr/bin/vsttorture
drwxr-xr-x root/root ./usr/share/
drwxr-xr-x root/root ./usr/share/doc/
drwxr-xr-x root/root ./usr/share/doc/vsttorture/
-rw-r--r-- root/root ./usr/share/doc/vsttorture/PROTOCOL.md
-rw-r--r-- root/root ./usr/share/doc/vsttorture/changelog.gz
-rw-r--r-- root/root ./usr/share/doc/vsttorture/copyright
drwxr-xr-x root/root ./usr/share/doc/vsttorture/examples/
-rw-r--r-- root/root ./usr/share/doc/vsttorture/examples/try_plugin.cpp
-rwxr-xr-x root/root ./usr/share/doc/vsttorture/examples/try_plugin.py
drwxr-xr-x root/root ./usr/share/man/
drwxr-xr-x root/root ./usr/share/man/man1/
-rw-r--r-- root/root ./usr/share/man/man1/vsttorture.1.gz" \
    "$(dpkg-deb -c "$package" | awk '{ print $1, $2, $6 }' | sort -k 3)"

  local unpacked=$work/unpacked_$architecture
  dpkg-deb -x "$package" "$unpacked"
  check "lintian finds no error and gives no warning" "" \
    "$(lintian --no-cfg --allow-root --display-level '>=warning' "$package" 2>&1)"
  check "mandoc finds no fault in the man page" "" \
    "$(gunzip -c "$unpacked/usr/share/man/man1/vsttorture.1.gz" | mandoc -T lint -W style 2>&1)"
  check_hardening "$unpacked/usr/bin/vsttorture"
}

# check_hardening PROGRAM
check_hardening() {
  check "it can be loaded at any address" "DYN (Position-Independent Executable file)" \
    "$(readelf -h "$1" | sed -n 's/^ *Type: *//p')"
  check "all its symbols are bound before it starts" "BIND_NOW NOW PIE" \
    "$(readelf -dW "$1" | sed -n 's/.*(FLAGS\(_1\)\?) *\(Flags: \)\?//p' | xargs)"
  check "its tables are read-only after that, and its stack holds no code" "GNU_STACK RW
GNU_RELRO R" \
    "$(readelf -lW "$1" | awk '$1 == "GNU_STACK" || $1 == "GNU_RELRO" { print $1, $7 }')"
  check "its stack and its calls of the C library are checked" "__snprintf_chk
__stack_chk_fail" \
    "$(readelf --dyn-syms -W "$1" | grep -oE '__(snprintf_chk|stack_chk_fail)\b' | sort -u)"
  check "it opens files of 2 GiB and more" "" "$(narrow_functions "$1")"
}

# narrow_functions PROGRAM: what it calls that has only 32 bits for the size of a file. None on amd64.
narrow_functions() {
  [[ $architecture == i386 ]] || return 0
  readelf --dyn-syms -W "$1" |
    grep -oE ' (creat|f?open|openat|f?l?stat|fstatat|mmap|lseek|f?truncate|pread|pwrite|readdir|fseeko|ftello)(@|$)' || true
}

check_installed() {
  check "dpkg installs it" "ii  $version" "$(in_root dpkg -i /vsttorture.deb >"$work/log" 2>&1 || cat "$work/log"
    in_root dpkg-query -W -f '${db:Status-Abbrev} ${Version}' vsttorture 2>&1)"
  check "every file is as packed" \
    "usr/bin/vsttorture: OK
usr/share/doc/vsttorture/PROTOCOL.md: OK
usr/share/doc/vsttorture/changelog.gz: OK
usr/share/doc/vsttorture/copyright: OK
usr/share/doc/vsttorture/examples/try_plugin.cpp: OK
usr/share/doc/vsttorture/examples/try_plugin.py: OK
usr/share/man/man1/vsttorture.1.gz: OK" \
    "$(in_root md5sum --check /var/lib/dpkg/info/vsttorture.md5sums 2>&1; in_root dpkg --verify vsttorture 2>&1)"

  local page changelog
  page=$(gunzip -c "$root/usr/share/man/man1/vsttorture.1.gz")
  changelog=$(gunzip -c "$root/usr/share/doc/vsttorture/changelog.gz")
  check "the man page and the changelog are of this version" \
    "$(head -n 1 docs/vsttorture.1)
$(head -n 1 docs/changelog)" "${page%%$'\n'*}
${changelog%%$'\n'*}"

  check "the program is of this architecture" "$elf" \
    "$(readelf -h "$root/usr/bin/vsttorture" | sed -nE 's/^ +(Class|Machine): +//p')"
  check "it needs the C and C++ runtimes and nothing else" \
    "libc.so.6
libgcc_s.so.1
libstdc++.so.6" \
    "$(readelf -d "$root/usr/bin/vsttorture" | sed -nE 's/.*\(NEEDED\).*\[(.*)\]/\1/p' | sort)"
  check "it has no symbols for a debugger" "" \
    "$(readelf -SW "$root/usr/bin/vsttorture" | grep -oE '\.(symtab|debug)[^ ]*' || true)"
}

check_runs() {
  check "without arguments" \
    "!too few arguments. syntax is command pathtovst childID(optional)
exit status 2" "$(run)"
  check "no such file" \
    "!create and initialize failed -1
stderr: vsttorture: /plugins/none.so: No such file or directory
exit status 3" "$(run /plugins/none.so)"
  check "a file that is no plug-in" \
    "!create and initialize failed -1
stderr: vsttorture: /etc/hostname: file too short
exit status 3" "$(run /etc/hostname)"
  check "a good plug-in" \
    "total, 64
1, test gathering info
2, inspect class info
3, inspect preset info
4, inspect parameter info
5, testing setting states
6, inspect latency
7, inspect stream format
8, inspect stream format
9, inspect latency
10, testing setting states
11, inspect parameter info
12, inspect preset info
13, inspect class info
14, initialize
15, test gathering info
16 to 65, tests drawn at random
exit status 0" "$(run /plugins/well_behaved_effect.so)"
  check "a shell" \
    "total, 51
1, test gathering info
exit status 1" "$(run /plugins/shell.so)"
  # effGetPlugCategory (35) comes before the first line, effGetTailSize (52) in step 6.
  check "a plug-in that throws" \
    "!create and initialize failed 5
exit status 3" "$(run FAULT_KIND=throw_int FAULT_PLACE=dispatch:35 /plugins/faulty.so)"
  check "a plug-in that throws in a step" \
    "$steps_to_the_tail_size
!inspect latency test failed 5
exit status 3" "$(run FAULT_KIND=throw_int FAULT_PLACE=dispatch:52 /plugins/faulty.so)"
  check "a plug-in that crashes" \
    "$steps_to_the_tail_size
unexpected exit
exit status 7" "$(run FAULT_KIND=null_store FAULT_PLACE=dispatch:52 /plugins/faulty.so)"
  check "a plug-in that throws with a C++ runtime of its own" \
    "!create and initialize failed 5
exit status 3" "$(run FAULT_KIND=throw_int FAULT_PLACE=dispatch:35 /plugins/faulty_own_runtime.so)"
  check "a plug-in of the other architecture" \
    "!create and initialize failed -1
stderr: vsttorture: /plugins/other_architecture.so $other_architecture
exit status 3" "$(run /plugins/other_architecture.so)"
}

steps_to_the_tail_size="total, 64
1, test gathering info
2, inspect class info
3, inspect preset info
4, inspect parameter info
5, testing setting states
6, inspect latency"

version=$(sed -n 's/^project(vsttorture VERSION \([0-9.]*\).*/\1/p' CMakeLists.txt)

# choose ARCHITECTURE: says which of the two packages the functions above are about.
choose() {
  architecture=$1
  case $architecture in
    amd64)
      preset=release other_preset=x86 elf=$'ELF64\nAdvanced Micro Devices X86-64'
      other_architecture="is for i386, this program is for x86_64"
      ;;
    i386)
      preset=x86 other_preset=release elf=$'ELF32\nIntel 80386'
      other_architecture="is for x86_64, this program is for i386"
      ;;
  esac
  package=$work/$preset/vsttorture_${version}_$architecture.deb
  root=$work/$architecture
}

need_packages "to check the packages" g++ g++-multilib cmake ninja-build dpkg-dev mmdebstrap arch-test lintian mandoc \
  binutils
mirror=$(mirror)
if [[ -z $mirror ]]; then
  "${as_root[@]}" apt-get update -qq
  mirror=$(mirror)
fi
[[ -n $mirror ]] || give_up "apt knows no mirror of Debian 12 (bookworm)"

# Both roots are made side by side, while nothing else is to do.
declare -A makers
for architecture in amd64 i386; do
  choose "$architecture"
  build_package "$preset" >"$work/log" 2>&1 || { cat "$work/log"; give_up "$architecture: no package"; }
  make_root >"$root.log" 2>&1 </dev/null &
  makers[$architecture]=$!
done
for architecture in amd64 i386; do
  choose "$architecture"
  wait "${makers[$architecture]}" || { cat "$root.log"; give_up "$architecture: no fresh Debian 12 could be made"; }
done

for architecture in amd64 i386; do
  choose "$architecture"
  check_contents
  "${as_root[@]}" mkdir "$root/plugins"
  "${as_root[@]}" cp "build/$preset/plugins"/{well_behaved_effect,shell,faulty,faulty_own_runtime}.so "$root/plugins"
  "${as_root[@]}" cp "build/$other_preset/plugins/well_behaved_effect.so" "$root/plugins/other_architecture.so"
  "${as_root[@]}" cp "$package" "$root/vsttorture.deb"

  before=$(files)
  check_installed
  check_runs
  check "removed, it leaves nothing" "$before" "$(in_root dpkg -r vsttorture >"$work/log" 2>&1 || cat "$work/log"
    in_root dpkg-query -W -f '${db:Status-Abbrev}\n' vsttorture 2>/dev/null; files)"
done

if [[ $failures -gt 0 ]]; then
  echo "The Debian packages FAIL."
  exit 1
fi
echo "The Debian packages pass."
