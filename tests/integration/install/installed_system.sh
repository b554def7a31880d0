#!/usr/bin/env bash
# The installed system at its real places, with real accounts: /usr/velk, the system account 1:1,
# pam_unix, saslauthd, syslog. Everything happens in a private view of the file system and of the
# processes; the machine keeps none of it.
#
# usage: installed_system.sh STAGE CONSUMERS      exits with 77 where that is not possible
set -euo pipefail

if [ "${VELK_INSIDE-}" != yes ]; then
  enter=(unshare --mount --pid --fork --kill-child --mount-proc --propagation private)
  if [ "$(id -u)" -ne 0 ] || ! "${enter[@]}" mount -t tmpfs velk /run 2>/dev/null; then
    echo "needs root and the right to mount"
    exit 77
  fi
  VELK_INSIDE=yes exec "${enter[@]}" "$0" "$(realpath "$1")" "$(realpath "$2")"
fi

# ---- The private machine.

stage=$1 consumers=$2
here=$(realpath "$(dirname "$0")")
database=/usr/velk/etc/private/session/sharing.db
programs=/usr/velk/programs
log=/usr/velk/log

mount -t tmpfs -o mode=755 run /run

# /usr/velk, which the machine need not have: a /usr of all that there is, and this.
mkdir -p /run/usr/velk
for folder in /usr/*/; do
  name=$(basename "$folder")
  [ "$name" != velk ] || continue
  mkdir "/run/usr/$name"
  mount --rbind "$folder" "/run/usr/$name"
done
mount --rbind /run/usr /usr
cp -a "$stage/usr/velk/." /usr/velk/
cp -a "$stage/usr/local" "$programs"
cp "$consumers"/pkg-config/{front_end,application} "$programs/sbin"
PATH=$programs/sbin:$PATH

mount --bind "$(mktemp -d -p /usr/velk)" /var/cache  # ldconfig writes there
cp -a /etc /usr/velk/machine-etc
mount --bind /usr/velk/machine-etc /etc
install -m 644 "$programs/share/doc/velksharing/examples/pam/velk" /etc/pam.d/velk
echo "$programs/lib" >/etc/ld.so.conf.d/velksharing.conf
ldconfig -X

# usage: add_account NAME PASSWORD [OPTION ...]
add_account() {
  local name=$1 digest
  digest=$(openssl passwd -6 -stdin <<<"$2")
  shift 2
  useradd --no-create-home --no-log-init --user-group --password "$digest" "$@" "$name"
}
groupadd velk_team
add_account velk_ann ann-secret
add_account velk_team_member member-secret --groups velk_team
add_account velk_locked locked-secret
usermod --lock velk_locked
add_account velk_expired expired-secret --expiredate 2001-01-01

# A log of our own: /dev with the few devices that programs need and a socket.
mkdir /usr/velk/devices
for device in null zero full random urandom; do
  touch "/usr/velk/devices/$device"
  mount --bind "/dev/$device" "/usr/velk/devices/$device"
done
mount --rbind /usr/velk/devices /dev
ln -s /proc/self/fd /dev/fd
"$here/log_to_file.py" /dev/log "$log" &
while [ ! -S /dev/log ]; do sleep 0.05; done

export REMOTE_ADDR=192.0.2.7

# ---- Checks.

failed=0

# usage: check WHAT EXPECTED ACTUAL
check() {
  if [ "$2" = "$3" ]; then
    echo "ok      $1"
  else
    echo "FAILED  $1: expected <$2>, got <$3>"
    failed=1
  fi
}

# The answer of a front end that runs as COMMAND says: its result, and the ids that it ends with.
# usage: login "REQUEST" [COMMAND ...]
login() {
  local request=$1
  shift
  "$@" front_end <<<"$request" | sed -E "s/ '[^']*'//"
}

# What the log has of LINE (an extended regular expression); waits, for it comes by itself.
# usage: logged LINE
logged() {
  for _ in {1..40}; do
    if grep -qE -- "$1" "$log"; then
      echo yes
      return
    fi
    sleep 0.05
  done
  echo no
}

owner_and_mode() {
  stat -c '%u:%g %a' "$1"
}

remove_database() {
  rm -f "$database"{,-wal,-shm}
}

as_system_account=(setpriv --reuid 1 --regid 1 --clear-groups)
as_nobody=(setpriv --reuid 65534 --regid 65534 --clear-groups)
as_nobody_for_now=(setpriv --euid 65534 --egid 65534 --clear-groups)  # may become root again

echo "== Without a database, a stranger"
check "fails cleanly" "-4 65534:65534" "$(login anything "${as_nobody[@]}")"
check "makes no database" "no" "$([ -e "$database" ] && echo yes || echo no)"
check "logs the refused switch with the log's authorisation facility (35)" \
  yes "$(logged '^<35>.*base_db:[0-9]+ ERROR: IF_RUN_AS\(1, 1\)$')"
check "logs that the database is not made (11)" \
  yes "$(logged '^<11>.*base_db:[0-9]+ \([0-9]+\) failed to run as system')"

echo "== Front ends make the database for the system account"
for kind in root system_account nobody_for_now; do
  case $kind in
    root) as=() ids=0:0 ;;
    system_account) as=("${as_system_account[@]}") ids=1:1 ;;
    nobody_for_now) as=("${as_nobody_for_now[@]}") ids=65534:65534 ;;
  esac
  remove_database
  coproc FRONT_END { "${as[@]}" front_end; }
  echo "unknown" >&"${FRONT_END[1]}"
  read -r answer <&"${FRONT_END[0]}"
  check "$kind: refuses an unknown link and keeps its ids" "-3 '' $ids" "$answer"
  for file in "$database"{,-wal,-shm}; do
    check "$kind: ${file##*/} is the system account's" "1:1 660" "$(owner_and_mode "$file")"
  done
  eval "exec ${FRONT_END[1]}>&-"
  wait "$FRONT_END_PID"
