#!/usr/bin/env bash
# Checks the public headers: each compiles alone, and included twice, under every language
# standard that it is meant for, and includes only what stands below it.
#
# usage: header_hygiene.sh [SOURCE_FOLDER]
set -euo pipefail
cd "${1:-$(dirname "$0")/../..}"

# Every header of the library, and what it may include of the library.
declare -A below=(
  [export.h]=''
  [constants.h]='export.h'
  [utils.h]='export.h constants.h'
  [database.h]='export.h constants.h'
  [record.h]='export.h constants.h database.h'
  [store.h]='export.h constants.h database.h record.h'
  [access.h]='export.h constants.h utils.h database.h record.h store.h'
)

jsoncpp=$(pkg-config --cflags-only-I jsoncpp)
# Not ours: its warnings do not count.
read -r -a other_folders <<<"${jsoncpp//-I/-isystem }"

# Each line: a header as it is included, a language, a standard.
compilations() {
  local name path standard
  for name in "${!below[@]}"; do
    for standard in c++14 c++17 c++20; do
      echo "velksharing/$name c++ $standard"
    done
  done
  echo 'velksharing/access.h c c11'
  for path in platform/include/velk/*.h; do
    name=${path#platform/include/}
    echo "$name c++ c++14"
    [ "$name" = velk/velkrandom.h ] || echo "$name c c11"
  done
}

compile() {
  local header=$1 language=$2 standard=$3 compiler=gcc
  [ "$language" = c ] || compiler=g++
  # Ends in a declaration: in C a file without any is an error.
  printf '#include "%s"\n#include "%s"\nextern int declaration;\n' "$header" "$header" |
    "$compiler" -x "$language" -std="$standard" -Wall -Wextra -Wpedantic -Werror -fsyntax-only \
      -Iinclude -Iplatform/include "${other_folders[@]}" - && return
  echo "$header does not compile alone as $standard"
}

included_by() {
  sed -nE 's/^[[:space:]]*#[[:space:]]*include[[:space:]]*["<]([^">]+)[">].*/\1/p' "$1"
}

check_layers_of_the_library() {
  local path name included
  for path in include/velksharing/*; do
    name=${path##*/}
    if [[ ! -v below[$name] ]]; then
      echo "$path is not known to $0: say there what it may include"
      continue
    fi
    for included in $(included_by "$path"); do
      case "$included" in
        velksharing/*)
          [[ " ${below[$name]} " == *" ${included#velksharing/} "* ]] ||
            echo "$path includes $included, which does not stand below it"
          ;;
        internal/* | */internal/*) echo "$path includes the private $included" ;;
      esac
    done
  done
}

check_layers_of_the_platform() {
  local path included
  while IFS= read -r path; do
    for included in $(included_by "$path"); do
      case "$included" in
        *velksharing/* | internal/* | */internal/*)
          echo "$path includes $included: the platform knows no library"
          ;;
      esac
    done
  done < <(find platform -name '*.h' -o -name '*.cpp' -o -name '*.c')
}

complaints=$(
  while read -r header language standard; do
    compile "$header" "$language" "$standard"
  done < <(compilations)
  check_layers_of_the_library
  check_layers_of_the_platform
)
if [ -n "$complaints" ]; then
  echo "$complaints" >&2
  exit 1
fi
