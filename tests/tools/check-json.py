#!/usr/bin/python3
# SPDX-License-Identifier: Apache-2.0
"""check-json.py SCHEMA STATUS FILE [EXPRESSION...]: the answers for machines in a file, a line each.

Every answer must match the schema and hold no control byte; the last must agree with the exit
status, if nothing was printed after it, and every expression must be true of it: its members are
names, so that `result.members[0].verdict == "no"` and `len(notes) == 2` are expressions. Prints what
is wrong.
"""
import json
import sys
from types import SimpleNamespace

import jsonschema


def texts(value):
    if isinstance(value, dict):
        yield from value
        raw = ("commands", "foreign_words")  # words, to be run as they are
        value = [member for name, member in value.items() if name not in raw]
    if isinstance(value, list):
        for item in value:
            yield from texts(item)
    if isinstance(value, str):
        yield value


def faults(schema, status, path, expressions):
    lines = open(path, encoding="utf-8").readlines()
    answers = [line for line in lines if line.startswith('{"schema"')]
    if not answers:
        return ["no answer for machines"]
    found = []
    for line in answers:
        answer = json.loads(line)
        found += [f"{'/'.join(map(str, e.absolute_path))}: {e.message}"
                  for e in jsonschema.Draft202012Validator(schema).iter_errors(answer)]
        found += [f"a control byte: {text!r}" for text in texts(answer)
                  if any(ord(c) < 32 or ord(c) == 127 for c in text)]
    if answers[-1] == lines[-1] and answer.get("exit") != status:
        found.append(f"exit status {status}, but the answer says {answer.get('exit')}")
    names = vars(json.loads(answers[-1], object_hook=lambda members: SimpleNamespace(**members)))
    names |= {"true": True, "false": False, "null": None}
    for expression in expressions:
        try:
            if not eval(expression, names):
                found.append(f"not so: {expression}")
        except Exception as error:  # a member that is not there, above all
            found.append(f"{expression}: {error}")
    return found


if __name__ == "__main__":
    with open(sys.argv[1], encoding="utf-8") as schema_file:
        result = faults(json.load(schema_file), int(sys.argv[2]), sys.argv[3], sys.argv[4:])
    sys.exit("\n".join(result) or 0)
