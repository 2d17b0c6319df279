"""Gives the table maker of scripts/bench reports with known figures."""

import importlib.machinery
import importlib.util
import sys
import unittest
from pathlib import Path

sys.dont_write_bytecode = True
PATH = str(Path(__file__).resolve().parents[2] / "scripts" / "bench")
LOADER = importlib.machinery.SourceFileLoader("bench", PATH)
bench = importlib.util.module_from_spec(importlib.util.spec_from_loader("bench", LOADER))
LOADER.exec_module(bench)


def report(name, median, unit="ns", spread=0.01, real=None):
    common = {"run_name": name, "name": name, "run_type": "aggregate", "time_unit": unit}
    wall = median if real is None else real
    return [
        {**common, "aggregate_name": "median", "cpu_time": median, "real_time": wall},
        {**common, "aggregate_name": "mean", "cpu_time": 99 * median, "real_time": wall},
        {**common, "aggregate_name": "cv", "cpu_time": spread, "real_time": spread},
        {**common, "run_type": "iteration", "cpu_time": 99 * median, "real_time": wall},
    ]


class BenchTables(unittest.TestCase):
    def test_splits_names_into_group_variant_and_key(self):
        for name, parts in {
            "Transform/tessaly_avx2/512": ("Transform", "tessaly_avx2", ("512",)),
            "Mac/avx2/256/8": ("Mac", "avx2", ("256", "8")),
            "Mac/plain/256/8": ("Mac", "plain", ("256", "8")),
            "Process/moving/tessaly/1024/46": ("Process", "tessaly", ("moving", "1024", "46")),
            "Load/31/iterations:1/manual_time": ("Load", "time", ("31",)),
            "Engine/compose/48000/real_time": ("Engine", "time", ("compose", "48000")),
        }.items():
            self.assertEqual(bench.split_name(name), parts)

    def test_columns_go_from_our_widest_to_the_others(self):
        names = ["fftw", "plain", "scalar", "tessaly_sse2", "avx2", "tessaly", "tessaly_avx2"]
        wanted = ["tessaly", "tessaly_avx2", "tessaly_sse2", "avx2", "scalar", "plain", "fftw"]
        self.assertEqual(sorted(names, key=bench.variant_order), wanted)

    def test_takes_medians_in_one_unit_and_the_named_clock(self):
        groups = bench.collect(
            report("Mac/table/256/1", 2.0, "us", real=5.0)
            + report("Mac/plain/256/1/real_time", 3.0, "ns", real=7.0)
        )
        row = groups["Mac"][("256", "1")]
        self.assertEqual(row["table"], (2000.0, 0.01, None))
        self.assertEqual(row["plain"], (7.0, 0.01, None))

    def test_ratio_is_speed_against_the_reference(self):
        groups = bench.collect(
            report("Mac/table/256/1", 25.0)
            + report("Mac/plain/256/1", 100.0)
            + report("Mac/table/1024/1", 50.0, spread=0.5)
        )
        text, records = bench.format_table("Mac", groups["Mac"])
        self.assertIn("25 ns (4.00)", text[2])
        self.assertIn("100 ns (1.00)", text[2])
        self.assertIn("50 ns~", text[3])
        ratios = {(r["variant"], r["key"][0]): r["speed_ratio"] for r in records}
        expected = {("table", "256"): 4.0, ("plain", "256"): 1.0, ("table", "1024"): None}
        self.assertEqual(ratios, expected)

    def test_rows_are_in_numeric_order_and_blocks_as_share_of_real_time(self):
        groups = bench.collect(
            report("Process/still/tessaly/1024/8", 1024 / 48000 * 1e9 / 50)
            + report("Process/still/tessaly/256/8", 256 / 48000 * 1e9 / 4)
        )
        text, _ = bench.format_table("Process", groups["Process"])
        self.assertTrue(text[2].endswith(" 25"), text[2])
        self.assertTrue(text[3].endswith(" 2"), text[3])

    def test_sources_are_told_as_share_of_their_block(self):
        groups = bench.collect(
            report("Source/hall/still/1024", 1024 / 48000 * 1e9 / 8)
            + report("Return/alone/64/256/manual_time", 1.0, real=256 / 48000 * 1e9 / 5)
        )
        text, records = bench.format_table("Source", groups["Source"])
        self.assertTrue(text[1].endswith("% of a block at 48 kHz"), text[1])
        self.assertTrue(text[2].endswith(" 12.5"), text[2])
        self.assertEqual(records[0]["key"], ["hall", "still", "1024"])
        text, _ = bench.format_table("Return", groups["Return"])
        self.assertTrue(text[2].endswith(" 20"), text[2])

    def test_loads_are_told_in_blocks_with_their_worst(self):
        block = 1024 / 48000 * 1e9
        entries = report("Load/31/iterations:1/manual_time", 1.0, real=block / 2)
        entries.append({**entries[0], "aggregate_name": "max", "real_time": block * 1.25})
        entries += report("Load/9/iterations:1/manual_time", 1.0, real=block / 4)
        text, records = bench.format_table("Load", bench.collect(entries)["Load"])
        self.assertTrue(text[2].endswith(" 0.250"), text[2])
        self.assertEqual(text[3].split()[-2:], ["0.500", "1.250"])
        self.assertEqual([record["worst_ns"] for record in records], [None, block * 1.25])

    def test_a_benchmark_that_reports_an_error_ends_the_run(self):
        with self.assertRaises(SystemExit):
            bench.collect([{"name": "Mac/x", "error_occurred": True, "error_message": "no data"}])


if __name__ == "__main__":
    unittest.main()
