"""Feeds the library check small libraries that are good or wrong in one place.

The compiler's command is taken from the environment variable CXX (g++ without it).
"""

import os
import subprocess
import sys
import tempfile
import unittest
from pathlib import Path

SCRIPT = Path(__file__).resolve().parents[2] / "scripts" / "check_library.py"

SOURCE = """
#include <math.h>
#include <new>
#define SHOWN extern "C" __attribute__((visibility("default")))
SHOWN void* One(double x) { return ::operator new(static_cast<unsigned>(sin(x))); }
SHOWN int Two(int x) { return x + 1; }
"""
LINK = (
    "-shared -fPIC -fvisibility=hidden -static-libstdc++ -static-libgcc "
    "-Wl,--gc-sections -Wl,-z,max-page-size=16384 -Wl,-z,noexecstack "
    "-Wl,-z,nodynamic-undefined-weak -Wl,--version-script={map}"
).split()


class CheckLibrary(unittest.TestCase):
    def setUp(self):
        temporary = tempfile.TemporaryDirectory()
        self.addCleanup(temporary.cleanup)
        self.folder = Path(temporary.name)
        self.exports = self.folder / "exports.txt"
        self.exports.write_text("# names\nOne\nTwo\n", encoding="utf-8")

    def build(self, source=SOURCE, extra=(), without=(), visible="One; Two;"):
        script = self.folder / "exports.map"
        script.write_text("{ global: " + visible + " local: *; };", encoding="utf-8")
        code = self.folder / "library.cpp"
        code.write_text(source, encoding="utf-8")
        library = self.folder / "library.so"
        options = [option.format(map=script) for option in LINK if option not in without]
        subprocess.run(
            [os.environ.get("CXX", "g++"), "-O1", str(code), "-o", str(library), *options, *extra],
            check=True,
        )
        return library

    def check(self, library, *options):
        return subprocess.run(
            [sys.executable, str(SCRIPT), *options, str(self.exports), str(library)],
            capture_output=True,
            text=True,
            check=False,
        )

    def assert_complaint(self, library, complaint):
        result = self.check(library)
        self.assertEqual(result.returncode, 1, result.stdout + result.stderr)
        self.assertIn(complaint, result.stdout)

    def test_accepts_a_library_built_as_the_plug_in_is(self):
        result = self.check(self.build())
        self.assertEqual(result.returncode, 0, result.stdout + result.stderr)

    def test_complains_of_a_name_too_many(self):
        source = SOURCE + "SHOWN int Three() { return 3; }\n"
        self.assert_complaint(self.build(source, visible="One; Two; Three;"), "shows Three")

    def test_complains_of_a_missing_name(self):
        self.assert_complaint(self.build(visible="One;"), "does not show Two")

    def test_complains_of_a_hidden_name_on_the_list(self):
        hidden = SOURCE.replace("SHOWN int Two", 'extern "C" int Two')
        self.assert_complaint(self.build(hidden), "does not show Two")

    def test_complains_of_versioned_names(self):
        library = self.folder / "library.so"
        self.build(visible="One; Two;")
        script = self.folder / "versioned.map"
        script.write_text("V_1 { global: One; Two; local: *; };", encoding="utf-8")
        options = [option.format(map=script) for option in LINK]
        code = self.folder / "library.cpp"
        subprocess.run(
            [os.environ.get("CXX", "g++"), str(code), "-o", str(library), *options], check=True
        )
        self.assert_complaint(library, "shows One@@V_1")

    def test_complains_of_the_shared_cpp_runtime(self):
        library = self.build(without=["-static-libstdc++"])
        self.assert_complaint(library, "needs the library libstdc++.so.6")
        self.assert_complaint(library, "not from the C library")
        self.assertEqual(self.check(library, "--sanitized").returncode, 0)

    def test_complains_of_an_undefined_name(self):
        source = 'extern "C" int Elsewhere();\n' + SOURCE.replace("x + 1", "x + Elsewhere()")
        self.assert_complaint(self.build(source), "needs Elsewhere from anywhere")

    def test_complains_of_weak_names_left_by_the_runtime(self):
        source = 'extern "C" __attribute__((weak)) int Hook();\n' + SOURCE.replace(
            "x + 1", "(Hook ? Hook() : x)"
        )
        library = self.build(source, without=["-Wl,-z,nodynamic-undefined-weak"])
        self.assert_complaint(library, "needs Hook from anywhere")

    def test_complains_of_small_segment_alignment(self):
        library = self.build(
            extra=["-Wl,-z,max-page-size=4096"], without=["-Wl,-z,max-page-size=16384"]
        )
        self.assert_complaint(library, "aligned to 4096 bytes")

    def test_complains_of_an_executable_stack(self):
        library = self.build(extra=["-Wl,-z,execstack"], without=["-Wl,-z,noexecstack"])
        self.assert_complaint(library, "executable stack")

    def test_complains_of_a_run_path(self):
        self.assert_complaint(self.build(extra=["-Wl,-rpath,/somewhere"]), "run path")

    def test_complains_of_a_versioned_file_name(self):
        library = self.build(extra=["-Wl,-soname,library.so.1"])
        self.assert_complaint(library, "versioned name")

    def test_complains_of_text_relocations(self):
        source = SOURCE + 'asm(".text\\n.globl h\\nh: .quad h\\n");\n'
        self.assert_complaint(self.build(source, extra=["-Wl,-z,notext"]), "text relocations")

    def test_refuses_what_is_no_library(self):
        self.assertEqual(self.check(self.exports).returncode, 1)
        self.assertEqual(self.check(self.folder / "absent.so").returncode, 1)

    def test_refuses_an_empty_list(self):
        library = self.build()
        self.exports.write_text("# nothing\n", encoding="utf-8")
        self.assertEqual(self.check(library).returncode, 1)


if __name__ == "__main__":
    unittest.main()
