#!/bin/bash
# SPDX-License-Identifier: Apache-2.0
# run-document.sh COMMAND DOCUMENT [NEW]: runs the commands that a document shows, one after the other in a
# fresh directory with fresh stores, and compares what they print with what it shows:
#
#       $ command
#       what it prints, on both streams
#
# in blocks indented by four. A line that begins with # is a remark; a command that ends with \ goes
# on in the next line. The block after <!-- file NAME --> is the text of a file. Fingerprints and times of this
# run stand for the document's. NEW becomes the document as it should be.
#
# The library is found as if the command's build were installed.
set -u
document=$(realpath "$2") new=$(realpath -m "${3:-/dev/null}")
build=$(realpath "$(dirname "$1")/..") bindings=$(realpath "$(dirname "$0")/../../bindings/python")
work=$(mktemp -d) || exit 1
trap '[ -z "${SSH_AGENT_PID-}" ] || ssh-agent -k >"$work/printed"; rm -rf "$work"' EXIT
mkdir "$work/run" "$work/bin" && ln -s "$(realpath "$1")" "$work/bin/vesk2" && cd "$work/run" || exit 1
unset VESK2_HOME VESK2_GLOBAL SSH_AGENT_PID SSH_AUTH_SOCK
export LC_ALL=C PATH=$work/bin:$PATH XDG_DATA_HOME=$work/data
if [[ -e $build/cmake_install.cmake ]]; then
  DESTDIR=$work/installed cmake --install "$build" >"$work/printed" 2>&1 || { cat "$work/printed"; exit 1; }
  PKG_CONFIG_PATH=$(dirname "$(find "$work/installed" -name vesk2.pc)")
  LD_LIBRARY_PATH=${PKG_CONFIG_PATH%/pkgconfig}
  export PKG_CONFIG_PATH LD_LIBRARY_PATH PYTHONPATH=$bindings PYTHONDONTWRITEBYTECODE=1
fi
umask 022
failures=0 command='' ran=0 file=''

masked() {
  sed -E 's/SHA256:[A-Za-z0-9+/]{43}/FINGERPRINT/g
          s/(sha256:|KEY-OF-|grant-)[0-9a-f]{8,64}/FINGERPRINT/g
          s/20[0-9]{2}-[0-9]{2}-[0-9]{2}_[0-9:]{8}/TIME/g'
}

judge() {
  [ -n "$command" ] || return
  # In this shell, so that what a command sets stays set.
  eval "$command" >"$work/printed" 2>&1 </dev/null
  ran=$((ran + 1))
  if ! diff <(masked <"$work/shown") <(masked <"$work/printed") >"$work/difference"; then
    printf '%s: %s\n' "${document##*/}" "$command"
    cat "$work/difference"
    failures=$((failures + 1))
  fi
  sed 's/^/    /' "$work/printed" >>"$work/new"
  command=''
}

goes_on=no
while IFS= read -r line; do
  text=${line#    }
  case $line in
    '<!-- file '*) file=${line#<!-- file } file=${file% -->} && : >"$file" ;;
    '    $ '*) file='' ;;
    '    '* | '') [ -z "$file" ] || printf '%s\n' "$text" >>"$file" ;;
    *) file='' ;;
  esac
  if [ -n "$file" ]; then
    judge
    printf '%s\n' "$line" >>"$work/new"
    continue
  fi
  case $line in
    '    '*)
      if [ $goes_on = yes ]; then
        command=${command%\\}${text#"${text%%[! ]*}"}
      elif [[ $text = '$ '* ]]; then
        judge
        command=${text#??}
        : >"$work/shown"
      elif [[ -n $command && $text != '# '* ]]; then
        printf '%s\n' "$text" >>"$work/shown"
        continue
      else
        judge
      fi ;;
    *) judge ;;
  esac
  printf '%s\n' "$line" >>"$work/new"
  case $command in *\\) goes_on=yes ;; *) goes_on=no ;; esac
done <"$document"
judge
cat "$work/new" >"$new"
echo "$ran commands of ${document##*/}"
[ $ran -gt 0 ] && [ $failures -eq 0 ]
