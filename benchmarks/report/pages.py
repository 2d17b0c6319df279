"""Everything of one run, as text for the terminal or as Markdown for the documentation."""

from pathlib import Path

from report.goals import HEAD, goal_lines
from report.tables import UNSTEADY, Table, all_tables, as_markdown, as_text

BEGIN = "<!-- figures of scripts/bench: begin -->"
END = "<!-- figures of scripts/bench: end -->"


def conditions(content):
    about = content["machine"]
    pinned = "any core" if about["pinned_to"] is None else f"core {about['pinned_to']}"
    lines = [
        f"{about['processor']}, {' '.join(about['instructions'])}; commit {about['commit']}",
        f"{about['compiler']}; {about['flags']}",
        f"on {pinned} of {about['cores']}, medians of {content['repetitions']} interleaved "
        f"repetitions, load {about['load_average']:.1f} at the start",
    ]
    if content["against"]:
        lines.append(f"against: {content['against']}")
    return lines


HOW_TO_READ = [
    "In brackets: how many times as fast as the reference, which is 1.00; more is faster.",
    f"~ marks figures whose middle half of repetitions spans more than {200 * UNSTEADY:.0f} % of "
    "their median: run again on a quiet machine.",
]


def must_show(groups, content):
    lines = goal_lines(groups, content["machine"]["instructions"])
    return Table("Must show, ratios of this run", HEAD, lines, [])


def page_text(groups, content):
    parts = ["\n".join(conditions(content) + HOW_TO_READ)]
    parts += [as_text(table) for _, table in all_tables(groups)]
    parts.append(as_text(must_show(groups, content)))
    return "\n\n".join(parts)


def page_markdown(groups, content):
    parts = ["\n".join(f"- {line}" for line in conditions(content) + HOW_TO_READ)]
    parts += [as_markdown(must_show(groups, content))]
    parts += [as_markdown(table) for _, table in all_tables(groups)]
    return "\n\n".join(parts)


def around_figures(path):
    """What stands before and behind the figures of a page; a file to be written has neither.

    Raises ValueError for a file without the marks: what it holds is not ours to replace."""
    path = Path(path)
    if not path.exists():
        return "", "\n"
    head, begin, rest = path.read_text(encoding="utf-8").partition(BEGIN)
    _, end, tail = rest.partition(END)
    if not begin or not end:
        raise ValueError(f"{path} has no lines {BEGIN!r} and {END!r} to write between")
    return head, tail


def write_markdown(path, text):
    """Writes a new file, or what stands between the two marks of an existing one."""
    head, tail = around_figures(path)
    page = f"{head}{BEGIN}\n\n{text}\n\n{END}{tail}"
    Path(path).write_text(page, encoding="utf-8")
