# SPDX-License-Identifier: Apache-2.0
"""Malformed forms of every object of a chain: one change of one that is good, and what readers say to it."""

from __future__ import annotations

from typing import Any

from .book import Book, command, library, trouble
from .keys import ROOT, SIGNER
from .objects import ALWAYS, cert, chain, signature, triple
from .sexp import canonical

# Everything that a certificate can say.
FULL = cert(ROOT, SIGNER, propagate=True, period=ALWAYS, comment="text", source="calc (revoke all)")
GOOD = chain(triple(ROOT, FULL))
N = b"(1:n128:" + SIGNER.public[1][2][1] + b")"

# What stands in the text, what is put there, the code, and why. The first place counts, of the subject for keys.
CERTIFICATES = [
    ("sequence-keyword", b"(8:sequence", b"(8:sequencf", "PARSE_FILE", "a sequence of another keyword"),
    ("sequence-length", b"(8:sequence", b"(7:sequence", "PARSE_FILE", "a length that is not the keyword's"),
    ("sequence-open", b"(8:sequence", b"8:sequence", "PARSE_FILE", "no list"),
    ("sequence-hinted", b"(8:sequence", b"([bin]8:sequence", "PARSE_FILE", "keywords carry no hints"),
    ("sequence-blank", b"(8:sequence", b" (8:sequence", "PARSE_FILE", "no blanks before"),
    ("sequence-blank-inside", b"(8:sequence", b"(8:sequence ", "PARSE_FILE", "no blanks inside"),
    ("cert-keyword", b"(4:cert", b"(4:cerz", "PARSE_FILE", "a certificate of another keyword"),
    ("cert-upper", b"(4:cert", b"(4:CERT", "PARSE_FILE", "keywords are small letters"),
    ("cert-open", b"(4:cert", b"4:cert", "PARSE_FILE", "no list"),
    ("version-2", b"(7:version1:1)", b"(7:version1:2)", "PARSE_FILE", "another version is not guessed at"),
    ("version-long", b"(7:version1:1)", b"(7:version2:10)", "PARSE_FILE", "a version that only begins so"),
    ("version-twice", b"(7:version1:1)", b"(7:version1:1)(7:version1:1)", "PARSE_FILE", "no element may be repeated"),
    ("version-two-values", b"(7:version1:1)", b"(7:version1:11:1)", "PARSE_FILE", "one value"),
    ("version-empty", b"(7:version1:1)", b"(7:version)", "PARSE_FILE", "no value"),
    ("version-late", b"(9:propagate)", b"(7:version1:1)(9:propagate)", "PARSE_FILE", "elements have their places"),
    ("version-missing", b"(7:version1:1)", b"", "OK", "the version may be missing"),
    ("issuer-keyword", b"(6:issuer", b"(6:issuex", "PARSE_FILE", "an issuer of another keyword"),
    ("issuer-missing", b"(6:issuer" + canonical(ROOT.public) + b")", b"", "PARSE_FILE", "a certificate has an issuer"),
    ("issuer-twice", b"(7:subject", b"(6:issuer" + canonical(ROOT.public) + b")(7:subject", "PARSE_FILE", "and only one"),
    ("issuer-empty", b"(6:issuer" + canonical(ROOT.public), b"(6:issuer", "PRINCIPAL", "an issuer is a key or a digest"),
    ("issuer-threshold", b"(6:issuer(10:public-key", b"(6:issuer(6:k-of-n", "PRINCIPAL", "k-of-n cannot sign"),
    ("issuer-name", b"(6:issuer(10:public-key", b"(6:issuer(4:name", "PARSE_FILE", "names are not read: (4 is a digest"),
    ("issuer-word", b"(6:issuer(", b"(6:issuer3:abc(", "PRINCIPAL", "no word"),
    ("issuer-open", b"))(7:subject", b")(7:subject", "PARSE_FILE", "an issuer that is not closed"),
    ("subject-keyword", b"(7:subject", b"(7:subjecu", "PARSE_FILE", "a subject of another keyword"),
    ("subject-empty", b"(7:subject" + canonical(SIGNER.public), b"(7:subject", "PRINCIPAL", "a subject is something"),
    ("subject-five", b"(7:subject(10:public-key", b"(7:subject(5:other", "PRINCIPAL", "no kind of subject"),
    ("subject-letter", b"(7:subject(10:public-key", b"(7:subject(x", "PRINCIPAL", "no length"),
    ("subject-name", b"(7:subject" + canonical(SIGNER.public), b"(7:subject(4:name3:abc)", "PARSE_FILE", "names are not read"),
    ("subject-first", b"(6:issuer", b"(7:subject", "PARSE_FILE", "the issuer comes first"),
    ("subject-missing", b"(7:subject" + canonical(SIGNER.public) + b")", b"", "PARSE_FILE", "a certificate has a subject"),
    ("propagate-value", b"(9:propagate)", b"(9:propagate1:1)", "PARSE_FILE", "it takes no value"),
    ("propagate-twice", b"(9:propagate)", b"(9:propagate)(9:propagate)", "PARSE_FILE", "no element may be repeated"),
    ("propagate-keyword", b"(9:propagate)", b"(9:propagatf)", "PARSE_FILE", "an element that nobody knows"),
    ("propagate-missing", b"(9:propagate)", b"", "OK", "it may be missing"),
    ("tag-other-keyword", b"(3:tag", b"(3:tab", "OK", "any keyword of three letters stands for a tag: stored certificates rely on it"),
    ("tag-four", b"(3:tag", b"(4:tags", "PARSE_FILE", "a keyword of four letters does not"),
    ("tag-empty", b"(3:tag(7:install(3:app4:calc)))", b"(3:tag)", "OK", "the widest one"),
    ("tag-missing", b"(3:tag(7:install(3:app4:calc)))", b"", "OK", "it may be missing"),
    ("tag-twice", b"(5:valid", b"(3:tag1:x)(5:valid", "PARSE_FILE", "no element may be repeated"),
    ("tag-open", b"4:calc)))", b"4:calc))", "PARSE_FILE", "a list that is not closed takes all that follows"),
    ("tag-closed", b"4:calc)))", b"4:calc))))", "PARSE_FILE", "a list that is closed twice"),
    ("tag-deep", b"4:calc", b"(1:a" * 100 + b")" * 100, "OK", "a hundred levels"),
    ("tag-too-deep", b"4:calc", b"(1:a" * 300 + b")" * 300, "PARSE_FILE", "three hundred levels are more than any reader follows"),
    ("tag-late", b"(7:comment4:text)", b"(3:tag1:x)(7:comment4:text)", "PARSE_FILE", "elements have their places"),
    ("valid-keyword", b"(5:valid", b"(5:valie", "PARSE_FILE", "an element that nobody knows"),
    ("valid-empty", b"(10:not-before19:" + ALWAYS[0].encode() + b")(9:not-after19:" + ALWAYS[1].encode() + b")", b"", "OK", "neither time"),
    ("valid-swapped", b"(5:valid", b"(5:valid(9:not-after1:x)", "PARSE_FILE", "the end before the beginning"),
    ("valid-word", b"(5:valid", b"(5:valid1:x", "PARSE_FILE", "a word where a time must be"),
    ("valid-twice", b"(7:comment4:text)", b"(5:valid)(7:comment4:text)", "PARSE_FILE", "no element may be repeated"),
    ("not-before-twice", b"(5:valid", b"(5:valid(10:not-before1:x)", "PARSE_FILE", "one beginning"),
    ("not-before-list", b"(10:not-before19:", b"(10:not-before(19:", "PARSE_FILE", "a list where a time must be"),
    ("not-after-keyword", b"(9:not-after", b"(9:not-aftes", "PARSE_FILE", "an element that nobody knows"),
    ("comment-list", b"(7:comment4:text)", b"(7:comment(4:text))", "PARSE_FILE", "a list where a text must be"),
    ("comment-empty", b"(7:comment4:text)", b"(7:comment)", "PARSE_FILE", "no text"),
    ("comment-two", b"(7:comment4:text)", b"(7:comment4:text4:text)", "PARSE_FILE", "two texts"),
    ("comment-twice", b"(7:comment4:text)", b"(7:comment4:text)(7:comment4:text)", "PARSE_FILE", "no element may be repeated"),
    ("comment-hinted", b"(7:comment4:text)", b"(7:comment[utf-8]4:text)", "OK", "a text may carry a hint"),
    ("revocation-nine", b"(15:revocation-list", b"(9:revocatio", "PARSE_FILE", "a keyword of less than ten letters"),
    ("revocation-ten", b"(15:revocation-list", b"(10:revocation", "OK", "its text begins with (1, and that counts"),
    ("revocation-twice", b"(15:revocation-list", b"(10:revocation)(15:revocation-list", "PARSE_FILE", "no element may be repeated"),
    ("cert-more", b"(9:signature", b"(5:extra1:x)(9:signature", "PARSE_FILE", "something between certificate and signature"),
]  # fmt: skip

