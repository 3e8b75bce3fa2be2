# SPDX-License-Identifier: Apache-2.0
"""What must be answered so, and has surprised somebody: programs and stored files rely on it. Each names what a
careful caller does; what the command does stands beside it."""

from __future__ import annotations

from typing import Any

from .book import YES, Book, ask_chain, ask_manifest, command, library, no
from .chains import files
from .keys import ALICE, BOB, ROOT, SIGNER, SOURCE, STRANGER
from .lists import DUMMY, TAG, store as list_store
from .manifests import SECOND, store
from .objects import (
    FUTURE, MOMENT, PAST, cert, chain, entry, issue, manifest, pairs, revocations, sha256, threshold, triple,
)  # fmt: skip
from .sexp import canonical
from .trees import LISTING, tree

LAX = library("OK")


def _times(book: Book) -> None:
    moment = "ask about one moment: both times the same, most often now"
    ended = files(book, chain(issue(ROOT, SIGNER, period=PAST)))
    refused = LAX, command(1, "not-authorized")
    book.case(
        "warned/no-time-at-all", "without a time an ended certificate passes", ended, ask_chain(at=None), refused,
        caller_must=moment,
    )
    old_entry = files(book, chain(issue(ROOT, SIGNER)), entry(ROOT, period=PAST))
    book.case("warned/no-time-entry", "and an ended entry", old_entry, ask_chain(at=None), refused, caller_must=moment)
    unborn = files(book, chain(issue(ROOT, SIGNER, period=FUTURE)))
    book.case(
        "warned/no-time-future", "and one that has not begun", unborn, ask_chain(at=None), refused,
        caller_must=moment,
    )
    until_2021 = pairs(issue(ROOT, SIGNER, period=("2020-01-01_00:00:00", "2021-01-01_00:00:00")))
    backdated = store(book, manifest(LISTING, until_2021), tree=tree())
    now = "ask about now where a lost key must not date back"
    book.case(
        "warned/time-of-signing", "by default periods are judged when the signer says he signed", backdated,
        ask_manifest(), YES, caller_must=now,
    )
    book.case(
        "warned/time-of-signing-asked", "asked about a later moment it is a no", backdated, ask_manifest(at=MOMENT),
        no("NOT_AUTHORIZED"),
    )
    dated = revocations(SOURCE, TAG, ((sha256(issue(ROOT, SIGNER, source=TAG)[0]), "2025-01-01_00:00:00"),))
    signed = manifest(LISTING, pairs(issue(ROOT, SIGNER, source=TAG)))
    files_of = list_store(book, dated, **{"app.manifest": book.object(signed, "manifest"), **tree()})
    book.case(
        "warned/revoked-since", "revoked after the time of signing, by the signer's word", files_of, ask_manifest(),
        (LAX, command(1, "cert-revoked")), caller_must=now,
    )
    book.case(
        "warned/revoked-since-asked", "asked about a later moment it is a no", files_of, ask_manifest(at=MOMENT),
        no("SIGNING_CERT_ORDER"),
    )
    later = ask_chain(at=None, not_before="2024-01-01_00:00:00", not_after="2031-01-01_00:00:00")
    book.case(
        "warned/revoked-in-period", "a revocation after the period's start does not count", list_store(book, dated),
        later, YES, caller_must="ask about one moment: both times the same",
    )
    covered = list_store(book, revocations(SOURCE, TAG, DUMMY, period=PAST))
    book.case(
        "warned/expired-coverage", "without a time a list that has ended proves that nothing is revoked", covered,
        ask_chain(at=None), (LAX, command(1, "crl-not-found")), caller_must=moment,
    )
    begins = list_store(book, revocations(SOURCE, TAG, DUMMY, period=FUTURE))
    book.case(
        "warned/future-coverage", "a list that has not begun counts", begins, ask_chain(), YES,
        caller_must="test the list's own period with Vesk2CrlVerify",
    )
    for name, period, code in (("ended", PAST, "not-before"), ("not-yet", FUTURE, "not-after")):
        alone = {
            "global/acl/s.acl": book.object(entry(SOURCE, TAG), "entry"),
            "calc.crl": book.object(revocations(SOURCE, TAG, DUMMY, period=period), "list"),
        }
        question = {"operation": "verify-list", "file": "calc.crl", "tag": TAG}
        book.case(
            f"warned/list-{name}", "a list's period is tested only when both times are given", alone, question,
            (LAX, command(1, code)), caller_must="give the moment twice",
        )
    vouched = list_store(book, revocations(SOURCE, TAG, DUMMY), sources=[entry(SOURCE, TAG, period=PAST)])
    book.case(
        "warned/ended-entry-vouches", "an entry that has ended still vouches for lists", vouched, ask_chain(), YES,
        caller_must="remove entries that have ended",
    )
    frozen = list_store(book, revocations(SOURCE, TAG, DUMMY), sources=[entry(SOURCE, TAG, propagate=False)])
    book.case(
        "warned/entry-without-propagate-vouches", "so does one that may not be passed on", frozen, ask_chain(), YES,
        caller_must="trust keys with lists only where you mean to",
    )


