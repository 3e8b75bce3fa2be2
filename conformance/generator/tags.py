# SPDX-License-Identifier: Apache-2.0
"""Tags: a matrix of requests and grants, by the model; the laws; and the values that ranges take."""

from __future__ import annotations

from itertools import product

from .book import Book, ask_chain, command, library, no, word
from .keys import ROOT, SIGNER
from .meet import allows, granted, members, safe, within
from .objects import cert, chain, entry, issue, triple
from .sexp import tag_of

WORDS = (
    ["read", "write", "reader", "rea", "zz"],
    [
        "read", "(*)", "(* set read write)", "(* prefix rea)", "(* prefix reads)", "(* range alpha (ge r) (l s))",
        "(* range alpha (g read))", "(* set (* prefix wri) zz)", "(* set)", "(* range numeric (ge 1))", "(read)", "(* bad)",
    ],
)  # fmt: skip
LISTS = (
    ["(f /usr)", "(f /usr x)", "(f)", "(g /usr)", "f", "(f (g a) b)", "(f /usr/bin)"],
    [
        "(f)", "(f /usr)", "(f (* prefix /usr))", "(f (* set /usr /etc))", "(f (*))", "(* set (f /usr) (g))",
        "(f (g) b)", "(f (g a b))", "(f /usr (*))", "f",
    ],
)  # fmt: skip
NUMBERS = (
    ["(n 5)", "(n 9)", "(n 10)", "(n -3)", "(n 0)", "(n +5)", "(n 05)", "(n x)", "(n)"],
    [
        "(n (* range numeric (ge 5) (le 9)))", "(n (* range numeric (g 5)))", "(n (* range numeric (l 9)))",
        "(n (* range numeric (ge -5) (l 5)))", "(n (* range numeric))", "(n (* range))", "(n (* range roman (ge 5)))",
        "(n (* range numeric (eq 5)))", "(n (* range numeric (ge 5) (ge 7)))", "(n (* range numeric (le 5) (ge 7)))",
    ],
)  # fmt: skip
FORMS = (
    [
        "(* prefix abc)", "(* range alpha (ge ab) (l ac))", "(* range numeric (ge 6) (le 8))", "(*)",
        "(* range numeric (ge 5) (le 5))", "(* set read write)", "(* set write read)", "(* set read)", "(x (* set a b))",
    ],
    [
        "(* prefix ab)", "(* prefix abcd)", "(* range alpha (ge a))", "(* range numeric (ge 5) (le 9))", "(* range numeric (l 8))",
        "(* set read write)", "(* set (* prefix ab) (* range numeric (ge 1)))", "(* set a read write)", "(x)", "(x (* set b a c))",
    ],
)  # fmt: skip


def _careful(asked: list, *grants: object) -> dict:
    """The command asks each member of a set; the first refusal is its answer."""
    for member in members(asked):
        code = granted(member, *grants)
        if code != "OK":
            return command(1, word(code))
    return command(0, "ok")


def _matrix(book: Book) -> None:
    leaf = chain(issue(ROOT, SIGNER, None))
    for name, (requests, grants) in {"words": WORDS, "lists": LISTS, "numbers": NUMBERS, "forms": FORMS}.items():
        for (i, request), (j, grant) in product(enumerate(requests, 1), enumerate(grants, 1)):
            asked, given = tag_of(request), tag_of(grant)
            assert safe(asked, given), (request, grant)
            code, careful = granted(asked, given, None), _careful(asked, given, None)
            why = f"{request} under {grant}"
            if (code == "OK") != allows(asked, given):
                why += ": it means no more, but by the rules it is not within"
            files = {
                "global/acl/root.acl": book.object(entry(ROOT, grant), "entry"),
                "chain.cert": book.object(leaf, "chain"),
            }
            book.case(f"tags/{name}-{i}-under-{j}", why, files, ask_chain(request), (library(code), careful))
            if (i + j) % 3 == 0:
                inside = within(asked, given)
                answers = {"within": inside}, command(0, "ok") if inside else command(1, "not-within")
                question = {"operation": "tag-within", "tag": request, "within": grant}
                book.case(f"tags/{name}-{i}-within-{j}", why, {}, question, answers)


