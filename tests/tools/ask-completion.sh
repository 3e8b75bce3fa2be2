#!/bin/bash
# SPDX-License-Identifier: Apache-2.0
# ask-completion.sh WORD...: what bash would offer for the last of these words, on a line.
# shellcheck disable=SC2034 # read by the completion
source <(vesk2 completion bash)
COMP_WORDS=("$@")
COMP_CWORD=$(($# - 1))
_vesk2
(IFS='|' && echo "${COMPREPLY[*]}")
