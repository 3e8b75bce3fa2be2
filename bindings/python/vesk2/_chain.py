# SPDX-License-Identifier: Apache-2.0
"""Chains of certificates, and the revocation lists that take them back."""

from __future__ import annotations

import ctypes
import os
from ctypes import POINTER, byref
from dataclasses import dataclass
from datetime import datetime
from pathlib import Path
from types import TracebackType
from typing import Any, Optional, Type

from ._answer import Answer, ask
from ._errors import UNDECIDED, check, fail
from ._library import CertInfo, CrlInfo, StrPath, items, lib, moment, seconds, text, words


@dataclass(frozen=True)
class Certificate:
    """What a certificate says. Nothing of it is proved before the chain is verified."""

    tag: Optional[str]
    not_before: Optional[datetime]
    not_after: Optional[datetime]
    owner: Optional[str]
    key: Optional[bytes]
    """The subject's key, a DER SubjectPublicKeyInfo; None for other subjects."""


def _certificate(record: CertInfo) -> Certificate:
    key = ctypes.string_at(record.keyData, record.keyLength) if record.keyData else None
    return Certificate(
        words(record.tag), moment(record.notBefore), moment(record.notAfter), words(record.owner), key
    )


class _Record:
    """A record of the library with its end."""

    _free: Any = None

    def __init__(self) -> None:
        self._record: Any = None

    def close(self) -> None:
        """Releases what the library holds."""
        record, self._record = self._record, None
        if record:
            type(self)._free(record)

    def __exit__(
        self,
        kind: Optional[Type[BaseException]],
        raised: Optional[BaseException],
        trace: Optional[TracebackType],
    ) -> None:
        self.close()

    def __del__(self) -> None:
        if hasattr(self, "_record"):
            self.close()

    def _open(self) -> Any:
        if not self._record:
            raise ValueError("this is closed")
        return self._record


class Chain(_Record):
    """A certificate file: the certificate of interest first, then those that lead up to a trusted key.

        with vesk2.Chain("signer.cert") as chain:
            answer = chain.verify("(install (app calc))", at=datetime.now(timezone.utc))

    Not for two threads at a time.
    """

    _free = lib.Vesk2CertFree

    def __init__(self, path: StrPath) -> None:
        super().__init__()
        record = POINTER(CertInfo)()
        check(lib.Vesk2CertRead(byref(record), text(path)), "cannot read", path)
        if not record:
            raise ValueError(f"{os.fsdecode(path)!r} holds no certificate")
        self._record = record
        self.certificates = tuple(_certificate(one) for one in items(record))

    def __enter__(self) -> Chain:
        return self

    def verify(
        self,
        tag: str,
        *,
        at: Optional[datetime] = None,
        not_before: Optional[datetime] = None,
        not_after: Optional[datetime] = None,
    ) -> Answer:
        """Does the chain grant `tag` to the subject of its first certificate?

        Asked about a moment, or a period that the chain's must meet. One of these must be given: with none,
        a chain that has run out would pass. Raises Error when nothing was decided.
        """
        if at is not None:
            not_before = not_after = at
        if not_before is None and not_after is None:
            raise TypeError("a moment or a period must be asked about")
        question = (self._open(), text(tag), seconds(not_before), seconds(not_after))
        code, why = ask(lambda out: int(lib.Vesk2CertVerifyExplained(*question, byref(out))))
        if code in UNDECIDED:
            fail(code, "cannot verify")
        return Answer(code, why)


def find_certificates(directory: Optional[StrPath] = None) -> tuple[str, ...]:
    """The names of the certificate files in a directory, or in the user's store."""
    first = lib.CertFind(None if directory is None else text(directory))
    try:
        return tuple(os.fsdecode(item.name) for item in items(first))
    finally:
        lib.FreeFileItemList(first)


class RevocationList(_Record):
    """A revocation list with the certificate that vouches for it, from a file or from the store."""

    _free = lib.Vesk2CrlFree

    def __init__(self, path: Optional[StrPath] = None, *, tag: Optional[str] = None) -> None:
        super().__init__()
        if (path is None) == (tag is None):
            raise TypeError("a file or a tag must be given, and not both")
        record = POINTER(CrlInfo)()
        if path is not None:
            check(lib.Vesk2CrlRead(byref(record), text(path), None), "cannot read", path)
        else:
            check(lib.Vesk2CrlFindA(byref(record), text(tag or ""), None), f"cannot find {tag!r}")
        self._record = record
        self.tag = words(record.contents.tag)
        self.not_before = moment(record.contents.notBefore)
        self.not_after = moment(record.contents.notAfter)

    def __enter__(self) -> RevocationList:
        return self

    def verify(
        self,
        tag: Optional[str] = None,
        *,
        not_before: Optional[datetime] = None,
        not_after: Optional[datetime] = None,
    ) -> Answer:
        """Does an ACL entry trust this list's signer with it? With a tag, with exactly that one; with both
        ends of a period, is it current somewhere in it?
        """
        if (not_before is None) != (not_after is None):
            raise TypeError("a period has two ends")
        asked = None if tag is None else text(tag)
        code = lib.Vesk2CrlVerify(self._open(), asked, seconds(not_before), seconds(not_after))
        if code in UNDECIDED:
            fail(code, "cannot verify")
        return Answer(code, None)


def import_lists(directory: StrPath) -> None:
    """Offers the revocation lists of a directory to the store, which keeps the newest that verify."""
    check(lib.Vesk2ImportCrls(text(directory)), "cannot import the lists of", Path(os.fsdecode(directory)))
