#!/usr/bin/python3
# SPDX-License-Identifier: MIT
"""Validates JSON lines on standard input against the schema in $1: valid UTF-8, no key twice in an object. Gives how many."""
import json
import sys

import fastjsonschema


def no_key_twice(pairs):
    read = dict(pairs)
    if len(read) != len(pairs):
        sys.exit(f"a key is there twice: {[key for key, _ in pairs]}")
    return read


with open(sys.argv[1], encoding="utf-8") as file:
    validate = fastjsonschema.compile(json.load(file))
count = 0
for line in sys.stdin.buffer:
    packet = json.loads(line.decode("utf-8"), object_pairs_hook=no_key_twice)
    try:
        validate(packet)
    except fastjsonschema.JsonSchemaException as error:
        sys.exit(f"line {count + 1}: {error.message}: {line[:2000]!r}")
    count += 1
print(count, "valid")
