#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# run-remedy.sh SHELL: has SHELL run the command lines of the first remedy that standard input, the
# notes of a refusal, names: as they are printed, but for the files of the private keys.
sed -n '/^would pass: /,$p' | sed -n '1d; /^  vesk2/!q; p' >lines
for pem in *.pem; do
  digits=$(vesk2 key show "$pem" | sed -n 's/.*sha256:\([0-9a-f]\{16\}\).*/\1/p' | head -1)
  printf 's|KEY-OF-%s|%s|\n' "$digits" "$pem"
done >keys
[ -s lines ] && sed -f keys lines >script && "$1" -e script
