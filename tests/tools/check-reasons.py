#!/usr/bin/python3
"""check-reasons.py ROOT: that docs/json.md lists every reason: codes with their numbers, and the
words that the command's own sources give to Trouble and No. Prints those that are missing."""
import pathlib
import re
import sys

root = pathlib.Path(sys.argv[1])
page = (root / "docs/json.md").read_text()
missing = []
for code, name in re.findall(r"X\((-?\d+), (\w+)", (root / "include/vesk2.h").read_text()):
    word = re.sub("^VESK2_(ERR_)?", "", name).lower().replace("_", "-")
    if name not in ("VESK2_SUCCESS", "VESK2_MAX_ERROR"):
        if not re.search(rf"`{word}`( \|)?\s{code}\b", page):
            missing.append(f"{word} {code}")
for source in sorted((root / "tools/vesk2").glob("*.cpp")):
    words = re.findall(r'(?:Trouble\([^;]*?,\s*|\bNo\(\s*)"([a-z0-9-]+)"[,)]', source.read_text())
    missing += [f"{word} ({source.name})" for word in words if f"| `{word}` |" not in page]
sys.exit("\n".join(missing) or 0)
