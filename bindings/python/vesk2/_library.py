# SPDX-License-Identifier: Apache-2.0
"""vesk2.h as ctypes sees it: records, functions, the conversions between both worlds."""

from __future__ import annotations

import ctypes
import os
from ctypes import POINTER, c_char_p, c_int, c_int32, c_long, c_uint32, c_uint64, c_void_p
from datetime import datetime, timezone
from pathlib import Path
from typing import Any, Iterable, Iterator, Optional, Union

StrPath = Union[str, bytes, "os.PathLike[str]", "os.PathLike[bytes]"]


class FileItem(ctypes.Structure):
    pass


FileItem._fields_ = [
    ("name", c_char_p),
    ("name2", c_char_p),
    ("nameA", c_char_p),
    ("name2A", c_char_p),
    ("next", POINTER(FileItem)),
    ("size", c_uint32),
    ("isDirectory", c_int32),
]

FileStart = ctypes.CFUNCTYPE(c_int, c_void_p, c_char_p, c_uint64)
FileBytes = ctypes.CFUNCTYPE(c_int, c_void_p, c_uint64)
FileEnd = ctypes.CFUNCTYPE(None, c_void_p, c_char_p, c_int)


class FileCallbacks(ctypes.Structure):
    _fields_ = [
        ("size", c_uint32),
        ("user", c_void_p),
        ("fileStart", FileStart),
        ("fileBytes", FileBytes),
        ("fileEnd", FileEnd),
    ]


class CertInfo(ctypes.Structure):
    pass


CertInfo._fields_ = [
    ("size", c_uint32),
    ("sequence", c_void_p),
    ("notBefore", c_long),
    ("notAfter", c_long),
    ("tag", c_char_p),
    ("owner", c_char_p),
    ("keyData", c_void_p),
    ("keyLength", c_uint32),
    ("hashText", c_void_p),
    ("hashTextLength", c_uint32),
    ("next", POINTER(CertInfo)),
]


class CrlInfo(ctypes.Structure):
    _fields_ = [
        ("size", c_uint32),
        ("crl", c_void_p),
        ("notBefore", c_long),
        ("notAfter", c_long),
        ("tag", c_char_p),
    ]


class ReasonRecord(ctypes.Structure):
    pass


ReasonRecord._fields_ = [
    ("kind", c_char_p),
    ("text", c_char_p),
    ("certificate", c_uint32),
    ("otherCertificate", c_uint32),
    ("entry", c_char_p),
    ("source", c_char_p),
    ("next", POINTER(ReasonRecord)),
]


class ExplanationRecord(ctypes.Structure):
    _fields_ = [
        ("size", c_uint32),
        ("code", c_int32),
        ("isComplete", c_int32),
        ("reasons", POINTER(ReasonRecord)),
        ("signer", c_char_p),
        ("signedAt", c_long),
        ("listed", c_uint64),
        ("valid", c_uint64),
        ("changed", c_uint64),
        ("missing", c_uint64),
        ("extra", c_uint64),
        ("entry", c_char_p),
        ("certificates", POINTER(c_uint32)),
        ("certificateCount", c_uint32),
        ("holdsUntil", c_long),
        ("endedBy", c_char_p),
        ("endCertificate", c_uint32),
    ]


