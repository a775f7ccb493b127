"""What llvm-cov knows of the sources, with the instantiations of a template put together.

llvm-cov takes the best instantiation of a template as its figure, and leaves out the lines of an
`if constexpr` that another instantiation does not compile. Here a line or a side of a branch counts once,
wherever it stands in the source, and is covered if it was in any instantiation.
"""

import bisect
import collections
import re

CODE, SKIPPED = 0, 2
# Lines without code of their own. Which side of an `if constexpr` is compiled, its other lines tell.
TRIVIAL = re.compile(r"\s*([{}()\[\];,\s]*(//.*)?|\} else \{|else|#.*|(\} else )?if constexpr \(.*\)( \{)?)$")


class Sources:
    """The lines of the sources, and which of them hold code."""

    def __init__(self, root, tops=("basic", "processes")):
        self.lines = {}
        for top in tops:
            for path in sorted((root / top).rglob("*")):
                if path.suffix in (".h", ".cpp"):
                    name = str(path.relative_to(root))
                    self.lines[name] = path.read_text(encoding="utf-8").split("\n")

    def name_of(self, filename):
        """The path of a file of ours from the root on, None for another."""
        found = re.search(r"(?:^|/)((?:basic|processes)/.*)", filename)
        return found[1] if found and found[1] in self.lines else None

    def line(self, name, number):
        return self.lines[name][number - 1].strip()

    def has_code(self, name, number):
        return not TRIVIAL.match(self.lines[name][number - 1])

    def first_column(self, name, number):
        line = self.lines[name][number - 1]
        return len(line) - len(line.lstrip()) + 1

    def conditional_code(self, name):
        """What stands between directives of the preprocessor: the first line's directive, lines with code."""
        depth, lines = [], self.lines[name]
        for number, line in enumerate(lines, 1):
            if re.match(r"\s*#\s*if", line):
                depth.append([number, []])
            elif depth and re.match(r"\s*#\s*(else|elif)", line):
                yield depth[-1]
                depth[-1] = [number, []]
            elif depth and re.match(r"\s*#\s*endif", line):
                yield depth.pop()
            elif depth and self.has_code(name, number):
                depth[-1][1].append(number)

    def text(self, name, begin, end):
        if begin[0] == end[0]:
            return self.lines[name][begin[0] - 1][begin[1] - 1 : end[1] - 1]
        parts = [self.lines[name][begin[0] - 1][begin[1] - 1 :]]
        parts += self.lines[name][begin[0] : end[0] - 1]
        parts.append(self.lines[name][end[0] - 1][: end[1] - 1])
        return " ".join(part.strip() for part in parts)


def begin_of(region):
    return region[0], region[1]


def end_of(region):
    return region[2], region[3]


class Functions:
    """Where functions begin and end: a lambda has counts of its own, which those around it do not have."""

    def __init__(self, functions):
        spans = collections.defaultdict(set)
        for name, function in functions:
            outer = function["regions"][0]
            spans[name].add((begin_of(outer), end_of(outer)))
        self.spans = {name: sorted(found) for name, found in spans.items()}

    def within(self, name, span):
        """The functions within another."""
        spans = self.spans[name]
        for at in range(bisect.bisect_right(spans, span), len(spans)):
            if spans[at][0] >= span[1]:
                break
            if spans[at][1] <= span[1]:
                yield spans[at]


def line_counts(sources, name, regions, inner):
    """How often the lines of one function were executed; None where they are not compiled.

    Of a line counts what its first character belongs to, or what begins in it.
    """
    own = [r for r in regions if r[5] == 0 and r[7] in (CODE, SKIPPED)]
    counts = {}
    for region in sorted(own, key=lambda r: (begin_of(r), (-r[2], -r[3]))):
        for number in range(region[0], region[2] + 1):
            first = (number, sources.first_column(name, number))
            if begin_of(region) <= first < end_of(region):
                counts[number] = region[4] if region[7] == CODE else None
    for region in own:
        if region[7] == CODE:
            counts[region[0]] = max(counts.get(region[0]) or 0, region[4])
    for begin, end in inner:
        for number in [n for n in counts if begin <= (n, sources.first_column(name, n)) < end]:
            del counts[number]
    return counts


