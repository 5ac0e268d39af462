#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Checks the Debian packages vsttorture and vsttorture-workers, amd64 out of build/release and i386 out of build/x86:
# makes them, looks at what is in them (lintian, mandoc, readelf), installs them on fresh Debian 12s that hold what the
# packages ask for and nothing else, runs the programs there, and removes them again. One Debian is of i386. The other
# is of amd64 and gets i386's workers as well.
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

# check NAME EXPECTED SEEN: the line begins with $subject, what the check is about.
check() {
  if [[ $2 == "$3" ]]; then
    echo "ok    $subject: $1"
  else
    echo "FAIL  $subject: $1"
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

# build_packages PRESET: the umask is one that must not show in the package.
build_packages() {
  local targets=("${programs[@]}" sample_plugins)
  if [[ $1 == release ]]; then
    configure release -DVSTTORTURE_SCAN=ON
    targets+=(vsttorture-scan)
  else
    configure "$1"
  fi
  cmake --build --preset "$1" --target "${targets[@]}"
  (umask 077 && cpack --config "build/$1/CPackConfig.cmake" -G DEB -B "$work/$1")
}

# dependencies PACKAGE: the names in the field Depends, without versions and without our own package.
dependencies() {
  dpkg-deb -f "$1" Depends | sed 's/([^)]*)//g; s/,/ /g; s/vsttorture-workers//'
}

# Debian's essential packages, what ours ask for, and what these need; for amd64 also what i386's workers ask for.
make_root() {
  local architectures=$architecture wanted
  wanted="$(dependencies "$package") $(dependencies "$workers")"
  if [[ $architecture == amd64 ]]; then
    architectures=amd64,i386
    wanted+=" $(dependencies "$i386_workers" | sed -E 's/[^ ]+/&:i386/g')"
  fi
  "${as_root[@]}" mmdebstrap --mode=root --variant=essential --architectures="$architectures" \
    --include="$wanted" bookworm "$root" "$mirror"
}

in_root() { "${as_root[@]}" chroot "$root" "$@"; }

# All files, without those in which dpkg and ld.so keep what they know.
files() {
  "${as_root[@]}" find "$root" -xdev -printf '%P\n' |
    grep -Ev '^(var/lib/dpkg/|var/log/dpkg\.log$|var/cache/ldconfig/|etc/ld\.so\.cache$)' | sort
}

# run PROGRAM VARIABLE=VALUE... ARGUMENT...: what the program prints on both outputs, and its status, for an ordinary
# user. The steps that are drawn at random become one line.
run() {
  local program=$1
  shift
  local variables=() status=0
  while [[ ${1:-} == *=* ]]; do
    variables+=("$1")
    shift
  done
  "${as_root[@]}" chroot --userspec=65534:65534 "$root" /usr/bin/env -i "${variables[@]}" "$program" "$@" \
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

# describe PROGRAM BUNDLE: name, identifier and bundle out of the object that the program prints, and its status.
describe() {
  local status=0
  "${as_root[@]}" chroot --userspec=65534:65534 "$root" /usr/bin/env -i "$@" </dev/null >"$work/out" 2>"$work/err" ||
    status=$?
  python3 -c '
import json, sys
plugin = json.load(sys.stdin)
print(plugin["name"], plugin["uniqueId"]["text"], plugin["bundle"], sep="\n")' <"$work/out" 2>&1
  sed 's/^/stderr: /' "$work/err"
  echo "exit status $status"
}

# listing PACKAGE: permissions, owner and name of each file; of a link also where it leads.
listing() {
  dpkg-deb -c "$1" | awk '{ print $1, $2, $6, $7, $8 }' | sed 's/ *$//' | sort -k 3
}

# check_contents: the scan is in amd64's package only. It starts the workers of both word sizes.
check_contents() {
  local depends="vsttorture-workers (= $version)" pages=("${programs[@]}") scan_files=
  if [[ $architecture == amd64 ]]; then
    depends="libsqlite3-0 (>= any), libstdc++6 (>= 11), libuv1 (>= any), $depends
Recommends: bubblewrap"
    depends="libc6 (>= 2.34), libfmt9 (>= any), libgcc-s1 (>= any), libpugixml1v5 (>= any), $depends"
    pages+=(vsttorture-scan)
    scan_files="-rwxr-xr-x root/root ./usr/bin/vsttorture-scan
drwxr-xr-x root/root ./usr/share/bash-completion/
drwxr-xr-x root/root ./usr/share/bash-completion/completions/
-rw-r--r-- root/root ./usr/share/bash-completion/completions/vsttorture-scan
-rw-r--r-- root/root ./usr/share/doc/vsttorture/BREAKS_MY_SESSION.md
-rw-r--r-- root/root ./usr/share/doc/vsttorture/IN_YOUR_CI.md
-rw-r--r-- root/root ./usr/share/doc/vsttorture/IN_YOUR_HOST.md
-rw-r--r-- root/root ./usr/share/doc/vsttorture/RESULTS_DATABASE.md
-rw-r--r-- root/root ./usr/share/doc/vsttorture/VERDICTS.md
drwxr-xr-x root/root ./usr/share/doc/vsttorture/examples/ci/
-rw-r--r-- root/root ./usr/share/doc/vsttorture/examples/ci/github-workflow.yml
-rw-r--r-- root/root ./usr/share/doc/vsttorture/examples/ci/gitlab-ci.yml
-rwxr-xr-x root/root ./usr/share/doc/vsttorture/examples/ci/torture.sh
drwxr-xr-x root/root ./usr/share/doc/vsttorture/examples/many_machines/
-rwxr-xr-x root/root ./usr/share/doc/vsttorture/examples/many_machines/scan_array.sh
-rwxr-xr-x root/root ./usr/share/doc/vsttorture/examples/many_machines/scan_on_hosts.sh
-rw-r--r-- root/root ./usr/share/doc/vsttorture/examples/read_scan.cpp
-rwxr-xr-x root/root ./usr/share/doc/vsttorture/examples/read_scan.py
-rw-r--r-- root/root ./usr/share/doc/vsttorture/schema/scan-events.schema.json
-rw-r--r-- root/root ./usr/share/man/man1/vsttorture-scan.1.gz
"
  fi
  subject="vsttorture:$architecture"
  check "the package says what it is and what it needs" \
    "Package: vsttorture
Version: $version
Architecture: $architecture
Section: sound
Priority: optional
Depends: $depends" \
    "$(dpkg-deb -f "$package" Package Version Architecture Multi-Arch Section Priority Depends Recommends |
      without_versions)"
  check "it holds links to the programs, their man pages and the documents" \
    "$(sort -k 3 <<<"${scan_files}drwxr-xr-x root/root ./usr/
drwxr-xr-x root/root ./usr/bin/
lrwxrwxrwx root/root ./usr/bin/vsttorture -> ../$library_folder/vsttorture
lrwxrwxrwx root/root ./usr/bin/vsttorture-describe -> ../$library_folder/vsttorture-describe
lrwxrwxrwx root/root ./usr/bin/vsttorture-worker -> ../$library_folder/vsttorture-worker
drwxr-xr-x root/root ./usr/share/
drwxr-xr-x root/root ./usr/share/doc/
drwxr-xr-x root/root ./usr/share/doc/vsttorture/
-rw-r--r-- root/root ./usr/share/doc/vsttorture/FLIGHT_RECORD.md
-rw-r--r-- root/root ./usr/share/doc/vsttorture/PROTOCOL.md
-rw-r--r-- root/root ./usr/share/doc/vsttorture/WHEN_A_PLUGIN_FAILS.md
-rw-r--r-- root/root ./usr/share/doc/vsttorture/changelog.gz
-rw-r--r-- root/root ./usr/share/doc/vsttorture/copyright
drwxr-xr-x root/root ./usr/share/doc/vsttorture/examples/
-rwxr-xr-x root/root ./usr/share/doc/vsttorture/examples/explain_plugin.py
-rw-r--r-- root/root ./usr/share/doc/vsttorture/examples/try_plugin.cpp
-rwxr-xr-x root/root ./usr/share/doc/vsttorture/examples/try_plugin.py
drwxr-xr-x root/root ./usr/share/doc/vsttorture/schema/
-rw-r--r-- root/root ./usr/share/doc/vsttorture/schema/plugin-description.schema.json
drwxr-xr-x root/root ./usr/share/man/
drwxr-xr-x root/root ./usr/share/man/man1/
-rw-r--r-- root/root ./usr/share/man/man1/vsttorture-describe.1.gz
-rw-r--r-- root/root ./usr/share/man/man1/vsttorture-worker.1.gz
-rw-r--r-- root/root ./usr/share/man/man1/vsttorture.1.gz")" \
    "$(listing "$package")"
  check_with_lintian "$package"
  local unpacked=$work/unpacked_$architecture name
  dpkg-deb -x "$package" "$unpacked"
  for name in "${pages[@]}"; do
    check "mandoc finds no fault in $name(1)" "" \
      "$(gunzip -c "$unpacked/usr/share/man/man1/$name.1.gz" | mandoc -T lint -W style 2>&1)"
  done

  subject="vsttorture-workers:$architecture"
  check "the package says what it is and what it needs" \
    "Package: vsttorture-workers
Version: $version
Architecture: $architecture
Multi-Arch: same
Section: sound
Priority: optional
Depends: libc6 (>= 2.34), libgcc-s1 (>= any), libstdc++6 (>= 11)" \
    "$(dpkg-deb -f "$workers" Package Version Architecture Multi-Arch Section Priority Depends |
      without_versions)"
  check "it holds the programs below the folder of the architecture" \
    "drwxr-xr-x root/root ./usr/
drwxr-xr-x root/root ./usr/lib/
drwxr-xr-x root/root ./usr/${library_folder%/*}/
drwxr-xr-x root/root ./usr/$library_folder/
-rwxr-xr-x root/root ./usr/$library_folder/vsttorture
-rwxr-xr-x root/root ./usr/$library_folder/vsttorture-describe
-rwxr-xr-x root/root ./usr/$library_folder/vsttorture-worker
drwxr-xr-x root/root ./usr/share/
drwxr-xr-x root/root ./usr/share/doc/
drwxr-xr-x root/root ./usr/share/doc/vsttorture-workers/
-rw-r--r-- root/root ./usr/share/doc/vsttorture-workers/changelog.gz
-rw-r--r-- root/root ./usr/share/doc/vsttorture-workers/copyright" \
    "$(listing "$workers")"
  check_with_lintian "$workers"
  dpkg-deb -x "$workers" "$unpacked"
  for name in "${programs[@]}"; do
    subject=/usr/$library_folder/$name
    check_program "$unpacked/usr/$library_folder/$name" "$dynamic_loader libc.so.6 libgcc_s.so.1 libstdc++.so.6"
  done
  if [[ $architecture == amd64 ]]; then
    subject=/usr/bin/vsttorture-scan
    check_program "$unpacked/usr/bin/vsttorture-scan" \
      "libc.so.6 libfmt.so.9 libgcc_s.so.1 libm.so.6 libpugixml.so.1 libsqlite3.so.0 libstdc++.so.6 libuv.so.1"
  fi
}

# Replaces the versions that differ between the architectures, and those that only the libraries of others decide.
without_versions() {
  sed -E 's/(libgcc-s1|libfmt9|libpugixml1v5|libsqlite3-0|libuv1) \(>= [^)]*\)/\1 (>= any)/g'
}

# check_with_lintian PACKAGE
check_with_lintian() {
  check "lintian finds no error and gives no warning" "" \
    "$(lintian --no-cfg --allow-root --display-level '>=warning' "$1" 2>&1)"
}

# check_program PROGRAM LIBRARIES: the libraries that it needs, in the order of the alphabet.
check_program() {
  check "it is of this architecture" "$elf" "$(readelf -h "$1" | sed -nE 's/^ +(Class|Machine): +//p')"
  check "it needs these libraries and no others: $2" "$2" \
    "$(readelf -d "$1" | sed -nE 's/.*\(NEEDED\).*\[(.*)\]/\1/p' | sort | xargs)"
  check "it has no symbols for a debugger" "" "$(readelf -SW "$1" | grep -oE '\.(symtab|debug)[^ ]*' || true)"
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

# check_installed PACKAGE...: the files of the packages lie in the root's folder packages.
check_installed() {
  subject="Debian for $architecture"
  check "dpkg installs the packages" "$(printf 'ii  %s\n' "$@" | sort)" \
    "$(in_root dpkg -i -R /packages >"$work/log" 2>&1 || cat "$work/log"
      in_root dpkg-query -W -f '${db:Status-Abbrev} ${Package}:${Architecture} ${Version}\n' 'vsttorture*' | sort)"
  check "every file is as packed" "" "$(in_root dpkg --verify "${@%% *}" 2>&1)"

  local page name
  for name in "${programs[@]}"; do
    page=$(gunzip -c "$root/usr/share/man/man1/$name.1.gz")
    check "the man page $name(1) is of this version" \
      ".TH ${name^^} 1 DATE \"vsttorture $version\" \"User Commands\"" \
      "$(sed -E '1s/ 1 [0-9-]+ / 1 DATE /; q' <<<"$page")"
  done
  for name in vsttorture vsttorture-workers; do
    check "the changelog of $name is of this version" "$(head -n 1 docs/changelog)" \
      "$(gunzip -c "$root/usr/share/doc/$name/changelog.gz" | sed -n 1p)"
  done
}

# The scan picks the worker for each plug-in. It needs /proc, which the root lacks: it is mounted in a namespace that
# ends with the scan.
check_scan() {
  subject="/usr/bin/vsttorture-scan on $architecture"
  check "it tries plug-ins of both architectures" \
    "passed  /plugins/amd64/well_behaved_effect.so
passed  /plugins/i386/well_behaved_effect.so
2 results: 2 passed
exit status 0" \
    "$(status=0
      "${as_root[@]}" unshare --mount sh -c 'mount -t proc proc "$1/proc" && exec chroot --userspec=65534:65534 "$@"' \
        sh "$root" /usr/bin/env -i HOME=/tmp /usr/bin/vsttorture-scan --sandbox off --cache off --jobs 1 \
        /plugins/{amd64,i386}/well_behaved_effect.so </dev/null >"$work/out" 2>"$work/err" || status=$?
      sed -nE 's/^(passed) +[0-9.]+ m?s( .*)$/\1\2/p; s/^(.* results?: .*), in [0-9.]+ m?s$/\1/p; /^[a-z]/{/^passed/!p}' \
        "$work/out"
      sed 's/^/stderr: /' "$work/err"
      echo "exit status $status")"
}

# The name in the path, and bad input.
check_command() {
  subject="/usr/bin/vsttorture on $architecture"
  check "without arguments" \
    "!too few arguments. syntax is command pathtovst childID(optional)
exit status 2" "$(run /usr/bin/vsttorture)"
  check "no such file" \
    "!create and initialize failed -1
stderr: vsttorture: /plugins/none.so: No such file or directory
exit status 3" "$(run /usr/bin/vsttorture /plugins/none.so)"
  check "a file that is no plug-in" \
    "!create and initialize failed -1
stderr: vsttorture: /etc/hostname: file too short
exit status 3" "$(run /usr/bin/vsttorture /etc/hostname)"
}

# check_plugins PROGRAM ARCHITECTURE: the program, which is of this architecture, tries this architecture's plug-ins.
check_plugins() {
  local program=$1 plugins=/plugins/$2 other=/plugins/i386 refusal="is for i386, this program is for x86_64"
  subject="$program on $architecture"
  if [[ $2 == i386 ]]; then
    other=/plugins/amd64
    refusal="is for x86_64, this program is for i386"
  fi
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
exit status 0" "$(run "$program" "$plugins/well_behaved_effect.so")"
  check "a shell" \
    "total, 51
1, test gathering info
exit status 1" "$(run "$program" "$plugins/shell.so")"
  # effGetPlugCategory (35) comes before the first line, effGetTailSize (52) in step 6.
  check "a plug-in that throws" \
    "!create and initialize failed 5
exit status 3" "$(run "$program" FAULT_KIND=throw_int FAULT_PLACE=dispatch:35 "$plugins/faulty.so")"
  check "a plug-in that throws in a step" \
    "$steps_to_the_tail_size
!inspect latency test failed 5
exit status 3" "$(run "$program" FAULT_KIND=throw_int FAULT_PLACE=dispatch:52 "$plugins/faulty.so")"
  check "a plug-in that crashes" \
    "$steps_to_the_tail_size
unexpected exit
exit status 7" "$(run "$program" FAULT_KIND=null_store FAULT_PLACE=dispatch:52 "$plugins/faulty.so")"
  check "a plug-in that throws with a C++ runtime of its own" \
    "!create and initialize failed 5
exit status 3" "$(run "$program" FAULT_KIND=throw_int FAULT_PLACE=dispatch:35 "$plugins/faulty_own_runtime.so")"
  check "a plug-in of the other architecture" \
    "!create and initialize failed -1
stderr: vsttorture: $other/well_behaved_effect.so $refusal
exit status 3" "$(run "$program" "$other/well_behaved_effect.so")"
}

# check_describe PROGRAM ARCHITECTURE: the same for the program that describes plug-ins.
check_describe() {
  subject="$1 on $architecture"
  check "it prints what a plug-in is" \
    "Well-behaved effect
WbEf
/plugins/$2/well_behaved_effect.so
exit status 0" "$(describe "$1" "/plugins/$2/well_behaved_effect.so")"
}

steps_to_the_tail_size="total, 64
1, test gathering info
2, inspect class info
3, inspect preset info
4, inspect parameter info
5, testing setting states
6, inspect latency"

version=$(sed -n 's/^project(vsttorture VERSION \([0-9.]*\).*/\1/p' CMakeLists.txt)

programs=(vsttorture vsttorture-worker vsttorture-describe)
i386_workers=$work/x86/vsttorture-workers_${version}_i386.deb

# choose ARCHITECTURE: says which of the packages and Debians the functions above are about.
choose() {
  architecture=$1
  case $architecture in
    amd64)
      preset=release library_folder=lib/x86_64-linux-gnu/vsttorture
      elf=$'ELF64\nAdvanced Micro Devices X86-64' dynamic_loader=ld-linux-x86-64.so.2
      ;;
    i386)
      preset=x86 library_folder=lib/i386-linux-gnu/vsttorture
      elf=$'ELF32\nIntel 80386' dynamic_loader=ld-linux.so.2
      ;;
  esac
  package=$work/$preset/vsttorture_${version}_$architecture.deb
  workers=$work/$preset/vsttorture-workers_${version}_$architecture.deb
  root=$work/$architecture
}

need_packages "to check the packages" g++ g++-multilib cmake ninja-build dpkg-dev mmdebstrap arch-test lintian mandoc \
  binutils python3
need_scan_libraries
mirror=$(mirror)
if [[ -z $mirror ]]; then
  "${as_root[@]}" apt-get update -qq
  mirror=$(mirror)
fi
[[ -n $mirror ]] || give_up "apt knows no mirror of Debian 12 (bookworm)"

for architecture in amd64 i386; do
  choose "$architecture"
  build_packages "$preset" >"$work/log" 2>&1 || { cat "$work/log"; give_up "$architecture: no packages"; }
done
# Both roots are made side by side.
declare -A makers
for architecture in amd64 i386; do
  choose "$architecture"
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
  "${as_root[@]}" mkdir -p "$root"/plugins/{amd64,i386} "$root/packages"
  "${as_root[@]}" cp build/release/plugins/{well_behaved_effect,shell,faulty,faulty_own_runtime}.so "$root/plugins/amd64"
  "${as_root[@]}" cp build/x86/plugins/{well_behaved_effect,shell,faulty,faulty_own_runtime}.so "$root/plugins/i386"
  "${as_root[@]}" cp "$package" "$workers" "$root/packages"
  installed=("vsttorture:$architecture $version" "vsttorture-workers:$architecture $version")
  if [[ $architecture == amd64 ]]; then
    "${as_root[@]}" cp "$i386_workers" "$root/packages"
    installed+=("vsttorture-workers:i386 $version")
  fi

  before=$(files)
  check_installed "${installed[@]}"
  check_command
  check_plugins /usr/bin/vsttorture "$architecture"
  check_plugins /usr/bin/vsttorture-worker "$architecture"
  check_describe /usr/bin/vsttorture-describe "$architecture"
  if [[ $architecture == amd64 ]]; then
    check_plugins /usr/lib/i386-linux-gnu/vsttorture/vsttorture i386
    check_plugins /usr/lib/i386-linux-gnu/vsttorture/vsttorture-worker i386
    check_describe /usr/lib/i386-linux-gnu/vsttorture/vsttorture-describe i386
    check_scan
  fi
  subject="Debian for $architecture"
  check "removed, the packages leave nothing" "$before" \
    "$(in_root dpkg -r "${installed[@]%% *}" >"$work/log" 2>&1 || cat "$work/log"
      in_root dpkg-query -W -f '${db:Status-Abbrev}\n' 'vsttorture*' 2>/dev/null; files)"
done

if [[ $failures -gt 0 ]]; then
  echo "The Debian packages FAIL."
  exit 1
fi
echo "The Debian packages pass."
