"""Gives the table maker of scripts/bench runs with known figures."""

import contextlib
import io
import sys
import tempfile
import unittest
from pathlib import Path

sys.dont_write_bytecode = True
ROOT = Path(__file__).resolve().parents[2]
sys.path.insert(0, str(ROOT / "benchmarks"))

from report import goals, pages, results, tables  # noqa: E402

CONTENT = {
    "machine": {
        "processor": "Some processor",
        "cores": 2,
        "instructions": ["sse2", "avx2"],
        "pinned_to": 1,
        "load_average": 0.5,
        "compiler": "c++ 1",
        "flags": "-O2",
        "commit": "abc",
    },
    "repetitions": 3,
    "quick": False,
    "against": "before",
}


def runs(name, *times, unit="ns", real=None, **more):
    """Repetitions of one benchmark, as Google Benchmark writes them."""
    return [
        {
            "run_name": name,
            "name": name,
            "run_type": "iteration",
            "time_unit": unit,
            "cpu_time": time,
            "real_time": time if real is None else real,
            **more,
        }
        for time in times
    ]


def table_of(group, entries):
    return tables.make_table(group, results.collect(entries)[group])


def goal(what, against=None):
    found = [g for g in goals.GOALS if g.what == what and against in (None, g.against)]
    assert len(found) == 1, (what, len(found))
    return found[0]


class BenchTables(unittest.TestCase):
    def test_splits_names_into_group_variant_and_key(self):
        for name, parts in {
            "Transform/tessaly_avx2/512": ("Transform", "tessaly_avx2", ("512",)),
            "Mac/avx2/256/8": ("Mac", "avx2", ("256", "8")),
            "Mac/plain/256/8": ("Mac", "plain", ("256", "8")),
            "Source/tessaly/hall/moving/1/1024": (
                "Source",
                "tessaly",
                ("hall", "moving", "1", "1024"),
            ),
            "Load/31/iterations:1/manual_time": ("Load", "time", ("31",)),
            "Engine/compose/48000/real_time": ("Engine", "time", ("compose", "48000")),
        }.items():
            self.assertEqual(results.split_name(name), parts)

    def test_columns_go_from_our_widest_to_the_others(self):
        names = ["fftw", "plain", "scalar", "tessaly_sse2", "avx2", "tessaly", "tessaly_avx2"]
        wanted = ["tessaly", "tessaly_avx2", "tessaly_sse2", "avx2", "scalar", "plain", "fftw"]
        self.assertEqual(sorted(names, key=results.variant_order), wanted)

    def test_takes_medians_in_one_unit_and_the_named_clock(self):
        groups = results.collect(
            runs("Mac/avx2/256/1", 1.0, 9.0, 2.0, unit="us", real=5.0)
            + runs("Mac/plain/256/1/real_time", 3.0, real=7.0)
        )
        row = groups["Mac"][("256", "1")]
        self.assertEqual(row["avx2"].times, [1000.0, 9000.0, 2000.0])
        self.assertEqual(row["avx2"].median, 2000.0)
        self.assertEqual(row["avx2"].worst, 9000.0)
        self.assertEqual(row["plain"].median, 7.0)

    def test_variation_is_half_of_what_the_middle_half_spans(self):
        self.assertAlmostEqual(results.Cell([80, 90, 100, 110, 1000]).variation, 0.1)
        self.assertAlmostEqual(results.Cell([90, 100, 110]).variation, 0.1)
        self.assertEqual(results.Cell([5.0]).variation, 0)

    def test_a_run_that_reports_an_error_is_left_out(self):
        failed = {"run_name": "Mac/read/256/1", "error_occurred": True, "error_message": "no data"}
        said = io.StringIO()
        with contextlib.redirect_stderr(said):
            groups = results.collect([failed, *runs("Mac/plain/256/1", 1.0)])
        self.assertIn("Mac/read/256/1 left out: no data", said.getvalue())
        self.assertEqual(list(groups["Mac"][("256", "1")]), ["plain"])

    def test_records_give_the_same_groups_again(self):
        entries = runs("Load/tessaly/3", 4.0, 6.0, label="dry", heap_bytes=2048.0)
        groups = results.collect(entries)
        again = results.from_records(results.records(groups))
        cell = again["Load"][("3",)]["tessaly"]
        self.assertEqual(cell.times, [4.0, 6.0])
        self.assertEqual((cell.label, cell.counters), ("dry", {"heap_bytes": 2048.0}))
        self.assertEqual(results.records(again), results.records(groups))

    def test_ratio_is_speed_against_the_reference(self):
        table = table_of(
            "Mac",
            runs("Mac/avx2/256/1", 25.0)
            + runs("Mac/plain/256/1", 100.0)
            + runs("Mac/avx2/1024/1", 25.0, 50.0, 75.0),
        )
        self.assertEqual(table.head, ["block", "partitions", "avx2", "plain"])
        self.assertEqual(table.lines[0], ["256", "1", "25 ns (4.00)", "100 ns (1.00)"])
        self.assertEqual(table.lines[1], ["1024", "1", "50 ns~", "-"])
        self.assertTrue(table.title.endswith("(speed, plain = 1)"), table.title)

    def test_rows_are_in_numeric_order_and_sources_shares_of_their_block(self):
        table = table_of(
            "Source",
            runs("Source/tessaly/hall/still/1/1024", 1024 / 48000 * 1e9 / 8)
            + runs("Source/tessaly/hall/still/16/256", 16 * 256 / 48000 * 1e9 / 50)
            + runs("Source/tessaly/hall/still/1/256", 256 / 48000 * 1e9 / 4),
        )
        self.assertEqual(table.head[-1], "% of a block")
        self.assertEqual(
            [(line[2], line[3], line[-1]) for line in table.lines],
            [("1", "256", "25"), ("1", "1024", "12.5"), ("16", "256", "2")],
        )

    def test_crowds_are_told_with_and_without_their_fixed_cost(self):
        table = table_of(
            "Source",
            runs("Source/tessaly/dry/moving/1/1024", 1000.0)
            + runs("Source/tessaly/dry/moving/64/1024", 1000.0 + 63 * 200.0),
        )
        self.assertEqual(len(table.notes), 1)
        self.assertIn("tessaly takes 200 ns for one more of 64 sources, 212 ns", table.notes[0])

    def test_loads_are_told_in_blocks_with_their_worst(self):
        block = 1024 / 48000 * 1e9
        hall = {"heap_bytes": 2048, "label": "Hall"}
        table = table_of(
            "Load",
            runs("Load/tessaly/31/manual_time", 1, 1, real=block / 2, **hall)
            + runs("Load/tessaly/31/manual_time", 1, real=block * 1.25, **hall)
            + runs("Load/tessaly/9/manual_time", 1, real=block / 4),
        )
        self.assertEqual([line[0] for line in table.lines], ["9", "31"])
        self.assertEqual(table.lines[0][3:5], ["0.250", "0.250"])
        self.assertEqual(table.lines[1][3:], ["0.500", "1.250", "2", "0", "Hall"])
        self.assertIn("slowest room's median 0.500, worst load 1.250", table.notes[0])

    def test_text_is_aligned_and_markdown_has_every_cell(self):
        table = tables.Table("Title", ["a", "wide"], [["1234", "5"]], ["a note"])
        self.assertEqual(tables.as_text(table), "Title\n     a  wide\n  1234     5\n  a note")
        self.assertEqual(
            tables.as_markdown(table),
            "### Title\n\n| a | wide |\n| :-- | --: |\n| 1234 | 5 |\n\n- a note",
        )


