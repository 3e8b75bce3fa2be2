# SPDX-License-Identifier: Apache-2.0
"""Codes as words, and the exception that carries them."""

from __future__ import annotations

import os
from typing import NoReturn, Optional

from ._library import StrPath, lib, words

# Verifications answer with these when they could not decide: the answer may be another one next time.
UNDECIDED = frozenset({3, 10, 60})  # memory, a file that is held, a callback
CANNOT_OPEN = 19


def reason_of(code: int) -> str:
    """A code as a word that stays the same: `ok`, `not-authorized`, ... as in the answers of the command."""
    if code == 0:
        return "ok"
    name = words(lib.Vesk2ErrorName(code)) or ""
    for prefix in ("VESK2_ERR_", "VESK2_"):
        if name.startswith(prefix):
            name = name[len(prefix) :]
            break
    return name.lower().replace("_", "-")


def message_of(code: int) -> str:
    """A code in words, for people."""
    return words(lib.Vesk2ErrorWords(code)) or ""


class Error(Exception):
    """What was asked could not be done, or was not decided. Treat it as a refusal.

    `code` is the number and `reason` the stable word of the library, `message` says it to people, `path` is the
    file if one is known.
    """

    def __init__(self, code: int, doing: str, path: Optional[StrPath] = None) -> None:
        self.code = code
        self.reason = reason_of(code)
        self.message = message_of(code)
        self.path = None if path is None else os.fspath(path)
        where = "" if path is None else f" {os.fsdecode(path)!r}"
        super().__init__(f"{doing}{where}: {self.message} ({self.reason}, {code})")


def fail(code: int, doing: str, path: Optional[StrPath] = None) -> NoReturn:
    """Raises what a code stands for; memory is Python's own word for it."""
    if code == 3:
        raise MemoryError(doing)
    raise Error(code, doing, path)


def check(code: int, doing: str, path: Optional[StrPath] = None) -> None:
    if code != 0:
        fail(code, doing, path)
