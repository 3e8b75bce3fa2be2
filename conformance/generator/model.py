# SPDX-License-Identifier: Apache-2.0
"""Tags, twice: what they mean (`allows`), and the rules by which implementations must relate them (`within`).

The rules are stricter than the meaning where sets and single-valued ranges are asked about, and never laxer:
`safe` holds both against each other. Plain and slow. Of the orderings of ranges these cases use alpha and numeric.
"""

from __future__ import annotations

from typing import Optional

from .sexp import Sexp

EQUAL, NARROWER, WIDER, DISJOINT, OVERLAP = range(5)
_SWAPPED = {EQUAL: EQUAL, NARROWER: WIDER, WIDER: NARROWER, DISJOINT: DISJOINT, OVERLAP: OVERLAP}


def form(tag: Sexp) -> str:
    """atom, list, or one of the forms that stand for many words. One of these that is malformed is a list."""
    if not isinstance(tag, list):
        return "atom"
    if not tag or tag[0] != b"*":
        return "list"
    if len(tag) == 1:
        return "all"
    kind = tag[1] if isinstance(tag[1], bytes) else b""
    return kind.decode("latin-1") if kind in (b"set", b"prefix", b"range") else "list"


def number(value: bytes) -> Optional[int]:
    """A decimal number without leading zeros."""
    digits = value[1:] if value[:1] in (b"+", b"-") else value
    if not digits.isdigit() or (len(digits) > 1 and digits[:1] == b"0"):
        return None
    return -int(digits) if value[:1] == b"-" else int(digits)


def _value(ordering: bytes, text: bytes) -> object:
    return text if ordering == b"alpha" else number(text)


class Bounds:
    """The tightest bounds of two ranges, and which of the two gave each."""

    def __init__(self) -> None:
        self.ordering: Optional[bytes] = None
        self.low: Optional[tuple] = None  # value, operator, source, text
        self.high: Optional[tuple] = None
        self.broken = False

    def add(self, operator: bytes, text: bytes, ordering: bytes, source: int) -> None:
        value = _value(ordering, text)
        if self.ordering not in (None, ordering) or value is None or operator not in (b"g", b"ge", b"l", b"le"):
            self.broken = True
            return
        self.ordering, bound = ordering, (value, operator, source, text)
        if operator in (b"g", b"ge"):
            if self.low is None or value > self.low[0] or (value == self.low[0] and (self.low[1], operator) == (b"ge", b"g")):
                self.low = bound
        elif self.high is None or value < self.high[0] or (value == self.high[0] and (self.high[1], operator) == (b"le", b"l")):
            self.high = bound

    def fill(self, tag: list, source: int) -> Bounds:
        if form(tag) == "prefix":
            start = tag[2].rstrip(b"\xff")
            self.add(b"ge", tag[2], b"alpha", source)
            if start:
                self.add(b"l", start[:-1] + bytes([start[-1] + 1]), b"alpha", source)
            return self
        if len(tag) < 3 or tag[2] not in (b"alpha", b"numeric"):
            self.broken = True
            return self
        for bound in tag[3:]:
            if not isinstance(bound, list) or len(bound) < 2:
                self.broken = True
            else:
                self.add(bound[0], bound[1], tag[2], source)
        return self

    def relation(self) -> int:
        if self.broken:
            return DISJOINT
        if self.low and self.high:
            if self.low[0] == self.high[0]:
                return OVERLAP if (self.low[1], self.high[1]) == (b"ge", b"le") else DISJOINT
            if self.low[0] > self.high[0]:
                return DISJOINT
        sources = {bound[2] for bound in (self.low, self.high) if bound}
        return EQUAL if not sources else OVERLAP if len(sources) == 2 else sources.pop()

    def tag(self) -> Optional[list]:
        if self.relation() == DISJOINT:
            return None
        bounds = [[bound[1], bound[3]] for bound in (self.low, self.high) if bound]
        return [b"*", b"range", *([self.ordering] if self.ordering else []), *bounds]


def in_range(value: bytes, tag: list) -> bool:
    if len(tag) < 3 or tag[2] not in (b"alpha", b"numeric") or _value(tag[2], value) is None:
        return False
    for bound in tag[3:]:
        alone = Bounds().fill([b"*", b"range", tag[2], bound, [b"ge", value], [b"le", value]], 1)
        if not isinstance(bound, list) or len(bound) != 2 or alone.relation() == DISJOINT:
            return False
    return True


def _starts(tag: bytes, prefix: list) -> bool:
    return len(prefix) == 3 and tag.startswith(prefix[2])


def _set_overlaps(members: list, other: Sexp) -> int:
    return OVERLAP if any(relate(member, other) in (EQUAL, NARROWER) for member in members[2:]) else DISJOINT


def relate(a: Sexp, b: Sexp) -> int:
    """How an element lies to another. One and the same is equal, which two of the same range are not."""
    if a is b:
        return EQUAL
    first, second = form(a), form(b)
    if second == "all":
        return EQUAL if first == "all" else NARROWER
    if first == "all":
        return WIDER
    if second == "set":
        if first in ("atom", "list"):
            return NARROWER if any(relate(a, member) in (EQUAL, NARROWER) for member in b[2:]) else DISJOINT
        return _SWAPPED[_set_overlaps(b, a)]
    if first == "set":
        return _SWAPPED[relate(b, a)] if second in ("atom", "list") else _set_overlaps(a, b)
    if first == "atom":
        if second == "atom":
            return EQUAL if a == b else DISJOINT
        inside = {"prefix": _starts, "range": in_range}.get(second)
        return NARROWER if inside and inside(a, b) else DISJOINT
    if second == "atom":
        return _SWAPPED[relate(b, a)]
    if (first, second) == ("list", "list"):
        return relate_lists(a, b)
    if (first, second) == ("prefix", "prefix"):
        return NARROWER if a[2].startswith(b[2]) else WIDER if b[2].startswith(a[2]) else DISJOINT
    if "list" in (first, second):
        return DISJOINT
    if (first, second) == ("range", "prefix"):
        return _SWAPPED[relate(b, a)]
    if first == "prefix":
        return Bounds().fill(b, 2).fill(a, 1).relation()
    return Bounds().fill(a, 1).fill(b, 2).relation()


def relate_lists(a: list, b: list) -> int:
    """How a list lies to another: what is longer is narrower."""
    if a is b:
        return EQUAL
    state = EQUAL
    for one, other in zip(a, b):
        found = relate(one, other)
        if found == DISJOINT:
            return DISJOINT
        if found != EQUAL:
            state = found if state in (EQUAL, found) else OVERLAP
    if len(a) < len(b):
        return WIDER if state in (EQUAL, WIDER) else OVERLAP
    if len(a) > len(b):
        return NARROWER if state in (EQUAL, NARROWER) else OVERLAP
    return state
