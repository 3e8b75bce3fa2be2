#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Compiles tests/border/layout_caller.cpp with headers in which every private member lies elsewhere, and runs it.

    other_layout.py SOURCE COMPILER LIBRARY

A program that was built with such headers works only if nothing that it compiled knows where a member lies.
"""
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile

# Values that are copied, and so are what they are.
PLAIN = ("ref.h", "limits.h", "verify.h", "file_item.h", "context.h")


def main(source, compiler, library):
    with tempfile.TemporaryDirectory() as scratch:
        include = pathlib.Path(scratch) / "include"
        shutil.copytree(pathlib.Path(source) / "include", include)
        for header in include.glob("vesk2/*.h"):
            if header.name in PLAIN:
                continue
            # Before the first data of each class; "    " is a nested one, which is plain.
            text = re.sub(r"(?m)^((?:class|struct) [^;]*?\{\n)( public:)", r"\1 private: unsigned char moved[56];\n\2",
                          header.read_text())
            header.write_text(text)
        program = pathlib.Path(scratch) / "caller"
        subprocess.run([compiler, "-std=c++20", "-O2", "-o", program, f"-I{include}",
                        pathlib.Path(source) / "tests/border/layout_caller.cpp", library,
                        f"-Wl,-rpath,{pathlib.Path(library).parent}"], check=True)
        return subprocess.run([program]).returncode


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
