#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Plants declarations that scripts/check-results must refuse, and some that it must not.

    plant_results.py SOURCE
"""
import pathlib
import subprocess
import sys
import tempfile

# A file, its text, and whether the check may pass it.
FILES = [
    ("a.h", "class A {\n  int Get();\n};", False),
    ("a.h", "class A {\n  static int Get();\n};", False),
    ("a.h", "class A {\n  int Get() override;\n};", False),
    ("a.h", "inline int Get() { return 0; }", False),
    ("a.h", "VESK2_API int Get();", False),
    ("a.h", "class A {\n  [[nodiscard]] static int Get();\n  int32_t Type();\n  int code;\n};", True),
    ("a.cpp", "namespace {\n\nint Get() {\n  return 0;\n}\n\n}  // namespace\n", False),
    ("a.cpp", "class A {\n  int Get();\n};\n", False),
    ("a.cpp", "namespace {\n\n}  // namespace\n\nint A::Get() {\n  return 0;\n}\n\nint Get() {\n", True),
    ("vesk2.h", "VESK2_API int VerifyManifest(Manifest* manifest);", False),
    ("vesk2.h", "VESK2_VERDICT int VerifyManifest(Manifest* manifest);\nVESK2_API int Vesk2CrlFree();", True),
]


def main(source):
    failures = []
    for name, text, passes in FILES:
        with tempfile.TemporaryDirectory() as folder:
            (pathlib.Path(folder) / name).write_text(text + "\n")
            run = subprocess.run([f"{source}/scripts/check-results", folder], capture_output=True, text=True)
        if (run.returncode == 0) != passes:
            failures.append(f"{name}: {text}\n{run.stdout}{run.stderr}")
    print("\n".join(failures) if failures else f"{len(FILES)} planted declarations judged")
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
