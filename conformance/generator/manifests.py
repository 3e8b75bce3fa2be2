# SPDX-License-Identifier: Apache-2.0
"""Manifests as files: their malformed forms, their signatures, and the signer's authority."""

from __future__ import annotations

from typing import Any, Optional

from .book import YES, Book, ask_manifest, command, library, no, trouble
from .keys import ALICE, ROOT, SIGNER, STRANGER
from .objects import (
    ALWAYS, FUTURE, PAST, SIGNED_AT, body, cert, dir_entry, entry, file_entry, issue, manifest, pairs, sha256,
    signature, triple,
)  # fmt: skip
from .readers import edit
from .sexp import Raw, canonical

TREE = {"tree/a": {"content": "x"}, "tree/sub/b": {"content": "y"}}
LISTING = body(file_entry("a", b"x"), dir_entry("sub", file_entry("b", b"y")))
SECOND = pairs(issue(ROOT, SIGNER))
GOOD = manifest(LISTING, SECOND)

FORMS = [
    ("keyword", b"(8:manifest", b"(8:manifesu", "PARSE_FILE", "another keyword"),
    ("open", b"(8:manifest", b"8:manifest", "PARSE_FILE", "no list"),
    ("version-keyword", b"(7:version", b"(7:versiom", "PARSE_FILE", "the version comes first"),
    ("version-2", b"(7:version1:1", b"(7:version1:2", "MANIFEST_VERSION", "another version is not guessed at"),
    ("version-01", b"(7:version1:1", b"(7:version2:01", "MANIFEST_VERSION", "nor is it a number"),
    ("version-empty", b"(7:version1:1", b"(7:version0:", "MANIFEST_VERSION", "no version"),
    ("version-alone", b"1:13:kit)", b"1:1)", "PARSE_FILE", "who made it must stand there"),
    ("version-three", b"1:13:kit)", b"1:13:kit1:x)", "PARSE_FILE", "and nothing more"),
    ("type-other", b"5:plain", b"5:crypt", "MANIFEST_TYPE", "another type"),
    ("type-longer", b"5:plain", b"6:plain2", "MANIFEST_TYPE", "a longer one"),
    ("type-missing", b"(4:type5:plain)", b"", "PARSE_FILE", "no type"),
    ("type-twice", b"(4:type5:plain)", b"(4:type5:plain)(4:type5:plain)", "PARSE_FILE", "two types"),
    ("block-keyword", b"(15:signature-block", b"(15:signature-blocl", "PARSE_FILE", "no signatures"),
    ("time-missing", b"(15:time-of-signing19:" + SIGNED_AT.encode() + b")", b"", "PARSE_FILE", "no time of signing"),
    ("time-short", b"19:" + SIGNED_AT.encode(), b"18:" + SIGNED_AT[:-1].encode(), "TIME_STAMP", "a time without its last digit"),
    ("time-long", b"19:" + SIGNED_AT.encode(), b"20:" + SIGNED_AT.encode() + b"Z", "TIME_STAMP", "a time with a zone"),
    ("time-empty", b"19:" + SIGNED_AT.encode(), b"0:", "TIME_STAMP", "no time"),
    ("time-list", b"19:" + SIGNED_AT.encode(), b"(4:time)", "PARSE_FILE", "a list where a time must be"),
    ("time-other", SIGNED_AT.encode(), b"2021" + SIGNED_AT[4:].encode(), "HASH_MATCH", "another time than the one that was signed"),
    ("kit-other", b"3:kit", b"3:kat", "HASH_MATCH", "another maker than the one that was signed"),
    ("signer-keyword", b"(4:cert", b"(4:cerz", "PARSE_FILE", "no certificate for the content"),
    ("crl-missing", b"(3:crl)", b"", "PARSE_FILE", "the place of the lists is missing"),
    ("crl-word", b"(3:crl)", b"(3:crl1:x)", "PARSE_FILE", "a word among the lists"),
    ("crl-bad", b"(3:crl)", b"(3:crl(3:abc))", "PARSE_FILE", "something else among the lists"),
    ("crl-twice", b"(3:crl)", b"(3:crl)(3:crl)", "HASH_MATCH", "all that follows the lists is the content"),
    ("body-byte", b"1:a", b"1:b", "HASH_MATCH", "another name in the listing"),
    ("body-digest", b"(3:dir", b"(3:did", "HASH_MATCH", "a byte of the listing"),
    ("body-token", b"4:\1\2\3\4", b"4:\1\2\3\5", "HASH_MATCH", "the random token is signed too"),
    ("body-more", b"(3:dir", b"(4:file1:z0:1:z)(3:dir", "HASH_MATCH", "an entry more"),
]  # fmt: skip


