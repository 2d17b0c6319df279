#!/usr/bin/env python3
"""Checks that kernel objects offer the linker nothing but their one table.

usage: scripts/check_kernels.py OBJECT...

Objects not named kernels_... are passed over. An inline function or template of a shared header
that is not inlined leaves a weak copy in every object; the linker keeps one of them for all, and
the one from a kernel may use instructions that the machine does not have.
"""

import re
import subprocess
import sys
from pathlib import Path

KERNEL = re.compile(r"^kernels_\w+\.(cpp\.)?(o|obj)$")


def visible_names(path):
    """Returns [(type letter of nm, name)] of what the object defines for others."""
    result = subprocess.run(
        ["nm", "--defined-only", "--extern-only", "--demangle", str(path)],
        capture_output=True,
        text=True,
        check=False,
    )
    if result.returncode != 0:
        raise RuntimeError(f"{path}: {result.stderr.strip()}")
    found = (re.match(r"^[0-9a-fA-F]*\s+(\S)\s+(.+)$", line) for line in result.stdout.splitlines())
    return [match.groups() for match in found if match]


def check_object(path):
    """Returns the complaints about one object."""
    names = visible_names(path)
    complaints = []
    tables = []
    for kind, name in names:
        if name.startswith("DW.ref."):  # where exception handling is found: an address, no code
            continue
        if kind in "WVuwv":
            complaints.append(f"offers a copy of {name} that others may get")
        elif kind in "TI":
            complaints.append(f"shows the function {name}")
        elif not name.startswith("__"):  # sanitizers leave marks of their own
            tables.append(name)
    if len(tables) != 1:
        complaints.append(f"should show one table, shows {tables}")
    return complaints


def main(arguments):
    objects = [path for path in map(Path, arguments) if KERNEL.match(path.name)]
    if not objects:
        print("no kernel object given")
        return 1
    complaints = 0
    for path in objects:
        for complaint in check_object(path):
            print(f"{path.name} {complaint}")
            complaints += 1
    print(f"{len(objects)} kernel objects, {complaints} complaints")
    return 1 if complaints else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
