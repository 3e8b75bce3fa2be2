# SPDX-License-Identifier: Apache-2.0
"""Revocation lists: their malformed forms, who is believed, what they take back and when."""

from __future__ import annotations

import hashlib
from typing import Any, Optional

from .book import YES, Book, ask_chain, command, library, no, trouble
from .keys import ALICE, OTHER, ROOT, SIGNER, SOURCE, STRANGER
from .objects import ALWAYS, MOMENT, NOTHING, PAST, cert, chain, entry, issue, revocations, sha256, signature, triple
from .readers import edit
from .sexp import canonical

TAG = "calc (revoke all)"
STORED = f"global/cert/{TAG}.crl"
LEAF = issue(ROOT, SIGNER, source=TAG)
PLAIN = issue(ROOT, SIGNER)
REVOKED = ((sha256(LEAF[0]), "2025-01-01_00:00:00"),)
DUMMY = ((NOTHING, "2001-01-01_00:00:00"),)

ROWS = [
    ("sequence-open", b"(8:sequence", b"", "OK", "the opening may be missing: lists without it are in use"),
    ("sequence-keyword", b"(8:sequence", b"(8:sequencf", "PARSE_FILE", "another keyword"),
    ("crl-keyword", b"(3:crl", b"(3:crm", "PARSE_FILE", "a list of another keyword"),
    ("crl-delta", b"(3:crl", b"(9:delta-crl", "PARSE_FILE", "no list of changes"),
    ("version-2", b"(7:version1:1)", b"(7:version1:2)", "PARSE_FILE", "another version is not guessed at"),
    ("version-missing", b"(7:version1:1)", b"", "PARSE_FILE", "here a version must be"),
    ("version-twice", b"(7:version1:1)", b"(7:version1:1)(7:version1:1)", "PARSE_FILE", "one version"),
    ("list1-keyword", b"(5:list1", b"(5:list3", "PARSE_FILE", "a list that nobody knows"),
    ("lists-swapped", b"(5:list1", b"(5:list2", "PARSE_FILE", "list1 comes first"),
    ("list2-missing", b"(5:list2)", b"", "PARSE_FILE", "both lists must be there"),
    ("list3", b"(5:list2)", b"(5:list2)(5:list3)", "PARSE_FILE", "and no third"),
    ("list2-word", b"(5:list2)", b"(5:list21:x)", "PARSE_FILE", "a word among the items"),
    ("item-keyword", b"(4:item", b"(4:iten", "PARSE_FILE", "an item of another keyword"),
    ("item-no-hash", b"(4:item(4:hash6:sha25632:" + bytes(32) + b")", b"(4:item", "PARSE_FILE", "an item names a digest"),
    ("item-key", b"(4:item(4:hash6:sha25632:" + bytes(32) + b")", b"(4:item" + canonical(ALICE.public), "PARSE_FILE", "and no key"),
    ("item-md5", b"6:sha25632:", b"3:md532:", "HASH_ID", "a hash that nobody knows"),
    ("item-short", b"6:sha25632:" + bytes(32), b"6:sha25631:" + bytes(31), "INVALID_HASH", "a digest of the wrong length"),
    ("item-sha1-32", b"6:sha25632:", b"4:sha132:", "INVALID_HASH", "a digest of the wrong length"),
    ("item-no-date", b"19:2001-01-01_00:00:00)", b")", "PARSE_FILE", "an item has a date"),
    ("item-date-list", b"19:2001-01-01_00:00:00)", b"(4:date))", "PARSE_FILE", "that is a word"),
    ("item-two-dates", b"19:2001-01-01_00:00:00)", b"19:2001-01-01_00:00:004:2002)", "PARSE_FILE", "one date"),
    ("item-empty", b"(4:item", b"(4:item)(4:item", "PARSE_FILE", "an empty item"),
    ("cert-keyword", b"(4:cert", b"(4:cerz", "PARSE_FILE", "a certificate of another keyword"),
    ("cert-missing", b"(4:cert", b"(9:signature", "PARSE_FILE", "a certificate vouches for it"),
    ("signature-keyword", b"(9:signature", b"(9:signaturf", "PARSE_FILE", "a signature of another keyword"),
    ("issuer-word", b"(6:issuer(", b"(6:issuer1:x(", "PRINCIPAL", "an issuer is a key or a digest"),
]  # fmt: skip


