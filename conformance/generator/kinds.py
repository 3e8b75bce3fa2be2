# SPDX-License-Identifier: Apache-2.0
"""The malformed forms of what the good chain of readers.py does not hold: DSA keys, k of n, digests as subjects, key
files, entries of the store, and times as people write them."""

from __future__ import annotations

from .book import YES, Book, ask_chain, command, library, trouble
from .keys import ALICE, BOB, DSA, ROOT, SIGNER
from .objects import ALWAYS, cert, chain, entry, issue, threshold, triple
from .readers import edit
from .sexp import canonical

PAIRS = {pair[0]: canonical(pair) for pair in DSA.public[1][1:]}
P, G, Q, Y = (PAIRS[letter] for letter in (b"p", b"g", b"q", b"y"))

DSA_KEYS = [
    ("dsa-good", P, P, "OK", "a DSA key"),
    ("dsa-order", P + G + Q, P + Q + G, "PARSE_FILE", "its numbers stand in the order p, g, q, y"),
    ("dsa-y-first", P + G + Q + Y, Y + P + G + Q, "PARSE_FILE", "and in no other"),
    ("dsa-no-p", P, b"", "PARSE_FILE", "a number is missing"),
    ("dsa-no-g", G, b"", "PARSE_FILE", "a number is missing"),
    ("dsa-no-q", Q, b"", "PARSE_FILE", "a number is missing"),
    ("dsa-no-y", Y, b"", "PARSE_FILE", "a number is missing"),
    ("dsa-twice", Q, Q + Q, "PARSE_FILE", "a number that is there twice"),
    ("dsa-private", Y, Y + b"(1:x1:1)", "PARSE_FILE", "the private number has no place here"),
    ("dsa-as-rsa", b"(3:dsa", b"(3:rsa", "PARSE_FILE", "the numbers of another algorithm"),
    ("dsa-name", b"(3:dsa", b"(3:dss", "PARSE_FILE", "an algorithm that only begins so"),
]

THRESHOLD = threshold(2, ALICE, BOB)
_COUNTS = b"(6:k-of-n1:\x021:\x02"
THRESHOLDS = [
    ("k-of-n-good", _COUNTS, _COUNTS, "OK", "two of two"),
    ("k-of-n-keyword", _COUNTS, b"(6:k-of-m1:\x021:\x02", "PARSE_FILE", "another keyword"),
    ("k-of-n-hinted", _COUNTS, b"(6:k-of-n[num]1:\x02[num]1:\x02", "OK", "counts may carry hints"),
    ("k-of-n-no-counts", _COUNTS, b"(6:k-of-n", "PARSE_FILE", "no counts"),
    ("k-of-n-one-count", _COUNTS, b"(6:k-of-n1:\x02", "PARSE_FILE", "one count"),
    ("k-of-n-empty-k", _COUNTS, b"(6:k-of-n0:1:\x02", "PARSE_FILE", "an empty count"),
    ("k-of-n-empty-n", _COUNTS, b"(6:k-of-n1:\x020:", "PARSE_FILE", "an empty number"),
    ("k-of-n-list", _COUNTS, b"(6:k-of-n(1:\x02)1:\x02", "PARSE_FILE", "a list where a count must be"),
    ("k-of-n-zero", _COUNTS, b"(6:k-of-n1:\x001:\x02", "OK", "none of two can be read; no answer rests on it"),
    ("k-of-n-three-of-two", _COUNTS, b"(6:k-of-n1:\x031:\x02", "OK", "three of two, too"),
    ("k-of-n-more", _COUNTS, b"(6:k-of-n1:\x021:\x01", "PARSE_FILE", "a member too many"),
    ("k-of-n-fewer", _COUNTS, b"(6:k-of-n1:\x021:\x03", "PARSE_FILE", "a member too few"),
    ("k-of-n-digest", canonical(BOB.public), canonical(BOB.hash()), "PARSE_FILE", "members are keys, not digests"),
    ("k-of-n-word", canonical(BOB.public), b"3:bob", "PARSE_FILE", "nor words"),
]

