# SPDX-License-Identifier: Apache-2.0
"""Expressions: atoms are bytes (or Hinted), lists are lists. Written here by hand, from nothing of the library."""

from __future__ import annotations

from typing import Iterator, Union


class Hinted(bytes):
    """An atom with a display hint."""

    hint: bytes

    def __new__(cls, hint: bytes, data: bytes) -> Hinted:
        atom = super().__new__(cls, data)
        atom.hint = hint
        return atom


class Raw(bytes):
    """Bytes that stand in the canonical text as they are: for texts that are no expressions."""


Sexp = Union[bytes, list]


def canonical(value: Sexp, hints: bool = True) -> bytes:
    if isinstance(value, list):
        return b"(" + b"".join(canonical(item, hints) for item in value) + b")"
    if isinstance(value, Raw):
        return bytes(value)
    hint = b"[" + value.hint + b"]" if hints and isinstance(value, Hinted) else b""
    return hint + b"%d:" % len(value) + value


def _tokens(text: str) -> Iterator[str]:
    word = ""
    for char in text:
        if char in "() \t\n":
            if word:
                yield word
            word = ""
            if char in "()":
                yield char
        else:
            word += char
    if word:
        yield word


def advanced(text: str) -> list:
    """The elements of an advanced text: words and lists, without an enclosing list."""
    stack: list[list] = [[]]
    for token in _tokens(text):
        if token == "(":
            stack.append([])
        elif token == ")":
            done = stack.pop()
            stack[-1].append(done)
        else:
            stack[-1].append(token.encode("latin-1"))
    assert len(stack) == 1, text
    return stack[0]


def tag_of(text: str) -> list:
    return [b"tag", *advanced(text)]


def _word(atom: bytes) -> str:
    hint = f"[{atom.hint.decode('latin-1')}]" if isinstance(atom, Hinted) else ""
    plain = bool(atom) and all(33 <= byte < 127 and byte not in b'()#@"' for byte in atom)
    short = atom.hex() if len(atom) <= 8 else f"{atom[:4].hex()}..{len(atom)}"
    return hint + (atom.decode("ascii") if plain else f"#{short}#")


def readable(value: Sexp, names: dict[int, str]) -> str:
    """The advanced form for people: an object with a name of its own is @NAME, bytes that are no word are #hex#,
    long ones #their beginning..their number#."""
    if id(value) in names:
        return "@" + names[id(value)]
    if not isinstance(value, list):
        return _word(value)
    return "(" + " ".join(readable(item, names) for item in value) + ")"
