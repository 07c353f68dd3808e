#!/usr/bin/env python3
"""Checks a run result document (lsc --json) with a JSON parser and the schema.

Usage: check_result.py FILE [PATH=VALUE | ?PATH | !PATH]...

The file must be one JSON document (strict: no NaN, no duplicate keys) that
validates against docs/result.schema.json. Each PATH=VALUE compares the value
at a path of steps joined by "/" (list items by number: outputs/0/option) with
VALUE read as JSON (text that is not JSON is taken as a string); ?PATH only
asks for the path to exist, !PATH for it to be absent.
Prints "check_result: OK" or every problem found, and exits 0 or 1.
"""

import json
import os
import sys

import jsonschema

SCHEMA = os.path.join(os.path.dirname(__file__), "..", "..", "docs", "result.schema.json")


def refuse_constant(name):
    raise ValueError("not JSON: " + name)


def no_duplicates(pairs):
    keys = [key for key, _ in pairs]
    if len(keys) != len(set(keys)):
        raise ValueError("duplicate key")
    return dict(pairs)


def lookup(document, path):
    node = document
    for step in path.split("/"):
        if isinstance(node, list) and step.isdigit() and int(step) < len(node):
            node = node[int(step)]
        elif isinstance(node, dict) and step in node:
            node = node[step]
        else:
            raise KeyError(path)
    return node


def main(argv):
    problems = []
    with open(argv[1], encoding="utf-8") as stream:
        document = json.load(stream, parse_constant=refuse_constant,
                             object_pairs_hook=no_duplicates)
    with open(SCHEMA, encoding="utf-8") as stream:
        schema = json.load(stream)
    validator = jsonschema.Draft202012Validator(schema)
    for error in validator.iter_errors(document):
        problems.append("schema: %s at %s" % (error.message, "/".join(map(str, error.path))))
    for expectation in argv[2:]:
        try:
            if expectation.startswith("!"):
                lookup(document, expectation[1:])
                problems.append("present: " + expectation[1:])
            elif expectation.startswith("?"):
                lookup(document, expectation[1:])
            else:
                path, _, text = expectation.partition("=")
                try:
                    expected = json.loads(text)
                except ValueError:
                    expected = text
                actual = lookup(document, path)
                if actual != expected:
                    problems.append("%s: %r, expected %r" % (path, actual, expected))
        except KeyError:
            if not expectation.startswith("!"):
                problems.append("missing: " + expectation)
    for problem in problems:
        print(problem)
    print("check_result: " + ("OK" if not problems else "%d problem(s)" % len(problems)))
    return 1 if problems else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv))
