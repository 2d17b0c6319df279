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
    f"~ marks figures that vary by more than {UNSTEADY:.0%}: run again on a quiet machine.",
]


def must_show(groups):
    return Table("Must show, ratios of this run", HEAD, goal_lines(groups), [])


def page_text(groups, content):
    parts = ["\n".join(conditions(content) + HOW_TO_READ)]
    parts += [as_text(table) for _, table in all_tables(groups)]
    parts.append(as_text(must_show(groups)))
    return "\n\n".join(parts)


def page_markdown(groups, content):
    parts = ["\n".join(f"- {line}" for line in conditions(content) + HOW_TO_READ)]
    parts += [as_markdown(must_show(groups))]
    parts += [as_markdown(table) for _, table in all_tables(groups)]
    return "\n\n".join(parts)


def write_markdown(path, text):
    """Writes the file, or what stands between its two marks if it has them."""
    path = Path(path)
    page = path.read_text(encoding="utf-8") if path.exists() else f"{BEGIN}\n{END}\n"
    if BEGIN not in page or END not in page:
        page = f"{BEGIN}\n{END}\n"
    head, rest = page.split(BEGIN, 1)
    tail = rest.split(END, 1)[1]
    path.write_text(f"{head}{BEGIN}\n\n{text}\n\n{END}{tail}", encoding="utf-8")
