#!/usr/bin/python3
# SPDX-License-Identifier: Apache-2.0
"""check-report.py PAGE ANSWER: the page that --report wrote beside an answer for machines.

The page must be well-formed, load nothing, hold no element and no attribute but those that the
command writes, tell every text and every number of the answer, and have for every entry and
certificate a step with its tag, period and k-of-n. Prints what is wrong.
"""
import json
import re
import shlex
import sys
import xml.etree.ElementTree as ElementTree

ELEMENTS = set("""html head meta title style body main header section figure h1 h2 h3 dl dt dd ol li p pre code
                  strong table thead tbody tr th td svg desc g rect line text""".split())
ATTRIBUTES = set("""lang charset http-equiv content name class scope id role aria-labelledby viewBox width height
                    x y x1 y1 x2 y2 rx""".split())
POLICY = "default-src 'none'; style-src 'unsafe-inline'; base-uri 'none'; form-action 'none'"


def leaves(value):
    if isinstance(value, dict):
        for item in value.values():
            yield from leaves(item)
    elif isinstance(value, list):
        for item in value:
            yield from leaves(item)
    elif value is not None and not isinstance(value, bool):
        yield shown(str(value))


def shown(text):
    """As the page shows it: what XML does not know, or turns lines unseen, in hexadecimal."""
    return re.sub("[\u061c\ufdd0-\ufdef\ufffe\uffff]",
                  lambda m: "".join(f"\\x{byte:02x}" for byte in m[0].encode()), text)


def word(value):
    return bytes.fromhex(value["hex"]) if isinstance(value, dict) else value.encode()


def read_back(line):
    """The words of a command line as a shell reads them; $'...' is beyond shlex."""
    line = re.sub(r"\$'((?:[^'\\]|\\.)*)'", lambda m: shlex.quote(
        m[1].encode().decode("unicode_escape").encode("latin-1").decode("utf-8", "surrogateescape")), line)
    return [part.encode("utf-8", "surrogateescape") for part in shlex.split(line)]


def grants(result):
    """Each entry and certificate of the answer, with the name of its step."""
    for grant in result.get("acl") or []:
        yield "ACL entry " + grant["entry"], grant
    for grant in result.get("chain") or []:
        yield f"certificate {grant['certificate']}", grant
    for signer in (result.get("may_sign") or []) + (result.get("groups") or []):
        for way in signer["ways"]:
            for place, grant in zip(way["path"], way["steps"], strict=True):
                yield ("ACL entry " if "entry" in grant else "certificate ") + place, grant


def step_facts(grant):
    yield "; tag: " + (grant["tag"] or "no limit") + ";"
    first, last = grant["not_before"], grant["not_after"]
    if first is None and last is None:
        yield "; period: always;"
    yield from (moment for moment in (first, last) if moment is not None)
    if grant["threshold"] is not None:
        yield "; {k} of {n} keys must agree;".format(**grant["threshold"])


def faults(page, answer):
    if not page.isascii():
        yield "not ASCII"
    root = ElementTree.fromstring(page)
    for element in root.iter():
        name = element.tag.rpartition("}")[2]
        if name not in ELEMENTS:
            yield f"an element {name}"
        yield from (f"an attribute {a} of {name}" for a in element.attrib if a not in ATTRIBUTES)
    metas = [m.attrib for m in root.iter() if m.tag.endswith("meta")]
    if {"http-equiv": "Content-Security-Policy", "content": POLICY} not in metas:
        yield "no policy"
    if re.search(r"url\(|@import", page):
        yield "something is loaded"
    verdict, message = answer.pop("verdict"), answer.pop("message")
    if shown(f"{verdict}: {message}") not in ["".join(e.itertext()).strip() for e in root.iter() if e.tag.endswith("h1")]:
        yield "no verdict"
    texts = {"".join(element.itertext()).strip() for element in root.iter()}
    result = answer["result"]
    remedies = result.pop("remedies", None) or []
    if answer["notes"] and answer["notes"][-1].startswith("wrote "):
        answer["notes"].pop()
        result.pop("written", None)
    for text in leaves(answer):
        if text.strip() not in texts:
            yield f"not told: {text}"
    steps = ["".join(element.itertext()) for element in root.iter() if element.tag.endswith("li")]
    for name, grant in grants(result):
        if not any(step.startswith(shown(name) + ": ") and all(shown(fact) in step for fact in step_facts(grant))
                   for step in steps):
            yield f"no step with tag and period: {name}"
    lines = [read_back("".join(e.itertext())) for e in root.iter() if e.tag.endswith("code")]
    for remedy in remedies:
        if shown(remedy["text"]) not in texts:
            yield f"no remedy: {remedy['text']}"
        for command in remedy["commands"]:
            if [word(w) for w in command] not in lines:
                yield f"no command: {command}"


if __name__ == "__main__":
    with open(sys.argv[1], encoding="utf-8") as page_file, open(sys.argv[2], encoding="utf-8") as answer_file:
        result = list(faults(page_file.read(), json.load(answer_file)))
    sys.exit("\n".join(result) or 0)
