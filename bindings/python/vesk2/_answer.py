# SPDX-License-Identifier: Apache-2.0
"""What every verification answers, and why."""

from __future__ import annotations

from ctypes import POINTER
from dataclasses import dataclass
from datetime import datetime
from typing import Any, Callable, Optional

from ._errors import message_of, reason_of
from ._library import ExplanationRecord, items, lib, moment, words


@dataclass(frozen=True)
class Reason:
    """One reason why an answer is no."""

    kind: str
    """What stands in the way, as a word that stays the same: `signature`, `order`, `content`, `unreadable`,
    `revoked`, `key-revoked`, `undetermined`, `period`, `tag`, `link`, `propagate`, `no-entry`, `threshold` or
    `combination`."""
    text: str
    """The same for people; safe for a terminal, like all texts of an explanation."""
    certificate: Optional[int]
    """The certificate's number in the chain, counted from 1."""
    other_certificate: Optional[int]
    """The number of the one whose period it does not meet."""
    entry: Optional[str]
    """The file of the access-control entry."""
    source: Optional[str]
    """The tag of the revocation lists that were asked."""


@dataclass(frozen=True)
class Explanation:
    """Why an answer is what it is, and what was found on the way to it."""

    complete: bool
    """False when looking for reasons was stopped, for what it cost."""
    reasons: tuple[Reason, ...]
    """Of a no about authority; in a chain, the first place where it was lost first."""
    signer: Optional[str]
    """The fingerprint of the key that signed a manifest; None unless its signature holds."""
    signed_at: Optional[datetime]
    """When, by the signer's word."""
    listed: int
    """How many files the manifest lists."""
    entry: Optional[str]
    """The access-control entry that a yes rests on; None when several grant together."""
    certificates: tuple[int, ...]
    """The numbers of the certificates that are needed, from the root on."""
    holds_until: Optional[datetime]
    """Asked about a later moment, the answer would be no."""
    ended_by: Optional[str]
    """What ends then: `certificate`, `entry` or `list`."""
    end_certificate: Optional[int]
    """That certificate, or the one that the list speaks for."""


@dataclass(frozen=True)
class Answer:
    """What a verification answered. True in a condition when the answer is yes."""

    code: int
    """0 for yes, else the library's number."""
    explanation: Optional[Explanation]
    """Why; None when there was no memory to say, or nothing to explain."""

    @property
    def ok(self) -> bool:
        return self.code == 0

    @property
    def reason(self) -> str:
        """The answer as a word that stays the same: `ok`, `hash-mismatch`, `not-authorized`, ..."""
        return reason_of(self.code)

    @property
    def message(self) -> str:
        """The answer in words."""
        return message_of(self.code)

    @property
    def reasons(self) -> tuple[Reason, ...]:
        """What the explanation says of a no about authority."""
        return self.explanation.reasons if self.explanation is not None else ()

    def __bool__(self) -> bool:
        return self.ok


def _reason(record: Any) -> Reason:
    return Reason(
        words(record.kind) or "",
        words(record.text) or "",
        record.certificate or None,
        record.otherCertificate or None,
        words(record.entry),
        words(record.source),
    )


def _explanation(record: Any) -> Explanation:
    return Explanation(
        bool(record.isComplete),
        tuple(_reason(one) for one in items(record.reasons)),
        words(record.signer),
        moment(record.signedAt),
        record.listed,
        words(record.entry),
        tuple(record.certificates[: record.certificateCount]) if record.certificateCount else (),
        moment(record.holdsUntil),
        words(record.endedBy),
        record.endCertificate or None,
    )


def ask(question: Callable[[Any], int]) -> tuple[int, Optional[Explanation]]:
    """Calls a verification with the place for its explanation."""
    record = POINTER(ExplanationRecord)()
    try:
        code = question(record)
        return code, _explanation(record.contents) if record else None
    finally:
        lib.Vesk2FreeExplanation(record)