def _revocation(book: Book) -> None:
    plain = issue(ROOT, SIGNER)

    def revoked(*keys: Any) -> list:
        return revocations(SOURCE, TAG, DUMMY, tuple((key.hash(), "2025-01-01_00:00:00") for key in keys))

    source = "have certificates name a source of revocation: without a current list of it they are refused"
    book.case(
        "warned/list-missing", "with a list that is gone its revoked keys are good again",
        list_store(book, None, plain), ask_chain(), YES, caller_must=source,
    )
    for name, stored in (("cut", book.cut(revoked(SIGNER), "list", 300)), ("unsigned", [*revoked(SIGNER)[:3], revoked(ALICE)[3]])):
        what = list_store(book, stored, plain)
        book.case(
            f"warned/list-{name}", "a list that cannot be read or does not hold is passed over", what, ask_chain(),
            (LAX, command(2, "broken-list")), caller_must=source,
        )
    remove = "remove the entry: a key that it names is not looked up"
    book.case(
        "warned/root-revoked", "the key of the entry is not looked up", list_store(book, revoked(ROOT), plain),
        ask_chain(), YES, caller_must=remove,
    )
    votes = chain(issue(ALICE, SIGNER), issue(BOB, SIGNER))
    members = list_store(
        book, revoked(BOB), plain,
        **{"chain.cert": book.object(votes, "chain"), "global/acl/root.acl": book.object(entry(threshold(2, ALICE, BOB)), "entry")},
    )
    book.case(
        "warned/member-revoked", "a revoked member of k of n still counts", members, ask_chain(), YES,
        caller_must="replace the entry by one without that key",
    )
    carried = manifest(LISTING, SECOND, lists=(revoked(SIGNER),))
    with_list = list_store(book, None, plain, **{"app.manifest": book.object(carried, "manifest"), **tree()})
    book.case(
        "warned/carried-list", "a list that the manifest carries counts", with_list, ask_manifest(),
        no("SIGNING_CERT_ORDER"),
    )
    stripped = list_store(
        book, None, plain, **{"app.manifest": book.object(manifest(LISTING, SECOND), "manifest"), **tree()},
    )
    book.case(
        "warned/carried-list-stripped", "and can be taken out, since the signature does not cover it", stripped,
        ask_manifest(), YES, caller_must="keep current lists in the store",
    )
    before = [
        {"operation": "verify-manifest", "directory": "tree", "file": "app.manifest", "tag": "(remove)", "not_before": MOMENT, "not_after": MOMENT},
    ]
    lets_go = manifest(LISTING, SECOND, lists=(revocations(SOURCE, TAG, DUMMY),))
    replaced = list_store(book, revoked(SIGNER), plain, **{"app.manifest": book.object(lets_go, "manifest"), **tree()})
    must = "SetStoreUpdate(manifest, 0), and import lists by themselves"
    book.case(
        "warned/stored-after-a-no", "a refused manifest stores the lists that it carries", replaced, ask_chain(),
        (LAX, command(1, "cert-revoked")), before=before, caller_must=must,
    )
    kept = [{**before[0], "update_store": 0}]
    book.case(
        "warned/not-stored-when-told", "not so when the store is to be left alone", replaced, ask_chain(),
        no("CERT_REVOKED"), before=kept,
    )
    future = revocations(SOURCE, TAG, DUMMY, ((SIGNER.hash(), "2025-01-01_00:00:00"),), period=FUTURE)
    offered = list_store(
        book, future, plain, **{"in/x.crl": book.object(revocations(SOURCE, TAG, DUMMY, period=PAST), "list")},
    )
    taken = [{"operation": "import-lists", "directory": "in"}]
    book.case(
        "warned/future-list-replaced", "a stored list that has not begun gives way to any that has", offered,
        ask_chain(), (LAX, command(1, "cert-revoked")), before=taken,
        caller_must="compare what two lists revoke before offering one",
    )