DIGESTS = [
    ("digest-good", b"6:sha256", b"6:sha256", "OK", "a digest as subject"),
    ("digest-md5", b"6:sha256", b"3:md5", "HASH_ID", "a hash that nobody knows"),
    ("digest-sha1", b"6:sha256", b"4:sha1", "INVALID_HASH", "32 bytes are no SHA-1"),
    ("digest-rmd160", b"6:sha256", b"6:rmd160", "INVALID_HASH", "nor a RIPEMD-160"),
    ("digest-uri", b"6:sha256", b"6:sha2563:uri", "INVALID_HASH", "another word in the digest's place"),
    ("digest-short", b"32:" + SIGNER.digest(), b"31:" + SIGNER.digest()[1:], "INVALID_HASH", "a byte less"),
    ("digest-list", b"32:" + SIGNER.digest(), b"(1:x)", "PARSE_FILE", "a list where the digest must be"),
    ("digest-none", b"32:" + SIGNER.digest(), b"", "PARSE_FILE", "no digest"),
]


def _subjects(book: Book) -> None:
    question = {"operation": "read-chain", "file": "chain.cert"}
    for subject, after, rows in ((DSA.public, b"(7:subject", DSA_KEYS), (THRESHOLD, b"(7:subject", THRESHOLDS), (SIGNER.hash(), b"(7:subject", DIGESTS)):
        good = chain(triple(ROOT, cert(ROOT, subject)))
        for name, old, new, code, why in rows:
            answers = YES if code == "OK" else trouble(code)
            book.case(
                f"kinds/{name}", why, {"chain.cert": edit(book, good, "chain", old, new, after)}, question, answers,
            )


KEY_FILES = [
    ("keyword", b"(10:public-key", b"(10:public-kex", "another keyword"),
    ("private", b"(10:public-key", b"(11:private-key", "a private key"),
    ("algorithm", b"(3:rsa", b"(3:eca", "an algorithm that nobody knows"),
    ("exponent", b"(1:e", b"(1:d", "the private exponent"),
    ("length", b"(1:n128:", b"(1:n9999:", "more than there is"),
    ("closed", b")))", b"))", "a list that is not closed"),
    ("trailing", b")))", b")))x", "more after its end"),
    ("blank", b"(10:public-key", b" (10:public-key", "a blank before it"),
]


def _key_files(book: Book) -> None:
    question = {"operation": "read-key", "file": "key.pub"}
    for name, key in (("rsa", ALICE), ("dsa", DSA)):
        file = {"key.pub": book.object(key.public, "key")}
        book.case(f"kinds/key-file-{name}", "a key file", file, question, (library("OK"), command(0, "ok")))
    for name, old, new, why in KEY_FILES:
        file = {"key.pub": edit(book, ALICE.public, "key", old, new)}
        answers = library("OK" if name == "trailing" else "MAX_BYTE_STRING" if name == "length" else "PARSE_FILE"), command(
            2, "malformed",
        )
        must = "test that a file ends where its object does" if name == "trailing" else None
        book.case(f"kinds/key-file-{name}", why, file, question, answers, caller_must=must)


ENTRY = entry(ROOT, period=ALWAYS, generation=b"\1", comment="text")
_TAG = b"(3:tag(7:install))"
ENTRIES = [
    ("full", b"4:text", b"4:text", True, "everything that an entry can say"),
    ("keyword", b"(5:entry", b"(5:entrx", False, "another keyword"),
    ("acl", b"(5:entry", b"(3:acl", False, "a list of entries is none"),
    ("version-2", b"(7:version1:1)", b"(7:version1:2)", False, "another version is not guessed at"),
    ("version-twice", b"(7:version1:1)", b"(7:version1:1)(7:version1:1)", False, "no element may be repeated"),
    ("version-missing", b"(7:version1:1)", b"", True, "the version may be missing"),
    ("issuer", b"(7:subject", b"(6:issuer" + canonical(ROOT.public) + b")(7:subject", False, "an entry has no issuer"),
    ("subject-keyword", b"(7:subject", b"(7:subjecx", False, "another keyword"),
    ("subject-missing", b"(7:subject" + canonical(ROOT.public) + b")", b"", False, "no subject"),
    ("subject-empty", b"(7:subject" + canonical(ROOT.public), b"(7:subject", False, "nobody"),
    ("subject-two", b")(9:propagate)", canonical(SIGNER.public) + b")(9:propagate)", False, "two subjects"),
    ("propagate-value", b"(9:propagate)", b"(9:propagate1:1)", False, "it takes no value"),
    ("propagate-twice", b"(9:propagate)", b"(9:propagate)(9:propagate)", False, "the second stands in the tag's place"),
    ("propagate-late", b"(9:propagate)" + _TAG, _TAG + b"(9:propagate)", False, "elements have their places"),
    ("tag-missing", _TAG, b"", True, "what stands in the tag's place is taken for it, and grants everything"),
    ("tag-word", _TAG, b"7:install", False, "a word where the tag must be"),
    ("tag-open", _TAG, b"(3:tag(7:install)", False, "a tag that is not closed"),
    ("valid-word", b"(5:valid", b"(5:valid1:x", False, "a word where a time must be"),
    ("valid-twice", b"(10:generation", b"(5:valid)(10:generation", False, "no element may be repeated"),
    ("valid-swapped", b"(5:valid", b"(5:valid(9:not-after1:x)", False, "the end before the beginning"),
    ("generation-empty", b"(10:generation1:\1)", b"(10:generation0:)", False, "an empty number"),
    ("generation-missing", b"(10:generation1:\1)", b"", True, "the generation may be missing"),
    ("generation-long", b"(10:generation1:\1)", b"(10:generation2:\1\2)", True, "its first byte counts"),
    ("comment-list", b"(7:comment4:text)", b"(7:comment(4:text))", False, "a list where a text must be"),
    ("comment-first", b"(10:generation1:\1)(7:comment4:text)", b"(7:comment4:text)(10:generation1:\1)", False, "elements have their places"),
    ("more", b"(7:comment4:text)", b"(7:comment4:text)(5:extra)", False, "an element that nobody knows"),
    ("open", b"(7:comment4:text))", b"(7:comment4:text)", False, "an entry that is not closed"),
]  # fmt: skip


