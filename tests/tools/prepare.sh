#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# prepare.sh: what most sessions start from: a vendor that the store trusts for (install), a signer
# that it certified for (install (app calc)), and a signed tree.
set -e
for name in vendor signer; do
  openssl genpkey -algorithm RSA -pkeyopt rsa_keygen_bits:2048 -out $name.pem 2>/dev/null
  openssl pkey -in $name.pem -pubout -out $name.pub
done
vesk2 acl grant --subject vendor.pub --tag '(install)' --propagate
vesk2 cert issue --key vendor.pem --subject signer.pub --tag '(install (app calc))' -o signer.cert
mkdir -p tree/sub/deep tree/empty
for name in one two sub/three sub/four sub/deep/five; do echo "$name" >"tree/$name"; done
vesk2 manifest sign tree --key signer.pem --cert signer.cert -o tree.manifest
