#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Holds an implementation against the cases of this kit. README.md describes the protocol.

    run.py [--only TEXT] [--jobs N] --implementation COMMAND [WORD...]
"""

from __future__ import annotations

import argparse
import base64
import calendar
import json
import os
import select
import shutil
import subprocess
import sys
import tempfile
import time
from collections import Counter
from concurrent.futures import ThreadPoolExecutor
from pathlib import Path
from typing import Any, Iterator

HERE = Path(__file__).resolve().parent
PATIENCE = 120  # seconds; what waits for a pipe waits for ever
PATHS = ("file", "other", "directory", "acl_directory")


def load(folder: Path) -> tuple[dict[str, dict], list[dict]]:
    objects = json.loads((folder / "objects.json").read_text())
    cases = []
    for path in sorted(folder.glob("*.json")):
        if path.name != "objects.json":
            cases += json.loads(path.read_text())
    return objects, cases


def whole(name: str, objects: dict[str, dict]) -> bytes:
    """The bytes of an object: bytes in base64, each in a list of its own, and the names of other objects."""
    pieces = objects[name]["bytes"]
    return b"".join(whole(one, objects) if isinstance(one, str) else base64.b64decode(one[0]) for one in pieces)


def contents(what: Any, objects: dict[str, dict]) -> bytes:
    """The bytes of a file: the name of an object, an object with one change, or a text."""
    if isinstance(what, str):
        return whole(what, objects)
    if "from" in what:
        data, put = whole(what["from"], objects), what["put"].encode("latin-1")
        return data[: what["at"]] + put * what.get("times", 1) + data[what["at"] + what["drop"] :]
    return what["content"].encode("latin-1")


def lay_out(case: dict, objects: dict[str, dict], root: Path) -> None:
    """Makes the files of a case. One whose name ends in a slash is a directory."""
    for name, what in case["files"].items():
        path = os.path.join(os.fsencode(root), name.encode("latin-1"))
        if name.endswith("/"):
            os.makedirs(path, exist_ok=True)
            continue
        os.makedirs(os.path.dirname(path), exist_ok=True)
        if isinstance(what, dict) and "link" in what:
            os.symlink(what["link"], path)
        elif isinstance(what, dict) and "fifo" in what:
            os.mkfifo(path)
        else:
            with open(path, "wb") as file:
                file.write(contents(what, objects))


def request(question: dict, root: Path) -> dict:
    """A question as an implementation gets it: with full paths, and times as seconds."""
    asked = dict(question)
    for key in PATHS:
        if key in asked:
            asked[key] = str(root / asked[key])
    for key in ("not_before", "not_after"):
        stamp = asked.get(key)
        asked[key] = calendar.timegm(time.strptime(stamp, "%Y-%m-%d_%H:%M:%S")) if stamp else 0
    return {**asked, "global": str(root / "global"), "home": str(root / "home")}


class Implementation:
    """A process that answers one line with one line."""

    def __init__(self, words: list[str]) -> None:
        self._process = subprocess.Popen(words, stdin=subprocess.PIPE, stdout=subprocess.PIPE, text=True)
        self._asked = 0
        hello = self.ask({"operation": "hello", "protocol": 1})
        self.column, self.name = hello["column"], hello["name"]

    def ask(self, what: dict) -> dict:
        assert self._process.stdin and self._process.stdout
        self._asked += 1
        self._process.stdin.write(json.dumps({"id": self._asked, **what}) + "\n")
        self._process.stdin.flush()
        answered = select.select([self._process.stdout], [], [], PATIENCE)[0]
        line = self._process.stdout.readline() if answered else ""
        if not line:
            self._process.kill()
            raise SystemExit(f"run.py: no answer to: {json.dumps(what)}")
        answer: dict = json.loads(line)
        if answer.get("id") != self._asked:
            raise SystemExit(f"run.py: an answer to another question: {line.strip()}")
        return answer

    def close(self) -> int:
        assert self._process.stdin
        self._process.stdin.close()
        return self._process.wait()


def unsafe(shown: list[str]) -> Iterator[str]:
    """What would move a cursor or turn text on a terminal, in what an implementation prints."""
    for text in shown:
        for char in text:
            code = ord(char)
            if (code < 32 and char != "\n") or 127 <= code < 160 or 0x202A <= code <= 0x202E:
                yield f"U+{code:04X}"


def disagreements(expected: dict, answer: dict) -> list[str]:
    found = [
        f"{key} {json.dumps(answer.get(key))}, not {json.dumps(value)}"
        for key, value in expected.items()
        if answer.get(key) != value
    ]
    found += [f"it prints {code} raw" for code in sorted(set(unsafe(answer.get("shown", []))))]
    return found


def run(case: dict, objects: dict[str, dict], asked: Implementation) -> tuple[str, list[str]]:
    """Asks one case: agreed, disagreed or unsupported, and what was otherwise than expected."""
    expected = case.get(asked.column)
    if expected is None:
        return "unsupported", []
    root = Path(tempfile.mkdtemp(prefix="kit."))
    try:
        lay_out(case, objects, root)
        for question in (*case.get("before", []), case["question"]):
            answer = asked.ask(request(question, root))
            if answer.get("unsupported"):
                return "unsupported", []
        found = disagreements(expected, answer)
        return ("disagreed", found) if found else ("agreed", [])
    finally:
        shutil.rmtree(root)


def main() -> int:
    parser = argparse.ArgumentParser(description="Holds an implementation against the cases of this kit.")
    parser.add_argument("--only", default="", metavar="TEXT", help="the cases with TEXT in their name")
    parser.add_argument("--jobs", type=int, default=1, metavar="N", help="ask N of them at a time")
    parser.add_argument("--implementation", nargs=argparse.REMAINDER, required=True, metavar="COMMAND")
    options = parser.parse_args()
    objects, cases = load(HERE / "cases")
    wanted = [case for case in cases if options.only in case["name"]]
    running = [Implementation(options.implementation) for _ in range(options.jobs)]

    def share(number: int) -> list[tuple[dict, str, list[str]]]:
        return [(case, *run(case, objects, running[number])) for case in wanted[number :: options.jobs]]

    with ThreadPoolExecutor(options.jobs) as pool:
        done = [one for part in pool.map(share, range(options.jobs)) for one in part]
    for case, _, found in sorted(done, key=lambda one: str(one[0]["name"])):
        if found:
            print(f"{case['name']}: {'; '.join(found)} ({case['why']})")
    if any([one.close() for one in running]):
        raise SystemExit("run.py: the implementation ended with an error")
    counts = Counter(result for _, result, _ in done)
    shown = ", ".join(f"{counts[result]} {result}" for result in ("agreed", "disagreed", "unsupported"))
    print(f"{running[0].name}: {shown}")
    return 0 if counts["disagreed"] == 0 and counts["agreed"] > 0 else 1


if __name__ == "__main__":
    sys.exit(main())
