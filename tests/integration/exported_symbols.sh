#!/usr/bin/env bash
# Compares what the shared libraries in LIBRARY_FOLDER export with the lists in symbols/, as sets.
# A symbol that is gone breaks programs built before; one that is new has to be kept for ever.
#
# usage: exported_symbols.sh LIBRARY_FOLDER            compares
#        exported_symbols.sh --update LIBRARY_FOLDER   writes the lists anew
set -euo pipefail
export LC_ALL=C

update=
if [ "$1" = --update ]; then
  update=yes
  shift
fi
folder=$1
lists=$(dirname "$0")/symbols
libraries=(libvelksharing.so.6 libvelk{cgi,core,db,random,sdk,wins}.so.1)

# Names as the linker sees them, each with its version.
exported_by() {
  nm -D --defined-only --with-symbol-versions --format=just-symbols "$1" | sort
}

failed=0
for library in "${libraries[@]}"; do
  list=$lists/$library.txt
  if [ -n "$update" ]; then
    exported_by "$folder/$library" >"$list"
    continue
  fi
  difference=$(diff <(exported_by "$folder/$library") "$list") && continue
  failed=1
  printf '%s does not export what %s lists:\n' "$folder/$library" "$list" >&2
  sed -nE 's/^< /new: /p; s/^> /gone: /p' <<<"$difference" | c++filt >&2
done
exit $failed
