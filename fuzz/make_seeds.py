#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Writes the first inputs of the fuzz targets that read files, from what the command makes:

    fuzz/make_seeds.py build/release/bin/vesk2

Long numbers are shortened, as every byte of them costs tries. `scripts/fuzz --minimise` then keeps what
the targets have use for, beside what they found by themselves.
"""
import os
import pathlib
import subprocess
import sys
import tempfile

CORPUS = pathlib.Path(__file__).resolve().parent / "corpus"
LONGEST = 40

COMMANDS = """
key new vendor signer
acl grant --subject vendor.pub --tag (install) --propagate --not-before 2020 --not-after 2040 --comment text --name one
acl grant --subject vendor.pub --tag (*) --name two
acl grant --threshold 1 --subject vendor.pub --subject signer.pub --tag (install) --propagate --name three
cert issue --key vendor.pem --subject signer.pub --tag (install (app calc)) --propagate --not-before 2020 --not-after 2040 --comment text --owner me --revocation calc (revoke all) -o full.cert
cert issue --key vendor.pem --subject signer.pub --tag (install) -o plain.cert
cert issue --key signer.pem --subject vendor.pub --tag (install (* set a b)) --chain plain.cert -o long.cert
cert request --key signer.pem --tag (install) --comment text --owner me -o signer.req
crl issue --key vendor.pem --tag calc (revoke all) --revoke-key signer.pub --revoke-cert plain.cert --not-after 2040 -o one.crl
crl issue --key vendor.pem --tag calc (revoke all) --not-after 2040 --hash sha1 -o two.crl
manifest sign tree --key signer.pem --cert full.cert --tag (install (app calc)) --crl one.crl -o one.manifest
manifest sign tree --key signer.pem --cert plain.cert -o two.manifest
"""
# Arguments that hold blanks.
WORDS = ["(install (app calc))", "(install (* set a b))", "calc (revoke all)"]


def arguments(line):
    for number, words in enumerate(WORDS):
        line = line.replace(words, f"\0{number}")
    return [WORDS[int(word[1:])] if word.startswith("\0") else word for word in line.split()]


def make(command, directory):
    tree = directory / "tree"
    (tree / "sub").mkdir(parents=True)
    (tree / "a").write_text("a")
    (tree / "sub" / "b").write_text("b")
    for line in COMMANDS.strip().splitlines():
        subprocess.run([command, *arguments(line), "--home", "home", "--global", "global", "-q"], cwd=directory, check=True, stdout=subprocess.DEVNULL)


def parse(text, at=0):
    """The expression at a place of a canonical text, and the place behind it: bytes or a list."""
    if text[at:at + 1] == b"(":
        items, at = [], at + 1
        while text[at:at + 1] != b")":
            item, at = parse(text, at)
            items.append(item)
        return items, at + 1
    hint = b""
    if text[at:at + 1] == b"[":
        hint = text[at:text.index(b"]", at) + 1]
        at += len(hint)
    colon = text.index(b":", at)
    end = colon + 1 + int(text[at:colon])
    return (hint, text[colon + 1:end]), end


def write(item):
    if isinstance(item, list):
        return b"(" + b"".join(map(write, item)) + b")"
    hint, data = item
    if len(data) > LONGEST:
        data = data[:15] + b"\x01"
    return hint + str(len(data)).encode() + b":" + data


def lists_headed(item, head):
    if isinstance(item, list):
        if item and item[0] == (b"", head):
            yield item
        for inner in item:
            yield from lists_headed(inner, head)


# The lists that each target reads.
HEADS = {"key": [b"public-key", b"hash", b"k-of-n"], "signature": [b"signature"], "cert": [b"cert"], "acl_entry": [b"entry"],
         "sequence": [b"sequence"], "crl": [b"crl", b"sequence"], "body": [b"body"], "manifest": [b"manifest"],
         "canonical": [b"tag", b"item", b"valid"], "memory": [b"tag", b"entry"], "engine": [b"entry", b"tag", b"cert"]}


def main():
    command = pathlib.Path(sys.argv[1]).resolve()
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name)
        make(command, directory)
        for path in sorted(directory.rglob("*")):
            if not path.is_file() or not path.read_bytes().startswith(b"("):
                continue
            whole, _ = parse(path.read_bytes())
            for target, heads in HEADS.items():
                for head in heads:
                    for number, item in enumerate(lists_headed(whole, head)):
                        (CORPUS / target).mkdir(parents=True, exist_ok=True)
                        (CORPUS / target / f"{path.name}-{head.decode()}-{number}").write_bytes(write(item))


if __name__ == "__main__":
    os.environ.pop("VESK2_HOME", None)
    os.environ.pop("VESK2_GLOBAL", None)
    main()
