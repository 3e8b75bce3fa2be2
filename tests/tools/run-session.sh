#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# run-session.sh COMMAND SESSION: runs a session with the vesk2 command, in a fresh directory with
# fresh stores, and compares what it prints and answers.
#
#   # text        a comment
#   $ command     run by sh; the lines below it, up to the next command, are what must come of it
#   ? 1           its exit status (0 unless given)
#   1> pattern    a line of standard output (shell pattern); every line must be expected
#   2> pattern    a line of standard error; others may be there
#   2! pattern    no line of standard error
#   j> expression what is true of the answer for machines (see check-json.py); every such answer is
#                 checked against its schema and the exit status, asked or not
set -u

session=$(cd "$(dirname "$2")" && pwd)/$(basename "$2")
TOOLS=$(cd "$(dirname "$0")" && pwd)
work=$(mktemp -d) || exit 1
trap 'chmod -R u+rwx "$work"; rm -rf "$work"' EXIT
mkdir "$work/run" "$work/bin" && ln -s "$(realpath "$1")" "$work/bin/vesk2" && cd "$work/run" || exit 1
VESK2_HOME=$work/home VESK2_GLOBAL=$work/global LC_ALL=C PATH=$work/bin:$PATH
umask 022 # what a store's audit finds depends on it
export TOOLS VESK2_HOME VESK2_GLOBAL LC_ALL PATH
failures=0

fail() {
  failures=$((failures + 1))
  printf '%s: %s: %s\n' "$(basename "$session")" "$command" "$1"
  sed 's/^/  1> /' "$work/1"
  sed 's/^/  2> /' "$work/2"
}

# Whether a line of file $1 matches pattern $2.
matches() {
  while IFS= read -r line || [ -n "$line" ]; do
    # shellcheck disable=SC2254 # a pattern is meant
    case $line in $2) return 0 ;; esac
  done <"$1"
  return 1
}

# Whether every line of standard output was expected.
all_expected() {
  while IFS= read -r printed || [ -n "$printed" ]; do
    found=no
    while IFS= read -r pattern; do
      # shellcheck disable=SC2254
      case $printed in $pattern) found=yes ;; esac
    done <"$work/expected"
    [ $found = yes ] || return 1
  done <"$work/1"
}

# Checks the answer for machines, with the expressions of this command.
check_json() {
  set --
  while IFS= read -r expression; do set -- "$@" "$expression"; done <"$work/expressions"
  "$TOOLS/check-json.py" "$TOOLS/../../docs/answer.schema.json" $answered "$work/1" "$@" \
    >"$work/faults" 2>&1 || fail "$(cat "$work/faults")"
}

run() {
  : >"$work/expected"
  : >"$work/expressions"
  sh -c "$command" >"$work/1" 2>"$work/2" </dev/null
  answered=$?
  wanted=0
  judged=no
}

judge() {
  [ -n "$command" ] && [ $judged = no ] || return 0
  judged=yes
  [ $answered -eq $wanted ] || fail "answered $answered, not $wanted"
  if [ -s "$work/expressions" ] || grep -q '^{"schema"' "$work/1"; then
    check_json
  else
    all_expected || fail "an unexpected line on standard output"
  fi
}

command=
while IFS= read -r row || [ -n "$row" ]; do
  text=${row#???}
  case $row in
    '' | '#'*) ;;
    '$ '*) judge; command=${row#??}; run ;;
    '? '*) wanted=${row#??} ;;
    '1> '*) printf '%s\n' "$text" >>"$work/expected"
      matches "$work/1" "$text" || fail "no such line: $row" ;;
    '2> '*) matches "$work/2" "$text" || fail "no such line: $row" ;;
    '2! '*) ! matches "$work/2" "$text" || fail "this line: $row" ;;
    'j> '*) printf '%s\n' "$text" >>"$work/expressions" ;;
    *) echo "$session: not understood: $row"; exit 1 ;;
  esac
done <"$session"
judge
[ -n "$command" ] || { echo "$session: no command"; exit 1; }
exit $((failures > 0))
