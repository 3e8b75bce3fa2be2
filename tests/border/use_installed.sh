#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# use_installed.sh BUILD SOURCE: installs a build, moves what was installed somewhere else, and uses it there
# as a packager, a C and a C++ programmer would.
set -eu

build=$(realpath "$1") source=$(realpath "$2")
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
fail() { echo "use_installed: $*"; cat "$work/said"; exit 1; }
quietly() { "$@" >"$work/said" 2>&1 || fail "$*"; }

quietly env DESTDIR="$work/staged" cmake --install "$build"
prefix=$(sed -n 's/^CMAKE_INSTALL_PREFIX:[A-Z]*=//p' "$build/CMakeCache.txt")
root=$work/moved
mv "$work/staged$prefix" "$root"
! grep -rlF -e "$work" -e "$build" -e "$source" "$root" >"$work/said" || fail "paths of the build machine"
for file in bin/vesk2 share/vesk2/answer.schema.json share/man/man1/vesk2-manifest.1 share/man/man5/vesk2-formats.5 \
  share/bash-completion/completions/vesk2 share/zsh/site-functions/_vesk2 share/doc/vesk2/walkthrough.md; do
  [ -s "$root/$file" ] || fail "$file is missing"
done

# The programs, each way that a build can find the library.
examples=$root/share/doc/vesk2/examples
PKG_CONFIG_PATH=$(dirname "$(find "$root" -name vesk2.pc)")
export PKG_CONFIG_PATH
mkdir "$work/pc" "$work/static"
# shellcheck disable=SC2046 # words are meant
quietly cc -o "$work/pc/verify_chain" "$examples/verify_chain.c" $(pkg-config --cflags --libs vesk2)
# shellcheck disable=SC2046
quietly c++ -o "$work/pc/verify_tree" "$examples/verify_tree.cpp" $(pkg-config --cflags --libs vesk2)
quietly cmake -S "$examples" -B "$work/cmake" -DCMAKE_PREFIX_PATH="$root"
quietly cmake --build "$work/cmake"
cat >"$work/static/CMakeLists.txt" <<END
cmake_minimum_required(VERSION 3.16)
project(linked_in LANGUAGES C CXX)
find_package(vesk2 1 REQUIRED)
add_executable(verify_chain $examples/verify_chain.c)
add_executable(verify_tree $examples/verify_tree.cpp)
target_compile_features(verify_tree PRIVATE cxx_std_17)
target_link_libraries(verify_chain vesk2::static)
target_link_libraries(verify_tree vesk2::static)
END
quietly cmake -S "$work/static" -B "$work/static/build" -DCMAKE_PREFIX_PATH="$root"
quietly cmake --build "$work/static/build"

mkdir "$work/run" && cd "$work/run"
PATH=$root/bin:$PATH LD_LIBRARY_PATH=$(pkg-config --variable=libdir vesk2)
export PATH LD_LIBRARY_PATH VESK2_GLOBAL=store VESK2_HOME=home
mkdir app && echo 1 >app/calc
quietly vesk2 key new vendor signer
quietly vesk2 acl grant --subject vendor.pub --tag '(install)' --propagate
quietly vesk2 cert issue --key vendor.pem --subject signer.pub --tag '(install (app calc))' -o signer.cert
quietly vesk2 manifest sign app --key signer.pem --cert signer.cert -o app.manifest

# answers STATUS LINE PROGRAM ARGUMENT...: what every build of an example says.
answers() {
  status=$1 line=$2 program=$3
  shift 3
  for directory in "$work/pc" "$work/cmake" "$work/static/build"; do
    got=0
    "$directory/$program" "$@" >"$work/said" 2>&1 || got=$?
    [ $got = "$status" ] && grep -qx "$line" "$work/said" || fail "$directory/$program answers $got"
  done
}
answers 0 granted verify_chain home store signer.cert '(install (app calc))'
answers 1 'refused: .*' verify_chain home store signer.cert '(install (app mail))'
answers 0 yes verify_tree store app app.manifest '(install (app calc))'
echo 2 >app/calc
answers 1 '  changed app/calc' verify_tree store app app.manifest '(install (app calc))'

# The library alone asks for nothing that only the command and the tests need; elsewhere it says so.
set --
for package in CLI11 nlohmann_json GTest; do set -- "$@" "-DCMAKE_DISABLE_FIND_PACKAGE_$package=ON"; done
quietly cmake -S "$source" -B "$work/alone" "$@" -DVESK2_COMMAND=OFF -DVESK2_TESTS=OFF \
  -DCMAKE_INSTALL_PREFIX=/usr -DCMAKE_INSTALL_LIBDIR=lib/somewhere
cp "$work/alone/vesk2.pc" "$work/said"
grep -qx 'prefix=${pcfiledir}/../../..' "$work/said" || fail "another prefix"
