# SPDX-License-Identifier: Apache-2.0
"""Failures that are known of tools of this kind, each by its name. What people see is looked at, too."""

from __future__ import annotations

from typing import Any, Optional

from .book import YES, Book, ask_chain, ask_manifest, command, library, word
from .chains import files as chain_files
from .keys import ALICE, BOB, CAROL, ROOT, SIGNER, SOURCE, STRANGER
from .lists import DUMMY, REVOKED, TAG, store as list_store
from .manifests import SECOND, store
from .objects import (
    PAST, body, cert, chain, dir_entry, entry, file_entry, issue, manifest, revocations, threshold, triple,
)  # fmt: skip
from .thresholds import Other, hinted, padded
from .trees import LISTING, tree


def refused(code: str, **more: Any) -> tuple[dict, dict]:
    """A no that people are told as a no."""
    return library(code, **more), command(1, word(code), verdict="no", says="no", **more)


def unreadable(code: str, reason: str = "malformed") -> tuple[dict, dict]:
    return library(code), command(2, reason, verdict="trouble", says="")


def _signers(book: Book) -> None:
    two, rows = entry(threshold(2, ALICE, BOB)), []
    both = threshold(2, ALICE, Other(ALICE, padded(ALICE)))
    vote = issue(ALICE, SIGNER)
    once_more = triple(ALICE, cert(ALICE, SIGNER, comment="again"))
    no = refused("NOT_AUTHORIZED")
    careful = "write no entry in which one holder has two keys: compare the members' numbers"
    rows = [
        ("one-key-counted-twice/same-certificate", "one of two keys, its certificate twice", chain(vote, vote), [two], no),
        ("one-key-counted-twice/two-certificates", "one of two keys, with two certificates", chain(vote, once_more), [two], no),
        ("one-key-counted-twice/two-signatures", "one of two keys, in two ways of signing", chain(vote, triple(ALICE, cert(ALICE, SIGNER), "rsa-pss")), [two], no),
        ("one-key-counted-twice/through-another", "one of two keys, once by way of a third", chain(vote, issue(CAROL, SIGNER), issue(ALICE, CAROL, propagate=True)), [two], no),
        ("one-key-counted-twice/in-the-entry", "an entry that names one key twice lets it count twice", chain(vote), [entry(threshold(2, ALICE, ALICE))], YES),
        ("one-key-two-encodings/padded", "a padded modulus is another principal, and no member", chain(vote, triple(Other(ALICE, padded(ALICE)), cert(padded(ALICE), SIGNER))), [two], no),
        ("one-key-two-encodings/hinted", "a hint makes no other principal", chain(vote, triple(Other(ALICE, hinted(ALICE)), cert(hinted(ALICE), SIGNER))), [two], no),
        ("one-key-two-encodings/in-the-entry", "an entry with both encodings of a key lets its holder count twice", chain(vote, triple(Other(ALICE, padded(ALICE)), cert(padded(ALICE), SIGNER))), [entry(both)], YES),
        ("one-key-two-encodings/trusted", "a padded key is not the one that is trusted", chain(triple(Other(ROOT, padded(ROOT)), cert(padded(ROOT), SIGNER))), [entry(ROOT)], no),
        ("all-trusted-keys-counted/other-tag", "a second key is trusted, for something else", chain(vote, issue(CAROL, SIGNER)), [two, entry(CAROL, "(remove)")], no),
        ("all-trusted-keys-counted/other-threshold", "a second key is trusted, with others", chain(vote, issue(CAROL, SIGNER)), [two, entry(threshold(2, CAROL, BOB))], no),
        ("all-trusted-keys-counted/subject", "the subject is trusted, and no member", chain(vote), [two, entry(SIGNER, "(remove)")], no),
        ("all-trusted-keys-counted/stranger", "a signature that holds, by nobody who counts", chain(vote, issue(STRANGER, SIGNER)), [two], no),
    ]  # fmt: skip
    for name, why, sequence, entries, answers in rows:
        must = careful if answers is YES else None
        book.case(
            f"named/{name}", why, chain_files(book, sequence, *entries), ask_chain(people=1), answers,
            caller_must=must,
        )


