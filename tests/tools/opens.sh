#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# opens.sh COMMAND: counts how often a verification opens what it judges. What it prints must be
# what it proved, so the manifest, the chain and the stores are never opened once more to explain.
set -eu
here=$(cd "$(dirname "$0")" && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
command -v strace >/dev/null && strace -o /dev/null true || { echo "cannot trace here"; exit 77; }
mkdir "$work/bin" "$work/run" && ln -s "$(realpath "$1")" "$work/bin/vesk2" && cd "$work/run"
export VESK2_HOME="$work/home" VESK2_GLOBAL="$work/global" LC_ALL=C PATH="$work/bin:$PATH"

"$here/prepare.sh" 2>/dev/null
openssl genpkey -algorithm RSA -out carol.pem 2>/dev/null
crl() { vesk2 crl issue --key carol.pem --tag 'calc (revoke all)' "$@" 2>/dev/null; }
crl --not-after 2040 --grant --import
crl --not-after 2041 -o later.crl
vesk2 cert issue --key vendor.pem --subject signer.pub --tag '(install)' \
  --revocation 'calc (revoke all)' -o signer.cert -f 2>/dev/null
sign() { vesk2 manifest sign tree --key signer.pem --cert signer.cert "$@" 2>/dev/null; }
sign -o plain.m && sign --crl later.crl -o carries.m && cp -r tree changed && echo x >changed/one
vesk2 manifest sign tree --key carol.pem -o stranger.m 2>/dev/null

failures=0
# opens ACL LIST FILE WORD...: runs the command, which may open each ACL file and each stored list
# that often, and FILE once. O_PATH names a file and opens nothing.
opens() {
  acl=$1 list=$2 file=$3
  shift 3
  strace -f -e trace=open,openat -o log vesk2 "$@" --explain >/dev/null 2>&1 || true
  grep -v 'ENOENT\|O_DIRECTORY\|O_PATH\|O_WRONLY\|O_RDWR' log | sed -n 's/.*"\([^"]*\)".*/\1/p' |
    grep '\.acl$\|\.crl$\|\.m$\|\.cert$' | sort | uniq -c |
    while read -r count path; do
      case $path in *.acl) most=$acl ;; *.crl) most=$list ;; *) most=1 ;; esac
      [ "$count" -eq "$most" ] || echo "vesk2 $*: $path $count times, not $most"
    done >wrong
  grep -q "\"$file\"" log || echo "vesk2 $*: $file is not opened" >>wrong
  [ ! -s wrong ] || { cat wrong; failures=$((failures + 1)); }
}
for manifest in plain.m stranger.m; do
  for tag in '(install (app calc))' '(remove)' '(* set (install (app a)) (install (app b)))'; do
    opens 1 1 $manifest manifest verify tree $manifest --tag "$tag"
  done
done
opens 1 1 plain.m manifest verify changed plain.m --tag '(install)'
opens 1 2 carries.m manifest verify tree carries.m --tag '(install)'
opens 2 1 signer.cert cert verify signer.cert --tag '(install)'
opens 2 1 signer.cert cert verify signer.cert --tag '(* set (install) (remove))'
exit $((failures > 0))