_FILES = POINTER(FileItem)
_EXPLANATION = POINTER(ExplanationRecord)
_FUNCTIONS: list[tuple[str, Any, list[Any]]] = [
    ("Vesk2HomeDirectory", None, [c_char_p]),
    ("Vesk2GlobalDirectory", None, [c_char_p]),
    ("Vesk2VersionNumber", c_int, []),
    ("Vesk2VersionExtra", c_char_p, []),
    ("Vesk2ErrorName", c_char_p, [c_int]),
    ("Vesk2ErrorWords", c_char_p, [c_int]),
    ("FreeFileItemList", c_uint32, [_FILES]),
    ("CreateManifestContext", c_int, [POINTER(c_void_p), c_char_p, c_char_p, c_char_p]),
    ("DeleteManifestContext", None, [c_void_p]),
    ("FailOnExtraEntries", None, [c_void_p]),
    ("SetExtraAclDirectory", None, [c_void_p, c_char_p]),
    ("SetIgnoredEntries", None, [c_void_p, _FILES]),
    ("SetFileCallbacks", c_int, [c_void_p, POINTER(FileCallbacks)]),
    ("SetStoreUpdate", None, [c_void_p, c_int]),
    ("VerifyManifestExplained", c_int, [c_void_p, c_long, c_long, POINTER(_EXPLANATION)]),
    ("Vesk2FreeExplanation", None, [_EXPLANATION]),
    ("CompareManifest", c_int, [c_void_p, c_char_p]),
    ("GetValidEntries", _FILES, [c_void_p]),
    ("GetInvalidEntries", _FILES, [c_void_p]),
    ("GetMissingEntries", _FILES, [c_void_p]),
    ("GetExtraEntries", _FILES, [c_void_p]),
    ("Vesk2CertRead", c_int, [POINTER(POINTER(CertInfo)), c_char_p]),
    ("Vesk2CertFree", c_int, [POINTER(CertInfo)]),
    ("Vesk2CertVerifyExplained", c_int, [POINTER(CertInfo), c_char_p, c_long, c_long, POINTER(_EXPLANATION)]),
    ("CertFind", _FILES, [c_char_p]),
    ("Vesk2ImportCrls", c_int, [c_char_p]),
    ("Vesk2CrlRead", c_int, [POINTER(POINTER(CrlInfo)), c_char_p, c_void_p]),
    ("Vesk2CrlFindA", c_int, [POINTER(POINTER(CrlInfo)), c_char_p, c_void_p]),
    ("Vesk2CrlFree", c_int, [POINTER(CrlInfo)]),
    ("Vesk2CrlVerify", c_int, [POINTER(CrlInfo), c_char_p, c_long, c_long]),
]


def _load() -> ctypes.CDLL:
    library = ctypes.CDLL("libvesk2.so.1")
    for name, result, arguments in _FUNCTIONS:
        function = getattr(library, name)
        function.restype = result
        function.argtypes = arguments
    return library


lib = _load()


def text(value: StrPath) -> bytes:
    """A path or a text as the library takes it. It would stop at a zero byte, so none may be there."""
    encoded = os.fsencode(value)
    if b"\0" in encoded:
        raise ValueError("embedded null byte")
    return encoded


def words(value: Optional[bytes]) -> Optional[str]:
    """A text from an object. Whoever wrote it chose its bytes."""
    return None if value is None else value.decode("utf-8", "backslashreplace")


def seconds(when: Optional[datetime]) -> int:
    """A moment as the library takes it: None, and only that, is 0."""
    if when is None:
        return 0
    if when.tzinfo is None:
        raise ValueError("a time without a zone names no moment")
    whole = int(when.timestamp() // 1)
    if whole <= 0:
        raise ValueError("a time before 1970-01-01 00:00:01 UTC")
    return whole


def moment(when: int) -> Optional[datetime]:
    """The other way round."""
    return datetime.fromtimestamp(when, timezone.utc) if when != 0 else None


def items(first: Any) -> Iterator[Any]:
    """The records of a chain."""
    while first:
        yield first.contents
        first = first.contents.next


def paths(first: Any) -> tuple[Path, ...]:
    """The names of a chain of records that the library keeps."""
    return tuple(Path(os.fsdecode(item.name)) for item in items(first))


def chain_of(names: Iterable[StrPath]) -> Any:
    """A chain of records with these names, or None; kept alive by the first."""
    first = None
    for name in reversed(list(names)):
        item = FileItem(name=text(name))
        if first is not None:
            item.next = ctypes.pointer(first)
        first = item
    return first


def _use_standard_stores() -> None:
    """The stores that the command uses, so that a program and an operator speak of the same ones."""
    data = os.environ.get("XDG_DATA_HOME", "")
    if not data.startswith("/"):  # a relative one must be ignored
        data = os.path.join(os.environ["HOME"], ".local/share") if os.environ.get("HOME") else ""
    home = os.environ.get("VESK2_HOME") or (data and os.path.join(data, "vesk2"))
    set_stores(os.environ.get("VESK2_GLOBAL") or "/etc/vesk2", home or None)


def set_stores(machine: Optional[StrPath], user: Optional[StrPath] = None) -> None:
    """Uses these roots of the machine's and the user's store, for the whole process.

    Without a call, they are what the command `vesk2` would use: VESK2_GLOBAL or /etc/vesk2, and
    VESK2_HOME or vesk2 below the user's data directory. None is a store with nothing in it. Call it before
    other threads use the library.
    """
    for root, function in ((machine, lib.Vesk2GlobalDirectory), (user, lib.Vesk2HomeDirectory)):
        encoded = None if root is None else text(root)
        if encoded is not None and len(encoded) >= 4095:
            raise ValueError("a store root is too long")  # the library would cut it
        function(encoded)


_use_standard_stores()
