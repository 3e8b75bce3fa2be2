# SPDX-License-Identifier: Apache-2.0
"""Directories held against signed manifests, and manifests against each other."""

from __future__ import annotations

from typing import Any, Optional

from .book import YES, Book, ask_manifest, command, library, no, trouble, word
from .keys import STRANGER
from .manifests import SECOND, store
from .objects import body, dir_entry, file_entry, issue, manifest, pairs, signature
from .sexp import canonical

AS_SIGNED = {"tree/a": b"x", "tree/sub/b": b"y", "tree/sub/deep/c": b"z"}
LISTING = body(file_entry("a", b"x"), dir_entry("sub", file_entry("b", b"y"), dir_entry("deep", file_entry("c", b"z"))))
UNLISTED = "look at the top directory itself, and call FailOnExtraEntries for what lies below"


def tree(change: Optional[dict] = None, base: Optional[dict] = None) -> dict:
    """The files as they were signed, but for some. None takes one away."""
    files = {**(AS_SIGNED if base is None else base), **(change or {})}
    made = {name: {"content": what.decode("latin-1")} if isinstance(what, bytes) else what for name, what in files.items()}
    return {name: what for name, what in made.items() if what is not None or name.endswith("/")}


def lists(code: str, changed: tuple = (), missing: tuple = (), unlisted: tuple = ()) -> tuple[dict, dict]:
    found = {"changed": list(changed), "missing": list(missing), "unlisted": list(unlisted)}
    return library(code, **found), command(0 if code == "OK" else 1, word(code), **found)


def _one(book: Book, name: str, why: str, files: dict, answers: tuple, listing: Any = LISTING, must: Optional[str] = None, **more: Any) -> None:
    what = store(book, manifest(listing, SECOND), tree=files)
    book.case(f"trees/{name}", why, what, ask_manifest(**more), answers, caller_must=must)


def _changes(book: Book) -> None:
    rows: list = [
        ("as-signed", {}, lists("OK"), "everything as it was signed"),
        ("changed", {"tree/a": b"X"}, lists("HASH_MISMATCH", ["a"]), "one byte of a file"),
        ("emptied", {"tree/a": b""}, lists("HASH_MISMATCH", ["a"]), "an empty file"),
        ("newline", {"tree/a": b"x\n"}, lists("HASH_MISMATCH", ["a"]), "a byte more"),
        ("changed-below", {"tree/sub/b": b"Y"}, lists("HASH_MISMATCH", ["sub/b"]), "a file of a directory"),
        ("changed-deep", {"tree/sub/deep/c": b"Z"}, lists("HASH_MISMATCH", ["sub/deep/c"]), "a file far below"),
        ("swapped", {"tree/a": b"y", "tree/sub/b": b"x"}, lists("HASH_MISMATCH", ["a", "sub/b"]), "contents that changed places"),
        ("changed-all", {"tree/a": b"", "tree/sub/b": b"", "tree/sub/deep/c": b""}, lists("HASH_MISMATCH", ["a", "sub/b", "sub/deep/c"]), "every finding is told"),
        ("missing", {"tree/a": None}, lists("FILE_NOT_FOUND", [], ["a"]), "a file is missing"),
        ("missing-below", {"tree/sub/b": None}, lists("HASH_MISMATCH", [], ["sub/b"]), "its directory is not what was signed"),
        ("missing-directory", {"tree/sub/b": None, "tree/sub/deep/c": None}, (library("HASH_MISMATCH"), command(1, "hash-mismatch")), "a directory is missing"),
        ("missing-and-changed", {"tree/a": None, "tree/sub/b": b"Y"}, lists("HASH_MISMATCH", ["sub/b"], ["a"]), "what changed outranks what is missing"),
        ("renamed", {"tree/a": None, "tree/A": b"x"}, (library("FILE_NOT_FOUND"), command(1, "file-not-found")), "names differ in their case"),
        ("file-is-directory", {"tree/a": None, "tree/a/": None}, (library("FILE_NOT_FOUND"), command(1, "file-not-found")), "a directory where a file must be"),
        ("directory-is-file", {"tree/sub/b": None, "tree/sub/deep/c": None, "tree/sub": b""}, (library("HASH_MISMATCH"), command(1, "hash-mismatch")), "a file where a directory must be"),
        ("fifo", {"tree/a": {"fifo": 1}}, lists("FILE_NOT_FOUND", [], ["a"]), "a pipe is no file, and nobody waits for it"),
        ("dangling", {"tree/a": {"link": "none"}}, lists("FILE_NOT_FOUND", [], ["a"]), "a link to nothing"),
        ("loop", {"tree/a": {"link": "a"}}, lists("FILE_NOT_FOUND", [], ["a"]), "a link to itself"),
        ("link-to-directory", {"tree/a": {"link": "sub"}}, lists("FILE_NOT_FOUND", [], ["a"]), "a link to a directory"),
        ("link-changed", {"tree/a": {"link": "sub/b"}}, lists("HASH_MISMATCH", ["a"]), "a link to another file: contents count"),
        ("extra-and-missing", {"tree/a": None, "tree/sub/z": b""}, lists("FILE_NOT_FOUND", [], ["a"], ["sub/z"]), "what is missing outranks what is new"),
    ]  # fmt: skip
    for name, change, answers, why in rows:
        _one(book, name, why, tree(change), answers)