def _read(book: Book) -> None:
    good = revocations(SOURCE, TAG, DUMMY)
    question = {"operation": "read-list", "file": "calc.crl"}

    def one(name: str, why: str, file: Any, code: str) -> None:
        answers = YES if code == "OK" else trouble(code)
        book.case(f"lists/read-{name}", why, {"calc.crl": file}, question, answers)

    one("good", "a list with one item", book.object(good, "list"), "OK")
    one("empty-lists", "a list without items", book.object(revocations(SOURCE, TAG), "list"), "OK")
    for name, old, new, code, why in ROWS:
        one(name, why, edit(book, good, "list", old, new), code)
    size = len(canonical(good))
    for place in (0, 3, 12, 18, 33, 41, 50, 90, 115, 125, 140, 400, 700, size - 3, size - 2):
        one(
            f"cut-{place if place < 500 else place - size}", f"the first {place} bytes of {size}",
            book.cut(good, "list", place), "PARSE_FILE",
        )
    one(
        "cut-end", "the last byte is not looked for: lists without it are in use", book.cut(good, "list", size - 1),
        "OK",
    )
    book.case("lists/read-absent", "no such file", {}, question, trouble("FILE_NOT_FOUND", "io"))


def store(book: Book, stored: Any = None, leaf: list = LEAF, sources: Optional[list] = None, **more: Any) -> dict[str, Any]:
    """A chain, the root's entry, that of the source, and perhaps its list in the store."""
    entries = [entry(SOURCE, TAG)] if sources is None else sources
    files = {"global/acl/root.acl": book.object(entry(ROOT), "entry"), "chain.cert": book.object(chain(leaf), "chain")}
    files.update({f"global/acl/source{place}.acl": book.object(one, "entry") for place, one in enumerate(entries)})
    if stored is not None:
        files[STORED] = stored if isinstance(stored, dict) else book.object(stored, "list")
    return {**files, **more}


def _believed(book: Book) -> None:
    """A certificate that wants a current list, and what is stored."""
    good = revocations(SOURCE, TAG, DUMMY)
    unknown, broken = no("CRL_NOT_FOUND"), (library("CRL_NOT_FOUND"), command(2, "broken-list"))
    tampered = [*good[:1], revocations(SOURCE, TAG, DUMMY * 2)[1], *good[2:]]
    vouching = cert(SOURCE, ALICE, TAG, period=ALWAYS)
    keyed = [b"sequence", good[1], vouching, signature(SOURCE, vouching)]
    forged = [*good[:3], signature(STRANGER, good[2])]
    rows = [
        ("good", good, None, YES, "a current list that does not name it"),
        ("by-digest", good, [entry(SOURCE.hash(), TAG)], broken, "an entry must be for the very key that signs lists"),
        ("none", None, None, unknown, "no list tells"),
        ("ended", revocations(SOURCE, TAG, DUMMY, period=PAST), None, unknown, "an expired list is no coverage"),
        ("no-end", revocations(SOURCE, TAG, DUMMY, period=(ALWAYS[0], None)), None, unknown, "a list without an end covers nothing"),
        ("no-items", revocations(SOURCE, TAG), None, unknown, "a list without items counts as absent"),
        ("no-items-1", revocations(SOURCE, TAG, keys=DUMMY), None, unknown, "so does one whose list1 has none"),
        ("no-entry", good, [], unknown, "nobody is trusted with this source"),
        ("other-entry", good, [entry(SOURCE, "calc (revoke some)")], unknown, "the source is trusted with another list"),
        ("wider-entry", good, [entry(SOURCE, "calc")], unknown, "being trusted with more is not being trusted with lists"),
        ("other-signer", revocations(STRANGER, TAG, DUMMY), None, broken, "a list by a key that is not trusted with it"),
        ("root-signer", revocations(ROOT, TAG, DUMMY), None, broken, "the root is not trusted with this list"),
        ("last-entry", good, [entry(SOURCE, TAG), entry(STRANGER, TAG)], broken, "of two entries with this tag the last decides"),
        ("other-tag", revocations(SOURCE, "other (revoke all)", DUMMY), None, broken, "a list of another source under this name"),
        ("tampered", tampered, None, broken, "a list that was changed after it was signed"),
        ("keyed", keyed, None, broken, "a certificate that vouches for a key and not for the list"),
        ("forged", forged, None, broken, "the signature of another key"),
        ("cut", book.cut(good, "list", 300), None, broken, "half a list"),
        ("text", {"content": "none\n"}, None, broken, "no list at all"),
        ("empty", {"content": ""}, None, broken, "an empty file"),
        ("sha1", revocations(SOURCE, TAG, DUMMY, digest="sha1"), None, YES, "the list's digest may be SHA-1"),
    ]  # fmt: skip
    for name, stored, sources, answers, why in rows:
        book.case(f"lists/store-{name}", why, store(book, stored, sources=sources), ask_chain(), answers)


