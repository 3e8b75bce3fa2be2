#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# install.sh BUILD CHECK...: installs a build, as one that has no static library, and checks that
# the command finds its library, built and installed, and none of those that lie around it.
set -eu

build=$(realpath "$1")
shift
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# Only the script is another: the build itself is in use.
sed 's/libvesk2\.a/not-built.a/g' "$build/cmake_install.cmake" >"$work/install.cmake"
DESTDIR=$work/root cmake -P "$work/install.cmake" >"$work/said" || { cat "$work/said"; exit 1; }
"$@" "$work/root"
installed=$(find "$work/root" -path '*/bin/vesk2')

mkdir "$work/tree" && cd "$work/tree"
for library in $(readelf -d "$installed" | sed -n 's/.*(NEEDED).*\[\(.*\)\]/\1/p'); do
  echo 'not a library' >"$library"
done
unset LD_LIBRARY_PATH
for command in "$installed" "$build/bin/vesk2"; do "$command" version; done
