# SPDX-License-Identifier: Apache-2.0
"""Manifests: is a directory exactly what its signed manifest says, by a signer who may say so?"""

from __future__ import annotations

import ctypes
import os
from ctypes import byref, c_void_p
from dataclasses import dataclass, replace
from datetime import datetime
from pathlib import Path
from types import TracebackType
from typing import Any, Callable, Iterable, Optional, Type

from . import _library
from ._answer import Answer, Explanation, ask
from ._errors import CANNOT_OPEN, UNDECIDED, check, fail
from ._library import StrPath, lib, paths, seconds, text

_EXTRA_FILES = 74


@dataclass(frozen=True)
class Result(Answer):
    """What was answered about a directory. True in a condition when the answer is yes."""

    valid: tuple[Path, ...]
    """The entries that are as signed."""
    changed: tuple[Path, ...]
    """The entries that differ; as in the other lists, without the directories that are there for an entry's sake."""
    missing: tuple[Path, ...]
    unlisted: tuple[Path, ...]
    """What is there and was not signed."""

    @property
    def signer(self) -> Optional[str]:
        """The fingerprint of the key that signed; None unless its signature holds."""
        return self.explanation.signer if self.explanation is not None else None

    @property
    def signed_at(self) -> Optional[datetime]:
        """When, by the signer's word; None when the manifest was not read so far."""
        return self.explanation.signed_at if self.explanation is not None else None


class Manifest:
    """A directory, its manifest file, and the tag that the signer must have been granted.

        with vesk2.Manifest("app", "app.manifest", "(install (app calc))") as manifest:
            manifest.refuse_unlisted()
            result = manifest.verify()

    The library's answers as they are: `verify` of this module asks more. Not for two threads at a time.
    """

    def __init__(self, directory: StrPath, manifest: StrPath, tag: str) -> None:
        self._handle = c_void_p()
        self._callbacks: Optional[_library.FileCallbacks] = None
        self._raised: Optional[BaseException] = None
        self._file = manifest
        code = lib.CreateManifestContext(byref(self._handle), text(directory), text(manifest), text(tag))
        check(code, f"cannot ask about {tag!r}")

    def __enter__(self) -> Manifest:
        return self

    def __exit__(
        self,
        kind: Optional[Type[BaseException]],
        raised: Optional[BaseException],
        trace: Optional[TracebackType],
    ) -> None:
        self.close()

    def __del__(self) -> None:
        if hasattr(self, "_handle"):  # the arguments were good
            self.close()

    def close(self) -> None:
        """Releases what the library holds. Results that were handed out stay."""
        handle, self._handle = self._handle, c_void_p()
        if handle:
            lib.DeleteManifestContext(handle)

    def _open(self) -> c_void_p:
        if not self._handle:
            raise ValueError("the manifest is closed")
        return self._handle

    def refuse_unlisted(self) -> None:
        """Answers `extra-files` when entries below the top directory were not signed."""
        lib.FailOnExtraEntries(self._open())

    def trust_also(self, acl_directory: StrPath) -> None:
        """Trusts the ACL entries of a directory beside the store's: protect it as you protect the store."""
        lib.SetExtraAclDirectory(self._open(), text(acl_directory))

    def ignore(self, names: Iterable[StrPath]) -> None:
        """Leaves these entries out, named relative to the directory. Replaces what was ignored before."""
        first = _library.chain_of(names)
        lib.SetIgnoredEntries(self._open(), None if first is None else byref(first))

    def keep_store(self) -> None:
        """Does not offer the manifest's revocation lists to the store: nothing is written."""
        lib.SetStoreUpdate(self._open(), 0)

    def listen(
        self,
        start: Optional[Callable[[Path, int], object]] = None,
        read: Optional[Callable[[int], object]] = None,
        end: Optional[Callable[[Path, int], object]] = None,
    ) -> None:
        """Hears about the files that a verification hashes: a path and its size, bytes read, a path and its
        code. What one of them raises is raised by the verification, which `start` and `read` end by it.
        """

        def heard(function: Optional[Callable[..., object]], *arguments: Any) -> int:
            if function is None:
                return 0
            try:
                function(*arguments)
            except BaseException as raised:  # it cannot cross the library
                self._raised = self._raised or raised
                return 1
            return 0

        def named(name: bytes) -> Path:
            return Path(os.fsdecode(name))

        callbacks = _library.FileCallbacks(
            size=ctypes.sizeof(_library.FileCallbacks),
            user=None,
            fileStart=_library.FileStart(lambda user, name, size: heard(start, named(name), size)),
            fileBytes=_library.FileBytes(lambda user, count: heard(read, count)),
            fileEnd=_library.FileEnd(lambda user, name, code: heard(end, named(name), code)),
        )
        check(lib.SetFileCallbacks(self._open(), byref(callbacks)), "cannot listen")
        self._callbacks = callbacks  # for as long as the library may call

    def verify(self, not_before: Optional[datetime] = None, not_after: Optional[datetime] = None) -> Result:
        """Verifies, asking about authority within a period, or without one at the time of signing.

        Raises Error when nothing was decided, FileNotFoundError or another OSError when the manifest
        cannot be opened, and what a listener raised.
        """
        handle, period = self._open(), (seconds(not_before), seconds(not_after))
        code, why = ask(lambda out: int(lib.VerifyManifestExplained(handle, *period, byref(out))))
        return self._answer(code, why, "cannot verify", self._file)

    def compare(self, other: StrPath) -> Result:
        """Compares with what another manifest lists, by names relative to both. Signatures are proved, authority is
        not.
        """
        code = lib.CompareManifest(self._open(), text(other))
        return self._answer(code, None, "cannot compare with", other)

    def _answer(self, code: int, why: Optional[Explanation], doing: str, file: StrPath) -> Result:
        raised, self._raised = self._raised, None
        if raised is not None:
            raise raised
        if code in UNDECIDED:
            fail(code, doing, file)
        if code == CANNOT_OPEN:
            for path in (self._file, file):  # says why; a pipe would keep a blocking open
                os.close(os.open(path, os.O_RDONLY | os.O_NONBLOCK | os.O_NOCTTY | os.O_CLOEXEC))
            fail(code, doing, file)
        handle = self._open()
        lists = (lib.GetInvalidEntries(handle), lib.GetMissingEntries(handle), lib.GetExtraEntries(handle))
        found = [paths(first) for first in lists]
        parents = {parent for entries in found for path in entries for parent in path.parents}
        # A set: a directory that cannot be read is recorded twice.
        changed, missing, unlisted = (tuple(sorted(set(entries) - parents)) for entries in found)
        valid = paths(lib.GetValidEntries(handle))
        return Result(code, why, valid, changed, missing, unlisted)