def _grants(book: Book) -> None:
    tag = "require a list headed by tag before issuing or installing"

    def one(name: str, why: str, sequence: Any, must: str, *entries: list, answers: tuple = YES, tag: str = "(anything at all)") -> None:
        book.case(f"warned/{name}", why, files(book, sequence, *entries), ask_chain(tag), answers, caller_must=must)

    wide = entry(ROOT, "(*)")
    odd = cert(ROOT, SIGNER, None)
    odd.append([b"tab", [b"install"]])
    one("no-tag", "a certificate without a tag passes everything on", chain(issue(ROOT, SIGNER, None)), tag, wide)
    one("other-keyword", "so does one whose tag has another keyword", chain(triple(ROOT, odd)), tag, wide)
    odd_entry = entry(ROOT, None)
    odd_entry.append([b"other", [b"install"]])
    one(
        "entry-other-keyword", "an entry whose tag has another keyword grants everything",
        chain(issue(ROOT, SIGNER, None)), tag, odd_entry,
    )
    one("empty-tag", "the empty tag is the widest", chain(issue(ROOT, SIGNER, "")), "write out all that you mean", wide)
    one(
        "entry-empty-tag", "in an entry, too", chain(issue(ROOT, SIGNER, None)), "write out all that you mean",
        entry(ROOT, ""),
    )
    one(
        "shorter-is-wider", "a shorter list grants what a longer asks", chain(issue(ROOT, SIGNER, None)),
        "write out all that you mean", entry(ROOT, "(anything)"), tag="(anything at all)",
    )
    zero = entry(ROOT, None)
    zero.append([b"tag", [b"read\0x"]])
    one(
        "zero-byte", "words are compared up to their first 0 byte", chain(issue(ROOT, SIGNER, None)),
        "keep 0 bytes out of tags", zero, tag="(read)",
    )
    owner = chain([*triple(ROOT, cert(ROOT, SIGNER))[:2], [b"owner", b"anybody"]])
    one("owner", "the third item is not signed", owner, "show it as hearsay", tag="(install (app calc))")
    narrow = store(book, manifest(LISTING, pairs(issue(ROOT, SIGNER))), tree=tree())
    book.case(
        "warned/second-propagates", "a key that may not pass its grant on can sign manifests", narrow,
        ask_manifest(), YES, caller_must="grant a tag of its own for what is not to be signed by manifests",
    )


def _readers(book: Book) -> None:
    good = chain(issue(ROOT, SIGNER))
    size = len(canonical(good))
    trailing, end = book.changed(good, "chain", size, 0, b"trailing"), "test that a file ends where its object does"
    book.case(
        "warned/trailing-chain", "what follows a chain is not read", files(book, trailing), ask_chain(),
        (LAX, command(2, "malformed")), caller_must=end,
    )
    one = entry(ROOT)
    for name, tail in (("text", b"trailing"), ("entry", canonical(entry(STRANGER, "(*)")))):
        stored = {**files(book, good), "global/acl/root.acl": book.changed(one, "entry", len(canonical(one)), 0, tail)}
        book.case(
            f"warned/trailing-entry-{name}", "what follows an entry is not read", stored, ask_chain(), YES,
            caller_must=end,
        )
    second = {
        **files(book, good, entry(STRANGER)),
        "global/acl/root.acl": book.changed(entry(STRANGER), "entry", len(canonical(entry(STRANGER))), 0, canonical(one)),
    }
    book.case("warned/trailing-entry-hidden", "nor is it trusted", second, ask_chain(), no("NOT_AUTHORIZED"))
    broken = {"content": "(5:entry"}
    mend = "read each entry by itself, and mend what cannot be read"
    book.case(
        "warned/entry-malformed", "an entry that cannot be read is passed over",
        {**files(book, good), "global/acl/a.acl": broken}, ask_chain(), YES, caller_must=mend,
    )
    book.case(
        "warned/entry-malformed-last", "but for the last: then nothing is trusted",
        {**files(book, good), "global/acl/z.acl": broken}, ask_chain(),
        (library("ACL_ENTRY_NOT_FOUND"), command(2, "no-acl-store")),
    )
    key = revocations(SOURCE, TAG, DUMMY, ((SIGNER.hash(), "2025-01-01_00:00:00"),))
    gone = {**list_store(book, key, issue(ROOT, SIGNER)), "global/acl/a-source.acl": broken}
    del gone["global/acl/source0.acl"]
    book.case(
        "warned/entry-malformed-source", "with it goes the source of revocation that it named", gone, ask_chain(),
        YES, caller_must=mend,
    )
    stored = revocations(SOURCE, TAG, DUMMY, ((SIGNER.hash(), "2025-01-01_00:00:00"),))
    bare = book.changed(stored, "list", 0, len(b"(8:sequence"))
    book.case(
        "warned/list-without-opening", "a list without its opening is read, and counts",
        list_store(book, bare, issue(ROOT, SIGNER)), ask_chain(), no("CERT_REVOKED"),
    )


def make(book: Book) -> None:
    _times(book)
    _revocation(book)
    _grants(book)
    _readers(book)
