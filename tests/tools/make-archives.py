#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""make-archives.py TREE DIRECTORY: writes archives that are not what they should be, one a file.

Each holds the files of TREE, but for what its row changes: entries before them, instead of them, after them.
"""
import gzip
import io
import pathlib
import sys
import tarfile
import zipfile

tree, out = pathlib.Path(sys.argv[1]), pathlib.Path(sys.argv[2])
out.mkdir()
FILES = {str(p.relative_to(tree)): p.read_bytes() for p in sorted(tree.rglob("*")) if p.is_file()}


def entry(name, content=b"", **fields):
    info = tarfile.TarInfo(name)
    info.size, info.mode = len(content), 0o644
    for field, value in fields.items():
        setattr(info, field, value)
    return info, content


def link(name, target, kind=tarfile.SYMTYPE):
    return entry(name, type=kind, linkname=target)


DEVICE = dict(type=tarfile.CHRTYPE, devmajor=1, devminor=3)
ONE = FILES["one"]
# name: entries before the files, files left out, entries after them
TARS = {
    "listed-link": ([link("one", "/etc/passwd")], ["one"], []),
    "listed-hard-link": ([], ["one"], [link("one", "two", tarfile.LNKTYPE)]),
    "listed-device": ([entry("one", **DEVICE)], ["one"], []),
    "listed-fifo": ([entry("one", type=tarfile.FIFOTYPE)], ["one"], []),
    "listed-directory": ([entry("one", type=tarfile.DIRTYPE)], ["one"], []),
    "directory-link": ([link("sub", "../../outside")], [], []),
    "directory-file": ([], [], [entry("sub", b"x")]),
    "twice": ([], [], [entry("one", ONE)]),
    "twice-dotted": ([], [], [entry(".//one", b"evil")]),
    "link-then-file": ([link("one", "../../outside/one")], [], []),
    "climbing-instead": ([entry("sub/../one", ONE)], ["one"], []),
    "absolute-instead": ([entry("/one", ONE)], ["one"], []),
    "changed": ([entry("one", b"evil")], ["one"], []),
    # What is not listed does no harm.
    "unlisted": ([entry("../evil", b"x"), entry("/tmp/vesk2-evil", b"x"), entry("sub/../../evil", b"x"),
                  link("out", "../../outside"), entry("out/evil", b"x"), entry("zero", **DEVICE),
                  link("sub/evil", "two", tarfile.LNKTYPE), entry("sub/deeper/evil", b"x")], [], []),
    "set-uid": ([entry("one", ONE, mode=0o6777, uid=1, gid=1)], ["one"], []),
}

for name, (before, without, after) in TARS.items():
    with tarfile.open(out / f"{name}.tar", "w") as archive:
        for info, content in before + [entry(n, c) for n, c in FILES.items() if n not in without] + after:
            archive.addfile(info, io.BytesIO(content))

zeros = bytes(1 << 20)
for name, header in {"bomb-listed": "one", "bomb-unlisted": "other"}.items():
    with gzip.open(out / f"{name}.tar.gz", "wb", 1) as archive:
        archive.write(entry(header, size=6 << 30)[0].tobuf())  # and a little of it
        archive.write(zeros)
    with zipfile.ZipFile(out / f"{name}.zip", "w", zipfile.ZIP_DEFLATED) as archive:
        archive.writestr(header, zeros)
with gzip.open(out / "bomb-entries.tar.gz", "wb", 1) as archive:
    archive.write(entry("x")[0].tobuf() * 100_001)
with zipfile.ZipFile(out / "climbing.zip", "w") as archive:
    for name, content in {**FILES, "../evil": b"x", "/tmp/vesk2-evil": b"x"}.items():
        archive.writestr(name, content)

whole = (out / "unlisted.tar").read_bytes()
(out / "cut.tar").write_bytes(whole[:-10240 - 700])
(out / "none.tar").write_bytes(b"no archive at all\n" * 100)