class Counts:
    """Lines, sides of branches and conditions of decisions, by file.

    `lines`, `branches` and `functions` have counts, `conditions` whether each was shown to decide alone.
    """

    def __init__(self, sources, exported, shown):
        self.sources = sources
        self.lines = collections.defaultdict(dict)
        self.branches = collections.defaultdict(dict)
        self.conditions = collections.defaultdict(dict)
        self.instantiations = collections.Counter()
        self.functions = collections.defaultdict(dict)
        self.not_compiled = collections.defaultdict(set)
        self.llvm_sums = {kind: [0, 0] for kind in ("lines", "branches", "mcdc")}
        for file in exported["files"]:
            for kind, sums in self.llvm_sums.items():
                if sources.name_of(file["filename"]):
                    sums[0] += file["summary"][kind]["covered"]
                    sums[1] += file["summary"][kind]["count"]
        functions = []
        for function in exported["functions"]:
            name = sources.name_of(function["filenames"][0])
            if name:
                functions.append((name, function))
        spans = Functions(functions)
        for name, function in functions:
            self._add_function(name, function, spans)
        for name in sources.lines:
            self._find_not_compiled(name)
        self._add_conditions(shown)

    def _add_function(self, name, function, spans):
        outer = function["regions"][0]
        span = (begin_of(outer), end_of(outer))
        self.instantiations[function["count"] > 0] += 1
        self.functions[name][span] = self.functions[name].get(span, 0) + function["count"]
        inner = spans.within(name, span)
        for number, count in line_counts(self.sources, name, function["regions"], inner).items():
            if not self.sources.has_code(name, number):
                continue
            if count is None:
                self.not_compiled[name].add(number)
            else:
                self.lines[name][number] = self.lines[name].get(number, 0) + count
        for branch in function["branches"]:
            file = self.sources.name_of(function["filenames"][branch[6]])
            sides = self.branches[file].setdefault((begin_of(branch), end_of(branch)), [0, 0, branch[8]])
            sides[0] += branch[4]
            sides[1] += branch[5]

    def _find_not_compiled(self, name):
        """Code that nothing is known of. What the preprocessor leaves out is named by its directive."""
        numbers, lines = self.not_compiled[name], self.lines.get(name, {})
        numbers -= set(lines)
        for directive, code in self.sources.conditional_code(name):
            if code and not any(number in lines for number in code):
                numbers.difference_update(code)
                numbers.add(directive)

    def _add_conditions(self, shown):
        """Reads what `llvm-cov show` says of decisions: it alone says which conditions are constants."""
        name, decision, places = None, None, {}
        for line in shown:
            if found := re.match(r"(\S+):$", line):
                name = self.sources.name_of(found[1])
            elif found := re.search(r"MC/DC Decision Region \((\d+):(\d+)\)", line):
                decision, places = (int(found[1]), int(found[2])), {}
            elif found := re.search(r"Condition C(\d+) --> \((\d+):(\d+)\)", line):
                places[found[1]] = (int(found[2]), int(found[3]))
            elif found := re.search(r"C(\d+)-Pair: (covered|not covered)", line):
                place = (decision, places[found[1]])
                known = self.conditions[name].get(place, False)
                self.conditions[name][place] = known or found[2] == "covered"

    def lines_of(self, entry, number):
        """The lines of a function that begins at a line; none of another entry."""
        if entry.kind != "function":
            return range(0)
        ends = [end[0] for begin, end in self.functions[entry.file] if begin[0] == number]
        return range(number, max(ends) + 1)

    def condition_text(self, name, place):
        ends = [end for begin, end in self.branches[name] if begin == place]
        return self.sources.text(name, place, min(ends)) if ends else self.sources.line(name, place[0])

    def outside_decisions(self):
        """Branches of decisions of which llvm has no conditions."""
        for name, branches in self.branches.items():
            for (begin, end), (_, _, kind) in sorted(branches.items()):
                before = "".join(self.sources.lines[name][begin[0] - 2 : begin[0] - 1])
                before = (before + self.sources.lines[name][begin[0] - 1][: begin[1] - 1]).rstrip(" (!")
                after = self.sources.lines[name][end[0] - 1][end[1] - 1 :].lstrip(" )")
                if kind == 4 and (before.endswith(("&&", "||")) or after.startswith(("&&", "||"))):
                    yield name, begin[0], self.sources.text(name, begin, end)
