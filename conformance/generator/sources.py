# SPDX-License-Identifier: Apache-2.0
"""Lists by themselves: do they hold, what does the store take, and what is found in it."""

from __future__ import annotations

from typing import Any, Optional

from .book import YES, Book, ask_chain, command, library, no
from .keys import ALICE, SOURCE, STRANGER
from .lists import DUMMY, REVOKED, STORED, TAG, store
from .objects import ALWAYS, FUTURE, LONG_AGO, MOMENT, PAST, cert, entry, revocations, signature

GOOD = revocations(SOURCE, TAG, DUMMY)
REPLACED = "compare what two lists revoke before offering one, and look what is stored afterwards"


def _verify(book: Book, name: str, why: str, what: Any, answers: tuple, tag: Optional[str] = TAG, sources: Optional[list] = None, must: Optional[str] = None, **times: str) -> None:
    entries = [entry(SOURCE, TAG)] if sources is None else sources
    files = {f"global/acl/source{place}.acl": book.object(one, "entry") for place, one in enumerate(entries)}
    files["calc.crl"] = what if isinstance(what, dict) else book.object(what, "list")
    times = times or {"not_before": MOMENT, "not_after": MOMENT}
    question = {"operation": "verify-list", "file": "calc.crl", **({"tag": tag} if tag else {}), **times}
    book.case(f"sources/{name}", why, files, question, answers, caller_must=must)


def _held(book: Book) -> None:
    untagged = revocations(SOURCE, TAG, DUMMY)
    untagged[2] = [item for item in untagged[2] if item[0] != b"tag"]
    untagged[3] = signature(SOURCE, untagged[2])
    key_cert = cert(SOURCE, ALICE, TAG, period=ALWAYS)
    keyed = [*GOOD[:2], key_cert, signature(SOURCE, key_cert)]
    altered = [GOOD[0], revocations(SOURCE, TAG, REVOKED)[1], *GOOD[2:]]
    other_cert = cert(SOURCE, GOOD[2][3][1], TAG, period=PAST)
    forged = [*GOOD[:3], signature(STRANGER, GOOD[2])]
    nobody = no("ACL_ENTRY_NOT_FOUND")
    rows = [
        ("good", GOOD, {}, YES, "a list that an entry vouches for"),
        ("no-tag-asked", GOOD, {"tag": None}, YES, "its tag need not be asked about"),
        ("other-tag", GOOD, {"tag": "calc (revoke some)"}, no("NOT_AUTHORIZED"), "a list of another source"),
        ("wider-tag", GOOD, {"tag": "calc"}, (library("NOT_AUTHORIZED"), command(2, "trouble")), "tags of lists end in (revoke ...), or are none"),
        ("blanks", GOOD, {"tag": "calc  (revoke all)"}, (library("NOT_AUTHORIZED"), command(0, "ok")), "the library compares the tag as text, the command as a tag"),
        ("untagged", untagged, {}, (library("AUTH_TAG_MISSING"), command(1, "auth-tag-missing")), "a list without a source: to the command, of another one"),
        ("untagged-alone", untagged, {"tag": None}, nobody, "nobody is trusted with none"),
        ("stranger", revocations(STRANGER, TAG, DUMMY), {}, nobody, "a key that is not trusted with it"),
        ("other-entry", GOOD, {"sources": [entry(SOURCE, "other (revoke all)")]}, nobody, "its signer is trusted with another source"),
        ("last-entry", GOOD, {"sources": [entry(SOURCE, TAG), entry(STRANGER, TAG)]}, nobody, "of two entries with this tag the last decides"),
        ("first-entry", GOOD, {"sources": [entry(STRANGER, TAG), entry(SOURCE, TAG)]}, YES, "and here that is the right one"),
        ("no-store", GOOD, {"sources": []}, (library("FILE_NOT_FOUND"), command(2, "no-acl-store")), "nothing is trusted"),
        ("keyed", keyed, {}, no("HASH_ID"), "a certificate that vouches for a key"),
        ("altered", altered, {}, no("SIGNATURE"), "a list that was changed after it was signed"),
        ("forged", forged, {}, no("SIGNATURE"), "the signature of another key"),
        ("other-signed", [*GOOD[:3], signature(SOURCE, other_cert)], {}, no("HASH_MISMATCH"), "a signature over another certificate"),
        ("ended", revocations(SOURCE, TAG, DUMMY, period=PAST), {}, no("NOT_BEFORE"), "it ended before the period"),
        ("not-yet", revocations(SOURCE, TAG, DUMMY, period=FUTURE), {}, no("NOT_AFTER"), "it begins after the period"),
        ("no-end", revocations(SOURCE, TAG, DUMMY, period=(LONG_AGO, None)), {}, no("NOT_BEFORE"), "no end counts as ended"),
        ("at-end", GOOD, {"not_before": ALWAYS[1], "not_after": ALWAYS[1]}, YES, "its last second"),
        ("at-start", GOOD, {"not_before": ALWAYS[0], "not_after": ALWAYS[0]}, YES, "its first second"),
    ]  # fmt: skip
    for name, what, more, answers, why in rows:
        _verify(book, name, why, what, answers, **more)


