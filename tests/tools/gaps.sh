#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# gaps.sh A B [A B]...: why each A is not within its B, a line each.
while [ $# -gt 1 ]; do
  vesk2 tag check "$1" "$2" | sed 's/^no: .* is not within \(at \)*//; t; s/^/not a no: /'
  shift 2
done
