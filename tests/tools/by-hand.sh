#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# by-hand.sh: writes a certificate (hand.cert: vendor to leaf, for (install)) and a revocation list
# that revokes it (hand.crl) byte by byte, signed by the openssl command. Nothing of this system is
# used: what the command writes and reads must be the same format.
set -e

# The canonical public key of NAME.pem.
key() {
  openssl rsa -in "$1.pem" -noout -modulus 2>/dev/null | perl -pe 's/^Modulus=|\s//g; $_ = pack "H*", $_' >n
  printf '(10:public-key(3:rsa(1:e3:\001\000\001)(1:n256:'
  cat n
  printf ')))'
}
# The hash of a file.
hash() {
  printf '(4:hash6:sha25632:'
  openssl dgst -sha256 -binary "$1"
  printf ')'
}
# The signature by NAME.pem over a file.
signature() {
  printf '(9:signature'
  hash "$2"
  key "$1"
  printf '(7:rsa-1.5256:'
  openssl dgst -sha256 -sign "$1.pem" "$2"
  printf '))'
}

{
  printf '(4:cert(7:version1:1)(6:issuer'
  key vendor
  printf ')(7:subject'
  key leaf
  printf ')(3:tag(7:install))(15:revocation-list4:calc(6:revoke3:all)))'
} >cert
{ printf '(8:sequence' && cat cert && signature vendor cert && printf '(7:comment))'; } >hand.cert

{
  printf '(3:crl(7:version1:1)(5:list1(4:item'
  hash cert
  printf '19:2025-01-01_00:00:00))(5:list2))'
} >list
{
  printf '(4:cert(7:version1:1)(6:issuer'
  key revoker
  printf ')(7:subject'
  hash list
  printf ')(3:tag4:calc(6:revoke3:all))(5:valid(9:not-after19:2045-12-31_23:59:59)))'
} >voucher
{ printf '(8:sequence' && cat list voucher && signature revoker voucher && printf ')'; } >hand.crl
