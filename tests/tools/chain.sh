#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# chain.sh: what the sessions about chains start from: a vendor that the store trusts for (install),
# three certificates from it to the leaf, the second under revocation, and a fresh list.
set -e
for name in vendor first middle leaf revoker; do
  openssl genpkey -algorithm RSA -pkeyopt rsa_keygen_bits:2048 -out $name.pem 2>/dev/null
  openssl pkey -in $name.pem -pubout -out $name.pub
done
vesk2 acl grant --subject vendor.pub --tag '(install)' --propagate
vesk2 acl grant --subject revoker.pub --tag 'calc (revoke all)' --propagate
vesk2 cert issue --key vendor.pem --subject first.pub --tag '(install)' --propagate -o first.cert
vesk2 cert issue --key first.pem --chain first.cert --subject middle.pub --tag '(install)' \
  --propagate --revocation 'calc (revoke all)' -o middle.cert
vesk2 cert issue --key middle.pem --chain middle.cert --subject leaf.pub \
  --tag '(install (app calc))' --not-after 2035 --owner Leaf -o leaf.cert
vesk2 crl issue --key revoker.pem --tag 'calc (revoke all)' --not-after 2040 -o fresh.crl
