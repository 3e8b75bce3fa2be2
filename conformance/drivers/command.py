#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Answers the questions of the kit through the command, found as VESK2 or on the path."""

from __future__ import annotations

import json
import os
import subprocess
import sys
import time
from typing import Optional

COMMAND = os.environ.get("VESK2", "vesk2")


def stamp(seconds: int) -> str:
    return time.strftime("%Y-%m-%d_%H:%M:%S", time.gmtime(seconds))


def times(asked: dict) -> list[str]:
    """One moment, a period, or what the command asks about by itself."""
    start, end = asked["not_before"], asked["not_after"]
    if "at_text" in asked:
        return ["--at=" + asked["at_text"]]
    if start and start == end:
        return ["--at", stamp(start)]
    options = ["--not-before", stamp(start)] if start else []
    return options + (["--not-after", stamp(end)] if end else [])


def words(asked: dict) -> Optional[list[str]]:
    """The command line of a question; None for what the command has no words for."""
    file, tag = asked.get("file", ""), ["--tag=" + asked["tag"]] if "tag" in asked else []
    operation = asked["operation"]
    if operation == "verify-chain":
        return ["cert", "verify", file, *tag, *times(asked)]
    if operation == "verify-manifest":
        ignored = [word for name in asked.get("ignore", []) for word in ("--ignore", name)]
        trusted = ["--acl-dir", asked["acl_directory"]] if "acl_directory" in asked else []
        store = ["--no-store-update"] if asked.get("update_store") == 0 else []
        options = [*tag, *times(asked), *trusted, *store, *ignored]
        return ["manifest", "verify", asked["directory"], file, *options]
    if operation == "compare-manifests":
        return ["manifest", "compare", file, asked["other"]]
    if operation == "verify-list":
        return ["crl", "verify", file, *tag, *times(asked)]
    if operation == "import-lists":
        return ["crl", "import", asked["directory"]]
    if operation == "tag-within":
        return ["tag", "check", "--", asked["tag"], asked["within"]]
    shown = {"read-chain": ["cert", "show"], "read-list": ["crl", "show"], "read-key": ["key", "show"]}
    return [*shown[operation], file] if operation in shown else None


def run(arguments: list[str], asked: dict, json_too: bool) -> subprocess.CompletedProcess:
    before = arguments[: arguments.index("--")] if "--" in arguments else arguments
    options = ["--global", asked["global"], "--home", asked["home"], *(["--json"] if json_too else [])]
    line = [COMMAND, *before, *options, *arguments[len(before) :]]
    return subprocess.run([word.encode("latin-1") for word in line], capture_output=True, check=False)


def texts(value: object) -> list[str]:
    """Every text of an answer. The words of remedies are for programs, and not escaped."""
    if isinstance(value, str):
        return [value]
    if isinstance(value, dict):
        return [text for key, one in value.items() if key != "commands" for text in texts(one)]
    return [text for one in value for text in texts(one)] if isinstance(value, list) else []


def answer(asked: dict) -> dict:
    if asked["operation"] == "hello":
        return {"column": "command", "name": "the command"}
    line = words(asked)
    if line is None:
        return {"unsupported": True}
    done = run(line, asked, True)
    said = json.loads(done.stdout)
    shown = [*texts(said), done.stderr.decode("utf-8", "replace")]
    found: dict = {"exit": done.returncode, "reason": said["reason"], "verdict": said["verdict"], "shown": shown}
    if asked.get("people"):
        printed = run(line, asked, False)
        shown += [printed.stdout.decode("utf-8", "replace"), printed.stderr.decode("utf-8", "replace")]
        found["says"] = printed.stdout.decode("utf-8", "replace").partition(":")[0]
    for name, of_two in (("changed", "changed"), ("missing", "removed"), ("unlisted", "added")):
        entries = said["result"].get(name, said["result"].get(of_two))
        if entries is not None:
            paths = (entry["path"] if isinstance(entry, dict) else entry for entry in entries)
            found[name] = sorted(path.removeprefix(asked.get("directory", "") + "/") for path in paths)
    return found


def main() -> None:
    for line in sys.stdin:
        asked = json.loads(line)
        print(json.dumps({"id": asked["id"], **answer(asked)}), flush=True)


if __name__ == "__main__":
    main()