KEYS = [
    ("key-keyword", b"(10:public-key", b"(10:public-kez", "PARSE_FILE", "a key of another keyword"),
    ("key-private", b"(10:public-key", b"(11:private-key", "PARSE_FILE", "a private key has no place here"),
    ("key-algorithm", b"(3:rsa(", b"(3:xsa(", "PARSE_FILE", "an algorithm that nobody knows"),
    ("key-algorithm-r", b"(3:rsa(", b"(3:rsb(", "PARSE_FILE", "an algorithm that only begins so"),
    ("key-algorithm-long", b"(3:rsa(", b"(4:rsax(", "PARSE_FILE", "a longer name"),
    ("key-as-dsa", b"(3:rsa(", b"(3:dsa(", "PARSE_FILE", "the numbers of another algorithm"),
    ("key-exponent", b"(1:e", b"(1:f", "PARSE_FILE", "a number of another name"),
    ("key-no-exponent", b"(1:e3:\1\0\1)", b"", "PARSE_FILE", "a number is missing"),
    ("key-exponent-twice", b"(1:e3:\1\0\1)", b"(1:e3:\1\0\1)(1:e3:\1\0\1)", "PARSE_FILE", "a number that is there twice"),
    ("key-swapped", b"(1:e3:\1\0\1)" + N, N + b"(1:e3:\1\0\1)", "PARSE_FILE", "the numbers have an order"),
    ("key-no-modulus", N, b"", "PARSE_FILE", "a number is missing"),
    ("key-more", N + b")", N + b"(1:x1:y))", "PARSE_FILE", "a number that nobody knows"),
    ("key-modulus-list", b"(1:n128:", b"(1:n(128:", "PARSE_FILE", "a list where a number must be"),
    ("key-short", b"(1:n128:", b"(1:n127:", "PARSE_FILE", "a length that is one less"),
    ("key-long", b"(1:n128:", b"(1:n129:", "PARSE_FILE", "a length that is one more"),
    ("key-far", b"(1:n128:", b"(1:n8192:", "PARSE_FILE", "more than there is"),
    ("key-huge", b"(1:n128:", b"(1:n8193:", "MAX_BYTE_STRING", "longer than any byte string is"),
    ("key-five-digits", b"(1:n128:", b"(1:n00128:", "MAX_BYTE_STRING", "a length of five digits"),
    ("key-4-gib", b"(1:n128:", b"(1:n4294967296:", "MAX_BYTE_STRING", "four gibibytes"),
    ("key-negative", b"(1:n128:", b"(1:n-128:", "PARSE_FILE", "a sign"),
    ("key-hex", b"(1:n128:", b"(1:n0x80:", "PARSE_FILE", "a length in another notation"),
    ("key-no-length", b"(1:n128:", b"(1:n:", "PARSE_FILE", "no length"),
    ("key-no-colon", b"(1:n128:", b"(1:n128;", "PARSE_FILE", "another separator"),
    ("key-blank", b"(1:n128:", b"(1:n 128:", "PARSE_FILE", "no blanks"),
    ("key-hint", b"(1:n128:", b"(1:n[bin]128:", "OK", "a number may carry a hint"),
    ("key-hint-other", b"(1:n128:", b"(1:n[hex]128:", "PARSE_FILE", "a hint that nobody knows"),
    ("key-hint-empty", b"(1:n128:", b"(1:n[]128:", "PARSE_FILE", "no hint"),
    ("key-hint-open", b"(1:n128:", b"(1:n[bin128:", "PARSE_FILE", "a hint without an end"),
    ("key-hint-long", b"(1:n128:", b"(1:n[bin-bin-bin]128:", "PARSE_FILE", "a hint of more than ten letters"),
    ("key-hint-length", b"(1:n128:", b"(1:n[3:bin]128:", "PARSE_FILE", "hints have no length of their own"),
    ("key-hint-twice", b"(1:n128:", b"(1:n[bin][bin]128:", "PARSE_FILE", "one hint"),
    ("key-zero-before", b"(1:n128:", b"(1:n0128:", "OK", "a zero before the length is read: files with it are in use"),
]  # fmt: skip

