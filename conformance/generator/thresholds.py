# SPDX-License-Identifier: Apache-2.0
"""k of n keys that must agree, and the moments and periods that are asked about."""

from __future__ import annotations

from typing import Any

from .book import YES, Book, ask_chain, command, library, no
from .chains import files
from .keys import ALICE, BOB, CAROL, ROOT, SIGNER, STRANGER, Key, number
from .objects import FUTURE, PAST, cert, chain, entry, issue, threshold, triple
from .sexp import Hinted, Sexp


def padded(key: Key) -> Sexp:
    """The same key, its modulus with a zero before it: another principal, and signatures by it hold."""
    return [b"public-key", [b"rsa", [b"e", number(key.e)], [b"n", b"\0" + number(key.n)]]]


def hinted(key: Key) -> Sexp:
    """The same key with a display hint, which makes no other principal of it."""
    return [b"public-key", [b"rsa", [b"e", number(key.e)], [b"n", Hinted(b"bin", number(key.n))]]]


class Other:
    """A key in another encoding, with the private half of the first."""

    def __init__(self, key: Key, public: Sexp) -> None:
        self.public, self.sign = public, key.sign


def _votes(*keys: Any, **more: Any) -> list:
    return chain(*(issue(key, SIGNER, **more) for key in keys))


def _counts(book: Book) -> None:
    people = {"a": ALICE, "b": BOB, "c": CAROL, "s": STRANGER}
    for k, members, enough, few in (
        (1, "ab", ("a", "b", "ab"), ("s",)),
        (2, "ab", ("ab", "ba"), ("a", "b", "aa", "as", "ss")),
        (2, "abc", ("ab", "ac", "bc", "abc"), ("a", "b", "c", "aa", "bbb", "as", "cs")),
        (3, "abc", ("abc", "cab"), ("ab", "ac", "bc", "aab", "aaa", "abs")),
    ):
        subject = threshold(k, *(people[letter] for letter in members))
        for votes in (*enough, *few):
            code = "OK" if votes in enough else "NOT_AUTHORIZED"
            asked = files(book, _votes(*(people[letter] for letter in votes)), entry(subject))
            why = f"{votes} where {k} of {members} must agree"
            book.case(
                f"thresholds/{k}-of-{members}-{votes}", why, asked, ask_chain(), YES if code == "OK" else no(code),
            )


def _agreements(book: Book) -> None:
    two = entry(threshold(2, ALICE, BOB))
    refused = no("NOT_AUTHORIZED")

    def one(name: str, why: str, sequence: list, answers: tuple, *entries: list) -> None:
        book.case(f"thresholds/{name}", why, files(book, sequence, *(entries or (two,))), ask_chain(), answers)

    one("tags", "both allow what is asked", chain(issue(ALICE, SIGNER, "(install)"), issue(BOB, SIGNER)), YES)
    one(
        "other-tag", "one of them allows something else",
        chain(issue(ALICE, SIGNER), issue(BOB, SIGNER, "(remove)")), refused,
    )
    one("ended", "one of them has ended", chain(issue(ALICE, SIGNER), issue(BOB, SIGNER, period=PAST)), refused)
    one("not-yet", "one of them has not begun", chain(issue(ALICE, SIGNER), issue(BOB, SIGNER, period=FUTURE)), refused)
    one("other-subject", "they speak of different keys", chain(issue(ALICE, SIGNER), issue(BOB, CAROL)), refused)
    one(
        "forged", "one signature is another's", chain(issue(ALICE, SIGNER), triple(ALICE, cert(BOB, SIGNER))),
        no("SIGNATURE"),
    )
    one(
        "no-propagate", "they may not pass it on", _votes(ALICE, BOB), refused,
        entry(threshold(2, ALICE, BOB), propagate=False),
    )
    one(
        "two-entries", "two entries of one member each do not add up", _votes(ALICE, BOB), refused,
        entry(threshold(2, ALICE, STRANGER)), entry(threshold(2, BOB, CAROL)),
    )
    plain, counted = threshold(2, ALICE, BOB), threshold(2, ALICE, BOB)
    counted[1:3] = [Hinted(b"num", counted[1]), Hinted(b"num", counted[2])]
    votes = [issue(ALICE, SIGNER), issue(BOB, SIGNER)]
    one(
        "certified", "a certificate may want k of n, too", chain(*votes, issue(ROOT, counted, propagate=True)), YES,
        entry(ROOT),
    )
    one(
        "certified-few", "and one of the two is not enough", chain(votes[0], issue(ROOT, counted, propagate=True)),
        refused, entry(ROOT),
    )
    one(
        "certified-twice", "nor is the same one twice",
        chain(votes[0], votes[0], issue(ROOT, counted, propagate=True)), refused, entry(ROOT),
    )
    one(
        "certified-plain", "counts that are read carry the hint num, and a signature covers hints",
        chain(*votes, issue(ROOT, plain, propagate=True)), no("HASH_MISMATCH"), entry(ROOT),
    )
    leaf = library("SPKI_ERR_KEY_OR_HASH_EXPECTED"), command(2, "spki-err-key-or-hash-expected")
    one("leaf", "k of n cannot be whom a chain is for", chain(issue(ROOT, counted)), leaf, entry(ROOT))
    odd = library("SPKI_ERR_KOFN_SYNTAX"), command(2, "spki-err-kofn-syntax")  # nothing is answered with it there
    for name, subject, why in (
        ("zero", threshold(0, ALICE, BOB), "none of two: an odd entry stops every answer"),
        ("too-many", threshold(3, ALICE, BOB), "three of two"),
        ("ascii", [b"k-of-n", b"2", b"\2", ALICE.public, BOB.public], "counts are bytes: this asks for fifty"),
    ):
        one(f"count-{name}", why, _votes(ALICE, BOB), odd, entry(subject))
        one(f"count-{name}-beside", why + ", beside a good one", _votes(ALICE, BOB), odd, two, entry(subject))
    unreadable = library("ACL_ENTRY_NOT_FOUND"), command(2, "no-acl-store")
    for name, subject, why in (
        ("fewer", threshold(2, ALICE, n=2), "fewer members than said"),
        ("more", threshold(1, ALICE, BOB, n=1), "more members than said"),
        ("by-hash", threshold(2, ALICE.hash(), BOB), "a member is a key, not its digest"),
        ("empty-k", [b"k-of-n", b"", b"\2", ALICE.public, BOB.public], "an empty count"),
        ("nested", threshold(1, threshold(1, ALICE)), "a member is no k of n"),
    ):
        one(f"members-{name}", why, _votes(ALICE, BOB), unreadable, entry(subject))