def store(book: Book, what: Any, *entries: list, tree: Optional[dict] = None, **more: Any) -> dict[str, Any]:
    trusted = entries or (entry(ROOT),)
    files = {f"global/acl/e{place}.acl": book.object(one, "entry") for place, one in enumerate(trusted, 1)}
    written = what if isinstance(what, dict) else book.object(what, "manifest")
    return {**files, "app.manifest": written, **(TREE if tree is None else tree), **more}


def answers_of(code: str) -> tuple:
    """A file that cannot be read is trouble; one that can, and does not hold, is a no."""
    unreadable = {
        "PARSE_FILE", "PRINCIPAL", "MANIFEST_VERSION", "MANIFEST_TYPE", "TIME_STAMP", "UNKNOWN_HASH_ID",
        "RANDOM_TOKEN", "INVALID_HASH", "HASH_ID", "MAX_BYTE_STRING",
    }
    return YES if code == "OK" else trouble(code) if code in unreadable else no(code)


def _forms(book: Book) -> None:
    for name, old, new, code, why in FORMS:
        files = store(book, edit(book, GOOD, "manifest", old, new))
        book.case(f"manifests/{name}", why, files, ask_manifest(), answers_of(code))
    data, size = canonical(GOOD), len(canonical(GOOD))
    end_of_lists = data.index(b"(3:crl)") + 7
    for place in (0, 1, 11, 25, 60, 101, 150, 400, 700, 1000, end_of_lists - 1, end_of_lists, end_of_lists + 1, size - 40, size - 1):
        code = "HASH_MATCH" if place > end_of_lists else "PARSE_FILE"
        files = store(book, book.cut(GOOD, "manifest", place))
        book.case(
            f"manifests/cut-{place}", f"the first {place} bytes of {size}", files, ask_manifest(), answers_of(code),
        )
    trailing = store(book, book.changed(GOOD, "manifest", size, 0, b"\n"))
    book.case(
        "manifests/trailing", "a byte after its end moves into the content", trailing, ask_manifest(),
        no("HASH_MATCH"),
    )
    files = store(book, GOOD)
    del files["app.manifest"]
    book.case("manifests/absent", "no such file", files, ask_manifest(), trouble("OPEN_MANIFEST_FILE", "io"))
    book.case(
        "manifests/fifo", "a pipe is not opened", {**files, "app.manifest": {"fifo": 1}}, ask_manifest(),
        trouble("OPEN_MANIFEST_FILE", "io"),
    )


F = file_entry("a", b"x")
BODIES = [
    ("token-3", body(F, token=b"123"), "RANDOM_TOKEN", "a token of three bytes"),
    ("token-5", body(F, token=b"12345"), "RANDOM_TOKEN", "a token of five"),
    ("token-missing", [b"body", F], "PARSE_FILE", "no token"),
    ("keyword", [b"bodz", *body(F)[1:]], "PARSE_FILE", "another keyword"),
    ("entry-keyword", body([b"fill", *F[1:]]), "PARSE_FILE", "an entry that nobody knows"),
    ("entry-link", body([b"link", b"a", b"", b"b"]), "PARSE_FILE", "links are no entries"),
    ("entry-word", body(b"a"), "PARSE_FILE", "a word among the entries"),
    ("digest-20", body(file_entry("a", digest=bytes(20))), "UNKNOWN_HASH_ID", "a digest of 20 bytes"),
    ("digest-31", body(file_entry("a", digest=bytes(31))), "UNKNOWN_HASH_ID", "a digest of 31 bytes"),
    ("digest-33", body(file_entry("a", digest=bytes(33))), "UNKNOWN_HASH_ID", "a digest of 33 bytes"),
    ("digest-0", body(file_entry("a", digest=b"")), "UNKNOWN_HASH_ID", "no digest"),
    ("file-two", body(F[:3]), "PARSE_FILE", "a file without a digest"),
    ("file-four", body([*F, b"x"]), "PARSE_FILE", "a file with more"),
    ("file-list", body([b"file", [b"a"], b"", F[3]]), "PARSE_FILE", "a list where a name must be"),
    ("dir-alone", body([b"dir", b"a"]), "PARSE_FILE", "a directory without its second word"),
    ("name-empty", body(file_entry("", b"x")), "PARSE_FILE", "no name"),
    ("name-dot", body(file_entry(".", b"x")), "PARSE_FILE", "the directory itself"),
    ("name-dots", body(dir_entry("..", F)), "PARSE_FILE", "a path that climbs out"),
    ("name-climbs", body(file_entry("../a", b"x")), "PARSE_FILE", "a path that climbs out"),
    ("name-absolute", body(file_entry("/etc/passwd", b"x")), "PARSE_FILE", "a path from the root"),
    ("name-path", body(file_entry("sub/b", b"y")), "PARSE_FILE", "a path where a name must be"),
    ("name-end-slash", body(dir_entry("sub/", F)), "PARSE_FILE", "a slash"),
    ("name-zero", body(file_entry("a\0b", b"x")), "PARSE_FILE", "a name that would be cut at its 0 byte"),
    ("deep", body(Raw(b"(3:dir1:d0:" * 300 + b")" * 300)), "PARSE_FILE", "three hundred levels"),
    ("open", [*body(F), Raw(b"(4:file")], "PARSE_FILE", "an entry that is not closed"),
    ("more", Raw(canonical(body(F)) + b"(1:x)"), "OK", "what follows the listing was signed with it, and is not read"),
]  # fmt: skip


