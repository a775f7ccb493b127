"""What the tests need not reach: tests/coverage/exclusions.txt."""

import collections
import re

KINDS = {
    "line": "is not executed",
    "true": "is never true",
    "false": "is never false",
    "condition": "never decides alone",
    "function": "is not executed",
    "unbuilt": "is not compiled",
}

# What is counted, and one place in the source: `nth` tells equal ones of equal lines apart.
Entry = collections.namedtuple("Entry", "file kind nth text line")


def name_of(entry):
    return f"{entry.file} {entry.kind} {entry.nth}: {entry.text}".rstrip() + f"\n{entry.line}"


def read(path):
    """The reasons by entry. A paragraph for each: what it is, as `name_of` writes it, and the reason."""
    reasons = {}
    if not path.exists():
        return reasons
    for paragraph in re.split(r"\n{2,}", path.read_text(encoding="utf-8")):
        lines = paragraph.strip().split("\n")
        found = re.fullmatch(rf"(\S+) ({'|'.join(KINDS)}) (\d+): ?(.*)", lines[0])
        if found and len(lines) > 2:
            file, kind, nth, text = found.groups()
            reasons[Entry(file, kind, int(nth), text, lines[1])] = " ".join(lines[2:])
        elif lines[0] and not lines[0].startswith("#"):
            raise ValueError(f"{path}: no kind, line and reason: {lines[0]}")
    return reasons


class Namer:
    """Entries for places in the sources, in the order in which they are asked for."""

    def __init__(self, sources):
        self.sources, self.seen = sources, collections.Counter()

    def entry(self, file, kind, number, text=""):
        key = (file, kind, text, self.sources.line(file, number))
        self.seen[key] += 1
        return Entry(file, kind, self.seen[key], text, key[3])


def places(counts):
    """All that is counted, as (entry, number of the line, whether it is covered).

    A function comes before what is in it, which is excluded with it.
    """
    namer, sources = Namer(counts.sources), counts.sources
    for file in sources.lines:
        for (begin, _), count in sorted(counts.functions.get(file, {}).items()):
            yield namer.entry(file, "function", begin[0]), begin[0], count > 0
        for number in sorted(counts.not_compiled.get(file, ())):
            yield namer.entry(file, "unbuilt", number), number, False
        for number, count in sorted(counts.lines.get(file, {}).items()):
            yield namer.entry(file, "line", number), number, count > 0
        for (begin, end), sides in sorted(counts.branches.get(file, {}).items()):
            text = sources.text(file, begin, end)
            yield namer.entry(file, "true", begin[0], text), begin[0], sides[0] > 0
            yield namer.entry(file, "false", begin[0], text), begin[0], sides[1] > 0
        for (_, place), covered in sorted(counts.conditions.get(file, {}).items()):
            text = counts.condition_text(file, place)
            yield namer.entry(file, "condition", place[0], text), place[0], covered


def missing_lines(sources, reasons):
    """The entries whose line is not in the source."""
    for entry in reasons:
        if entry.line not in (line.strip() for line in sources.lines.get(entry.file, ())):
            yield entry