def _unlisted(book: Book) -> None:
    refused = no("EXTRA_FILES")
    for name, file, why in (
        ("file", "sub/z", "a file"), ("hidden", "sub/.z", "a hidden file"), ("deep", "sub/deep/z", "a file far below"), ("prefix", "sub/bb", "a name that begins as a listed one"),
    ):  # fmt: skip
        files, found = tree({f"tree/{file}": b""}), {"changed": [], "missing": [], "unlisted": [file]}
        strict = library("EXTRA_FILES", **found), command(1, "extra-files", **found)
        _one(book, f"unlisted-{name}-refused", why + " that was not signed", files, strict, refuse_unlisted=1)
        _one(
            book, f"unlisted-{name}", why + " that was not signed", files, (library("OK", **found), strict[1]),
            must=UNLISTED,
        )
    for name, change in (("directory", {"tree/sub/z/": None}), ("full-directory", {"tree/sub/z/q": b""}), ("link", {"tree/sub/z": {"link": "/"}}), ("fifo", {"tree/sub/z": {"fifo": 1}})):
        _one(book, f"unlisted-{name}-refused", "it was not signed", tree(change), refused, refuse_unlisted=1)
        _one(book, f"unlisted-{name}", "it was not signed", tree(change), (library("OK"), refused[1]), must=UNLISTED)
    for name, change in (("file", {"tree/z": b""}), ("directory", {"tree/z/": None}), ("twin", {"tree/A": b"x"})):
        _one(
            book, f"unlisted-top-{name}", "the library does not search the top directory", tree(change),
            (library("OK", unlisted=[]), refused[1]), must=UNLISTED, refuse_unlisted=1,
        )


def _links(book: Book) -> None:
    out = {"outside": {"content": "x"}, "far/b": {"content": "y"}, "far/deep/c": {"content": "z"}}
    leaves = command(1, "link-leaves-tree")
    must = "refuse trees in which a listed entry is a link that leads out, or lies behind one"
    _one(
        book, "link-out", "a link to the right contents, outside",
        {**tree({"tree/a": {"link": "../outside"}}), **out}, (library("OK"), leaves), must=must,
    )
    _one(
        book, "link-out-directory", "a directory that lies elsewhere",
        {**tree({"tree/sub": {"link": "../far"}, "tree/sub/b": None, "tree/sub/deep/c": None}), **out},
        (library("OK"), leaves), must=must,
    )
    two = body(file_entry("a", b"x"), file_entry("d", b"x"))
    _one(
        book, "link-inside", "a link to a file of the tree", tree({"tree/d": {"link": "a"}}, {"tree/a": b"x"}), YES,
        two,
    )


def _listings(book: Book) -> None:
    a, b = file_entry("a", b"x"), file_entry("b", b"y")
    flat = {"tree/a": b"x", "tree/b": b"y"}
    rows = [
        ("order", body(b, a), YES, "entries stand in any order"),
        ("second-word", body([b[0], b[1], b"note", b[3]], a), YES, "the second word of an entry is not used"),
        ("twice", body(a, a, b), YES, "a file that is listed twice, alike"),
        ("twice-different", body(a, file_entry("a", b"y"), b), no("HASH_MISMATCH"), "and not alike: one of both is wrong"),
        ("file-and-directory", body(a, b, dir_entry("a")), no("HASH_MISMATCH"), "a name for a file and a directory"),
        ("long-name", body(a, b, file_entry("n" * 256, b"")), no("FILE_NOT_FOUND"), "a name longer than any file's"),
        ("more", body(a, b, file_entry("c", b"")), no("FILE_NOT_FOUND"), "one more than there is"),
        ("empty-directory", body(a, b, dir_entry("sub")), no("HASH_MISMATCH"), "a directory that is not there"),
        ("composed", body(a, b, file_entry("\xc3\xa9", b"")), no("FILE_NOT_FOUND"), "names are bytes: no two spellings are one"),
    ]  # fmt: skip
    for name, listing, answers, why in rows:
        change = {"tree/e\xcc\x81": b""} if name == "composed" else {}
        _one(book, f"listing-{name}", why, tree(change, flat), answers, listing)