_DIGEST = signature(ROOT, FULL)[1][2]
SIGNATURES = [
    ("signature-keyword", b"(9:signature", b"(9:signaturf", "PARSE_FILE", "a signature of another keyword"),
    ("signature-hash-keyword", b"(4:hash6:sha25632:", b"(4:hasg6:sha25632:", "PARSE_FILE", "a digest of another keyword"),
    ("signature-no-hash", b"(4:hash6:sha25632:" + _DIGEST + b")", b"", "PARSE_FILE", "the digest comes first"),
    ("signature-md5", b"6:sha25632:", b"3:md532:", "HASH_ID", "a hash that nobody knows"),
    ("signature-sha512", b"6:sha25632:", b"6:sha51232:", "HASH_ID", "a hash that nobody knows here"),
    ("signature-upper", b"6:sha25632:", b"6:SHA25632:", "HASH_ID", "names are small letters"),
    ("signature-prefix", b"6:sha25632:", b"6:sha25 32:", "HASH_ID", "a name that only begins so"),
    ("signature-sha1-32", b"6:sha25632:", b"4:sha132:", "INVALID_HASH", "a digest of the wrong length"),
    ("signature-rmd160-32", b"6:sha25632:", b"6:rmd16032:", "INVALID_HASH", "a digest of the wrong length"),
    ("signature-31", b"6:sha25632:" + _DIGEST, b"6:sha25631:" + _DIGEST[1:], "INVALID_HASH", "a byte less"),
    ("signature-33", b"6:sha25632:", b"6:sha25633:x", "INVALID_HASH", "a byte more"),
    ("signature-empty-digest", b"6:sha25632:" + _DIGEST, b"6:sha2560:", "INVALID_HASH", "no digest"),
    ("signature-hash-more", b"6:sha25632:" + _DIGEST, b"6:sha25632:" + _DIGEST + b"1:x", "PARSE_FILE", "more in the digest"),
    ("signature-no-signer", _DIGEST + b")" + canonical(ROOT.public), _DIGEST + b")", "PRINCIPAL", "nobody signed"),
    ("signature-algorithm-list", b"(7:rsa-1.5", b"((7:rsa-1.5", "PARSE_FILE", "a list where the algorithm must be"),
    ("signature-algorithm-word", b"(7:rsa-1.5", b"7:rsa-1.5", "PARSE_FILE", "no list around the value"),
    ("signature-algorithm-empty", b"(7:rsa-1.5", b"(0:", "OK", "read as any other name"),
    ("signature-short", b"(7:rsa-1.5128:", b"(7:rsa-1.5127:", "PARSE_FILE", "a length that is one less"),
    ("signature-two-values", b"(7:rsa-1.5", b"(7:rsa-1.51:x", "PARSE_FILE", "two values"),
    ("extra-missing", b"(7:comment)", b"", "PARSE_FILE", "a third item goes with each certificate"),
    ("extra-word", b"(7:comment)", b"7:comment", "PARSE_FILE", "it is a list"),
    ("extra-empty", b"(7:comment)", b"()", "OK", "of any form"),
    ("extra-twice", b"(7:comment)", b"(7:comment)(7:comment)", "PARSE_FILE", "and only one"),
    ("extra-deep", b"(7:comment)", b"(1:a" * 100 + b")" * 100, "OK", "a hundred levels"),
    ("extra-too-deep", b"(7:comment)", b"(" * 100000 + b")", "PARSE_FILE", "a hundred thousand levels"),
    ("sequence-end", b"(7:comment))", b"(7:comment)", "PARSE_FILE", "a sequence that is not closed"),
]  # fmt: skip