STAMPS = {"2020": "2020-01-01_00:00:00", "2025": "2025-12-31_23:59:59"}
PERIODS = [
    ("start", "2020-01-01_00:00:00", "2020-01-01_00:00:00", True, "its first second"),
    ("before-start", "2019-12-31_23:59:59", "2019-12-31_23:59:59", False, "the second before"),
    ("end", "2025-12-31_23:59:59", "2025-12-31_23:59:59", True, "its last second"),
    ("after-end", "2026-01-01_00:00:00", "2026-01-01_00:00:00", False, "the second after"),
    ("inside", "2021-01-01_00:00:00", "2022-01-01_00:00:00", True, "a period within it"),
    ("meets-end", "2024-01-01_00:00:00", "2030-01-01_00:00:00", None, "a period that only meets its end"),
    ("meets-start", "2010-01-01_00:00:00", "2021-01-01_00:00:00", None, "one that only meets its start"),
    ("around", "2010-01-01_00:00:00", "2030-01-01_00:00:00", None, "one around it"),
    ("only-end", None, "2030-01-01_00:00:00", None, "an end alone: what ended before it passes"),
    ("only-early-end", None, "2019-01-01_00:00:00", False, "an end before its start"),
    ("only-start", "2030-01-01_00:00:00", None, False, "a start after its end"),
    ("only-early-start", "2010-01-01_00:00:00", None, None, "a start alone"),
    ("turned", "2024-01-01_00:00:00", "2021-01-01_00:00:00", False, "an end before the start"),
    ("later", "2027-01-01_00:00:00", "2028-01-01_00:00:00", False, "a period after it"),
    ("earlier", "2010-01-01_00:00:00", "2011-01-01_00:00:00", False, "a period before it"),
]


def _times(book: Book) -> None:
    """A period of one certificate, or of the entry, and what is asked about it. None: it is granted, and a
    careful caller would not have asked so."""
    period = (STAMPS["2020"], STAMPS["2025"])
    where = {
        "cert": files(book, chain(issue(ROOT, SIGNER, period=period))),
        "entry": files(book, chain(issue(ROOT, SIGNER)), entry(ROOT, period=period)),
        "link": files(book, chain(issue(ALICE, SIGNER), issue(ROOT, ALICE, propagate=True, period=period))),
    }
    must = "ask about one moment: both times the same"
    for place, asked in where.items():
        for name, start, end, granted, why in PERIODS:
            times = {key: stamp for key, stamp in (("not_before", start), ("not_after", end)) if stamp}
            question = ask_chain(at=None, **times)
            answers = no("NOT_AUTHORIZED") if granted is False else YES
            if name == "turned":
                answers = answers[0], command(2, "usage")
            book.case(
                f"times/{place}-{name}", why, asked, question, answers,
                caller_must=must if granted is None else None,
            )
    apart = chain(issue(ALICE, SIGNER, period=PAST), issue(ROOT, ALICE, propagate=True, period=FUTURE))
    book.case(
        "times/apart", "two certificates that are never in force together", files(book, apart), ask_chain(at=None),
        no("NOT_AUTHORIZED"),
    )
    for name, stamps in (("start", (None, PAST[1])), ("end", (FUTURE[0], None))):
        book.case(
            f"times/without-{name}", "a period that is open at one side",
            files(book, chain(issue(ROOT, SIGNER, period=stamps))), ask_chain(), no("NOT_AUTHORIZED"),
        )


def make(book: Book) -> None:
    _counts(book)
    _agreements(book)
    _times(book)
