#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Makes the cases of this kit, the same ones every time. What they expect is reasoned here, and not taken from an
implementation: each changes one thing of something good, and says what must come of that.

    make_cases.py [--check]    --check compares with what is stored, and counts
"""

from __future__ import annotations

import sys
from pathlib import Path

from generator import FAMILIES
from generator.book import Book

CASES = Path(__file__).resolve().parent / "cases"
# The question, and the columns that an interface of ours can answer.
OPERATIONS = {
    "read-chain", "verify-chain", "read-list", "verify-list", "find-list", "import-lists",
    "verify-manifest", "compare-manifests", "escape", "tag-within", "read-key",
}  # fmt: skip
COMMAND_ONLY, LIBRARY_ONLY = {"tag-within", "read-key"}, {"find-list", "escape"}


def accepts(case: dict) -> bool:
    """Whether the careful answer is yes; the library's, where nobody can ask the command."""
    column = case.get("command", case.get("library"))
    return column.get("exit", column.get("code")) == 0


def faults(book: Book) -> list[str]:
    """What a kit must not be."""
    cases = [case for family in book.families.values() for case in family]
    found = []
    for case in cases:
        operation = case["question"]["operation"]
        if operation not in OPERATIONS:
            found.append(f"{case['name']}: no such operation")
        column = "command" if operation in COMMAND_ONLY else "library"
        if column not in case or (operation in LIBRARY_ONLY and "command" in case):
            found.append(f"{case['name']}: no interface of ours answers this")
        lax = case.get("library", {}).get("code") == 0 and case.get("command", {}).get("exit", 0) != 0
        if lax and "caller_must" not in case:
            found.append(
                f"{case['name']}: the library says yes and the command no, and nothing says what a caller must do",
            )
    accepted = sum(accepts(case) for case in cases)
    if len(cases) < 1000 or accepted * 4 > len(cases):
        found.append(f"{len(cases)} cases, {accepted} of them accepted: too few, or too friendly")
    return found


def main() -> int:
    book = Book()
    for family in FAMILIES:
        family(book)
    if sys.argv[1:] != ["--check"]:
        book.save(CASES)
    made, stored = book.write(), {path.name: path.read_text() for path in CASES.glob("*.json")}
    wrong = faults(book)
    wrong += [f"{name}: not what is made today" for name in sorted(made.keys() | stored.keys()) if made.get(name) != stored.get(name)]
    for line in wrong:
        print(f"make_cases.py: {line}")
    cases = [case for family in book.families.values() for case in family]
    yes = sum(accepts(case) for case in cases)
    print(f"{len(cases)} cases, {yes} accepted, {len(cases) - yes} refused; {sum(map(len, made.values()))} bytes")
    return 1 if wrong else 0


if __name__ == "__main__":
    sys.exit(main())