def edit(book: Book, what: list, kind: str, old: bytes, new: bytes, after: bytes = b"") -> dict:
    """One change of an object: the first `old` behind `after` becomes `new`."""
    data = canonical(what)
    at = data.index(old, data.index(after))
    if len(new) > 1000 and new == new[:1] * (len(new) - 1) + new[-1:]:
        return {**book.changed(what, kind, at, len(old), new[:1]), "times": len(new) - 1}
    return book.changed(what, kind, at, len(old), new)


def _read(book: Book, name: str, why: str, file: Any, code: str, **more: Any) -> None:
    files, question = {"chain.cert": file}, {"operation": "read-chain", "file": "chain.cert"}
    answers = trouble(code) if code != "OK" else (library("OK", **more), command(0, "ok"))
    book.case(f"read/{name}", why, files, question, answers)


def _cuts(book: Book) -> None:
    """Every kind of place at which a file can end."""
    data, size = canonical(GOOD), len(canonical(GOOD))
    principals = [data.index(b"(6:issuer") + 9, data.index(b"(7:subject") + 10, data.index(_DIGEST + b")") + 33]
    places = {1, 5, 11, 12, 16, 20, 40, 60, 200, 300, size - 1, size - 2, size - 10, size - 12, size - 100}
    for index, place in enumerate(sorted(places | {start + add for start in principals for add in (0, 1, 2)})):
        code = "PRINCIPAL" if any(place - start in (0, 1) for start in principals) else "PARSE_FILE"
        _read(book, f"cut-{index + 1}", f"the first {place} bytes of {size}", book.cut(GOOD, "chain", place), code)


