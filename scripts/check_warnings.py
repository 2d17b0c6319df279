#!/usr/bin/env python3
"""Compiles every source of a configured build for its warnings only, nothing is generated.

usage: check_warnings.py BUILD_DIRECTORY [JOBS]
Reads compile_commands.json there and runs each command with -fsyntax-only in place of its
output. Prints what the compiler says of the sources that fail, and exits with 1 if one does.
"""

import concurrent.futures
import json
import os
import pathlib
import shlex
import subprocess
import sys


def syntax_only(command):
    """The words of a compile command without output and dependency files."""
    words = shlex.split(command)
    if words and os.path.basename(words[0]) == "ccache":
        words = words[1:]
    kept = []
    skip = False
    for word in words:
        if skip:
            skip = False
        elif word in ("-o", "-MF", "-MT", "-MQ"):
            skip = True
        elif word not in ("-c", "-MD", "-MMD"):
            kept.append(word)
    return kept + ["-fsyntax-only"]


def check(entry):
    done = subprocess.run(
        syntax_only(entry["command"]),
        cwd=entry["directory"],
        stdout=subprocess.PIPE,
        stderr=subprocess.STDOUT,
        text=True,
        check=False,
    )
    return entry["file"], done.returncode, done.stdout


def main():
    if len(sys.argv) not in (2, 3):
        print(__doc__, file=sys.stderr)
        return 2
    listing = pathlib.Path(sys.argv[1]) / "compile_commands.json"
    try:
        entries = json.loads(listing.read_text(encoding="utf-8"))
    except (OSError, ValueError) as problem:
        print(f"cannot read {listing}: {problem}", file=sys.stderr)
        return 2
    if not entries:
        print(f"{listing} names no source", file=sys.stderr)
        return 2
    jobs = int(sys.argv[2]) if len(sys.argv) == 3 else os.cpu_count() or 1
    failed = 0
    with concurrent.futures.ThreadPoolExecutor(jobs) as pool:
        for file, code, text in pool.map(check, entries):
            if code != 0:
                failed += 1
                print(f"-- {file}\n{text}", end="")
    print(f"{len(entries)} sources, {failed} with warnings or errors")
    return 1 if failed else 0


if __name__ == "__main__":
    sys.exit(main())
