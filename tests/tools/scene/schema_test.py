#!/usr/bin/env python3
"""Checks the scenes' JSON schema against the examples and against scenes that the reader refuses.

usage: schema_test.py SCHEMA EXAMPLES BAD_SCENES

Every example must be valid. Of the refused scenes each says whether the schema can tell, and the
schema must do as it says.
"""

import json
import sys
from pathlib import Path

try:
    import jsonschema
except ImportError:
    sys.exit("the Python package jsonschema is missing (Debian package python3-jsonschema)")


def main():
    schema_file, examples, bad_scenes = map(Path, sys.argv[1:])
    schema = json.loads(schema_file.read_text())
    jsonschema.Draft7Validator.check_schema(schema)
    validator = jsonschema.Draft7Validator(schema)
    failures = []

    files = sorted(examples.glob("*.json"))
    if len(files) < 12:
        failures.append(f"only {len(files)} examples in {examples}")
    for file in files:
        for error in validator.iter_errors(json.loads(file.read_text())):
            place = "/".join(map(str, error.absolute_path))
            failures.append(f"{file.name}: {place}: {error.message[:200]}")

    cases = json.loads(bad_scenes.read_text())
    if len(cases) < 50:
        failures.append(f"only {len(cases)} refused scenes")
    for case in cases:
        verdict = "accepts" if validator.is_valid(case["scene"]) else "refuses"
        if verdict != case["schema"]:
            failures.append(f"{case['what']}: the schema {verdict} it")

    for failure in failures:
        print(failure)
    print(f"{len(files)} examples, {len(cases)} refused scenes, {len(failures)} failures")
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main())
