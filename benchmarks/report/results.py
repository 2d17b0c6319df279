"""Figures of one run: names of benchmarks taken apart, medians of their repetitions."""

import re
import statistics
import sys

# Element of a benchmark's name that says whose code ran; the others say what it did.
WIDTHS = ["avx512", "avx2", "neon", "sse2", "scalar"]
OWNERS = ["tessaly", "against", "", "plain", "read", "fftw", "kissfft", "zita", "openal"]
VARIANT = re.compile(
    rf"^(({'|'.join(name for name in OWNERS if name)})(_\w+)?|{'|'.join(WIDTHS)})$"
)
MODIFIER = re.compile(
    r"^(real_time|process_time|manual_time|repeats:.*|min_time:.*|threads:.*|iterations:.*)$"
)
UNITS = {"ns": 1.0, "us": 1e3, "ms": 1e6, "s": 1e9}


class Cell:
    """Repetitions of one benchmark, nanoseconds each."""

    def __init__(self, times, counters=None, label=""):
        self.times = times
        self.counters = counters or {}
        self.label = label

    @property
    def median(self):
        return statistics.median(self.times)

    @property
    def worst(self):
        return max(self.times)

    @property
    def variation(self):
        """Half of what the middle half of the repetitions spans, as a share of the median.

        With fewer than four repetitions all of them count."""
        if len(self.times) < 4:
            return (max(self.times) - min(self.times)) / 2 / self.median
        quarters = statistics.quantiles(self.times, n=4, method="inclusive")
        return (quarters[2] - quarters[0]) / 2 / self.median


def split_name(name):
    """Splits "Mac/plain/256/8" into group "Mac", variant "plain" and key ("256", "8")."""
    group, *rest = [part for part in name.split("/") if not MODIFIER.match(part)]
    variant = next((part for part in rest if VARIANT.match(part)), None)
    if variant is not None:
        rest.remove(variant)
    return group, variant or "time", tuple(rest)


def collect(runs):
    """Returns {group: {key: {variant: Cell}}} of all repetitions."""
    groups = {}
    for entry in runs:
        name = entry["run_name"]
        if entry.get("error_occurred"):
            print(f"bench: {name} left out: {entry.get('error_message')}", file=sys.stderr)
            continue
        # The processor's time leaves out what other programs did meanwhile.
        clock = "real_time" if re.search("/(real|manual)_time", name) else "cpu_time"
        group, variant, key = split_name(name)
        cell = groups.setdefault(group, {}).setdefault(key, {}).setdefault(variant, Cell([]))
        cell.times.append(entry[clock] * UNITS[entry["time_unit"]])
        cell.label = entry.get("label", "")
        for counter in ("heap_bytes", "resident_bytes"):
            if counter in entry:
                cell.counters[counter] = entry[counter]
    return groups


def records(groups):
    """The same as a list for a file."""
    return [
        {
            "group": group,
            "key": list(key),
            "variant": variant,
            "label": cell.label,
            "median_ns": cell.median,
            "worst_ns": cell.worst,
            "variation": cell.variation,
            "times_ns": cell.times,
            "counters": cell.counters,
        }
        for group, rows in groups.items()
        for key, row in rows.items()
        for variant, cell in row.items()
    ]


def from_records(entries):
    """What `records` made."""
    groups = {}
    for entry in entries:
        row = groups.setdefault(entry["group"], {}).setdefault(tuple(entry["key"]), {})
        row[entry["variant"]] = Cell(entry["times_ns"], entry["counters"], entry["label"])
    return groups


def in_order(key):
    return tuple((0, int(part), "") if part.isdigit() else (1, 0, part) for part in key)


def variant_order(name):
    owner, _, width = ("", "", name) if name in WIDTHS else name.partition("_")
    return (
        OWNERS.index(owner) if owner in OWNERS else len(OWNERS),
        WIDTHS.index(width) + 1 if width in WIDTHS else 0,
        name,
    )
