"""All mutants of a source in one text, where a number chooses at run time which of them is alive."""

import bisect
import re

SWITCH = "gridmill_mutant"
HEADER = f"extern int {SWITCH};\n"
# The number is there before the first constructor of the program runs.
DEFINITION = f"""#include <cstdlib>
int {SWITCH} = 0;
__attribute__((constructor(101))) static void ChooseMutant() {{
  if (const char* const number = std::getenv("GRIDMILL_MUTANT")) {SWITCH} = std::atoi(number);
}}
"""
OPENING = {
    "choice": "({switch} == {number} ? {text} : ",
    "negation": "(({switch} == {number}) != static_cast<bool>(",
    "removal": "{{ if ({switch} != {number}) ",
    "order": "{{ if ({switch} == {number}) {{ {text} }} else {{ ",
}
ENDING = {"choice": ")", "negation": "))", "removal": " }", "order": " }}"}
OUTERMOST = ["order", "removal", "negation", "choice"]


class Schema:
    def __init__(self, text, mutants):
        """Mutants whose ranges cross those of others, or that have no form, are in `left`."""
        self.mutants, self.left = [], []
        self._spans = []  # (start, end, number) of the text of a mutant, then of all that it wraps
        self._nest(mutants)
        self._pieces, self._length = [], 0
        self._write(text)
        self.text = "".join(self._pieces)
        self._lines = [0] + [m.end() for m in re.finditer("\n", self.text)]

    def _nest(self, mutants):
        order = sorted(mutants, key=lambda m: (m.start, -m.end, OUTERMOST.index(m.form) if m.form else 9))
        opened = []
        for mutant in order:
            while opened and opened[-1].end <= mutant.start:
                opened.pop()
            if mutant.form is None or (opened and mutant.end > opened[-1].end):
                self.left.append(mutant)
            else:
                opened.append(mutant)
                self.mutants.append(mutant)

    def _put(self, text):
        self._pieces.append(text)
        self._length += len(text)

    def _write(self, text):
        position, opened = 0, []

        def close_until(limit):
            nonlocal position
            while opened and opened[-1][0].end <= limit:
                mutant, start = opened.pop()
                self._put(text[position : mutant.end])
                self._put(ENDING[mutant.form])
                position = mutant.end
                self._spans.append((start, self._length, mutant.number, False))

        for mutant in self.mutants:
            close_until(mutant.start)
            self._put(text[position : mutant.start])
            position = mutant.start
            start = self._length
            self._put(OPENING[mutant.form].format(switch=SWITCH, number=mutant.number, text=mutant.text))
            self._spans.append((start, self._length, mutant.number, True))
            opened.append((mutant, start))
        close_until(len(text))
        self._put(text[position:])

    def blamed(self, positions):
        """The mutants at which the compiler complained: (line, column) of this text."""
        found = set()
        for line, column in positions:
            at = self._lines[min(line, len(self._lines)) - 1] + column - 1
            own = [s for s in self._spans if s[3] and s[0] <= at < s[1]]
            around = [s for s in self._spans if not s[3] and s[0] <= at < s[1]]
            inner = own or around
            if inner:
                found.add(min(inner, key=lambda s: s[1] - s[0])[2])
                continue
            first = self._lines[line - 1] if line <= len(self._lines) else 0
            k = bisect.bisect_right(self._lines, first)
            last = self._lines[k] if k < len(self._lines) else len(self.text)
            found.update(s[2] for s in self._spans if s[0] < last and s[1] > first)
        return found
