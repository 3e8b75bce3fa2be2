#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Links programs that scripts/check-elf --hardened must refuse, one that it must not, and an archive.

    plant_elf.py SOURCE C_COMPILER
"""
import pathlib
import platform
import subprocess
import sys
import tempfile

PROGRAM = r"""
#include <stdio.h>
#include <string.h>
#ifdef ADDRESS_IN_CODE
__asm__(".quad main\n");
#endif
#ifdef WRITABLE_CODE
__asm__(".pushsection mixed, \"awx\"\n.byte 0\n.popsection");
#endif
int main(int count, char** words) {
  char text[64];
  strcpy(text, words[count - 1]);
  return puts(text) < 0;
}
"""
GOOD = "-O2 -fPIE -pie -fstack-protector-strong -U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=2 -Wl,-z,relro,-z,now,-z,noexecstack".split()
# What is added to that, and what the check must say; nothing when it is as it should be.
PROGRAMS = [
    ("-Wl,-rpath,$ORIGIN/../lib", ""),
    ("-Wl,-rpath,$ORIGIN/../lib:", "search path"),
    ("-Wl,-rpath,lib", "search path"),
    ("-fno-pie -no-pie", "can lie anywhere"),
    ("-Wl,-z,norelro", "become read-only"),
    ("-Wl,-z,lazy", "binding at the start"),
    ("-Wl,-z,execstack", "executable stack"),
    ("-DWRITABLE_CODE", "written and run"),
    ("-DADDRESS_IN_CODE -Wl,-z,notext", "code that is changed"),
    ("-fno-stack-protector", "stack protector"),
    ("-U_FORTIFY_SOURCE", "fortified calls"),
]


def judge(source, folder):
    """What the check says of a folder, nothing when it is content."""
    run = subprocess.run([f"{source}/scripts/check-elf", "--hardened", folder], capture_output=True, text=True)
    return run.stdout + run.stderr if run.returncode != 0 else ""


def main(source, compiler):
    planted = []
    with tempfile.TemporaryDirectory() as work:
        folder = pathlib.Path(work, "built")
        folder.mkdir()
        code = pathlib.Path(work, "program.c")
        code.write_text(PROGRAM)
        for flags, complaint in PROGRAMS:
            subprocess.run([compiler, *GOOD, code, *flags.split(), "-o", folder / "vesk2"], check=True, stderr=subprocess.DEVNULL)
            planted.append((flags, complaint, judge(source, folder)))
        if platform.machine() == "x86_64":
            subprocess.run([compiler, *GOOD, code, "-o", folder / "vesk2"], check=True)
            subprocess.run([compiler, *GOOD, "-fcf-protection=none", "-c", code, "-o", f"{work}/program.o"], check=True)
            subprocess.run(["ar", "cr", folder / "libvesk2.a", f"{work}/program.o"], check=True)
            planted.append(("-fcf-protection=none", "indirect jumps", judge(source, folder)))
    failures = [f"{flags}: {said or 'passed'}" for flags, complaint, said in planted
                if (complaint not in said or said.count("\n") != 1 if complaint else said)]
    print("\n".join(failures) if failures else f"{len(planted)} planted programs judged")
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
