# SPDX-License-Identifier: Apache-2.0
"""What two tags allow both, what lies within what, and what tags mean."""

from __future__ import annotations

from copy import deepcopy
from typing import Optional

from .model import DISJOINT, EQUAL, NARROWER, OVERLAP, WIDER, Bounds, form, in_range, relate, relate_lists
from .sexp import Sexp


def _copy(one: Optional[Sexp]) -> Optional[Sexp]:
    """What was taken over from one side is another element than the one there."""
    return list(one) if isinstance(one, list) else one


def _meet_set(members: list, other: Sexp) -> Optional[Sexp]:
    found: list = []

    def add(one: Sexp) -> None:
        if form(one) == "set":
            for member in one[2:]:
                add(member)
        elif not any(relate(one, there) == EQUAL for there in found):
            found.insert(0, one)

    for member in members[2:]:
        relation = relate(member, other)
        met = _copy({EQUAL: member, NARROWER: member, WIDER: other}.get(relation))
        if relation == OVERLAP:
            met = meet(member, other)
        if met is not None:
            add(met)
    return None if not found else found[0] if len(found) == 1 else [b"*", b"set", *found]


def meet(a: Sexp, b: Sexp) -> Optional[Sexp]:
    """The element that allows what both allow; None for nothing."""
    first, second = form(a), form(b)
    if isinstance(a, list) and isinstance(b, list) and (a[:1] == [b"*"] or b[:1] == [b"*"]):
        if first == "all":
            return _copy(b)
        if second == "all":
            return _copy(a)
        if first == "set":
            return _meet_set(a, b)
        if second == "set":
            return _meet_set(b, a)
        if (first, second) == ("prefix", "prefix"):
            return {NARROWER: a, EQUAL: a, WIDER: b}.get(relate(a, b))
        if {first, second} <= {"prefix", "range"}:
            sides = ((a, 1), (b, 2)) if first == second else ((a, 2), (b, 1)) if first == "range" else ((b, 2), (a, 1))
            return Bounds().fill(*sides[0]).fill(*sides[1]).tag()
        return None
    if isinstance(a, list) and isinstance(b, list):
        return meet_lists(a, b)
    return _copy({EQUAL: a, NARROWER: a, WIDER: b}.get(relate(a, b)))


def meet_lists(a: list, b: list) -> Optional[list]:
    relation = relate_lists(a, b)
    if relation != OVERLAP:
        return {EQUAL: a, NARROWER: a, WIDER: b}.get(relation)
    head = meet(a[0], b[0])
    if head is None or not a[1:] or not b[1:]:
        return None if head is None else [head, *(a[1:] or b[1:])]
    rest = meet_lists(a[1:], b[1:])
    return None if rest is None else [head, *rest]


def within(asked: list, granted: list) -> bool:
    """The rule: equal, or meeting the grant leaves what was asked as it is."""
    if asked == granted:
        return True
    met = meet_lists(asked, granted)
    return met is not None and relate_lists(met, asked) == EQUAL


def granted(asked: list, *grants: Optional[list]) -> str:
    """The answer about a chain with these grants, from the entry on: a code's name. A certificate without a
    tag passes on what is asked."""
    left: Optional[list] = None
    for grant in reversed(grants):
        met = asked if grant is None else meet_lists(grant, asked)
        left = met if left is None or met is None else meet_lists(met, left)
        if left is None:
            return "NOT_AUTHORIZED"
    assert left is not None
    # What was granted is written out and read again before it is compared.
    return "OK" if within(asked, deepcopy(left)) else "PACKAGE_NOT_GRANTED"


def members(asked: Sexp) -> list:
    """The requests without sets that a request stands for: a careful caller asks each of them."""
    if not isinstance(asked, list):
        return [asked]
    if form(asked) == "set" and len(asked) > 2:
        return [one for member in asked[2:] for one in members(member)]
    made: list = [[]]
    for item in asked:
        made = [[*line, one] for line in made for one in members(item)]
    return made


def allows(asked: Sexp, grant: Sexp) -> bool:
    """What tags mean: everything that `asked` stands for, `grant` stands for too. No rule of the system."""
    want, have = form(asked), form(grant)
    if have == "all":
        return True
    if want == "set":
        return all(allows(member, grant) for member in asked[2:])
    if have == "set":
        return any(allows(asked, member) for member in grant[2:])
    if want == "all":
        return False
    if want == "list" and have == "list":
        return len(asked) >= len(grant) and all(allows(one, other) for one, other in zip(asked, grant))
    if want == "atom":
        inside = {"atom": lambda: asked == grant, "prefix": lambda: asked.startswith(grant[2])}
        inside["range"] = lambda: in_range(asked, grant)
        return inside.get(have, lambda: False)()
    if want == "prefix" and have == "prefix":
        return asked[2].startswith(grant[2])
    if {want, have} <= {"prefix", "range"} and have == "range":
        both = Bounds().fill(grant, 2).fill(asked, 1)
        alone = Bounds().fill(asked, 1)
        return alone.relation() == DISJOINT or (both.low, both.high) == (alone.low, alone.high)
    if want == "range" and have == "prefix":
        alone, both = Bounds().fill(asked, 1), Bounds().fill(asked, 1).fill(grant, 2)
        return alone.relation() == DISJOINT or (both.low, both.high) == (alone.low, alone.high)
    return False


def safe(asked: list, grant: list) -> bool:
    """The rules never allow what the meaning does not."""
    return allows(asked, grant) or not within(asked, grant)
