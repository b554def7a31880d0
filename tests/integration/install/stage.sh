#!/usr/bin/env bash
# Installs into an empty folder what a build without any options installs.
#
# usage: stage.sh SOURCE_FOLDER BUILD_FOLDER STAGE
set -euo pipefail
source=$1 build=$2 stage=$3

# A folder that is there already is used again: building everything takes minutes.
[ -f "$build/CMakeCache.txt" ] || cmake -S "$source" -B "$build"
cmake --build "$build" --parallel
rm -rf "$stage"
DESTDIR=$stage cmake --install "$build"
