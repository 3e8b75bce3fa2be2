#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# damage.sh cut|flip: damages tree.manifest at every 53rd byte and prints each place where the
# answer is not a refusal with its reason.
verify() {
  vesk2 manifest verify tree damaged --tag '(install (app calc))' >1 2>2
  code=$?
}

# Cut in its head, a manifest is malformed and one line says where; cut in the listing, it is not
# what was signed, and a line says where as well.
cut_refused() {
  if [ $code -eq 2 ]; then
    [ ! -s 1 ] && [ "$(wc -l <2)" = 1 ] && grep -q '^vesk2: damaged: byte [0-9]*: malformed' 2
  else
    [ $code -eq 1 ] && [ "$at" -gt 2400 ] && grep -q '^damaged: byte [0-9]*: ' 2
  fi
}

flip_refused() { [ $code -eq 1 ] || [ $code -eq 2 ] && [ -s 2 ]; }

size=$(stat -c %s tree.manifest)
at=0
while [ $at -lt "$size" ]; do
  head -c $at tree.manifest >damaged
  if [ "$1" = flip ]; then
    { printf '\001' && tail -c +$((at + 2)) tree.manifest; } >>damaged
  fi
  cmp -s damaged tree.manifest || {
    verify
    "$1_refused"
  } || { echo "$1 at $at: exit $code" && cat 1 2; }
  at=$((at + 53))
done