def _revoked(book: Book) -> None:
    """What a good list takes back."""
    digest = {name: [b"hash", name.encode(), SIGNER.digest(name)] for name in ("sha1", "sha256", "rmd160")}
    leaf_sha1 = [b"hash", b"sha1", hashlib.sha1(canonical(LEAF[0])).digest()]
    revoked = no("CERT_REVOKED")
    rows = [
        ("cert", REVOKED, (), revoked, "the certificate is on the list"),
        ("cert-sha1", ((leaf_sha1, "2025-01-01_00:00:00"),), (), revoked, "by its SHA-1"),
        ("cert-at-moment", ((sha256(LEAF[0]), MOMENT),), (), revoked, "from the moment on that is asked about"),
        ("cert-later", ((sha256(LEAF[0]), "2030-06-01_00:00:01"),), (), YES, "a second later it will be"),
        ("cert-odd-date", ((sha256(LEAF[0]), "soon"),), (), revoked, "a date that is none counts as come"),
        ("cert-second", (*DUMMY, *REVOKED), (), revoked, "the second item counts as the first does"),
        ("cert-list2", DUMMY, REVOKED, YES, "list2 is for keys: a certificate's digest there is nobody's"),
        ("key", DUMMY, ((digest["sha256"], "2025-01-01_00:00:00"),), revoked, "the subject's key is on the list"),
        ("key-later", DUMMY, ((digest["sha256"], "3500-01-01_00:00:00"),), revoked, "a key has no date"),
        ("key-sha1", DUMMY, ((digest["sha1"], "2025-01-01_00:00:00"),), revoked, "by its SHA-1"),
        ("key-rmd160", DUMMY, ((digest["rmd160"], "2025-01-01_00:00:00"),), revoked, "by its RIPEMD-160"),
        ("key-list1", (*DUMMY, (digest["sha256"], "2025-01-01_00:00:00")), (), YES, "list1 is for certificates"),
        ("other-cert", ((sha256(PLAIN[0]), "2025-01-01_00:00:00"),), (), YES, "another certificate of the same key"),
    ]  # fmt: skip
    for name, certs, keys, answers, why in rows:
        files = store(book, revocations(SOURCE, TAG, certs, keys))
        book.case(f"lists/revoked-{name}", why, files, ask_chain(), answers)
    middle = triple(ROOT, cert(ROOT, ALICE, propagate=True))
    for name, key, answers, why in (
        ("middle-key", ALICE, revoked, "a key in the middle of the chain"),
        ("leaf-key", SIGNER, revoked, "the key at its end"),
        ("nobody-key", OTHER, YES, "a key that has no place in the chain"),
    ):
        stored = revocations(SOURCE, TAG, DUMMY, ((key.hash(), "2025-01-01_00:00:00"),))
        files = store(book, stored, **{"chain.cert": book.object(chain(issue(ALICE, SIGNER), middle), "chain")})
        book.case(f"lists/revoked-{name}", why, files, ask_chain(), answers)
    named = chain(issue(ROOT, SIGNER.hash()))
    stored = revocations(SOURCE, TAG, DUMMY, ((SIGNER.hash(), "2025-01-01_00:00:00"),))
    files = store(book, stored, **{"chain.cert": book.object(named, "chain")})
    book.case(
        "lists/revoked-key-by-hash", "a certificate that names the key by its digest", files, ask_chain(), revoked,
    )


def make(book: Book) -> None:
    _read(book)
    _believed(book)
    _revoked(book)