def make(book: Book) -> None:
    _read(book, "good", "a certificate that says everything it can", book.object(GOOD, "chain"), "OK", certificates=1)
    for after, rows in ((b"", CERTIFICATES), (b"(7:subject", KEYS), (b"(9:signature", SIGNATURES)):
        for name, old, new, code, why in rows:
            _read(book, name, why, edit(book, GOOD, "chain", old, new, after), code)
    _cuts(book)
    two = chain(triple(ROOT, FULL), triple(ROOT, FULL))
    _read(book, "two", "two certificates", book.object(two, "chain"), "OK", certificates=2)
    _read(book, "empty-file", "nothing at all", {"content": ""}, "PARSE_FILE")
    _read(book, "text-file", "no expression", {"content": "hello\n"}, "PARSE_FILE")
    _read(book, "other-object", "an entry where a chain must be", {"content": "(5:entry)"}, "PARSE_FILE")
    where = {"operation": "read-chain", "file": "chain.cert"}
    book.case("read/absent", "no such file", {}, where, trouble("FILE_OPEN", "io"))
    book.case(
        "read/fifo", "a pipe is not opened, and nobody waits for it", {"chain.cert": {"fifo": 1}}, where,
        trouble("FILE_OPEN", "io"),
    )
    book.case("read/directory", "a directory is no file", {"chain.cert/": None}, where, trouble("FILE_OPEN", "io"))