def _bodies(book: Book) -> None:
    tree = {"tree/a": {"content": "x"}}
    for name, listing, code, why in BODIES:
        files = store(book, manifest(listing, SECOND), tree=tree)
        book.case(f"manifests/listing-{name}", why + ", signed", files, ask_manifest(), answers_of(code))


def _signatures(book: Book) -> None:
    def one(name: str, why: str, what: list, code: str, *entries: list) -> None:
        book.case(f"manifests/{name}", why, store(book, what, *entries), ask_manifest(), answers_of(code))

    parts = GOOD[3]
    content = parts[2]
    for name, algorithm, digest, code, why in (
        ("pss", "rsa-pss", "sha256", "OK", "PSS"),
        ("sha1", "rsa-1.5", "sha1", "OK", "SHA-1 is taken for signatures: old chains rely on it"),
        ("pss-sha1", "rsa-pss", "sha1", "OK", "PSS over SHA-1"),
    ):
        one(
            f"signed-{name}", why,
            manifest(LISTING, pairs(triple(ROOT, cert(ROOT, SIGNER), algorithm, digest)), algorithm=algorithm), code,
        )
    for name, algorithm in (("unknown", "rsa-1.6"), ("longer", "rsa-pss-"), ("upper", "RSA-PSS"), ("dsa", "dsa-sha1"), ("pkcs", "rsa-pkcs1"), ("none", "none")):
        bad = signature(SIGNER, content)
        bad[3] = [algorithm.encode(), bad[3][1]]
        one(
            f"algorithm-{name}", "an algorithm that an RSA key does not know",
            manifest(LISTING, SECOND, signer_cert=[content, bad]), "SIGNATURE_ID",
        )
    rmd = signature(SIGNER, content)
    rmd[1] = [b"hash", b"rmd160", bytes(20)]
    one(
        "signature-rmd160", "a digest that RSA signatures do not take",
        manifest(LISTING, SECOND, signer_cert=[content, rmd]), "SIGNATURE_ID",
    )
    by_hash = signature(SIGNER, content)
    by_hash[2] = SIGNER.hash()
    one(
        "signature-by-hash", "a digest is not the issuer's key, which must sign",
        manifest(LISTING, SECOND, signer_cert=[content, by_hash]), "SIGNATURE",
    )
    hashed = cert(SIGNER.hash(), content[3][1], None)
    hash_signed = signature(SIGNER, hashed)
    hash_signed[2] = SIGNER.hash()
    one(
        "issuer-by-hash", "a digest cannot sign", manifest(LISTING, SECOND, signer_cert=[hashed, hash_signed]),
        "NOT_IMPLEMENTED",
    )
    zero = signature(SIGNER, content)
    for name, value in (("flipped", bytes([zero[3][1][0] ^ 1]) + zero[3][1][1:]), ("short", zero[3][1][1:]), ("long", b"\0" + zero[3][1]), ("zero", bytes(128)), ("empty", b"")):
        wrong = [*zero[:3], [zero[3][0], value]]
        one(
            f"signature-{name}", "a value that no key of the issuer made",
            manifest(LISTING, SECOND, signer_cert=[content, wrong]), "SIGNATURE",
        )
    one(
        "signature-other-cert", "a signature over another certificate",
        manifest(LISTING, SECOND, signer_cert=[content, signature(SIGNER, cert(SIGNER, ALICE))]), "HASH_MISMATCH",
    )
    one(
        "signature-stranger", "signed by another than the issuer",
        manifest(LISTING, SECOND, signer_cert=[content, signature(STRANGER, content)]), "SIGNATURE",
    )
    one(
        "second-stranger", "the second certificate signed by another",
        manifest(LISTING, pairs(triple(STRANGER, cert(ROOT, SIGNER)))), "SIGNATURE",
    )
    third = [*SECOND, *pairs(triple(STRANGER, cert(ROOT, ALICE)))]
    one("third-stranger", "a third that nobody needs must hold too", manifest(LISTING, third), "SIGNATURE")
    for_key = cert(SIGNER, ALICE)
    one(
        "for-key", "the first certificate must be for a digest",
        manifest(LISTING, SECOND, signer_cert=[for_key, signature(SIGNER, for_key)]), "NOT_OBJECT_CERT",
    )
    other = cert(SIGNER, sha256([b"x"]), None)
    one(
        "for-other", "a certificate for another content",
        manifest(LISTING, SECOND, signer_cert=[other, signature(SIGNER, other)]), "HASH_MATCH",
    )
    one("content-sha1", "the content named by SHA-1", manifest(LISTING, SECOND, hash_name="sha1"), "OK")