def _revoked(book: Book) -> None:
    no = refused("CERT_REVOKED")
    key = revocations(SOURCE, TAG, DUMMY, ((SIGNER.hash(), "2025-01-01_00:00:00"),))
    cert_list = revocations(SOURCE, TAG, REVOKED)
    book.case("named/revoked-exits-0/key", "a revoked key is a no", list_store(book, key), ask_chain(people=1), no)
    book.case(
        "named/revoked-exits-0/certificate", "so is a revoked certificate", list_store(book, cert_list),
        ask_chain(people=1), no,
    )
    plain = issue(ROOT, SIGNER)
    book.case(
        "named/revoked-exits-0/no-source", "a revoked key is one where the certificate names no source",
        list_store(book, key, plain), ask_chain(people=1), no,
    )
    signed = manifest(LISTING, SECOND)
    named = {"app.manifest": book.object(signed, "manifest"), **tree()}
    book.case(
        "named/revoked-exits-0/manifest", "a manifest by a revoked key", list_store(book, key, plain, **named),
        ask_manifest(people=1), refused("SIGNING_CERT_ORDER"),
    )
    ended, unknown = revocations(SOURCE, TAG, DUMMY, period=PAST), refused("CRL_NOT_FOUND")
    book.case(
        "named/expired-list-as-coverage/chain", "a list that has ended tells nothing", list_store(book, ended),
        ask_chain(people=1), unknown,
    )
    late = ask_chain(at=None, not_before="2030-01-01_00:00:00", people=1)
    book.case(
        "named/expired-list-as-coverage/open-end", "nor for a time that has no end", list_store(book, ended), late,
        unknown,
    )
    old = revocations(SOURCE, TAG, DUMMY, period=("2001-01-01_00:00:00", "3400-01-01_00:00:00"))
    before = [{"operation": "import-lists", "directory": "in"}]
    for name, stored in (("certificate", cert_list), ("key", revocations(SOURCE, TAG, DUMMY, ((SIGNER.hash(), "2025-01-01_00:00:00"),)))):
        files = list_store(book, stored, **{"in/old.crl": book.object(old, "list")})
        book.case(
            f"named/rolled-back-list/{name}", "an older list that revokes less takes no effect", files,
            ask_chain(people=1), no, before=before,
        )


def _trees(book: Book) -> None:
    empty = {"tree/": None}
    signed = manifest(LISTING, SECOND)
    ask = ask_manifest(people=1)

    def one(name: str, why: str, what: Any, files: dict, answers: tuple, must: Optional[str] = None, **more: Any) -> None:
        book.case(f"named/{name}", why, store(book, what, tree=files), {**ask, **more}, answers, caller_must=must)

    one("empty-tree-accepted/nothing-there", "everything is missing", signed, empty, refused("HASH_MISMATCH"))
    one(
        "empty-tree-accepted/no-directory", "so it is where there is no directory", signed, {},
        (library("HASH_MISMATCH"), command(2, "io", says="")),
    )
    nothing = manifest(body(), SECOND)
    one("empty-tree-accepted/nothing-listed", "a manifest that lists nothing, and a directory that is not there", nothing, {},
        (library("OK"), command(2, "io", says="")), "see that the directory exists, and that something is listed")  # fmt: skip
    one("empty-tree-accepted/full", "a manifest that lists nothing, and a directory with files", nothing, tree(),
        (library("OK"), refused("EXTRA_FILES")[1]), "look at the top directory itself: it is not searched")  # fmt: skip
    outside = {"outside": {"content": "x"}, "tree/sub/": None}
    for name, listed in (
        ("dots", file_entry("../outside", b"x")), ("dots-below", dir_entry("sub", file_entry("../../outside", b"x"))),
        ("directory", dir_entry("..", file_entry("outside", b"x"))), ("slash", file_entry("/etc/hostname", b"x")), ("backslash", file_entry("..\\outside", b"x")),
    ):  # fmt: skip
        answers = refused("FILE_NOT_FOUND") if name == "backslash" else unreadable("PARSE_FILE")
        one(
            f"path-climbs-out/{name}", "no name leads out of the tree", manifest(body(listed), SECOND), outside,
            answers,
        )
    book.case(
        "named/success-on-failure/no", "a refusal is told as one", store(book, signed, tree=tree({"tree/a": b"X"})),
        ask, refused("HASH_MISMATCH"),
    )
    book.case(
        "named/success-on-failure/usage", "a wrong usage is none", store(book, signed, tree=tree()),
        {**ask, "tag": "a)"}, unreadable("UNEXPECTED_CHAR", "unexpected-char"),
    )
    cut = book.cut(signed, "manifest", 700)
    book.case(
        "named/success-on-failure/trouble", "nor is a file that cannot be read", store(book, cut, tree=tree()), ask,
        unreadable("PARSE_FILE"),
    )
    future = manifest(LISTING, SECOND, at="2990-01-01_00:00:00")
    one(
        "signed-in-the-future", "a time of signing that is yet to come", future, tree(),
        (library("OK"), command(1, "signed-in-future", says="no")), "compare the time of signing with the clock",
    )


