#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# confine.sh COMMAND TRESPASS: what the command has given up when it has answered, tried from within by
# a library that is loaded with it; and that it still does what it is for.
set -eu
here=$(cd "$(dirname "$0")" && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
mkdir "$work/bin" "$work/run" "$work/away" "$work/home" && ln -s "$(realpath "$1")" "$work/bin/vesk2"
trespass=$(realpath "$2")
cd "$work/run"
export VESK2_HOME="$work/home" VESK2_GLOBAL="$work/global" LC_ALL=C PATH="$work/bin:$PATH"
"$here/prepare.sh" 2>/dev/null
mkdir signed && mv tree.manifest signed && mv "$VESK2_GLOBAL/acl/vendor.acl" "$work/away"
ln -s "$work/away/vendor.acl" "$VESK2_GLOBAL/acl/vendor.acl" # as where stores are managed
: >keep
fail() { echo "confine: $*"; cat said; exit 1; }

in_force=$(vesk2 manifest verify tree signed/tree.manifest --tag '(install (app calc))' --explain 2>&1 |
  sed -n 's/^confined: //p')
case $in_force in
  *files*"system calls"*) ;;
  *) echo "this kernel enforces: $in_force"; exit 77 ;;
esac

# tries COMMAND...: what it says of each attempt; all but reading what it was asked about must fail.
tries() {
  status=0
  TRESPASS=/etc/hostname:$work/run/vendor.pem:$work/run/tree/one:$VESK2_GLOBAL/acl/vendor.acl \
    LD_PRELOAD=$trespass vesk2 "$@" >said 2>&1 || status=$?
  for refused in "read /etc/hostname: EACCES" "read $work/run/vendor.pem: EACCES" "write here: EACCES" \
    "remove: EACCES" "socket: EPERM" "unix socket: EPERM" "trace: EPERM" "exec: EPERM"; do
    grep -qxF "$refused" said || fail "$*: not so: $refused"
  done
  [ "$status" -eq 0 ] || fail "$*: exit $status"
}
tries manifest verify tree signed/tree.manifest --tag '(install (app calc))'
grep -qxF "read $work/run/tree/one: DONE" said || fail "the tree is closed"
grep -qxF "read $VESK2_GLOBAL/acl/vendor.acl: DONE" said || fail "the store is closed"
mkdir certs && cp signer.cert certs
tries cert verify certs/signer.cert --tag '(install (app calc))'
tries who '(install (app calc))' --cert certs/signer.cert
tries until certs/signer.cert --tag '(install (app calc))'
tries show certs/signer.cert
tries manifest show signed/tree.manifest
tries store check
# What is installed is written beside nothing else, and what it replaces is removed.
mkdir place packed && tar cf packed/tree.tar -C tree .
tries manifest install packed/tree.tar signed/tree.manifest place/app --tag '(install (app calc))'
tries manifest install tree signed/tree.manifest place/app/ --tag '(install (app calc))' --replace

# What is to be written still is: a carried list into the store, an output beside nothing else.
openssl genpkey -algorithm RSA -out carol.pem 2>/dev/null
vesk2 crl issue --key carol.pem --tag 'calc (revoke all)' --not-after 2040 --grant --import 2>/dev/null
vesk2 crl issue --key carol.pem --tag 'calc (revoke all)' --not-after 2041 -o later.crl 2>/dev/null
vesk2 manifest sign tree --key signer.pem --cert signer.cert --crl later.crl -o carries.m 2>/dev/null
vesk2 manifest verify tree carries.m --tag '(install (app calc))' >said 2>&1 || fail "carried lists"
cmp -s later.crl "$VESK2_GLOBAL/cert/calc (revoke all).crl" || fail "the carried list is not stored"
mkdir out && vesk2 show certs/signer.cert --advanced -o out/text >said 2>&1 && [ -s out/text ] || fail "show -o"
vesk2 manifest verify tree signed/tree.manifest --tag '(install (app calc))' --report out/page.html \
  >said 2>&1 && [ -s out/page.html ] || fail "--report"
tries cert verify certs/signer.cert --tag '(install (app calc))' --report out/chain.html
# A manifest that is replaced by another one at any moment is read, the old or the new.
cp signed/tree.manifest next && ln next same && mv same signed/tree.manifest
vesk2 manifest verify tree signed/tree.manifest --tag '(install (app calc))' >said 2>&1 || fail "replaced"
