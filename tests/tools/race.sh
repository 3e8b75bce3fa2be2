#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# race.sh TREE GOOD BAD: verifies a tree against a manifest that is replaced all the time, by one
# whose signer is authorized and one whose signer is not. Each yes must name the first. VESK2_RACES
# is how often it is asked.
set -u
good=$(vesk2 manifest verify "$1" "$2" --tag '(install (app calc))' | sed 's/.* by //')
[ -n "$good" ] || exit 1
while :; do
  ln -f "$2" next && mv next raced
  ln -f "$3" next && mv next raced
done &
swapper=$!
trap 'kill $swapper' EXIT
while [ ! -e raced ]; do sleep 0.1; done
runs=0
wrong=0
while [ $runs -lt "${VESK2_RACES:-40}" ]; do
  runs=$((runs + 1))
  answer=$(vesk2 manifest verify "$1" raced --tag '(install (app calc))' --explain 2>/dev/null)
  case $answer in
    "yes: "*"by $good") ;;
    "no: nothing is granted "*) ;;
    *) wrong=$((wrong + 1)); echo "$answer" ;;
  esac
done
[ $wrong -eq 0 ] && echo "only the proved"
