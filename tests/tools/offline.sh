#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# offline.sh COMMAND SESSION...: runs the sessions with every system call of the command that could
# reach the network or change a file on record. No command may open a socket, and verifications may
# change nothing but the machine's revocation lists, not even those with --no-store-update, and a
# floor or a report that they are asked for.
set -u
here=$(cd "$(dirname "$0")" && pwd)
logs=$(mktemp -d) || exit 1
trap 'rm -rf "$logs"' EXIT
command -v strace >/dev/null && strace -o /dev/null true || { echo "cannot trace here"; exit 77; }

calls=%network,open,openat,creat,link,linkat,symlink,symlinkat,rename,renameat,renameat2
calls=$calls,unlink,unlinkat,mkdir,mkdirat,rmdir,mknod,mknodat,truncate,ftruncate,chmod
calls=$calls,fchmodat,chown,fchown,lchown,fchownat,utimensat
# -D: the traced program keeps its place, so that it gets the signals that are sent to it.
cat >"$logs/vesk2" <<END
#!/bin/sh
[ "\$(ulimit -f)" = unlimited ] || exec "$(realpath "$1")" "\$@" # a record would not fit either
log=\$(mktemp "$logs/log.XXXXXX")
for word; do printf '%s ' "\$word"; done | tr '\n' ' ' >"\$log.words"
exec strace -D -f --seccomp-bpf -s 4096 -e trace=$calls -o "\$log" "$(realpath "$1")" "\$@"
END
chmod +x "$logs/vesk2"
shift

for session; do
  "$here/run-session.sh" "$logs/vesk2" "$session" || { echo "$session: fails when traced"; exit 1; }
done

# A tracer may finish after the program.
waits=0
while [ "$(grep -lE '\+\+\+ (exited|killed)' "$logs"/log.?????? | wc -l)" -ne "$(ls "$logs"/*.words | wc -l)" ]; do
  waits=$((waits + 1))
  [ $waits -lt 50 ] || { echo "a record is not finished"; exit 1; }
  sleep 0.1
done

failures=0
report() {
  echo "$1: vesk2 $(cat "$log.words")"
  failures=$((failures + 1))
}
verifications=0
for log in "$logs"/log.??????; do
  grep -q 'openat(.*libc' "$log" || report "has no record"
  ! grep -E '(socket|connect|sendto|sendmsg|bind)\(' "$log" || report "touches the network"
  case $(cat "$log.words") in
    'manifest verify '* | 'cert verify '*) verifications=$((verifications + 1)) ;;
    *) continue ;;
  esac
  grep -E '^[0-9]+ +[a-z]' "$log" | grep -vE 'open(at)?\(.*O_RDONLY' >"$logs/changes"
  case $(cat "$log.words") in
    *--no-store-update*) ;;
    *) sed -i '\|/global/cert[/"]|d' "$logs/changes" ;;
  esac
  case $(cat "$log.words") in
    *--floor* | *--remember*) sed -Ei '\,/home"|/floor[/"]|[.]lock"|[.]tmp-|O_TMPFILE,d' "$logs/changes" ;;
  esac
  case $(cat "$log.words") in
    *--report*) sed -Ei '\,[.]html["].|[.]html[.]tmp-|O_TMPFILE,d' "$logs/changes" ;;
  esac
  [ ! -s "$logs/changes" ] || { cat "$logs/changes"; report "changes a file"; }
done
echo "$verifications verifications among $(ls "$logs"/*.words | wc -l) commands"
[ $verifications -gt 50 ] && [ $failures -eq 0 ]
