#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Answers the questions of the kit through the Python module."""

from __future__ import annotations

import json
import os
import sys
from datetime import datetime, timezone
from typing import Callable, Optional

import vesk2


def moment(seconds: int) -> Optional[datetime]:
    return datetime.fromtimestamp(seconds, timezone.utc) if seconds else None


def read_chain(asked: dict) -> dict:
    try:
        with vesk2.Chain(asked["file"]) as chain:
            return {"code": 0, "certificates": len(chain.certificates)}
    except ValueError:  # a chain without certificates is none to Python
        return {"code": 0, "certificates": 0}


def verify_chain(asked: dict) -> dict:
    start, end = moment(asked["not_before"]), moment(asked["not_after"])
    if (start is None and end is None) or "at_text" in asked:
        return {"unsupported": True}
    with vesk2.Chain(asked["file"]) as chain:
        return {"code": chain.verify(asked["tag"], not_before=start, not_after=end).code}


def read_list(asked: dict) -> dict:
    with vesk2.RevocationList(asked["file"]):
        return {"code": 0}


def verify_list(asked: dict) -> dict:
    start, end = moment(asked["not_before"]), moment(asked["not_after"])
    if (start is None) != (end is None):
        return {"unsupported": True}
    with vesk2.RevocationList(asked["file"]) as found:
        return {"code": found.verify(asked.get("tag"), not_before=start, not_after=end).code}


def find_list(asked: dict) -> dict:
    with vesk2.RevocationList(tag=asked["tag"]):
        return {"code": 0}


def import_lists(asked: dict) -> dict:
    vesk2.import_lists(asked["directory"])
    return {"code": 0}


def told(result: vesk2.Result, directory: Optional[str]) -> dict:
    """The code and the files that are not as signed, as the questions name them."""

    def relative(paths: tuple) -> list[str]:
        shown = (os.path.relpath(path, directory) if directory else str(path) for path in paths)
        return sorted(os.fsencode(path).decode("latin-1") for path in shown)

    lists = {"changed": result.changed, "missing": result.missing, "unlisted": result.unlisted}
    return {"code": result.code, **{name: relative(paths) for name, paths in lists.items()}}


def verify_manifest(asked: dict) -> dict:
    with vesk2.Manifest(asked["directory"], asked["file"], asked["tag"]) as manifest:
        if asked.get("refuse_unlisted"):
            manifest.refuse_unlisted()
        if "acl_directory" in asked:
            manifest.trust_also(asked["acl_directory"])
        if asked.get("update_store") == 0:
            manifest.keep_store()
        manifest.ignore(asked.get("ignore", []))
        result = manifest.verify(moment(asked["not_before"]), moment(asked["not_after"]))
        return told(result, asked["directory"])


def compare_manifests(asked: dict) -> dict:
    with vesk2.Manifest(asked["global"], asked["file"], "x") as manifest:
        return told(manifest.compare(asked["other"]), None)


OPERATIONS: dict[str, Callable[[dict], dict]] = {
    "read-chain": read_chain,
    "verify-chain": verify_chain,
    "read-list": read_list,
    "verify-list": verify_list,
    "find-list": find_list,
    "import-lists": import_lists,
    "verify-manifest": verify_manifest,
    "compare-manifests": compare_manifests,
}


def answer(asked: dict) -> dict:
    if asked["operation"] == "hello":
        return {"column": "library", "name": "the Python module"}
    ask = OPERATIONS.get(asked["operation"])
    if ask is None:
        return {"unsupported": True}
    vesk2.set_stores(asked["global"], asked["home"])
    try:
        return ask(asked)
    except vesk2.Error as error:
        return {"code": error.code}
    except ValueError:  # what the module does not let ask
        return {"unsupported": True}
    except OSError:  # the module's word for a manifest that cannot be opened
        return {"code": 19}


def main() -> None:
    for line in sys.stdin:
        asked = json.loads(line)
        print(json.dumps({"id": asked["id"], **answer(asked)}), flush=True)


if __name__ == "__main__":
    main()
