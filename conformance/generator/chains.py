# SPDX-License-Identifier: Apache-2.0
"""Chains of certificates: who may pass what on to whom, and when."""

from __future__ import annotations

from typing import Any, Optional

from .book import YES, Book, ask_chain, command, library, no
from .keys import ALICE, BOB, CAROL, OTHER, ROOT, SIGNER, STRANGER
from .objects import ALWAYS, FUTURE, PAST, TAG, cert, chain, entry, issue, triple
from .sexp import canonical

STORE = "global/acl/root.acl"


def files(book: Book, sequence: Any, *entries: list) -> dict[str, Any]:
    """A chain and the entries of the store, which trusts the root key for (install) when none are given."""
    trusted = entries or (entry(ROOT),)
    names = [STORE] + [f"global/acl/root{index}.acl" for index in range(2, len(trusted) + 1)]
    stored = {name: book.object(one, "entry") for name, one in zip(names, trusted)}
    return {**stored, "chain.cert": sequence if isinstance(sequence, dict) else book.object(sequence, "chain")}


def _lengths(book: Book) -> None:
    """Chains of one to four certificates, and each with one of its links undone."""
    people = [ROOT, ALICE, BOB, CAROL, SIGNER]
    for count in range(1, 5):
        keys = [*people[:count], SIGNER]
        links = list(zip(keys, keys[1:]))

        def build(broken: Optional[int] = None, **change: Any) -> list:
            made = []
            for place, (issuer, subject) in enumerate(links):
                passes = {"propagate": subject is not SIGNER}
                one = {"issuer": issuer, "subject": subject, **passes, **(change if place == broken else {})}
                made.append(triple(one.pop("key", one["issuer"]), cert(**one)))
            return chain(*reversed(made))

        name = f"chains/{count}-"
        book.case(name + "certificates", "each passes on what it was granted", files(book, build()), ask_chain(), YES)
        for place in range(count):
            last = place == count - 1
            for what, change, why in (
                ("stranger-issues", {"issuer": STRANGER}, "an issuer whom nobody granted anything"),
                ("other-tag", {"tag": "(remove)"}, "tags along a chain only narrow, here to nothing"),
                ("ended", {"period": PAST}, "a certificate that has ended"),
                ("not-yet", {"period": FUTURE}, "a certificate that has not begun"),
                ("stranger-signs", {"key": STRANGER}, "a signature by another than the issuer"),
                ("no-propagate", {"propagate": False}, "a subject that may not pass it on, and does"),
            ):
                if last and what == "no-propagate":
                    continue
                answer = no("SIGNATURE" if what == "stranger-signs" else "NOT_AUTHORIZED")
                changed = files(book, build(place, **change))
                book.case(f"{name}{what}-{place + 1}", why, changed, ask_chain(), answer)


def _entries(book: Book) -> None:
    """One good chain, and what the store says."""
    good = chain(issue(ROOT, SIGNER))
    rows = [
        ("exact", [entry(ROOT, TAG)], YES, "trusted for exactly what is asked"),
        ("wider", [entry(ROOT, "(install)")], YES, "trusted for more"),
        ("all", [entry(ROOT, "(*)")], YES, "trusted for everything"),
        ("by-hash", [entry(ROOT.hash())], YES, "a digest names its key"),
        ("second", [entry(STRANGER), entry(ROOT)], YES, "one entry of two is enough"),
        ("no-version", [entry(ROOT, version=None)], YES, "the version may be missing"),
        ("in-period", [entry(ROOT, period=ALWAYS)], YES, "an entry in force"),
        ("narrower", [entry(ROOT, "(install (app calc) (beta))")], no("PACKAGE_NOT_GRANTED"), "trusted for less than is asked"),
        ("other-tag", [entry(ROOT, "(remove)")], no("NOT_AUTHORIZED"), "trusted for something else"),
        ("other-key", [entry(STRANGER)], no("NOT_AUTHORIZED"), "another key is trusted"),
        ("no-propagate", [entry(ROOT, propagate=False)], no("NOT_AUTHORIZED"), "trusted, but not to pass it on"),
        ("ended", [entry(ROOT, period=PAST)], no("NOT_AUTHORIZED"), "an entry that has ended"),
        ("not-yet", [entry(ROOT, period=FUTURE)], no("NOT_AUTHORIZED"), "an entry that has not begun"),
        ("two-halves", [entry(ROOT, propagate=False), entry(ROOT, "(remove)")], no("NOT_AUTHORIZED"), "what two entries grant each does not add up"),
        ("subject-trusted", [entry(SIGNER, "(remove)")], no("NOT_AUTHORIZED"), "the subject is trusted, for something else"),
        ("hash-of-other", [entry(STRANGER.hash())], no("NOT_AUTHORIZED"), "the digest of another key"),
    ]
    for name, entries, answer, why in rows:
        book.case(f"chains/entry-{name}", why, files(book, good, *entries), ask_chain(), answer)