def _imported(book: Book) -> None:
    """A stored list, one that is offered, and what is believed afterwards."""
    early = (LONG_AGO, "3400-12-31_23:59:59")
    takes_back = revocations(SOURCE, TAG, REVOKED)
    lets_go = GOOD
    revoked = no("CERT_REVOKED")
    lax = library("OK"), command(1, "cert-revoked")
    rows: list = [
        ("first", None, takes_back, revoked, "the first list is stored"),
        ("first-good", None, lets_go, YES, "the first list is stored"),
        ("newer", revocations(SOURCE, TAG, DUMMY, period=early), takes_back, revoked, "one that ends later takes its place"),
        ("newer-good", revocations(SOURCE, TAG, REVOKED, period=early), lets_go, YES, "and with it what it names no more"),
        ("older", takes_back, revocations(SOURCE, TAG, DUMMY, period=early), revoked, "a rolled-back list is not taken"),
        ("same-end", takes_back, lets_go, lax, "one of the same end is: an older list can be played back"),
        ("future", takes_back, revocations(SOURCE, TAG, DUMMY, period=FUTURE), revoked, "one that has not begun waits"),
        ("stranger", takes_back, revocations(STRANGER, TAG, DUMMY), revoked, "one by a key that is not trusted with it is not taken"),
        ("other-source", takes_back, revocations(SOURCE, "other (revoke all)", DUMMY), revoked, "one of another source is no substitute"),
        ("over-broken", {"content": "none"}, takes_back, revoked, "a broken one makes room"),
        ("no-end", takes_back, revocations(SOURCE, TAG, DUMMY, period=(LONG_AGO, None)), revoked, "one without an end replaces nothing"),
        ("first-ended", None, revocations(SOURCE, TAG, DUMMY, period=PAST), no("CRL_NOT_FOUND"), "the first is stored whatever its period, and covers nothing"),
    ]
    before = [{"operation": "import-lists", "directory": "in"}]
    for name, stored, offered, answers, why in rows:
        files = store(book, stored, **{"in/new.crl": book.object(offered, "list")})
        must = REPLACED if answers is lax else None
        book.case(f"sources/import-{name}", why, files, ask_chain(), answers, before=before, caller_must=must)
    question = {"operation": "import-lists", "directory": "in"}
    book.case(
        "sources/import-nothing", "a directory without lists", store(book, **{"in/": None}), question,
        (library("CRL_NOT_FOUND"), command(2, "nothing")),
    )
    book.case(
        "sources/import-broken", "a list that cannot be read", store(book, **{"in/x.crl": {"content": "none"}}),
        question, (library("CRL_NOT_FOUND"), command(2, "trouble")),
    )
    told = library("OK"), command(1, "no")
    files = store(book, takes_back, **{"in/x.crl": book.object(revocations(STRANGER, TAG, DUMMY), "list")})
    book.case(
        "sources/import-says-yes", "the library reports success whatever was stored", files, question, told,
        caller_must="look what is stored afterwards",
    )


def _found(book: Book) -> None:
    both = {
        STORED: book.object(GOOD, "list"),
        "global/cert/other (revoke all).crl": book.object(revocations(SOURCE, "other (revoke all)", DUMMY), "list"),
    }
    for name, tag, code in (
        ("one", TAG, "OK"), ("other", "other (revoke all)", "OK"), ("none", "third (revoke all)", "ACL_ENTRY_NOT_FOUND"),
        ("shorter", "calc", "ACL_ENTRY_NOT_FOUND"), ("longer", TAG + " x", "ACL_ENTRY_NOT_FOUND"), ("case", "Calc (revoke all)", "ACL_ENTRY_NOT_FOUND"),
        ("open", "calc (revoke", "INVALID_S_EXPRESSION"), ("closed", "calc)", "UNEXPECTED_CHAR"),
    ):  # fmt: skip
        book.case(
            f"sources/find-{name}", f"the stored list of {tag}", both, {"operation": "find-list", "tag": tag},
            (library(code), None),
        )
    book.case(
        "sources/find-empty", "an empty store", {"global/cert/": None}, {"operation": "find-list", "tag": TAG},
        (library("CRL_NOT_FOUND"), None),
    )


def make(book: Book) -> None:
    _held(book)
    _imported(book)
    _found(book)