def _entries(book: Book) -> None:
    """An entry alone in the store: it is trusted, or nothing is."""
    leaf = book.object(chain(issue(ROOT, SIGNER)), "chain")
    nothing = library("ACL_ENTRY_NOT_FOUND"), command(2, "no-acl-store")

    def one(name: str, why: str, file: object, good: bool) -> None:
        files = {"global/acl/root.acl": file, "chain.cert": leaf}
        must = "require a list headed by tag before installing" if name == "tag-missing" else None
        book.case(f"kinds/entry-{name}", why, files, ask_chain(), YES if good else nothing, caller_must=must)

    for name, old, new, good, why in ENTRIES:
        one(name, why, edit(book, ENTRY, "entry", old, new), good)
    for place in (0, 1, 8, 22, 32, 33, 40, 200, len(canonical(ENTRY)) - 1):
        one(f"cut-{place}", f"its first {place} bytes", book.cut(ENTRY, "entry", place), False)
    short = entry(ROOT)
    one("open-after-tag", "an entry may end right after its tag", book.object(short, "entry"), True)
    one("fifo", "a pipe is no entry", {"fifo": 1}, False)
    files = {"global/acl/root.txt": book.object(short, "entry"), "chain.cert": leaf}
    book.case("kinds/entry-other-name", "only files named .acl are entries", files, ask_chain(),
              (library("ACL_ENTRY_NOT_FOUND"), command(1, "nothing-trusted")))
    files = {"global/acl/root.acl/": None, "chain.cert": leaf}
    book.case("kinds/entry-directory", "a directory is none", files, ask_chain(), nothing)


def _stamps(book: Book) -> None:
    """Times as people write them. The whole field must be there, and the day must be."""
    files = {
        "global/acl/root.acl": book.object(entry(ROOT), "entry"),
        "chain.cert": book.object(chain(issue(ROOT, SIGNER)), "chain"),
    }
    for text in ("2030", "2030-06", "2028-02-29", "3900-12-31_23:59:59"):
        book.case(
            f"kinds/time-{text}", "a time may end after any field", files, ask_chain(at=None, at_text=text),
            (library("OK"), command(0, "ok")),
        )
    for text, why in (
        ("1969", "before 1970"), ("3901", "after 3900"), ("203", "three digits"), ("2030-6", "a digit is missing"), ("2030-13", "no such month"),
        ("2030-00", "no such month"), ("2030-02-29", "no such day"), ("2030-04-31", "no such day"), ("2030-06-01_24", "no such hour"),
        ("2030-06-01_12:60", "no such minute"), ("2030-06-01_12:00:60", "no such second"), ("2030/06", "another separator"), ("2030-06-01 12", "another separator"),
        ("2030-06-01T12", "another separator"), ("2030-06-01_12:00:00Z", "a zone"), ("2030-06-01_12:00:00.5", "a fraction"), ("x030", "a letter"), ("tomorrow", "a word"), ("+2030", "a sign"),
    ):  # fmt: skip
        book.case(
            f"kinds/time-{text.replace('/', '.')}", why, files, ask_chain(at=None, at_text=text),
            (library("TIME_STAMP"), command(2, "usage")),
        )


def make(book: Book) -> None:
    _subjects(book)
    _key_files(book)
    _entries(book)
    _stamps(book)