def _unlisted_at_top(
    directory: StrPath, manifest: StrPath, ignored: Iterable[StrPath], result: Result
) -> list[Path]:
    """The entries of the top directory that nobody signed: the library looks below it only."""
    top, own = Path(os.fsdecode(directory)), Path(os.fsdecode(manifest))
    known = {os.path.normpath(os.fsdecode(name)) for name in ignored}
    for entries in (result.valid, result.changed, result.missing, result.unlisted):
        known.update(path.relative_to(top).parts[0] for path in entries)
    if os.path.realpath(own.parent) == os.path.realpath(top):
        known.add(own.name)
    return [top / name for name in sorted(os.listdir(top)) if name not in known]


def verify(
    directory: StrPath,
    manifest: StrPath,
    *,
    tag: str,
    at: Optional[datetime] = None,
    ignore: Iterable[StrPath] = (),
    allow_unlisted: bool = False,
    trust_also: Optional[StrPath] = None,
    update_store: bool = True,
) -> Result:
    """Is `directory` exactly what `manifest` says, and was its signer granted `tag`?

        if not vesk2.verify("app", "app.manifest", tag="(install (app calc))"):
            raise SystemExit("refused")

    The signer's authority is asked about for the moment `at`, or without one for the time of signing, which
    is the signer's own word: give `datetime.now(timezone.utc)` where a key that is lost must not date back.
    Unlisted entries are refused in the top directory too, where the library does not look for them; the
    manifest itself may lie there. Links are followed. The answer speaks of the moment of reading.

    Raises what `Manifest.verify` raises.
    """
    ignored = list(ignore)
    with Manifest(directory, manifest, tag) as asked:
        if not allow_unlisted:
            asked.refuse_unlisted()
        if trust_also is not None:
            asked.trust_also(trust_also)
        if not update_store:
            asked.keep_store()
        asked.ignore(ignored)
        result = asked.verify(at, at)
    if allow_unlisted or result.code not in (0, _EXTRA_FILES):
        return result
    unlisted = _unlisted_at_top(directory, manifest, ignored, result)
    if not unlisted:
        return result
    return replace(result, code=_EXTRA_FILES, unlisted=tuple(sorted([*unlisted, *result.unlisted])))
