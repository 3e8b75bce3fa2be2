# SPDX-License-Identifier: Apache-2.0
"""The fixed keys, and signing with them: textbook arithmetic, so that the same cases come out everywhere.

For tests only: it is slow, and what it computes leaks through the time it takes.
"""

from __future__ import annotations

import base64
import hashlib
from pathlib import Path
from typing import Optional

from .sexp import Sexp, canonical

FOLDER = Path(__file__).resolve().parent.parent / "keys"
_DIGEST_INFO = {
    "sha1": bytes.fromhex("3021300906052b0e03021a05000414"),
    "sha256": bytes.fromhex("3031300d060960864801650304020105000420"),
}


def _integers(name: str) -> list[int]:
    """The numbers of a key in PEM: a DER sequence of integers and nothing else."""
    lines = (FOLDER / f"{name}.pem").read_text().splitlines()
    der = base64.b64decode("".join(line for line in lines if not line.startswith("-")))

    def header(at: int) -> tuple[int, int]:
        length = der[at + 1]
        if length < 0x80:
            return at + 2, length
        count = length & 0x7F
        return at + 2 + count, int.from_bytes(der[at + 2 : at + 2 + count], "big")

    at, _ = header(0)
    numbers = []
    while at < len(der):
        start, length = header(at)
        numbers.append(int.from_bytes(der[start : start + length], "big"))
        at = start + length
    return numbers


def number(value: int) -> bytes:
    return value.to_bytes(max(1, (value.bit_length() + 7) // 8), "big")


class Key:
    """An RSA key: its expression, and signatures by it."""

    def __init__(self, name: str) -> None:
        self.name = name
        _, self.n, self.e, self.d = _integers(name)[:4]
        self.size = (self.n.bit_length() + 7) // 8
        self._made: dict[bytes, bytes] = {}  # the same certificate is signed for many cases
        self.public: Sexp = [b"public-key", [b"rsa", [b"e", number(self.e)], [b"n", number(self.n)]]]

    def digest(self, algorithm: str = "sha256") -> bytes:
        return hashlib.new(algorithm, canonical(self.public, hints=False)).digest()

    def hash(self, algorithm: str = "sha256") -> Sexp:
        return [b"hash", algorithm.encode(), self.digest(algorithm)]

    def _private(self, block: bytes) -> bytes:
        if block not in self._made:
            power = pow(int.from_bytes(block, "big"), self.d, self.n)
            self._made[block] = power.to_bytes(self.size, "big")
        return self._made[block]

    def sign(self, digest: bytes, algorithm: str = "sha256", name: str = "rsa-1.5") -> bytes:
        if name.startswith("rsa-1"):
            tail = _DIGEST_INFO[algorithm] + digest
            return self._private(b"\0\1" + b"\xff" * (self.size - len(tail) - 3) + b"\0" + tail)
        return self._private(self._pss(digest, algorithm))

    def _pss(self, digest: bytes, algorithm: str) -> bytes:
        length = len(digest)
        salt = b"\x5a" * length
        mark = hashlib.new(algorithm, bytes(8) + digest + salt).digest()
        plain = bytes(self.size - 2 * length - 2) + b"\1" + salt
        mask = b""
        while len(mask) < len(plain):
            mask += hashlib.new(algorithm, mark + (len(mask) // length).to_bytes(4, "big")).digest()
        hidden = bytearray(a ^ b for a, b in zip(plain, mask))
        hidden[0] &= 0x7F
        return bytes(hidden) + mark + b"\xbc"


class DsaKey:
    """A DSA key; it signs SHA-1 digests with a nonce that its input fixes."""

    def __init__(self, name: str) -> None:
        self.name = name
        _, self.p, self.q, self.g, self.y, self.x = _integers(name)[:6]
        pairs = ((b"p", self.p), (b"g", self.g), (b"q", self.q), (b"y", self.y))
        self.public: Sexp = [b"public-key", [b"dsa", *([letter, number(value)] for letter, value in pairs)]]

    def digest(self, algorithm: str = "sha256") -> bytes:
        return hashlib.new(algorithm, canonical(self.public, hints=False)).digest()

    def sign(self, digest: bytes, algorithm: str = "sha1", name: Optional[str] = None) -> bytes:
        del algorithm, name
        nonce = int.from_bytes(hashlib.sha512(number(self.x) + digest).digest(), "big") % (self.q - 1) + 1
        r = pow(self.g, nonce, self.p) % self.q
        s = pow(nonce, -1, self.q) * (int.from_bytes(digest, "big") + self.x * r) % self.q
        half = (self.q.bit_length() + 7) // 8
        return r.to_bytes(half, "big") + s.to_bytes(half, "big")


NAMES = ("root", "signer", "other", "stranger", "alice", "bob", "carol", "source")
KEYS = {name: Key(name) for name in NAMES}
ROOT, SIGNER, OTHER, STRANGER, ALICE, BOB, CAROL, SOURCE = (KEYS[name] for name in NAMES)
DSA = DsaKey("dsa")
