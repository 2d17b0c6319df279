"""Feeds the kernel object check small objects that are good or wrong in one place."""

import os
import subprocess
import sys
import tempfile
import unittest
from pathlib import Path

SCRIPT = Path(__file__).resolve().parents[2] / "scripts" / "check_kernels.py"
GOOD = """
struct Table { void (*add)(float*, int); };
namespace {
template <class T> [[gnu::noinline]] void add(T* x, int n) { for (int i = 0; i < n; ++i) x[i] += 1; }
}
extern const Table table;
const Table table = {add<float>};
"""


class CheckKernels(unittest.TestCase):
    def check(self, source, name="kernels_wide"):
        with tempfile.TemporaryDirectory() as folder:
            code, product = Path(folder) / f"{name}.cpp", Path(folder) / f"{name}.cpp.o"
            code.write_text(source, encoding="utf-8")
            compiler = os.environ.get("CXX", "g++")
            subprocess.run([compiler, "-O1", "-c", str(code), "-o", str(product)], check=True)
            return subprocess.run(
                [sys.executable, str(SCRIPT), str(product)],
                capture_output=True,
                text=True,
                check=False,
            )

    def test_accepts_a_kernel_that_shows_its_table_alone(self):
        result = self.check(GOOD)
        self.assertEqual(result.returncode, 0, result.stdout + result.stderr)

    def test_complains_of_a_shared_inline_function(self):
        result = self.check(GOOD.replace("namespace {", "namespace shared {").replace(
            "{add<", "{shared::add<"))
        self.assertEqual(result.returncode, 1)
        self.assertIn("offers a copy of void shared::add<float>", result.stdout)

    def test_complains_of_a_visible_function(self):
        result = self.check(GOOD + "int helper(int x) { return x + 1; }\n")
        self.assertEqual(result.returncode, 1)
        self.assertIn("shows the function helper(int)", result.stdout)

    def test_complains_of_a_kernel_without_table(self):
        result = self.check(GOOD.replace("extern const Table table;\n", ""))
        self.assertEqual(result.returncode, 1)
        self.assertIn("should show one table", result.stdout)

    def test_refuses_a_list_without_kernels(self):
        self.assertEqual(self.check(GOOD, name="dispatch").returncode, 1)


if __name__ == "__main__":
    unittest.main()
