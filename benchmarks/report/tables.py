"""Tables of ratios, one a group, as text or as Markdown."""

import statistics

from report.results import in_order, variant_order

RATE = 48000
EVENT_BLOCK = 1024 / RATE  # seconds; rare events are told in blocks of this length
UNSTEADY = 0.10  # variation from which a median deserves a second run

# Group: title, what the other elements of its names mean, variants that count as 1.00 (the first
# of them that a row has).
GROUPS = {
    "Source": (
        "A block of one source, the whole Process call",
        ["room", "source", "sources", "block"],
        ["against", "openal"],
    ),
    "Return": (
        "A block of all sources and their returns, or of the returns alone",
        ["part", "sources", "returns", "block"],
        ["against"],
    ),
    "Load": ("The block that changes to a room, files in memory", ["room"], ["against"]),
    "Convolver": (
        "A block of the convolver, mono to two ears",
        ["source", "block", "taps"],
        ["zita_uniform", "tessaly_scalar"],
    ),
    "Mac": (
        "Multiply-accumulate of both ears",
        ["block", "partitions"],
        ["plain", "scalar"],
    ),
    "Transform": ("Forward and backward real transform", ["length"], ["fftw", "tessaly_scalar"]),
}


class Table:
    def __init__(self, title, head, lines, notes):
        self.title, self.head, self.lines, self.notes = title, head, lines, notes


def time_text(nanoseconds):
    for unit, size in (("s", 1e9), ("ms", 1e6), ("us", 1e3)):
        if nanoseconds >= size:
            return f"{nanoseconds / size:.3g} {unit}"
    return f"{nanoseconds:.3g} ns"


def block_share(nanoseconds, block):
    """Share of a block's duration."""
    return nanoseconds / (int(block) / RATE * 1e9)


def reference_of(group, row):
    return next((name for name in GROUPS.get(group, ("", [], []))[2] if name in row), None)


def extra_columns(group, keys):
    """Headings behind the variants, and what stands there for one row's key and first variant."""
    if group in ("Source", "Return"):
        block = keys.index("block")
        return ["% of a block"], lambda key, cell, share: [
            f"{100 * block_share(cell.median * share, key[block]):.3g}"
        ]
    if group == "Load":
        duration = EVENT_BLOCK * 1e9
        return ["worst", "median, blocks", "worst, blocks", "heap, KB", "resident, KB", ""], (
            lambda key, cell, share: [
                time_text(cell.worst),
                f"{cell.median / duration:.3f}",
                f"{cell.worst / duration:.3f}",
                f"{cell.counters.get('heap_bytes', 0) / 1024:.0f}",
                f"{cell.counters.get('resident_bytes', 0) / 1024:.0f}",
                cell.label,
            ]
        )
    return [], lambda key, cell, share: []


def make_table(group, rows):
    title, keys, _ = GROUPS.get(group, (group, [], []))
    keys = keys or [f"key {i + 1}" for i in range(max(len(key) for key in rows))]
    variants = sorted({variant for row in rows.values() for variant in row}, key=variant_order)
    extra_head, extra = extra_columns(group, keys)
    lines = []
    for key in sorted(rows, key=in_order):
        row = rows[key]
        # Crowds are told by what each of them costs.
        share = 1 / int(key[keys.index("sources")]) if group == "Source" else 1
        reference = row.get(reference_of(group, row))
        line = list(key)
        for variant in variants:
            if variant not in row:
                line.append("-")
                continue
            cell = row[variant]
            text = time_text(cell.median * share)
            if reference:
                text += f" ({reference.median / cell.median:.2f})"
            line.append(text + ("~" if cell.variation > UNSTEADY else ""))
        first = row.get(variants[0])
        line += extra(key, first, share) if first else [""] * len(extra_head)
        lines.append(line)
    references = sorted({name for row in rows.values() if (name := reference_of(group, row))})
    if references:
        title += f" (speed, {' or else '.join(references)} = 1)"
    return Table(title, [*keys, *variants, *extra_head], lines, notes_of(group, rows))


def one_more(rows, variant, room, motion, block, many=64):
    """Time of one source among `many`: what one more costs, and all of them shared out."""
    crowd = rows.get((room, motion, str(many), block), {}).get(variant)
    single = rows.get((room, motion, "1", block), {}).get(variant)
    if crowd is None or single is None:
        return None
    return (crowd.median - single.median) / (many - 1), crowd.median / many


def load_summary(rows, variant="tessaly"):
    """Median of all loads, the slowest room's median, the worst load; in blocks."""
    cells = [row[variant] for row in rows.values() if variant in row]
    if not cells:
        return None
    times = [time for cell in cells for time in cell.times]
    duration = EVENT_BLOCK * 1e9
    return (
        statistics.median(times) / duration,
        max(cell.median for cell in cells) / duration,
        max(times) / duration,
    )


def notes_of(group, rows):
    notes = []
    if group == "Source":
        cases = sorted({(room, motion, block) for room, motion, _, block in rows}, key=in_order)
        for room, motion, block in cases:
            for variant in ("tessaly", "against", "openal"):
                cost = one_more(rows, variant, room, motion, block)
                if cost:
                    notes.append(
                        f"{room}, {motion}, {block}: {variant} takes {time_text(cost[0])} for one "
                        f"more of 64 sources, {time_text(cost[1])} with the fixed cost shared out"
                    )
    if group == "Load":
        for variant in ("tessaly", "against"):
            summary = load_summary(rows, variant)
            if summary:
                notes.append(
                    f"{variant}, all {len(rows)} rooms: median {summary[0]:.3f} blocks, slowest "
                    f"room's median {summary[1]:.3f}, worst load {summary[2]:.3f}"
                )
    return notes


def all_tables(groups):
    order = [*GROUPS, *sorted(set(groups) - set(GROUPS))]
    return [(name, make_table(name, groups[name])) for name in order if name in groups]


def as_text(table):
    lines = [table.head, *table.lines]
    widths = [max(len(line[i]) for line in lines) for i in range(len(table.head))]
    text = [table.title]
    for line in lines:
        cells = (cell.rjust(size) for cell, size in zip(line, widths))
        text.append(("  " + "  ".join(cells)).rstrip())
    return "\n".join(text + [f"  {note}" for note in table.notes])


def as_markdown(table):
    def row(cells):
        return "| " + " | ".join(cells) + " |"

    text = [f"### {table.title}", "", row(table.head), row([":--"] + ["--:"] * (len(table.head) - 1))]
    text += [row(line) for line in table.lines]
    if table.notes:
        text += ["", *(f"- {note}" for note in table.notes)]
    return "\n".join(text)
