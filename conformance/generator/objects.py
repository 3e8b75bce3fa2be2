# SPDX-License-Identifier: Apache-2.0
"""Signed objects, each as its canonical form has it."""

from __future__ import annotations

import hashlib
from typing import Any, Optional

from .keys import Key, SIGNER
from .sexp import Sexp, canonical, tag_of

# Far enough apart that no test runs outside of the good ones.
LONG_AGO, AGO = "2001-01-01_00:00:00", "2002-12-31_23:59:59"
ALWAYS = ("2001-01-01_00:00:00", "3500-12-31_23:59:59")
PAST, FUTURE = (LONG_AGO, AGO), ("3000-01-01_00:00:00", "3500-12-31_23:59:59")
MOMENT = "2030-06-01_00:00:00"
SIGNED_AT = "2020-06-01_12:00:00"
TAG = "(install (app calc))"


def sha256(value: Sexp) -> Sexp:
    return [b"hash", b"sha256", hashlib.sha256(canonical(value)).digest()]


def valid(period: Optional[tuple[Optional[str], Optional[str]]]) -> list[Sexp]:
    if period is None:
        return []
    names = (b"not-before", b"not-after")
    return [[b"valid", *([name, stamp.encode()] for name, stamp in zip(names, period) if stamp is not None)]]


def cert(
    issuer: Any,
    subject: Any,
    tag: Optional[str] = TAG,
    *,
    propagate: bool = False,
    period: Optional[tuple[Optional[str], Optional[str]]] = None,
    comment: Optional[str] = None,
    source: Optional[str] = None,
    version: Optional[bytes] = b"1",
) -> list:
    """A certificate; `source` is the tag of the revocation lists that are to be asked."""
    return [
        b"cert",
        *([[b"version", version]] if version is not None else []),
        [b"issuer", getattr(issuer, "public", issuer)],
        [b"subject", getattr(subject, "public", subject)],
        *([[b"propagate"]] if propagate else []),
        *([tag_of(tag)] if tag is not None else []),
        *valid(period),
        *([[b"comment", comment.encode("latin-1")]] if comment is not None else []),
        *([[b"revocation-list", *tag_of(source)[1:]]] if source is not None else []),
    ]


def signature(key: Any, signed: Sexp, algorithm: str = "rsa-1.5", digest: str = "sha256") -> list:
    value = hashlib.new(digest, canonical(signed)).digest()
    made = key.sign(value, digest, algorithm)
    return [b"signature", [b"hash", digest.encode(), value], key.public, [algorithm.encode(), made]]


def triple(key: Any, what: list, algorithm: str = "rsa-1.5", digest: str = "sha256", extra: Sexp = None) -> list:
    return [what, signature(key, what, algorithm, digest), extra if extra is not None else [b"comment"]]


def chain(*triples: list) -> list:
    """A sequence: the certificate of interest first."""
    return [b"sequence", *(item for one in triples for item in one)]


def issue(issuer: Any, subject: Any, tag: Optional[str] = TAG, **more: Any) -> list:
    return triple(issuer, cert(issuer, subject, tag, **more))


def threshold(k: int, *members: Any, n: Optional[int] = None) -> list:
    """k of these keys. The counts are raw bytes."""
    count = len(members) if n is None else n
    return [b"k-of-n", bytes([k]), bytes([count]), *(getattr(member, "public", member) for member in members)]


def entry(
    subject: Any,
    tag: Optional[str] = "(install)",
    *,
    propagate: bool = True,
    period: Optional[tuple[Optional[str], Optional[str]]] = None,
    version: Optional[bytes] = b"1",
    generation: Optional[bytes] = None,
    comment: Optional[str] = None,
) -> list:
    return [
        b"entry",
        *([[b"version", version]] if version is not None else []),
        [b"subject", getattr(subject, "public", subject)],
        *([[b"propagate"]] if propagate else []),
        *([tag_of(tag)] if tag is not None else []),
        *valid(period),
        *([[b"generation", generation]] if generation is not None else []),
        *([[b"comment", comment.encode("latin-1")]] if comment is not None else []),
    ]


NOTHING = [b"hash", b"sha256", bytes(32)]  # the digest of nothing that there is


def revocations(
    key: Any,
    source: str,
    certs: tuple = (),
    keys: tuple = (),
    period: tuple[Optional[str], Optional[str]] = ALWAYS,
    digest: str = "sha256",
) -> list:
    """A revocation list with the certificate that vouches for it. Items are (hash, date)."""
    items = [[[b"item", value, date.encode()] for value, date in group] for group in (certs, keys)]
    crl = [b"crl", [b"version", b"1"], [b"list1", *items[0]], [b"list2", *items[1]]]
    named = [b"hash", digest.encode(), hashlib.new(digest, canonical(crl)).digest()]
    vouching = cert(key, named, source, period=period)
    return [b"sequence", crl, vouching, signature(key, vouching)]


def file_entry(name: str, contents: bytes = b"", digest: Optional[bytes] = None) -> list:
    return [b"file", name.encode("latin-1"), b"", hashlib.sha256(contents).digest() if digest is None else digest]


def dir_entry(name: str, *entries: list) -> list:
    return [b"dir", name.encode("latin-1"), b"", *entries]


def body(*entries: list, token: bytes = b"\1\2\3\4") -> list:
    return [b"body", [b"random-token", token], *entries]


def manifest(
    listing: Any,
    chain_pairs: list,
    *,
    key: Key = SIGNER,
    at: str = SIGNED_AT,
    lists: tuple = (),
    version: bytes = b"1",
    kind: bytes = b"plain",
    signer_cert: Optional[list] = None,
    tag: Optional[str] = None,
    algorithm: str = "rsa-1.5",
    hash_name: str = "sha256",
) -> list:
    """A manifest; `chain_pairs` are certificates and signatures, one after the other. `signer_cert` stands
    for the certificate of the digest, with its signature."""
    parts: tuple = ([b"version", version, b"kit"], [b"type", kind], [b"time-of-signing", at.encode()])
    signed = b"".join(canonical(one) for one in (*parts, listing))
    content = [b"hash", hash_name.encode(), hashlib.new(hash_name, signed).digest()]
    if signer_cert is None:
        what = cert(key, content, tag)
        signer_cert = [what, signature(key, what, algorithm)]
    block = [b"signature-block", parts[2], *signer_cert, *chain_pairs]
    return [b"manifest", parts[0], parts[1], block, [b"crl", *lists], listing]


def pairs(*triples: list) -> list:
    """The certificates and signatures of triples, as a manifest has them."""
    return [item for one in triples for item in one[:2]]