class Goals(unittest.TestCase):
    def test_the_least_favourable_case_counts(self):
        row = goal("multiply-accumulate, both ears, N >= 16, AVX2")
        entries = (
            runs("Mac/plain/256/16", 80.0)
            + runs("Mac/avx2/256/16", 10.0)
            + runs("Mac/plain/1024/73", 90.0)
            + runs("Mac/avx2/1024/73", 10.0)
        )
        figure, text, verdict, where = row.result(results.collect(entries), [])
        self.assertEqual((figure, text, verdict, where), (8.0, "8 x", "yes", "256/16"))
        # A short ring is not asked for.
        entries += runs("Mac/plain/256/1", 10.0) + runs("Mac/avx2/256/1", 10.0)
        self.assertEqual(row.result(results.collect(entries), [])[3], "256/16")
        entries += runs("Mac/plain/1024/216", 69.0) + runs("Mac/avx2/1024/216", 10.0)
        figure, _, verdict, where = row.result(results.collect(entries), [])
        self.assertEqual((figure, verdict, where), (6.9, "NO", "1024/216"))

    def test_a_target_just_reached_is_met_from_either_side(self):
        moving = goal("moving source, hall of N 73, B 1024")
        for time, verdict in ((1500.0, "yes"), (1501.0, "NO")):
            entries = runs("Source/tessaly/hall/moving/1/1024", time)
            entries += runs("Source/tessaly/hall/still/1/1024", 1000.0)
            self.assertEqual(moving.result(results.collect(entries), [])[2], verdict)
        before = goal("moving source, hall of N 216, B 1024", "the earlier library")
        for time, verdict in ((6000.0, "yes"), (5999.0, "NO")):
            entries = runs("Source/against/longest/moving/1/1024", time)
            entries += runs("Source/tessaly/longest/moving/1/1024", 1000.0)
            self.assertEqual(before.result(results.collect(entries), [])[2], verdict)

    def test_silence_is_told_in_percent_of_its_worst_room(self):
        entries = []
        for room, silent in (("dry", 40.0), ("hall", 60.0)):
            entries += runs(f"Source/tessaly/{room}/silent/1/256", silent)
            entries += runs(f"Source/tessaly/{room}/still/1/256", 1000.0)
        row = goal("silent source, each room, B 256 and 1024")
        self.assertEqual(row.result(results.collect(entries), []), (0.06, "6 %", "NO", "hall/256"))

    def test_the_widest_table_that_ran_is_judged(self):
        row = goal("convolver, still, 81533 and 220245 taps")
        entries = runs("Convolver/zita_uniform/still/256/81533", 100.0)
        entries += runs("Convolver/tessaly_sse2/still/256/81533", 80.0)
        self.assertEqual(row.result(results.collect(entries), [])[0], 1.25)
        entries += runs("Convolver/tessaly_avx2/still/256/81533", 50.0)
        self.assertEqual(row.result(results.collect(entries), [])[0], 2.0)

    def test_four_lanes_are_those_of_either_processor(self):
        for width in ("sse2", "neon"):
            entries = runs("Transform/fftw/512", 7.0) + runs(f"Transform/tessaly_{width}/512", 10.0)
            result = goal("same, 4 lanes").result(results.collect(entries), [])
            self.assertEqual(result, (0.7, "0.7 x", "yes", "512"))

    def test_a_row_without_figures_is_neither_met_nor_missed(self):
        result = goal("same, 4 lanes").result({}, ["sse2"])
        self.assertEqual(result, (None, "no rows", "-", ""))
        self.assertEqual({entry["met"] for entry in goals.goal_records({}, ["sse2"])}, {None})

    def test_not_measurable_is_only_what_the_processor_cannot_do(self):
        row = goal("same, AVX-512", "FFTW, measured plans")
        for instructions, text in (
            (["sse2", "avx2", "fma"], "not measurable here"),
            (["sse2", "avx2", "fma", "avx512f", "avx512vl"], "no rows"),
            ([], "no rows"),
        ):
            self.assertEqual(row.result({}, instructions)[1], text)
        before = goal("moving source, hall of N 216, B 1024", "the earlier library")
        self.assertEqual(before.result({}, ["sse2"])[1], "no rows (--against)")