# Names, and how they must be shown.
NAMES = [
    ("colour", "\x1b[31mred\x1b[0m", "\\x1b[31mred\\x1b[0m"),
    ("title", "\x1b]0;owned\x07", "\\x1b]0;owned\\x07"),
    ("line", "a\nyes: all is well", "a\\x0ayes: all is well"),
    ("return", "bad\rgood", "bad\\x0dgood"),
    ("c1", "\x9b2J", "\\x9b2J"),
    ("c1-utf-8", "\xc2\x9b2J", "\\xc2\\x9b2J"),
    ("turned", "\xe2\x80\xaegnp.exe", "\\xe2\\x80\\xaegnp.exe"),
    ("separator", "a\xe2\x80\xa8b", "a\\xe2\\x80\\xa8b"),
    ("invalid", "\xff\xfe", "\\xff\\xfe"),
    ("backslash", "\\x41", "\\\\x41"),
    ("backspace", "x\x08\x08y", "x\\x08\\x08y"),
    ("delete", "x\x7f", "x\\x7f"),
]


def _escapes(book: Book) -> None:
    """What a stranger can name must not reach a terminal as it is."""
    for name, raw, shown in NAMES:
        listing = body(file_entry("a", b"x"), dir_entry("sub", file_entry(raw, b"x")))
        good = {"tree/a": b"x", f"tree/sub/{raw}": b"x"}
        for what, change, code, member in (
            ("changed", {f"tree/sub/{raw}": b"X"}, "HASH_MISMATCH", "changed"),
            ("missing", {f"tree/sub/{raw}": None, "tree/sub/": None}, "HASH_MISMATCH", "missing"),
            ("unlisted", {f"tree/sub/{raw}2": b""}, "EXTRA_FILES", "unlisted"),
        ):
            more = "2" if what == "unlisted" else ""
            answers = library(code, **{member: [f"sub/{raw}{more}"]}), command(
                1, word(code), says="no", **{member: [f"sub/{shown}{more}"]},
            )
            files = store(book, manifest(listing, SECOND), tree=tree(change, good))
            book.case(
                f"named/escape-sequences/{what}-{name}", "a name that would drive a terminal", files,
                ask_manifest(refuse_unlisted=1, people=1), answers,
            )
        book.case(
            f"named/escape-sequences/text-{name}", "the same, by itself", {}, {"operation": "escape", "text": raw},
            (library("OK", text=shown), None),
        )
        owned = chain([*triple(ROOT, cert(ROOT, SIGNER, comment=raw))[:2], [b"owner", raw.encode("latin-1")]])
        question = {"operation": "read-chain", "file": "chain.cert", "people": 1}
        book.case(
            f"named/escape-sequences/owner-{name}", "a text that anybody wrote", chain_files(book, owned), question,
            YES,
        )


def make(book: Book) -> None:
    _signers(book)
    _revoked(book)
    _trees(book)
    _escapes(book)
