#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# version.sh SOURCE VERSION: finds what names another version than CMakeLists.txt, or none.
set -eu
cd "$1"
# names PATTERN FILE: the first version that a file names, after the pattern.
names() {
  found=$(sed -nE "s/^$1([0-9]+\.[0-9]+\.[0-9]+).*/\1/p" "$2" | head -1)
  [ "$found" = "$version" ] || { echo "$2 names version ${found:-none}, not $version"; faults=1; }
}
version=$2 faults=0
names '## ' CHANGELOG.md
names '__version__ = "' bindings/python/vesk2/__init__.py
names 'vesk2 \(' debian/changelog
exit $faults
