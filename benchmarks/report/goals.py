"""What the library must show: ratios of one run, each beside the least it must reach."""

from report.tables import block_share, load_summary, one_more


class Goal:
    """One row. `measure` returns (figure, where) pairs; the least favourable one counts. `needs`
    names the processor's instructions without which there is nothing to measure."""

    def __init__(self, what, against, target, at_least, unit, measure, needs=(), hint=""):
        self.what, self.against, self.target = what, against, target
        self.at_least, self.unit = at_least, unit
        self.measure, self.needs, self.hint = measure, needs, hint

    def result(self, groups, instructions):
        """Returns (figure, text, verdict, where); the figure is None if there is none.
        `instructions` are those of the processor, empty if nobody knows."""
        found = self.measure(groups)
        if not found:
            lacking = instructions and not set(self.needs) <= set(instructions)
            return None, "not measurable here" if lacking else "no rows" + self.hint, "-", ""
        figure, where = (min if self.at_least else max)(found, key=lambda pair: pair[0])
        met = figure >= self.target if self.at_least else figure <= self.target
        return figure, self.text(figure), "yes" if met else "NO", where

    def text(self, value):
        return f"{100 * value:.3g} %" if self.unit == "%" else f"{value:.3g}{self.unit}"

    def target_text(self):
        return ("at least " if self.at_least else "at most ") + self.text(self.target)


def ratios(rows, slow, fast, chosen):
    """Times of `slow` over those of `fast`, for all rows that have both and are `chosen`."""
    return [
        (row[slow].median / row[fast].median, "/".join(key))
        for key, row in rows.items()
        if slow in row and fast in row and chosen(*key)
    ]


def transform(*variants):
    def measure(groups):
        rows, lengths = groups.get("Transform", {}), ("512", "1024", "2048")
        return [
            pair
            for variant in variants
            for pair in ratios(rows, "fftw", variant, lambda length: length in lengths)
        ]

    return measure


def multiply(slow, fast, chosen):
    return lambda groups: ratios(groups.get("Mac", {}), slow, fast, chosen)


def convolver(variant, least, most):
    def chosen(source, block, taps):
        return source == "still" and least <= int(taps) <= most

    return lambda groups: ratios(groups.get("Convolver", {}), "zita_uniform", variant, chosen)


def widest_convolver(least, most):
    """Of the widest table that ran."""

    def measure(groups):
        for width in ("avx512", "avx2", "neon", "sse2"):
            found = convolver(f"tessaly_{width}", least, most)(groups)
            if found:
                return found
        return []

    return measure


def source(groups, room, motion, block, sources="1", variant="tessaly"):
    cell = groups.get("Source", {}).get((room, motion, sources, block), {}).get(variant)
    return cell.median if cell else None


def motions(room, motion, other, block):
    """Time of one motion over that of the other."""

    def measure(groups):
        times = [source(groups, room, name, block) for name in (motion, other)]
        return [(times[0] / times[1], f"{room}/{block}")] if all(times) else []

    return measure


def against_before(room, block):
    def measure(groups):
        before = source(groups, room, "moving", block, variant="against")
        now = source(groups, room, "moving", block)
        return [(before / now, f"{room}/{block}")] if before and now else []

    return measure


def silent(groups):
    found = []
    for room in ("dry", "reflections", "hall", "longest"):
        for block in ("256", "1024"):
            found += motions(room, "silent", "still", block)(groups)
    return found


def dry_against_openal(groups):
    """The less favourable of both ways to count a source among 64."""
    rows = groups.get("Source", {})
    ours = one_more(rows, "tessaly", "dry", "moving", "1024")
    other = one_more(rows, "openal", "dry", "moving", "1024")
    if not ours or not other:
        return []
    return [
        (other[0] / ours[0], "one more of 64"),
        (other[1] / ours[1], "64 with the fixed cost shared out"),
    ]


def crowd_with_returns(groups):
    cell = groups.get("Return", {}).get(("whole", "64", "2", "1024"), {}).get("tessaly")
    return [(block_share(cell.median, 1024), "")] if cell else []


def loads(index):
    def measure(groups):
        summary = load_summary(groups.get("Load", {}))
        return [(summary[index], "")] if summary else []

    return measure


AVX512 = ("avx512f",)
AVX2 = ("avx2", "fma")

GOALS = [
    Goal("forward + backward, 2B 512 to 2048, AVX2", "FFTW, measured plans", 1.2, True, " x",
         transform("tessaly_avx2"), AVX2),
    Goal("same, AVX-512", "FFTW, measured plans", 1.8, True, " x",
         transform("tessaly_avx512"), AVX512),
    Goal("same, 4 lanes", "FFTW, measured plans", 0.6, True, " x",
         transform("tessaly_sse2", "tessaly_neon")),
    Goal("multiply-accumulate, both ears, N >= 16, AVX2", "plain scalar passes", 7.0, True, " x",
         multiply("plain", "avx2", lambda block, partitions: int(partitions) >= 16), AVX2),
    Goal("same, AVX-512, B 1024, N 216", "time to read the same bytes", 1.4, False, " x",
         multiply("avx512", "read", lambda *key: key == ("1024", "216")), AVX512),
    Goal("convolver, still, 128 to 23147 taps, AVX2", "zita-convolver, uniform", 2.2, True, " x",
         convolver("tessaly_avx2", 128, 23147), AVX2),
    Goal("same, AVX-512", "zita-convolver, uniform", 3.3, True, " x",
         convolver("tessaly_avx512", 128, 23147), AVX512),
    Goal("convolver, still, 81533 and 220245 taps", "zita-convolver, uniform", 1.8, True, " x",
         widest_convolver(81533, 220245)),
    Goal("moving source, hall of N 73, B 1024", "the same standing still", 1.5, False, " x",
         motions("hall", "moving", "still", "1024")),
    Goal("moving source, hall of N 216, B 1024", "the same standing still", 1.5, False, " x",
         motions("longest", "moving", "still", "1024")),
    Goal("moving source, hall of N 216, B 1024", "the earlier library", 6.0, True, " x",
         against_before("longest", "1024"), hint=" (--against)"),
    Goal("64 moving dry sources, B 1024", "OpenAL Soft, per source", 1.5, True, " x",
         dry_against_openal),
    Goal("64 moving sources with reflections (N 8), two returns (N 73)", "one core", 0.10, False,
         "%", crowd_with_returns),
    Goal("silent source, each room, B 256 and 1024", "the same sounding", 0.05, False, "%", silent),
    Goal("load of a room, 48000/1024, median of all", "block duration", 0.25, False, " x",
         loads(0)),
    Goal("load of a room, 48000/1024, worst of all", "block duration", 0.5, False, " x", loads(2)),
]  # fmt: skip

HEAD = ["what", "against", "measured", "target", "met", "least favourable"]


def goal_lines(groups, instructions):
    lines = []
    for goal in GOALS:
        _, text, verdict, where = goal.result(groups, instructions)
        lines.append([goal.what, goal.against, text, goal.target_text(), verdict, where])
    return lines


def goal_records(groups, instructions):
    entries = []
    for goal in GOALS:
        figure, text, verdict, where = goal.result(groups, instructions)
        entries.append(
            {
                "what": goal.what,
                "against": goal.against,
                "measured": figure,
                "text": text,
                "target": goal.target,
                "at_least": goal.at_least,
                "met": {"yes": True, "NO": False}.get(verdict),
                "where": where,
            }
        )
    return entries
