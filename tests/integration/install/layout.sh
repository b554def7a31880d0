#!/usr/bin/env bash
# Checks what lies where in an installed tree: all that is promised, nothing outside of the two
# folders, and no trace of where it was built.
#
# usage: layout.sh SOURCE_FOLDER BUILD_FOLDER STAGE
set -euo pipefail
source=$1 build=$2 stage=$3
prefix=$stage/usr/local
failed=0

complain() {
  echo "$*" >&2
  failed=1
}

expect_file() {
  local path
  for path in "$@"; do
    [ -f "$path" ] || complain "missing: $path"
  done
}

expect_same() {
  cmp -s "$1" "$2" || complain "not what the source has: $2"
}

# usage: expect_folder PATH MODE: as the system account's own, when root installs
expect_folder() {
  local owner=1:1
  [ "$(id -u)" -eq 0 ] || owner=$(id -u):$(id -g)
  [ "$(stat -c '%F %a %u:%g' "$1")" = "directory $2 $owner" ] ||
    complain "$1 is $(stat -c '%F %a %u:%g' "$1"), not a folder of $owner with mode $2"
}

for header in "$source"/include/velksharing/*.h; do
  expect_same "$header" "$prefix/include/velksharing/${header##*/}"
done
for header in "$source"/platform/include/velk/*.h; do
  expect_same "$header" "$prefix/include/velk/${header##*/}"
done
for script in "$source"/schema/*.sql; do
  expect_same "$script" "$stage/usr/velk/share/velksharing/db_schema/${script##*/}"
done

expect_file "$prefix"/lib/libvelksharing.so{,.6} "$prefix"/lib/libvelk{cgi,core,db,random,sdk,wins}.so{,.1}
expect_file "$prefix"/lib/pkgconfig/velksharing.pc \
  "$prefix"/lib/cmake/velksharing/velksharing-{config,config-version,targets}.cmake
expect_file "$prefix"/sbin/velksharing{,-web} "$prefix"/share/man/man8/velksharing{,-web}.8
expect_file "$stage"/usr/velk/bin/{velksharingurl,velkwebapi} \
  "$prefix"/share/man/man8/{velksharingurl,velkwebapi}.8 "$prefix/share/doc/velksharing/webapi.md"
expect_file "$prefix"/share/doc/velksharing/examples/{autoblock.conf,sharing-url.conf,pam/velk} \
  "$prefix"/share/doc/velksharing/examples/{sharing-web.conf,nginx/velksharing.conf} \
  "$prefix"/share/doc/velksharing/examples/nginx/velksharing-{upstream,auth,auth-http,auth-app}.conf \
  "$prefix"/share/doc/velksharing/examples/lighttpd/velksharing{,-cgi,-auth}.conf \
  "$prefix"/share/doc/velksharing/examples/apache/velksharing{,-cgi,-auth}.conf \
  "$prefix"/share/doc/velksharing/examples/caddy/velksharing-auth.caddyfile \
  "$prefix"/share/doc/velksharing/examples/traefik/velksharing-auth.yml \
  "$prefix"/share/doc/velksharing/examples/systemd/velksharing-web.service
expect_file "$prefix"/share/doc/velksharing/forward-auth{,/nginx,/caddy,/lighttpd,/apache,/traefik}.md
expect_folder "$stage/usr/velk/etc/private" 750
expect_folder "$stage/usr/velk/etc/private/session" 750

elsewhere=$(find "$stage" -not -type d -not -path "$prefix/*" -not -path "$stage/usr/velk/*")
[ -z "$elsewhere" ] || complain "outside of /usr/local and /usr/velk: $elsewhere"
private=$(find "$stage/usr/velk/etc/private" -not -type d)
[ -z "$private" ] || complain "there before anybody put it there: $private"

traces=$(grep -rIlF "$build" "$stage" || true)
[ -z "$traces" ] || complain "knows the folder that it was built in: $traces"

# Every program and library runs from where the tree lies.
for file in "$prefix"/lib/libvelk*.so "$prefix"/sbin/* "$stage"/usr/velk/bin/*; do
  needed=$(ldd "$file")
  lost=$(grep -E 'not found|libvelk' <<<"$needed" | grep -vF "=> $(realpath "$stage")/" || true)
  [ -z "$lost" ] || complain "$file does not find its libraries in the tree: $lost"
done

exit $failed
