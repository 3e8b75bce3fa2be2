#!/usr/bin/python3
# SPDX-License-Identifier: Apache-2.0
"""check-reasons.py ROOT: that docs/json.md lists every reason: the library's codes of which the
command's sources speak, with their numbers, and the words that these give to Trouble and No; and
every finding of the audit. Prints those that are missing."""
import pathlib
import re
import sys

root = pathlib.Path(sys.argv[1])
page = (root / "docs/json.md").read_text()
rows = re.findall(r"X\((-?\d+), (\w+)", (root / "include/vesk2.h").read_text())
numbers = {name: number for number, name in rows}
missing = []
for source in [*sorted((root / "tools/vesk2").rglob("*.cpp")), root / "src/frame/errors.cpp"]:
    text = source.read_text()
    for name in set(re.findall(r"\b(?:VESK2|SPKI)_ERR_\w+", text)) & set(numbers):
        word = name.removeprefix("VESK2_ERR_").lower().replace("_", "-")
        if f"| `{word}` | {numbers[name]} |" not in page:
            missing.append(f"{word} {numbers[name]} ({source.name})")
    words = re.findall(r'(?:Trouble\([^;]*?,\s*|\bNo\(\s*)"([a-z0-9-]+)"(?:,|\)(?! \+))', text)
    missing += [f"{word} ({source.name})" for word in words if f"| `{word}` |" not in page]
for source in sorted((root / "tools/vesk2/audit").glob("*.cpp")):
    words = re.findall(r'\bAdd\("([a-z0-9-]+)"', source.read_text())
    missing += [f"{word} ({source.name})" for word in words if f"| `{word}` |" not in page]
sys.exit("\n".join(missing) or 0)
