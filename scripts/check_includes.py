#!/usr/bin/env python3
"""Checks that includes and link lists of NativeCode point downwards only.

usage: scripts/check_includes.py [ROOT]

host -> handler -> engine -> {convolution, resources} -> base; convolution and resources do not
know each other, nothing in NativeCode knows tests, tools or third-party code. Intrinsics stay in
convolution/simd/, where a kernel source includes kernels.h, its intrinsics header and headers of
that folder whose whole code is in an unnamed namespace: an inline function of any other header,
built with wide instructions, could become the copy the linker gives to every caller.
"""

import re
import sys
from pathlib import Path

BELOW = {
    "base": set(),
    "convolution": {"base"},
    "resources": {"base"},
    "engine": {"convolution", "resources", "base"},
    "handler": {"engine", "convolution", "resources", "base"},
    "host": {"handler", "engine", "convolution", "resources", "base"},
}

STANDARD = set(
    """algorithm any array atomic barrier bit bitset cassert cctype cerrno cfenv cfloat charconv
    chrono cinttypes climits clocale cmath codecvt compare complex concepts condition_variable
    coroutine csetjmp csignal cstdarg cstddef cstdint cstdio cstdlib cstring ctime cuchar cwchar
    cwctype deque exception execution filesystem format forward_list fstream functional future
    initializer_list iomanip ios iosfwd iostream istream iterator latch limits list locale map
    memory memory_resource mutex new numbers numeric optional ostream queue random ranges ratio
    regex scoped_allocator semaphore set shared_mutex source_location span sstream stack stdexcept
    stop_token streambuf string string_view strstream syncstream system_error thread tuple
    type_traits typeindex typeinfo unordered_map unordered_set utility valarray variant vector
    version stdint.h stddef.h""".split()
)
PLATFORM = {"windows.h", "android/log.h", "intrin.h", "cpuid.h", "sys/auxv.h", "asm/hwcap.h"}
INTRINSICS = re.compile(r"^(\w*intrin\.h|arm_neon\.h|arm_acle\.h|arm_sve\.h)$")
CPU_IDENTIFICATION = {"intrin.h"}  # matches the pattern, carries __cpuid on Windows
INTRINSICS_OUTSIDE_SIMD = {"base/flush_denormals.h"}  # the floating-point mode register

INCLUDE = re.compile(r'^\s*#\s*(?:include|import)\s*(?:<([^>]+)>|"([^"]+)"|(\S+))')
MODULE = re.compile(r"\btessaly_(\w+)\b")
SOURCES = {".h", ".cpp"}

KERNEL_FOLDER = "convolution/simd"
NO_KERNEL = {"dispatch.cpp", "kernels.h", "signal_kernels.h"}  # plain code or declarations
# What a text is made of as far as namespaces go; strings hold no braces in such headers.
TOKEN = re.compile(r"namespace(?:\s+\w+(?:::\w+)*)?\s*\{|\{|\}|[^\s{}]+")


def is_kernel(path):
    """Sources compiled with wide instructions, and the headers made for them."""
    return path.parent.as_posix() == KERNEL_FOLDER and path.name not in NO_KERNEL


def code_outside_unnamed_namespace(text):
    """Returns the first piece of code that stands in no unnamed namespace, or None."""
    text = re.sub(r"/\*.*?\*/|//[^\n]*", " ", text, flags=re.DOTALL)
    text = re.sub(r"^\s*#(?:[^\n]*\\\n)*[^\n]*$", " ", text, flags=re.MULTILINE)
    open_scopes = []
    for token in TOKEN.findall(text):
        if token.startswith("namespace") and token.endswith("{"):
            open_scopes.append("unnamed" if token[9:-1].strip() == "" else "named")
        elif token == "}":
            if not open_scopes:
                return token
            open_scopes.pop()
        elif "unnamed" not in open_scopes:
            return token
        elif token == "{":
            open_scopes.append("block")
    return None


def check_source(native, path):
    """Yields (line number, complaint) for one file, path relative to NativeCode."""
    folder = path.parts[0]
    simd = path.parent.as_posix() == KERNEL_FOLDER
    kernel = is_kernel(path)
    text = (native / path).read_text(encoding="utf-8")
    if kernel and path.suffix == ".h":
        outside = code_outside_unnamed_namespace(text)
        if outside is not None:
            yield 1, f"a kernel header keeps all in an unnamed namespace, not so: {outside}"
    for number, line in enumerate(text.splitlines(), 1):
        match = INCLUDE.match(line)
        if not match:
            continue
        system, local, computed = match.groups()
        if computed is not None:
            yield number, f"{computed}: an include must name its file"
        elif system is not None:
            intrinsics = INTRINSICS.match(system) and system not in CPU_IDENTIFICATION
            if intrinsics:
                if not simd and path.as_posix() not in INTRINSICS_OUTSIDE_SIMD:
                    yield number, f"<{system}>: intrinsics belong in convolution/simd/"
            elif system not in STANDARD and system not in PLATFORM:
                yield number, f"<{system}>: neither standard library nor known platform header"
            elif kernel:
                yield number, f"<{system}>: a kernel includes kernels.h and intrinsics only"
        else:
            target = Path(local)
            if ".." in target.parts or target.is_absolute() or len(target.parts) < 2:
                yield number, f'"{local}": write includes from NativeCode, "{folder}/..."'
            elif target.parts[0] not in BELOW:
                yield number, f'"{local}": not a folder of NativeCode'
            elif not (native / target).is_file():
                yield number, f'"{local}": no such file'
            elif target.parts[0] != folder and target.parts[0] not in BELOW[folder]:
                yield number, f'"{local}": {folder} must not know {target.parts[0]}'
            elif kernel and target.parent.as_posix() != KERNEL_FOLDER:
                yield number, f'"{local}": a kernel includes kernels.h and intrinsics only'


def check_links(native, path):
    """Yields complaints for the link list of one folder's CMakeLists.txt."""
    folder = path.parts[0]
    text = (native / path).read_text(encoding="utf-8")
    for number, line in enumerate(text.splitlines(), 1):
        for name in MODULE.findall(line.split("#", 1)[0]):
            if name in BELOW and name != folder and name not in BELOW[folder]:
                yield number, f"tessaly_{name}: {folder} must not link {name}"


def check_tree(root):
    """Returns (number of files seen, list of complaints)."""
    native = root / "NativeCode"
    seen = 0
    complaints = []
    for file in sorted(native.rglob("*")):
        path = file.relative_to(native)
        if not file.is_file():
            continue
        if len(path.parts) == 1:
            if file.suffix in SOURCES:
                complaints.append(f"NativeCode/{path}: sources belong in a folder")
            continue
        if path.parts[0] not in BELOW:
            complaints.append(f"NativeCode/{path}: unknown folder {path.parts[0]}")
            continue
        if file.suffix in SOURCES:
            found = check_source(native, path)
        elif file.name == "CMakeLists.txt":
            found = check_links(native, path)
        else:
            continue
        seen += 1
        complaints += [f"NativeCode/{path}:{number}: {text}" for number, text in found]
    return seen, complaints


def main(arguments):
    if len(arguments) > 1 or (arguments and arguments[0].startswith("-")):
        print(__doc__, file=sys.stderr)
        return 2
    root = Path(arguments[0]) if arguments else Path(__file__).resolve().parent.parent
    seen, complaints = check_tree(root)
    for complaint in complaints:
        print(complaint)
    if seen == 0:
        print(f"{root}: no source found in NativeCode")
        return 1
    print(f"{seen} files, {len(complaints)} complaints")
    return 1 if complaints else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
