#!/usr/bin/env bash
# Builds the programs of consumer/ against an installed tree: by pkg-config into
# WORK/pkg-config/, as a CMake package into WORK/cmake/. The programs in the README, too.
#
# usage: consumers.sh STAGE WORK
set -euo pipefail
stage=$(realpath "$1") work=$2
source=$(realpath "$(dirname "$0")")/consumer
warnings=(-Wall -Wextra -Wpedantic -Werror)
rm -rf "$work"
mkdir -p "$work/pkg-config"

echo "== pkg-config"
export PKG_CONFIG_PATH=$stage/usr/local/lib/pkgconfig
# shellcheck disable=SC2046  # flags are words
cc -std=c11 "${warnings[@]}" "$source/front_end.c" -o "$work/pkg-config/front_end" \
  $(pkg-config --cflags --libs velksharing)
# shellcheck disable=SC2046
c++ -std=c++14 "${warnings[@]}" "$source/application.cpp" -o "$work/pkg-config/application" \
  $(pkg-config --cflags --libs velksharing)
pkg-config --exact-version=6.0.0 velksharing

echo "== the README's programs"
# code LANGUAGE: the first block of that language in the README.
code() {
  awk -v fence='```' -v language="$1" '
    $0 == fence language && !seen { seen = inside = 1; next }
    $0 == fence { inside = 0 }
    inside' "$source/../../../../README.md"
}
# shellcheck disable=SC2046
code c | cc -x c -std=c11 "${warnings[@]}" - -x none -o "$work/pkg-config/readme_c" \
  $(pkg-config --cflags --libs velksharing)
# shellcheck disable=SC2046
code cpp | c++ -x c++ -std=c++14 "${warnings[@]}" - -x none -o "$work/pkg-config/readme_cpp" \
  $(pkg-config --cflags --libs velksharing)

echo "== find_package"
cmake -S "$source" -B "$work/cmake" -DCMAKE_PREFIX_PATH="$stage/usr/local" \
  -DCMAKE_C_FLAGS="${warnings[*]}" -DCMAKE_CXX_FLAGS="${warnings[*]}"
cmake --build "$work/cmake"

echo "== the programs find their libraries in the tree"
export LD_LIBRARY_PATH=$stage/usr/local/lib
for program in "$work"/{pkg-config,cmake}/{front_end,application} \
  "$work"/pkg-config/readme_{c,cpp}; do
  needed=$(ldd "$program")
  grep -F "libvelksharing.so.6 => $stage/" <<<"$needed"
  if grep 'not found' <<<"$needed"; then exit 1; fi
done