def _ignored(book: Book) -> None:
    must = "ignore what nobody runs or reads, by full paths"
    rows = [
        ("changed", {"tree/a": b"X"}, ["a"], "OK"), ("missing", {"tree/a": None}, ["a"], "OK"),
        ("below", {"tree/sub/b": b"Y"}, ["sub/b"], "OK"), ("directory", {"tree/sub/b": b"Y"}, ["sub"], "OK"),
        ("two", {"tree/a": b"X", "tree/sub/b": b"Y"}, ["sub/b", "a"], "OK"),
        ("other", {"tree/a": b"X"}, ["b"], "HASH_MISMATCH"), ("bare-name", {"tree/sub/b": b"Y"}, ["b"], "HASH_MISMATCH"),
        ("prefix", {"tree/sub/b": b"Y"}, ["su"], "HASH_MISMATCH"), ("longer", {"tree/a": b"X"}, ["a/x"], "HASH_MISMATCH"),
        ("pattern", {"tree/a": b"X"}, ["*"], "HASH_MISMATCH"), ("case", {"tree/a": b"X"}, ["A"], "HASH_MISMATCH"),
        ("one-of-two", {"tree/a": b"X", "tree/sub/b": b"Y"}, ["a"], "HASH_MISMATCH"),
    ]  # fmt: skip
    for name, change, names, code in rows:
        why = "an ignored name is not looked at" if code == "OK" else "a name is ignored only if it is that one"
        _one(
            book, f"ignored-{name}", why, tree(change), YES if code == "OK" else no(code),
            must=must if code == "OK" else None, ignore=names,
        )


def _compared(book: Book) -> None:
    base = manifest(LISTING, SECOND)
    question = {"operation": "compare-manifests", "file": "one.manifest", "other": "two.manifest"}

    def one(name: str, why: str, other: Any, answers: tuple, must: Optional[str] = None) -> None:
        written = other if isinstance(other, dict) else book.object(other, "manifest")
        files = {"one.manifest": book.object(base, "manifest"), "two.manifest": written}
        book.case(f"trees/compared-{name}", why, files, question, answers, caller_must=must)

    deep = dir_entry("deep", file_entry("c", b"z"))
    bodies = [
        ("same", LISTING, lists("OK"), "the same entries"),
        ("changed", body(file_entry("a", b"X"), LISTING[3]), lists("HASH_MISMATCH", ["a"]), "another digest"),
        ("missing", body(LISTING[3]), lists("FILE_NOT_FOUND", [], ["a"]), "an entry less"),
        ("more", body(*LISTING[2:], file_entry("z")), lists("EXTRA_FILES", [], [], ["z"]), "an entry more, whatever the setting"),
        ("changed-below", body(LISTING[2], dir_entry("sub", file_entry("b", b"Y"), deep)), lists("HASH_MISMATCH", ["sub/b"]), "another digest below"),
        ("missing-below", body(LISTING[2], dir_entry("sub", deep)), lists("HASH_MISMATCH", [], ["sub/b"]), "an entry less below"),
        ("more-below", body(LISTING[2], dir_entry("sub", *LISTING[3][3:], file_entry("z"))), lists("HASH_MISMATCH", [], [], ["sub/z"]), "an entry more below"),
        ("empty", body(), (library("FILE_NOT_FOUND"), command(1, "file-not-found")), "no entries"),
    ]  # fmt: skip
    for name, listing, answers, why in bodies:
        one(name, why, manifest(listing, SECOND), answers)
    stranger = manifest(LISTING, pairs(issue(STRANGER, STRANGER)), key=STRANGER)
    one(
        "stranger", "authority is not looked at", stranger, YES,
        "verify both manifests first: any key that anyone made passes here",
    )
    content = base[3][2]
    forged = manifest(LISTING, SECOND, signer_cert=[content, signature(STRANGER, content)])
    one("forged", "signatures are proved", forged, no("SIGNATURE"))
    at = canonical(base).index(b"1:a0:") + 2
    one("altered", "so is the content", book.changed(base, "manifest", at, 1, b"b"), no("HASH_MATCH"))
    one("cut", "half a manifest", book.cut(base, "manifest", 500), trouble("PARSE_FILE"))
    one("text", "no manifest", {"content": "hello"}, trouble("PARSE_FILE"))


def make(book: Book) -> None:
    _changes(book)
    _unlisted(book)
    _links(book)
    _listings(book)
    _ignored(book)
    _compared(book)
