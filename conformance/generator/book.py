# SPDX-License-Identifier: Apache-2.0
"""Where the cases are collected: files that are objects are kept once, under a name, and cases name them."""

from __future__ import annotations

import base64
import hashlib
import json
from pathlib import Path
from typing import Any, Optional

from .keys import DSA, KEYS
from .objects import MOMENT
from .sexp import Sexp, canonical, readable

# The codes that the cases expect.
CODES = {
    "OK": 0, "FILE_NOT_FOUND": 5, "FILE_OPEN": 7, "PARSE_FILE": 9, "PRINCIPAL": 11, "INVALID_HASH": 12,
    "UNKNOWN_HASH_ID": 13, "MAX_BYTE_STRING": 14, "SIGNATURE_ID": 15, "HASH_ID": 16, "NOT_IMPLEMENTED": 18,
    "OPEN_MANIFEST_FILE": 19, "SIGNATURE": 21, "HASH_MISMATCH": 22, "UNEXPECTED_CHAR": 28,
    "INVALID_S_EXPRESSION": 29, "NOT_AUTHORIZED": 31, "HASH_MATCH": 32, "RANDOM_TOKEN": 33, "TIME_STAMP": 34,
    "AUTH_TAG_MISSING": 35, "SIGNING_CERT_ORDER": 36, "NOT_BEFORE": 51, "NOT_AFTER": 52,
    "ACL_ENTRY_NOT_FOUND": 54, "MANIFEST_VERSION": 56, "MANIFEST_TYPE": 57, "INVALID_SEQUENCE": 64,
    "CERT_REVOKED": 66, "PACKAGE_NOT_GRANTED": 67, "NOT_OBJECT_CERT": 71, "CRL_NOT_FOUND": 73,
    "EXTRA_FILES": 74, "FIND_DIR": 26, "KEY_REVOKED": 68,
    "SPKI_ERR_BAD_LTH_FORMAT": -135, "SPKI_ERR_UNKNOWN_HASH_ALG": -146, "SPKI_ERR_HASH_LTH_DIFFER": -149,
    "SPKI_ERR_KOFN_SYNTAX": -157, "SPKI_ERR_KEY_OR_HASH_EXPECTED": -165,
}  # fmt: skip


def library(code: str, **more: Any) -> dict:
    return {"code": CODES[code], **more}


def command(exit_status: int, reason: str, **more: Any) -> dict:
    return {"exit": exit_status, "reason": reason, **more}


def word(code: str) -> str:
    """The reason word of a code."""
    return "ok" if code == "OK" else code.lower().replace("_", "-")


YES = (library("OK"), command(0, "ok"))


def no(code: str) -> tuple[dict, dict]:
    """A refusal in which the command says what the library says."""
    return library(code), command(1, word(code))


def trouble(code: str, reason: str = "malformed") -> tuple[dict, dict]:
    """A file that cannot be read: a code of the library, trouble for the command."""
    return library(code), command(2, reason)


# Objects that others are made of: kept once, and named by those.
_SHARED = (b"public-key", b"cert", b"signature", b"crl")


class Book:
    def __init__(self) -> None:
        self.objects: dict[str, dict] = {}
        self.families: dict[str, list[dict]] = {}
        self._names: set[str] = set()
        self._keys = {canonical(key.public): name for name, key in {**KEYS, "dsa": DSA}.items()}

    def object(self, what: Sexp, kind: str) -> str:
        """Keeps an object; the name that files refer to it by."""
        data = canonical(what)
        name = self._keys.get(data) or f"{kind}-{hashlib.sha256(data).hexdigest()[:10]}"
        if name not in self.objects:
            names: dict[int, str] = {}
            self.objects[name] = {}
            pieces = self._pieces(what, names)
            encoded = [one if isinstance(one, str) else [base64.b64encode(one).decode()] for one in pieces]
            self.objects[name] = {"text": readable(what, names), "bytes": encoded}
        return name

    def _pieces(self, what: Sexp, names: dict[int, str], outermost: bool = True) -> list:
        """Bytes, and the names of objects between them."""
        if isinstance(what, list) and what and not outermost and what[0] in _SHARED:
            names[id(what)] = self.object(what, what[0].decode())
            return [names[id(what)]]
        if not isinstance(what, list):
            return [canonical(what)]
        found: list = [b"("]
        for piece in (piece for item in what for piece in self._pieces(item, names, False)):
            if isinstance(piece, bytes) and isinstance(found[-1], bytes):
                found[-1] += piece
            else:
                found.append(piece)
        if isinstance(found[-1], bytes):
            found[-1] += b")"
        else:
            found.append(b")")
        return found

    def changed(self, what: Sexp, kind: str, at: int, drop: int, put: bytes = b"") -> dict:
        """A file that is an object with one change: at a place some bytes are dropped and others put."""
        assert 0 <= at <= at + drop <= len(canonical(what)), (at, drop)
        return {"from": self.object(what, kind), "at": at, "drop": drop, "put": put.decode("latin-1")}

    def cut(self, what: Sexp, kind: str, length: int) -> dict:
        """A file that is the beginning of an object."""
        return self.changed(what, kind, length, len(canonical(what)) - length)

    def case(
        self,
        name: str,
        why: str,
        files: dict[str, Any],
        question: dict[str, Any],
        answers: tuple[Optional[dict], Optional[dict]],
        *,
        caller_must: Optional[str] = None,
        before: Optional[list[dict]] = None,
    ) -> None:
        """One case. `answers` are the library's and the command's; None is one that nobody can ask."""
        assert name not in self._names, name
        self._names.add(name)
        case: dict[str, Any] = {"name": name, "why": why, "files": files}
        if before:
            case["before"] = before
        case["question"] = question
        for column, answer in zip(("library", "command"), answers):
            if answer is not None:
                case[column] = answer
        if caller_must is not None:
            case["caller_must"] = caller_must
        self.families.setdefault(name.split("/")[0], []).append(case)

    def write(self) -> dict[str, str]:
        """The files of the kit, by name: one line a case, one line an object."""
        out = {"objects.json": _lines({name: self.objects[name] for name in sorted(self.objects)})}
        for family, cases in self.families.items():
            out[f"{family}.json"] = "[\n" + ",\n".join(json.dumps(case) for case in cases) + "\n]\n"
        return out

    def save(self, folder: Path) -> None:
        for old in folder.glob("*.json"):
            old.unlink()
        for name, text in self.write().items():
            (folder / name).write_text(text)


def _lines(values: dict) -> str:
    return "{\n" + ",\n".join(f"{json.dumps(key)}: {json.dumps(value)}" for key, value in values.items()) + "\n}\n"


def ask_chain(tag: str = "(install (app calc))", at: Optional[str] = MOMENT, **more: Any) -> dict:
    question = {"operation": "verify-chain", "file": "chain.cert", "tag": tag}
    if at is not None:
        question.update(not_before=at, not_after=at)
    return {**question, **more}


def ask_manifest(tag: str = "(install (app calc))", at: Optional[str] = None, **more: Any) -> dict:
    question = {"operation": "verify-manifest", "directory": "tree", "file": "app.manifest", "tag": tag}
    if at is not None:
        question.update(not_before=at, not_after=at)
    return {**question, **more}