def _authority(book: Book) -> None:
    def one(name: str, why: str, what: list, code: str, *entries: list, at: Optional[str] = None, **more: Any) -> None:
        book.case(f"manifests/{name}", why, store(book, what, *entries), ask_manifest(at=at, **more), answers_of(code))

    one("good", "signed by a key that the root certified", GOOD, "OK")
    one("one-certificate", "a second certificate must be there", manifest(LISTING, []), "PARSE_FILE")
    one(
        "self-trusted", "the signer itself is trusted, and says so", manifest(LISTING, pairs(issue(SIGNER, SIGNER))),
        "OK", entry(SIGNER),
    )
    one(
        "self-made", "any key can certify itself", manifest(LISTING, pairs(issue(STRANGER, STRANGER)), key=STRANGER),
        "NOT_AUTHORIZED",
    )
    one(
        "order", "the second certificate is for another key",
        manifest(LISTING, pairs(issue(ROOT, ALICE), issue(ROOT, SIGNER))), "SIGNING_CERT_ORDER",
    )
    middle = pairs(issue(ALICE, SIGNER), issue(ROOT, ALICE, propagate=True))
    one("three", "a chain of three", manifest(LISTING, middle), "OK")
    stopped = pairs(issue(ALICE, SIGNER), issue(ROOT, ALICE))
    one("three-no-propagate", "the third may not be passed on", manifest(LISTING, stopped), "NOT_AUTHORIZED")
    one("three-missing", "a link is missing", manifest(LISTING, pairs(issue(ALICE, SIGNER))), "NOT_AUTHORIZED")
    one(
        "entry-no-propagate", "signing passes on what was granted", GOOD, "NOT_AUTHORIZED",
        entry(ROOT, propagate=False),
    )
    one("other-root", "another root", GOOD, "NOT_AUTHORIZED", entry(STRANGER))
    one("wider-asked", "more is asked than the signer was granted", GOOD, "PACKAGE_NOT_GRANTED", tag="(install)")
    one("other-asked", "something else is asked", GOOD, "NOT_AUTHORIZED", tag="(remove)")
    one(
        "signer-narrows", "the signer itself signed for less",
        manifest(LISTING, SECOND, tag="(install (app calc) (beta))"), "PACKAGE_NOT_GRANTED",
    )
    one(
        "signer-other", "the signer signed for something else", manifest(LISTING, SECOND, tag="(remove)"),
        "NOT_AUTHORIZED",
    )
    for name, period, code in (("ended", PAST, "NOT_AUTHORIZED"), ("not-yet", FUTURE, "NOT_AUTHORIZED"), ("in-force", ALWAYS, "OK")):
        one(
            f"second-{name}", "the certificate's period, by the time of signing",
            manifest(LISTING, pairs(issue(ROOT, SIGNER, period=period))), code,
        )
        one(f"entry-{name}", "the entry's period, by the time of signing", GOOD, code, entry(ROOT, period=period))
    window = manifest(LISTING, pairs(issue(ROOT, SIGNER, period=("2020-01-01_00:00:00", "2020-12-31_23:59:59"))))
    one("asked-in-2020", "asked about a moment of the period", window, "OK", at="2020-07-01_00:00:00")
    one("asked-in-2021", "and about one after it", window, "NOT_AUTHORIZED", at="2021-07-01_00:00:00")
    one("asked-in-2019", "and about one before it", window, "NOT_AUTHORIZED", at="2019-07-01_00:00:00")
    one("asked-at-start", "its first second", window, "OK", at="2020-01-01_00:00:00")
    one("asked-at-end", "its last second", window, "OK", at="2020-12-31_23:59:59")
    one("asked-after-end", "a second later", window, "NOT_AUTHORIZED", at="2021-01-01_00:00:00")
    nothing = {**store(book, GOOD)}
    del nothing["global/acl/e1.acl"]
    book.case(
        "manifests/no-store", "nothing is trusted", nothing, ask_manifest(),
        (library("FILE_NOT_FOUND"), command(1, "nothing-trusted")),
    )
    book.case(
        "manifests/acl-directory", "an entry of a directory that is trusted beside",
        {**nothing, "more/x.acl": book.object(entry(ROOT), "entry")}, ask_manifest(acl_directory="more"), YES,
    )


def make(book: Book) -> None:
    _forms(book)
    _bodies(book)
    _signatures(book)
    _authority(book)
