#!/usr/bin/env python3
"""Checks that a built Linux plug-in library loads into any player.

usage: scripts/check_library.py [--sanitized] EXPORTS LIBRARY

EXPORTS lists the names to be seen, one a line, # begins a comment. Checked are: the names the
library shows are exactly these, it needs the C library alone, its segments fit 16 KB pages, and
it has no text relocations, executable stack, run path or versioned file name. With --sanitized,
for a build whose runtime libraries come with the sanitizer, what the library needs is not checked.
"""

import re
import subprocess
import sys
from pathlib import Path

C_LIBRARY = re.compile(r"^(libc|libm|libpthread|libdl|librt|ld-linux[-\w]*)\.so\.\d+$")
C_LIBRARY_VERSION = re.compile(r"^GLIBC_(\d+(\.\d+)*|ABI_DT_RELR)$")
# Weak hooks of the compiler's start-up code that are simply absent in most processes.
WEAK_HOOKS = {"__gmon_start__", "_ITM_deregisterTMCloneTable", "_ITM_registerTMCloneTable"}
PAGE = 16384


def readelf(library, *options):
    result = subprocess.run(
        ["readelf", "--wide", *options, str(library)], capture_output=True, text=True, check=False
    )
    # readelf reports a file of another kind on the error stream, with exit code 0 or 1.
    if result.returncode != 0 or "Error" in result.stderr:
        raise RuntimeError(f"{library}: {result.stderr.strip()}")
    return result.stdout


def dynamic_symbols(library):
    """Returns (names defined, [(name, version, binding)] undefined) of the dynamic symbols."""
    defined, undefined = set(), []
    for line in readelf(library, "--dyn-syms").splitlines():
        # Num: Value Size Type Bind Vis Ndx Name[@[@]Version [(number)]]
        fields = line.split()
        if len(fields) < 8 or not re.fullmatch(r"\d+:", fields[0]):
            continue
        binding, section, name = fields[4], fields[6], fields[7]
        if binding == "LOCAL":
            continue
        if section == "UND":
            plain, _, version = name.partition("@")
            undefined.append((plain, version.lstrip("@"), binding))
        else:
            defined.add(name)
    return defined, undefined


def check_exports(library, expected, sanitized):
    defined, undefined = dynamic_symbols(library)
    for name in sorted(expected - defined):
        yield f"does not show {name}"
    for name in sorted(defined - expected):
        yield f"shows {name}, which is not on the list"
    if sanitized:
        return
    for name, version, binding in undefined:
        if binding == "WEAK" and name in WEAK_HOOKS:
            continue
        if not C_LIBRARY_VERSION.match(version):
            yield f"needs {name} from {version or 'anywhere'}, not from the C library"


def check_dynamic_section(library, sanitized):
    for line in readelf(library, "--dynamic").splitlines():
        match = re.search(r"\((\w+)\)\s*(.*)$", line)
        if not match:
            continue
        tag, value = match.groups()
        if tag == "NEEDED" and not sanitized:
            name = value.partition("[")[2].rstrip("]")
            if not C_LIBRARY.match(name):
                yield f"needs the library {name}"
        elif tag in ("RPATH", "RUNPATH"):
            yield f"carries a run path {value}"
        elif tag == "SONAME" and not value.endswith(".so]"):
            yield f"has a versioned name {value}"
        elif tag == "TEXTREL" or (tag == "FLAGS" and "TEXTREL" in value):
            yield "has text relocations"


def check_segments(library):
    loads, stack_seen = 0, False
    for line in readelf(library, "--program-headers").splitlines():
        fields = line.split()
        if not fields:
            continue
        if fields[0] == "LOAD":
            loads += 1
            alignment = int(fields[-1], 16)
            if alignment < PAGE or alignment % PAGE != 0:
                yield f"has a segment aligned to {alignment} bytes, not to {PAGE}"
        elif fields[0] == "GNU_STACK":
            stack_seen = True
            if "E" in "".join(fields[6:-1]):
                yield "asks for an executable stack"
    if loads == 0:
        yield "has no segments to load"
    if not stack_seen:
        yield "does not say that its stack is not executable"


def newest_version_needed(library):
    """The oldest C library that has all the names needed, as a text; empty if none is needed."""
    versions = [
        tuple(int(number) for number in match.group(1).split("."))
        for _, version, _ in dynamic_symbols(library)[1]
        if (match := C_LIBRARY_VERSION.match(version)) and match.group(1)[0].isdigit()
    ]
    return ".".join(str(number) for number in max(versions)) if versions else ""


def read_list(path):
    names = set()
    for line in path.read_text(encoding="utf-8").splitlines():
        name = line.split("#", 1)[0].strip()
        if name:
            names.add(name)
    return names


def check_library(library, expected, sanitized=False):
    """Returns the list of complaints; empty if the library is as it must be."""
    return [
        *check_exports(library, expected, sanitized),
        *check_dynamic_section(library, sanitized),
        *check_segments(library),
    ]


def main(arguments):
    sanitized = "--sanitized" in arguments
    arguments = [argument for argument in arguments if argument != "--sanitized"]
    if len(arguments) != 2:
        print(__doc__, file=sys.stderr)
        return 2
    exports, library = (Path(argument) for argument in arguments)
    expected = read_list(exports)
    if not expected:
        print(f"{exports}: no name in the list")
        return 1
    try:
        complaints = check_library(library, expected, sanitized)
    except RuntimeError as error:
        print(error)
        return 1
    for complaint in complaints:
        print(f"{library.name} {complaint}")
    version = newest_version_needed(library)
    print(f"oldest C library it loads with: {version or 'any'}")
    print(f"{len(expected)} names expected, {len(complaints)} complaints")
    return 1 if complaints else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