class Pages(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.path = Path(folder.name) / "page.md"

    def test_a_new_file_has_the_marks_and_the_text(self):
        pages.write_markdown(self.path, "figures")
        self.assertEqual(self.path.read_text(), f"{pages.BEGIN}\n\nfigures\n\n{pages.END}\n")

    def test_a_file_without_both_marks_stays_as_it_is(self):
        for text in ("mine\n", f"mine\n{pages.BEGIN}\n", f"{pages.END}\n{pages.BEGIN}\n", ""):
            self.path.write_text(text)
            with self.assertRaisesRegex(ValueError, "page.md has no lines"):
                pages.write_markdown(self.path, "figures")
            self.assertEqual(self.path.read_text(), text)

    def test_only_what_stands_between_the_marks_is_replaced(self):
        self.path.write_text(f"before\n{pages.BEGIN}\nold\n{pages.END}\nafter\n")
        for text in ("figures", "newer"):
            pages.write_markdown(self.path, text)
            wanted = f"before\n{pages.BEGIN}\n\n{text}\n\n{pages.END}\nafter\n"
            self.assertEqual(self.path.read_text(), wanted)

    def test_the_page_names_its_conditions_and_every_table(self):
        groups = results.collect(runs("Mac/plain/256/1", 1.0) + runs("Transform/fftw/512", 1.0))
        for page in (pages.page_text(groups, CONTENT), pages.page_markdown(groups, CONTENT)):
            for words in (
                "Some processor, sse2 avx2; commit abc",
                "on core 1 of 2, medians of 3",
                "against: before",
                "Must show",
                "Multiply-accumulate",
                "Forward and backward",
            ):
                self.assertIn(words, page)


if __name__ == "__main__":
    unittest.main()
