"""Feeds the include check trees that are good or wrong in one place."""

import subprocess
import sys
import tempfile
import unittest
from pathlib import Path

SCRIPT = Path(__file__).resolve().parents[2] / "scripts" / "check_includes.py"

GOOD = {
    "base/log.h": "#include <string>\n",
    "base/flush_denormals.h": "#include <xmmintrin.h>\n",
    "convolution/conv.h": '#include "base/log.h"\n',
    "convolution/simd/kernels.h": "#include <cstddef>\n",
    "convolution/simd/kernels_avx2.cpp": '#include "convolution/simd/kernels.h"\n'
    "#include <immintrin.h>\n",
    "convolution/simd/lanes.h": '// x\n#pragma once\n#include "convolution/simd/kernels.h"\n'
    "#define ONE \\\n 1\nnamespace tessaly {\nnamespace {\nstruct A { int f() { return ONE; } };\n"
    "}  // namespace\n}  // namespace tessaly\n",
    "convolution/simd/kernels_sse2.cpp": '#include "convolution/simd/lanes.h"\n',
    "convolution/simd/dispatch.cpp": '#include "convolution/simd/kernels.h"\n#include <atomic>\n',
    "resources/wav.h": '#include "base/log.h"\n',
    "engine/engine.h": '#include "convolution/conv.h"\n#include "resources/wav.h"\n',
    "handler/handler.h": '#include "engine/engine.h"\n#include "base/log.h"\n',
    "host/host.cpp": '#include "handler/handler.h"\n#include "engine/engine.h"\n',
    "engine/CMakeLists.txt": "tessaly_module(engine LINKS tessaly_convolution tessaly_base)\n",
    "CMakeLists.txt": "add_subdirectory(base)\n",
}


class CheckIncludes(unittest.TestCase):
    def run_on(self, changes):
        """Runs the check on the good tree with some files replaced or added."""
        with tempfile.TemporaryDirectory() as folder:
            for name, text in {**GOOD, **changes}.items():
                file = Path(folder) / "NativeCode" / name
                file.parent.mkdir(parents=True, exist_ok=True)
                file.write_text(text, encoding="utf-8")
            return subprocess.run(
                [sys.executable, str(SCRIPT), folder], capture_output=True, text=True, check=False
            )

    def assert_complaint(self, name, text, complaint):
        result = self.run_on({name: text})
        self.assertEqual(result.returncode, 1, result.stdout)
        self.assertIn(complaint, result.stdout)
        self.assertIn(f"NativeCode/{name}", result.stdout)
        self.assertIn(" 1 complaints", result.stdout)

    def test_accepts_includes_that_point_downwards(self):
        result = self.run_on({})
        self.assertEqual(result.returncode, 0, result.stdout + result.stderr)

    def test_refuses_an_empty_tree(self):
        with tempfile.TemporaryDirectory() as folder:
            result = subprocess.run(
                [sys.executable, str(SCRIPT), folder], capture_output=True, text=True, check=False
            )
        self.assertEqual(result.returncode, 1)

    def test_refuses_every_upward_or_sideways_include(self):
        order = ["base", "resources", "convolution", "engine", "handler", "host"]
        header = {
            "base": "base/log.h",
            "convolution": "convolution/conv.h",
            "resources": "resources/wav.h",
            "engine": "engine/engine.h",
            "handler": "handler/handler.h",
            "host": "host/host.h",
        }
        wrong = [(a, b) for i, a in enumerate(order) for b in order[i + 1 :]]
        wrong.append(("convolution", "resources"))
        for lower, upper in wrong:
            with self.subTest(lower=lower, upper=upper):
                changes = {f"{lower}/bad.cpp": f'#include "{header[upper]}"\n', "host/host.h": ""}
                result = self.run_on(changes)
                self.assertEqual(result.returncode, 1)
                self.assertIn(f"{lower} must not know {upper}", result.stdout)

    def test_names_file_and_line(self):
        result = self.run_on({"base/bad.h": '\n\n#include "host/host.cpp"\n'})
        self.assertIn("NativeCode/base/bad.h:3:", result.stdout)

    def test_refuses_tests_tools_and_third_party_code(self):
        for include, complaint in [
            ('"tests/support/signals.h"', "not a folder of NativeCode"),
            ('"tools/minihost/host.h"', "not a folder of NativeCode"),
            ("<gtest/gtest.h>", "neither standard library"),
            ("<fftw3.h>", "neither standard library"),
            ('"../tests/support/signals.h"', "write includes from NativeCode"),
            ('"log.h"', "write includes from NativeCode"),
            ('"base/missing.h"', "no such file"),
            ("SOME_MACRO", "must name its file"),
        ]:
            with self.subTest(include=include):
                self.assert_complaint("engine/bad.h", f"  #  include {include}\n", complaint)

    def test_refuses_intrinsics_outside_their_folder(self):
        for header in ["immintrin.h", "xmmintrin.h", "arm_neon.h"]:
            with self.subTest(header=header):
                self.assert_complaint(
                    "convolution/bad.cpp", f"#include <{header}>\n", "intrinsics belong in"
                )

    def test_refuses_shared_headers_in_a_kernel_source(self):
        for include in ["<cmath>", '"base/log.h"', '"convolution/conv.h"']:
            with self.subTest(include=include):
                self.assert_complaint(
                    "convolution/simd/kernels_sse2.cpp", f"#include {include}\n", "a kernel includes"
                )

    def test_refuses_kernel_headers_with_code_for_everyone(self):
        for text in [
            "namespace tessaly {\ninline int f() { return 1; }\n}\n",
            "namespace tessaly {\nnamespace {\nint g() { return 1; }\n}\ntemplate <class T> T h();\n}\n",
            "namespace tessaly {\nnamespace detail {\nstruct B {};\n}\n}\n",
            "inline int k() { return 1; }\nnamespace {\n}\n",
        ]:
            with self.subTest(text=text):
                self.assert_complaint("convolution/simd/lanes.h", text, "in an unnamed namespace")

    def test_refuses_a_link_list_that_points_upwards(self):
        self.assert_complaint(
            "base/CMakeLists.txt",
            "tessaly_module(base LINKS tessaly_engine)\n",
            "base must not link engine",
        )

    def test_refuses_an_unknown_folder(self):
        self.assert_complaint("extra/new.cpp", "", "unknown folder extra")


if __name__ == "__main__":
    unittest.main()
