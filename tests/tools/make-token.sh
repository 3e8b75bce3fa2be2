#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# make-token.sh LABEL PIN KEY: makes a token with an RSA key in it, in the directory `tokens` here,
# where SOFTHSM2_CONF (./token.conf) is to point.
set -eu
module=/usr/lib/softhsm/libsofthsm2.so
mkdir -p tokens
printf 'directories.tokendir = %s/tokens\nlog.level = ERROR\n' "$PWD" >token.conf
export SOFTHSM2_CONF="$PWD/token.conf"
softhsm2-util --init-token --free --label "$1" --pin "$2" --so-pin 0000 >/dev/null
pkcs11-tool --module $module --token-label "$1" --login --pin "$2" --keypairgen --key-type rsa:2048 \
  --label "$3" --id 01 >/dev/null 2>&1
