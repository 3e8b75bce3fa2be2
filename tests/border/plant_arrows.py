#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Plants includes, names and calls that scripts/check-arrows must refuse, one at a time, in a copy of the tree.

    plant_arrows.py SOURCE COMPILER
"""
import pathlib
import shutil
import subprocess
import sys
import tempfile

# A file that gets one more line, the line, and what the refusal must say.
LINES = [
    ("src/sexpr/walk.h", '#include "src/trust/chain.h"', "sexpr must not include src/trust/chain.h (trust)"),
    ("src/sexpr/walk.h", '#include "../trust/chain.h"', "names no file of a room"),
    ("src/sexpr/walk.h", '#include "walk.h"', "names no file of a room"),
    ("src/sexpr/walk.h", "#include <vesk2/crl.h>", "sexpr must not include vesk2/crl.h (trust)"),
    ("src/sexpr/walk.h", "#include <vesk2/unknown.h>", "an undeclared header"),
    ("src/sexpr/walk.h", "#  include  <openssl/evp.h>", "<openssl/evp.h> is not listed for sexpr"),
    ("src/sexpr/walk.h", "#include VESK2_HEADER", "cannot be placed"),
    ("src/engine/tag.h", "#include <unistd.h>", "<unistd.h> is not listed for engine"),
    ("src/engine/tag.h", "#include <vesk2/expression.h>", "engine must not include vesk2/expression.h"),
    ("src/engine/interface/reduct.cpp", "#include <vesk2/acl_entry.h>", "engine/interface must not include"),
    ("src/trust/chain.h", '#include "src/manifest/findings.h"', "trust must not include"),
    ("src/objects/build.h", "#include <vector>", "<vector> is not listed for objects"),
    ("include/vesk2/ref.h", "#include <vesk2/cert.h>", "sexpr must not include vesk2/cert.h (objects)"),
    ("include/vesk2/cert.h", "#include <string>", "<string> is not for public headers"),
    ("tools/vesk2/main.cpp", '#include "src/sexpr/walk.h"', "tools must not include"),
    ("tools/vesk2/say/line.h", '#include "tools/vesk2/files/files.h"', "tools/vesk2/say must not include"),
    ("tools/vesk2/explain/remedy.h", '#include "tools/vesk2/explain/explain.h"', "a circle"),
    ("tools/vesk2/say/line.h", "struct Destination {};", "Destination is a type of tools/vesk2/install/destination.h"),
    ("fuzz/fuzz_support.h", "#include <openssl/evp.h>", "<openssl/evp.h> is not listed for fuzz"),
    ("bench/bench.h", "#include <curl/curl.h>", "is not listed for bench"),
    ("examples/verify_chain.c", '#include "src/platform/file.h"', "examples must not include"),
]
NEW_FILES = [
    ("src/stray.cpp", "this file lies in no room"),
    ("include/vesk2/stray.h", "this header belongs to no room"),
]
ROOMS = ["platform", "frame", "sexpr", "objects", "engine", "engine_interface", "trust", "manifest", "frame_flat"]


def check(root, *more):
    run = subprocess.run([root / "scripts/check-arrows", "--root", root, *more], capture_output=True, text=True)
    return run.returncode, run.stdout + run.stderr


def compile_rooms(build, compiler):
    """One object a room, each with a function; sexpr calls one of trust."""
    for room in ROOMS:
        folder = build / f"CMakeFiles/vesk2_{room}.dir"
        folder.mkdir(parents=True)
        call = "void of_trust(void); void of_sexpr(void) { of_trust(); }"
        code = call if room == "sexpr" else f"void of_{room}(void) {{}}"
        subprocess.run([compiler, "-x", "c", "-c", "-", "-o", folder / "x.o"], input=code, text=True, check=True)


def main(source, compiler):
    failures = []

    def expect(what, outcome, refusal):
        code, output = outcome
        if code != (1 if refusal else 0) or (refusal and refusal not in output):
            failures.append(f"{what}: exit {code}, wanted '{refusal}':\n{output}")

    with tempfile.TemporaryDirectory() as scratch:
        root = pathlib.Path(scratch) / "tree"
        root.mkdir()
        for folder in ["src", "include", "tools", "tests", "fuzz", "bench", "examples", "scripts"]:
            shutil.copytree(pathlib.Path(source) / folder, root / folder)
        expect("the tree as it is", check(root), None)
        for path, line, refusal in LINES:
            text = (root / path).read_text()
            (root / path).write_text(line + "\n" + text)
            expect(f"{path} with {line}", check(root), refusal)
            (root / path).write_text(text)
        for path, refusal in NEW_FILES:
            (root / path).write_text("#include <vesk2.h>\n")
            expect(path, check(root), refusal)
            (root / path).unlink()
        build = pathlib.Path(scratch) / "build"
        compile_rooms(build, compiler)
        expect("a call upward", check(root, "--symbols", build), "sexpr must not call of_trust (trust)")
    print("\n".join(failures) if failures else f"{len(LINES) + len(NEW_FILES) + 1} planted faults refused")
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
