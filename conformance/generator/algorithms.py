# SPDX-License-Identifier: Apache-2.0
"""Names of algorithms, of hashes and of keys: which are taken for which, and what a careful caller does about it."""

from __future__ import annotations

from .book import YES, Book, ask_chain, no
from .chains import files
from .keys import DSA, ROOT, SIGNER, STRANGER
from .objects import cert, chain, entry, issue, signature, triple
from .thresholds import hinted


def make(book: Book) -> None:
    names = "compare the names of algorithms in full, if you must know"
    good, no_rsa = cert(ROOT, SIGNER), no("SIGNATURE_ID")
    for written, kind in (("", "rsa-pss"), ("r", "rsa-pss"), ("rsa", "rsa-pss"), ("rsa-", "rsa-pss"), ("rsa-p", "rsa-pss"), ("rsa-1", "rsa-1.5")):
        signed = signature(ROOT, good, kind)
        signed[3] = [written.encode(), signed[3][1]]
        sequence = chain([good, signed, [b"comment"]])
        book.case(
            f"warned/algorithm-{written or 'empty'}", "a name that only begins so is taken for it",
            files(book, sequence), ask_chain(), YES, caller_must=names,
        )
        wrong = signature(ROOT, good, "rsa-1.5" if kind == "rsa-pss" else "rsa-pss")
        wrong[3] = [written.encode(), wrong[3][1]]
        book.case(
            f"warned/algorithm-{written or 'empty'}-other", "and for no other",
            files(book, chain([good, wrong, [b"comment"]])), ask_chain(), no("SIGNATURE"),
        )
    for written in ("rsa-2", "rsa-pss2", "s", "ecdsa"):
        signed = signature(ROOT, good)
        signed[3] = [written.encode(), signed[3][1]]
        book.case(
            f"warned/algorithm-{written}", "a name that nobody knows",
            files(book, chain([good, signed, [b"comment"]])), ask_chain(), no_rsa,
        )
    by_dsa = cert(DSA, SIGNER)
    trusted, new = entry(DSA), "trust no DSA key for anything new"
    for name, written, hash_name, code in (("full", "dsa-sha1", "sha1", "OK"), ("prefix", "d", "sha1", "OK"), ("as-rmd160", "dsa-sha1", "rmd160", "OK"), ("rsa", "rsa-pss", "sha1", "SIGNATURE_ID"), ("sha256", "dsa-sha256", "sha1", "SIGNATURE_ID")):
        signed = signature(DSA, by_dsa, "dsa-sha1", "sha1")
        signed[1] = [b"hash", hash_name.encode(), signed[1][2]]
        signed[3] = [written.encode(), signed[3][1]]
        asked = files(book, chain([by_dsa, signed, [b"comment"]]), trusted)
        why = "a DSA key hashes by SHA-1, whatever the signature names" if code == "OK" else "not its algorithm"
        book.case(
            f"warned/dsa-{name}", why, asked, ask_chain(), YES if code == "OK" else no(code),
            caller_must=new if code == "OK" else None,
        )
    short = [b"hash", b"sha256", ROOT.digest("sha1") + bytes(12)]
    sha1 = "name keys by key or by SHA-256"
    for name, subject in (("sha1", ROOT.hash("sha1")), ("sha1-padded", short)):
        book.case(
            f"warned/name-{name}", "a key may be named by its SHA-1",
            files(book, chain(issue(ROOT, SIGNER)), entry(subject)), ask_chain(), YES, caller_must=sha1,
        )
    for name, subject in (("sha1-cut", [b"hash", b"sha256", ROOT.digest("sha1") + b"\1" + bytes(11)]), ("sha1-other", STRANGER.hash("sha1"))):
        book.case(
            f"warned/name-{name}", "and by nothing else", files(book, chain(issue(ROOT, SIGNER)), entry(subject)),
            ask_chain(), no("NOT_AUTHORIZED"),
        )
    old = chain(triple(ROOT, good, "rsa-1.5", "sha1"))
    book.case(
        "warned/signed-over-sha1", "signatures over SHA-1 hold", files(book, old), ask_chain(), YES,
        caller_must="look at the signature's hash where SHA-1 must not count",
    )
    book.case(
        "warned/hints", "hints count in no comparison of keys",
        files(book, chain(issue(ROOT, SIGNER)), entry(hinted(ROOT))), ask_chain(), YES,
        caller_must="compare keys by fingerprint, not by the bytes of files",
    )
    rehinted = chain([cert(hinted(ROOT), SIGNER), signature(ROOT, cert(ROOT, SIGNER)), [b"comment"]])
    book.case(
        "warned/hints-signed", "but signatures cover them", files(book, rehinted), ask_chain(), no("HASH_MISMATCH"),
    )