def _laws(book: Book) -> None:
    """What is asked is granted by a chain only if every grant of it allows it, whatever their order."""
    requests = ["(f /usr/bin)", "(f /etc)", "(f (* prefix /usr/lib))"]
    grants = ["(f)", "(f (* prefix /usr))", "(f (* set /usr/bin /etc))", "(f /etc x)"]
    for (i, request), (j, first), (k, second) in product(enumerate(requests, 1), enumerate(grants, 1), enumerate(grants, 1)):
        asked, grants_of = tag_of(request), (tag_of(first), tag_of(second))
        code = granted(asked, *grants_of)
        assert code != "OK" or all(allows(asked, one) for one in grants_of)
        assert (code == "OK") == (granted(asked, *reversed(grants_of)) == "OK"), (request, first, second)
        files = {
            "global/acl/root.acl": book.object(entry(ROOT, first), "entry"),
            "chain.cert": book.object(chain(triple(ROOT, cert(ROOT, SIGNER, second))), "chain"),
        }
        why = f"{request} under {first} and then {second}"
        book.case(f"tags/law-{i}-{j}-{k}", why, files, ask_chain(request), (library(code), _careful(asked, *grants_of)))


VALUES = [
    ("date", "(ge 2010)", ["2010-02-28", "2012-02-29", "2010-12-31_23:59:59"], [
        ("2010-02-29", "no leap year"), ("2010-04-31", "a day that April has not"), ("2010-13", "no such month"),
        ("2010-03-15", "a day in March is no date of a range: stored grants rely on it"), ("2010-1-01", "digits are missing"),
        ("2010-01-01_24", "no such hour"), ("2010-01-01_23:60", "no such minute"), ("2009-12-31", "before the bound"),
        ("2010/01/01", "other separators"), ("2010-00-10", "no such month"), ("20100101", "no separators"),
    ]),
    ("time", "(ge 08:00) (l 17)", ["08:00", "12:30:59"], [
        ("07:59", "before the bound"), ("17", "the bound itself, which is not in it"), ("08:60", "no such minute"),
        ("24", "no such hour"), ("8:00", "a digit is missing"), ("12:30:60", "no such second"), ("12:30:00:00", "too long"),
    ]),
    ("binary", "(ge b)", ["b", "c", "ba"], [("a", "less"), ("B", "less: bytes are compared")]),
    ("numeric", "(l 0)", ["-1", "-0", "-10"], [
        ("0", "zero is not less than itself; minus zero is"), ("1", "more"), ("007", "leading zeros are no number"),
        ("--1", "two signs"), ("1.5", "no whole number"), ("0x1", "not decimal"),
    ]),
]  # fmt: skip


def _values(book: Book) -> None:
    leaf = book.object(chain(issue(ROOT, SIGNER, None)), "chain")
    for ordering, bounds, good, bad in VALUES:
        grant = f"(n (* range {ordering} {bounds}))"
        files = {"global/acl/root.acl": book.object(entry(ROOT, grant), "entry"), "chain.cert": leaf}
        for value, why in [(value, "") for value in good] + bad:
            code = "NOT_AUTHORIZED" if why else "OK"
            answers = no(code) if why else (library("OK"), command(0, "ok"))
            question = ask_chain(f"(n {value})")
            book.case(f"tags/{ordering}-{value}", why or f"in {bounds}", files, question, answers)


MALFORMED = [
    ("(a", "INVALID_S_EXPRESSION", "a list that is not closed"), ("(a (b)", "INVALID_S_EXPRESSION", "one of two"),
    ("a)", "UNEXPECTED_CHAR", "a list that was not opened"), (")", "UNEXPECTED_CHAR", "nothing but an end"),
    ("(a) b)", "UNEXPECTED_CHAR", "more after the end"), ("(" * 300 + ")" * 300, "INVALID_S_EXPRESSION", "too deep"),
]  # fmt: skip


def _malformed(book: Book) -> None:
    files = {
        "global/acl/root.acl": book.object(entry(ROOT, "(*)"), "entry"),
        "chain.cert": book.object(chain(issue(ROOT, SIGNER, None)), "chain"),
    }
    for index, (text, code, why) in enumerate(MALFORMED, 1):
        answers = library(code), command(2, word(code))
        book.case(f"tags/malformed-{index}", why, files, ask_chain(text), answers)


def make(book: Book) -> None:
    _matrix(book)
    _laws(book)
    _values(book)
    _malformed(book)