done

echo "== Links for everybody"
open=$(application)
check "root logs in and stays root" "1 0:0" "$(login "$open")"
check "the system account logs in" "1 1:1" "$(login "$open" "${as_system_account[@]}")"
check "an account that may become root logs in and keeps its ids" \
  "1 65534:65534" "$(login "$open" "${as_nobody_for_now[@]}")"
check "a stranger does not" "-4 65534:65534" "$(login "$open" "${as_nobody[@]}")"

echo "== Links for accounts, asked of PAM in the process"
for_accounts=$(application velk_ann velk_locked velk_expired @velk_team)
check_accounts() {
  check "$1: the right password" "1 $2" "$(login "$for_accounts velk_ann ann-secret" "${@:3}")"
  check "$1: a wrong password" "-2 $2" "$(login "$for_accounts velk_ann wrong" "${@:3}")"
  check "$1: no password" "-2 $2" "$(login "$for_accounts velk_ann" "${@:3}")"
  check "$1: a member of a permitted group" \
    "1 $2" "$(login "$for_accounts velk_team_member member-secret" "${@:3}")"
  check "$1: a locked account" \
    "-2 $2" "$(login "$for_accounts velk_locked locked-secret" "${@:3}")"
  check "$1: an expired account" \
    "-2 $2" "$(login "$for_accounts velk_expired expired-secret" "${@:3}")"
  check "$1: an account that is not permitted" \
    "-10 $2" "$(login "$(application velk_ann) velk_team_member member-secret" "${@:3}")"
}
check_accounts root 0:0
check "the system account cannot ask PAM for others" \
  "-2 1:1" "$(login "$for_accounts velk_ann ann-secret" "${as_system_account[@]}")"

echo "== The same, asked of saslauthd"
mkdir -m 755 /run/saslauthd
saslauthd -a pam -m /run/saslauthd -n 1
while [ ! -S /run/saslauthd/mux ]; do sleep 0.05; done
check_accounts "system account" 1:1 "${as_system_account[@]}"
kill "$(cat /run/saslauthd/saslauthd.pid)"

echo "== The administrator's command line"
hash=$(velksharing link create --project files --path /srv --user velk_ann)
check "a link that it made" 1 "$(login "$hash velk_ann ann-secret" | cut -d' ' -f1)"
answer=$(velksharing visit login "$hash" --as velk_ann --password-stdin <<<ann-secret)
session=${answer##* }
check "the session of a visit" 32 "${#session}"
check "a later visit in that session" "1" "$(
  velksharing visit check "$hash" --session-file <(echo "$session") | cut -d' ' -f1)"

echo "== The platform's programs"
install -m 644 "$programs/share/doc/velksharing/examples/sharing-url.conf" /usr/velk/etc/
echo "external_host = share.example.org" >>/usr/velk/etc/sharing-url.conf
check "the URL of a link" "http://share.example.org/sharing/$hash" "$(velksharing link url "$hash")"
ask() { "$@" /usr/velk/bin/velkwebapi --exec api=VELK.Sharing.Link version=1 method=why hash="$hash"; }
check "the web API asked by root" yes "$(ask env | grep -q '"success":true' && echo yes)"
check "and by the system account" yes "$(
  ask "${as_system_account[@]}" | grep -q '"success":true' && echo yes)"
check "and by a stranger" yes "$(ask "${as_nobody[@]}" | grep -q '"code":401' && echo yes)"

echo "== No secret in the log"
for secret in ann-secret member-secret locked-secret expired-secret "$session"; do
  check "not in the log" no "$(grep -qF -- "$secret" "$log" && echo yes || echo no)"
done

exit $failed