def _shapes(book: Book) -> None:
    """Certificates in odd company."""
    good, link = issue(ROOT, SIGNER), issue(ROOT, ALICE, propagate=True)
    forged = triple(STRANGER, cert(ROOT, OTHER))
    around = [issue(ALICE, BOB, propagate=True), issue(BOB, CAROL, propagate=True), issue(CAROL, ALICE, propagate=True)]
    refused, first = no("NOT_AUTHORIZED"), "look whom the first certificate is for: the answer is about that key"
    rows: list = [
        ("empty", chain(), (library("INVALID_SEQUENCE"), command(2, "trouble")), "no certificate at all", None),
        ("twice", chain(good, good), YES, "the same certificate twice", None),
        ("unrelated", chain(good, issue(STRANGER, OTHER)), YES, "one that nobody needs", None),
        ("unrelated-forged", chain(good, forged), no("SIGNATURE"), "its signature must hold all the same", None),
        ("unrelated-first", chain(issue(STRANGER, OTHER), good), refused, "the first certificate is the one that is asked about", None),
        ("upside-down", chain(link, issue(ALICE, SIGNER)), YES, "the root's certificate first", first),
        ("shuffled", chain(issue(BOB, SIGNER), link, issue(ALICE, BOB, propagate=True)), YES, "the others in any order", None),
        ("two-ways", chain(issue(ALICE, SIGNER), link, issue(ROOT, BOB, propagate=True), issue(BOB, SIGNER)), YES, "two ways to the root", None),
        ("second-way", chain(issue(ALICE, SIGNER), issue(STRANGER, ALICE, propagate=True), good), YES, "one of two ways is enough", None),
        ("cycle", chain(issue(CAROL, SIGNER), *around, link), YES, "a way that runs in a circle", None),
        ("cycle-alone", chain(issue(CAROL, SIGNER), *around), refused, "and one that only does", None),
        ("own", chain(issue(SIGNER, SIGNER, propagate=True)), refused, "a key that certifies itself", None),
        ("own-then-root", chain(issue(SIGNER, SIGNER, propagate=True), good), YES, "and is certified, too", None),
        ("crossed", chain(issue(ALICE, BOB, propagate=True), issue(BOB, ALICE, propagate=True)), refused, "two keys that certify each other", None),
        ("halves", chain(issue(ALICE, SIGNER), issue(ROOT, ALICE, "(remove)", propagate=True), issue(ROOT, ALICE)), refused, "one link passes on something else, the other nothing", None),
        ("for-digest", chain(issue(ROOT, SIGNER.hash())), YES, "a certificate for a key's digest", None),
        ("digest-issues", chain(issue(ALICE, SIGNER), issue(ROOT, ALICE.hash(), propagate=True)), YES, "and the key itself passes it on", None),
        ("digest-of-other", chain(issue(ALICE, SIGNER), issue(ROOT, BOB.hash(), propagate=True)), refused, "but no other", None),
        ("digest-rmd160", chain(issue(ALICE, SIGNER), issue(ROOT, ALICE.hash("rmd160"), propagate=True)), (library("SPKI_ERR_UNKNOWN_HASH_ALG"), command(2, "spki-err-unknown-hash-alg")), "a digest that keys are not named by stops the answer", None),
        ("version-missing", chain(triple(ROOT, cert(ROOT, SIGNER, version=None))), YES, "a certificate that was signed without a version", None),
    ]  # fmt: skip
    whole = chain(good)
    for name, old, new in (("version", b"(7:version1:1)", b""), ("propagate", b"(3:tag", b"(9:propagate)(3:tag"), ("tag", b"4:calc", b"4:calx"), ("comment", b"4:calc)))", b"4:calc)))(7:comment1:x)")):
        at, why = canonical(whole).index(old), "a signature covers every element of a certificate"
        altered = files(book, book.changed(whole, "chain", at, len(old), new))
        book.case(f"chains/altered-{name}", why, altered, ask_chain(), no("HASH_MISMATCH"))
    for name, sequence, answers, why, must in rows:
        book.case(f"chains/shape-{name}", why, files(book, sequence), ask_chain(), answers, caller_must=must)


def make(book: Book) -> None:
    _shapes(book)
    _lengths(book)
    _entries(book)
