# SPDX-License-Identifier: MIT
# Completion of vsttorture-scan's options, values and paths for bash.
_vsttorture_scan() {
  local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]}
  if [[ ${COMP_WORDS[1]} == history && $COMP_CWORD -gt 1 && $current == -* ]]; then
    mapfile -t COMPREPLY < <(compgen -W "--cache --help" -- "$current")
    return
  fi
  if [[ ${COMP_WORDS[1]} == report && $COMP_CWORD -gt 1 && $current == -* ]]; then
    mapfile -t COMPREPLY < <(compgen -W "--json --junit --html --baseline --quiet --help" -- "$current")
    return
  fi
  case $previous in
    --sandbox)
      mapfile -t COMPREPLY < <(compgen -W "auto required off" -- "$current")
      return
      ;;
    --under)
      mapfile -t COMPREPLY < <(compgen -W "memcheck gdb" -- "$current")
      return
      ;;
    --skip | --expect | --baseline | --cache | --json | --junit | --html)
      compopt -o filenames
      mapfile -t COMPREPLY < <(compgen -f -- "$current")
      return
      ;;
    --workers)
      compopt -o filenames
      mapfile -t COMPREPLY < <(compgen -d -- "$current")
      return
      ;;
    -j | --jobs | --step-limit | --limit | --memory | --repeat | --shard)
      return
      ;;
  esac
  if [[ $current == -* ]]; then
    mapfile -t COMPREPLY < <(compgen -W "--jobs --step-limit --limit --memory --repeat --under --shrink --skip --expect
      --baseline --shard --sandbox --describe --display --cache --fresh --json --junit --html --quiet --no-progress
      --workers --help --version" -- "$current")
  else
    compopt -o filenames
    mapfile -t COMPREPLY < <(compgen -f -- "$current")
    ((COMP_CWORD > 1)) ||
      mapfile -t -O "${#COMPREPLY[@]}" COMPREPLY < <(compgen -W "history report" -- "$current")
  fi
}
complete -F _vsttorture_scan vsttorture-scan
