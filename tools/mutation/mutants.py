"""The mutants of a source: small changes that a test should notice."""

import math
import re
import struct

PRECEDENCE = {}
for level, operators in enumerate(
    ("||", "&&", "|", "^", "&", "== !=", "< <= > >=", "<=>", "<< >>", "+ -", "* / %"), start=1
):
    PRECEDENCE.update(dict.fromkeys(operators.split(), level))
ASSIGNMENTS = {"=", "+=", "-=", "*=", "/=", "%=", "&=", "|=", "^=", "<<=", ">>="}
WORDS = {"return", "throw", "case", "else", "do", "delete", "co_return", "new", "goto"}

CHANGES = {
    "+": ["-"],
    "-": ["+"],
    "*": ["/"],
    "/": ["*"],
    "%": ["*"],
    "<": ["<=", ">="],
    "<=": ["<", ">"],
    ">": [">=", "<="],
    ">=": [">", "<"],
    "==": ["!="],
    "!=": ["=="],
    "&&": ["||"],
    "||": ["&&"],
    "&": ["|"],
    "|": ["&"],
    "^": ["&"],
    "<<": [">>"],
    ">>": ["<<"],
    "+=": ["-="],
    "-=": ["+="],
    "*=": ["/="],
    "/=": ["*="],
    "|=": ["&="],
    "&=": ["|="],
    "^=": ["|="],
    "<<=": [">>="],
    ">>=": ["<<="],
}
# Functions that can stand for each other.
TWINS = {
    "min": "max",
    "max": "min",
    "floor": "ceil",
    "ceil": "floor",
    "ClipTo": "PlainCast",
    "PlainCast": "ClipTo",
    "front": "back",
    "back": "front",
}
NOT_FIRST = {
    "const",
    "constexpr",
    "static",
    "using",
    "typedef",
    "auto",
    "return",
    "template",
    "if",
    "for",
    "while",
    "do",
    "switch",
    "case",
    "default",
    "else",
    "friend",
    "struct",
    "class",
    "enum",
    "public",
    "private",
    "protected",
    "namespace",
    "extern",
    "static_assert",
    "goto",
    "try",
    "catch",
    "inline",
    "explicit",
    "virtual",
    "mutable",
    "volatile",
    "unsigned",
    "signed",
    "throw",
}


class Mutant:
    """A change of the range from `start` to `end`.

    `form` says how a switch between the two is written: "choice" between expressions, "negation" of a
    condition, "removal" of a statement, "order" of two statements, None for one that is compiled on its own.
    """

    def __init__(self, source, at, start, end, kind, change, text, form):
        self.source, self.start, self.end = source, start, end
        self.kind, self.change, self.text, self.form = kind, change, text, form
        self.line, self.column = source.line_of(at), source.column_of(at)
        self.line_text = source.line_text(self.line)
        indent = len(source.text[source.starts[self.line - 1] :]) - len(
            source.text[source.starts[self.line - 1] :].lstrip()
        )
        self.at = self.column - indent  # within the line's text
        self.nth = 1  # among the mutants of equal lines
        self.number = 0  # within its file

    @property
    def key(self):
        """What stays the same when the lines around change."""
        return f"{self.source.path}|{self.line_text}|{self.at}|{self.kind}|{self.change}|{self.nth}"

    @property
    def name(self):
        return f"{self.source.path}:{self.line}:{self.column}:{self.kind}"

    def applied(self):
        text = self.source.text
        return text[: self.start] + self.text + text[self.end :]

    def after(self):
        """The source line, or lines, as the mutant has them."""
        first = self.source.text.rfind("\n", 0, self.start) + 1
        last = self.source.text.find("\n", self.end)
        text = self.source.text[first : self.start] + self.text + self.source.text[self.end : last]
        return " ".join(text.split())

    def before(self):
        first = self.source.text.rfind("\n", 0, self.start) + 1
        last = self.source.text.find("\n", self.end)
        return " ".join(self.source.text[first:last].split())


def next_float(text):
    """The literal of the next greater number of the same type."""
    digits, suffix = re.fullmatch(r"(.*?)([fFlL]?)", text.replace("'", "")).groups()
    value = float.fromhex(digits) if digits.lower().startswith("0x") else float(digits)
    if suffix.lower() != "f":
        return repr(math.nextafter(value, math.inf)) + suffix
    bits = struct.unpack("<I", struct.pack("<f", value))[0]
    following = struct.unpack("<f", struct.pack("<I", bits + 1))[0]
    shown = f"{following:.9g}"
    return (shown if "." in shown or "e" in shown else shown + ".0") + suffix


def changed_numbers(text):
    """The literals that stand for this one."""
    hexadecimal = text.lower().startswith("0x")
    floating = "p" in text.lower() if hexadecimal else re.search(r"[.eE]", text) or text[-1] in "fF"
    if floating:
        zero = not re.search(r"[1-9]", text.lower().split("p")[0].split("e")[0])
        return [re.sub(r"0", "1", text, count=1) if zero and not hexadecimal else next_float(text)]
    digits, suffix = re.fullmatch(r"(0[xX][0-9a-fA-F']+|[\d']+)([uUlL]*)", text).groups()
    value = int(digits.replace("'", ""), 0 if hexadecimal else 10)
    return [f"{value + 1}{suffix}"] + ([f"{value - 1}{suffix}"] if value > 1 else [])


class Finder:
    def __init__(self, source):
        self.source, self.tokens, self.found = source, source.tokens, []

    def all(self):
        for i, token in enumerate(self.tokens):
            # Template arguments are types mostly, and what they are otherwise the compiler has to know.
            if token.angle or (i and self.tokens[i - 1].text == "operator"):
                continue
            if token.kind == "operator":
                self._operator(i, token)
            elif token.kind == "number":
                self._number(i, token)
            elif token.kind == "name":
                self._name(i, token)
        negated = {(m.start, m.end) for m in self.found if m.change in ("== -> !=", "!= -> ==", "! -> !!")}
        self.found = [m for m in self.found if m.kind != "condition" or (m.start, m.end) not in negated]
        self.found.sort(key=lambda m: (m.line, m.column, m.kind, m.change))
        seen = {}
        for number, mutant in enumerate(self.found, start=1):
            mutant.number = number
            same = (mutant.line_text, mutant.at, mutant.kind, mutant.change)
            mutant.nth = seen[same] = seen.get(same, 0) + 1
        return self.found

    def _add(self, i, first, last, kind, change, text, form):
        """A mutant of token i that changes the tokens from `first` to `last`."""
        start, end = self.tokens[first].start, self.tokens[last].end
        # Two lambdas are of two types, and statements of one do not go into two branches of an expression.
        if form == "choice" and any(k in self.source.blocks for k in range(first, last + 1)):
            form = None
        if form and self.source.is_constant(i):
            form = None
        self.found.append(Mutant(self.source, self.tokens[i].start, start, end, kind, change, text, form))

    # ---- extents

    def _ends(self, k, level):
        """True if an operand of an operator of this level does not go beyond the token k."""
        token = self.tokens[k]
        if token.text in (";", ",", "?", ":", "{", "}", "(", "[", ")", "]") and token.match is None:
            return True
        if k in self.source.blocks or token.text in WORDS or (token.text in ASSIGNMENTS and token.binary):
            return True
        return token.binary and PRECEDENCE.get(token.text, 99) < level

    def _first(self, i, level):
        first = i
        while True:
            k = self.source.back(first)
            if k < 0 or k == self.tokens[i].parent or self._ends(k, level) or self.source.is_control(k):
                return first
            if self.tokens[k].text == "[" and not self._subscripts(k):
                return first
            first = k

    def _subscripts(self, k):
        return k > 0 and (self.tokens[k - 1].kind == "name" or self.tokens[k - 1].text in (")", "]", ">"))

    def _last(self, i, level):
        k = i + 1
        while True:
            match = self.tokens[k].match
            k = match if match is not None and match > k else k
            following = k + 1
            token = self.tokens[following]
            closes = token.match is not None and token.match < following
            if closes or self._ends(following, level + 1):
                return k
            k = following

    # ---- kinds

    def _operator(self, i, token):
        text = token.text
        if text in ASSIGNMENTS and token.binary:
            self._assignment(i, text)
        elif text in PRECEDENCE and token.binary:
            self._binary(i, text)
        elif text == "?":
            self._condition(self._first(i, 0), i - 1, i)
        elif text == "!" and not token.after:
            self._sign(i, "not", "!!")
        elif text == "-" and not token.after and not self._is_operand(i - 1):
            self._sign(i, "sign", "+")
        elif self.source.is_statement_end(i) and self.source.in_function(i):
            self._removal(i)

    def _is_operand(self, k):
        token = self.tokens[k]
        return (token.kind in ("name", "number") and token.text not in WORDS) or token.text in (")", "]")

    def _between(self, i, first, last, operator):
        plain = self.source.plain
        left = plain(self.tokens[first].start, self.tokens[i].start).rstrip()
        return f"{left} {operator} {plain(self.tokens[i].end, self.tokens[last].end).lstrip()}"

    def _binary(self, i, text):
        level = PRECEDENCE[text]
        first, last = self._first(i, level), self._last(i, level)
        kind = "compare" if text in ("<", "<=", ">", ">=", "==", "!=") else "operator"
        for other in CHANGES[text] if first < i else []:
            self._add(
                i, first, last, kind, f"{text} -> {other}", self._between(i, first, last, other), "choice"
            )

    def _assignment(self, i, text):
        if text not in CHANGES:
            return
        first, last = self._first(i, 0), self._last(i, 0)
        other = CHANGES[text][0]
        self._add(
            i, first, last, "assign", f"{text} -> {other}", self._between(i, first, last, other), "choice"
        )

    def _sign(self, i, kind, other):
        last = self._last(i, 90)
        text = other + self.source.plain(self.tokens[i].end, self.tokens[last].end)
        self._add(i, i, last, kind, f"{self.tokens[i].text} -> {other}", text, "choice")

    def _number(self, i, token):
        pure = self.tokens[i - 1].text == "=" and self.tokens[i - 2].text in (")", "const", "override")
        for other in [] if pure else changed_numbers(token.text):
            form = None if self._is_extent(i) else "choice"
            self._add(i, i, i, "literal", f"{token.text} -> {other}", other, form)

    def _is_extent(self, i):
        """True for the N of `T name[N]`: with a choice there it would become an array of variable length."""
        if self.tokens[i - 1].text != "[" or self.tokens[i + 1].text != "]":
            return False
        before = self.tokens[i - 3]
        is_type = before.kind == "name" and before.text not in WORDS or before.text in (">", "*", "&")
        return self.tokens[i - 2].kind == "name" and is_type

    def _condition(self, first, last, at, form="negation"):
        text = self.source.plain(self.tokens[first].start, self.tokens[last].end)
        self._add(at, first, last, "condition", "c -> !c", f"!({text})", form)

    def _name(self, i, token):
        text, following = token.text, self.tokens[i + 1].text if i + 1 < len(self.tokens) else ""
        if text in ("true", "false"):
            other = "false" if text == "true" else "true"
            self._add(i, i, i, "literal", f"{text} -> {other}", other, "choice")
        elif text in TWINS and following in ("(", "<") and self.tokens[i - 1].text in ("::", ".", "->"):
            self._twin(i, TWINS[text])
        elif text == "static_cast" and following == "<":
            self._cast(i)
        elif text in ("if", "while"):
            self._control(i)

    def _twin(self, i, other):
        first = i
        while self.tokens[first - 1].text in ("::", ".", "->") and not self.tokens[first - 1].before:
            first = self.source.back(first - 1)
            if self.tokens[first].text in ("(", "["):
                first -= 1
        last = self.tokens[i + 1].match
        if last is not None and self.tokens[i + 1].text == "<":
            last = self.tokens[last + 1].match if self.tokens[last + 1].text == "(" else None
        if last is None or self.tokens[first].kind != "name":
            return
        text = self._replaced(first, last, i, other)
        self._add(i, first, last, "function", f"{self.tokens[i].text} -> {other}", text, "choice")

    def _replaced(self, first, last, i, other):
        plain = self.source.plain
        head = plain(self.tokens[first].start, self.tokens[i].start)
        return head + other + plain(self.tokens[i].end, self.tokens[last].end)

    def _cast(self, i):
        close = self.tokens[i + 1].match
        last = self.tokens[close + 1].match
        text = self.source.plain(self.tokens[close + 1].start, self.tokens[last].end)
        self._add(i, i, last, "cast", "static_cast<T>(x) -> (x)", text, None)

    def _control(self, i):
        head = i + 2 if self.tokens[i + 1].text == "constexpr" else i + 1
        close = self.tokens[head].match
        declares = any(
            t.parent == head and (t.text == ";" or t.text == "=") for t in self.tokens[head + 1 : close]
        )
        if not declares:
            self._condition(head + 1, close - 1, i, "negation" if head == i + 1 else None)
        if self.tokens[i].text == "if" and head == i + 1:
            self._order(i)

    # ---- statements

    def _removal(self, i):
        first = self.source.statement_start(i)
        texts = [t.text for t in self.tokens[first:i]]
        if texts and (
            len(texts) == 1 and texts[0] in ("break", "continue", "return") or self._is_expression(first, i)
        ):
            self._add(first, first, i, "removal", "statement -> ;", ";", "removal")

    def _is_expression(self, first, end):
        """True for a statement that is a call or an assignment, false for a declaration."""
        k = first
        while self.tokens[k].text in ("*", "++", "--", "::"):
            k += 1
        if self.tokens[k].text == "(":
            return True
        if self.tokens[k].kind != "name" or self.tokens[k].text in NOT_FIRST:
            return False
        while k < end and (self.tokens[k].kind == "name" or self.tokens[k].text == "::"):
            following = self.tokens[k + 1]
            if self.tokens[k].kind == "name" and following.text == "<" and following.match is not None:
                k = following.match
            k += 1
            if self.tokens[k].kind == "name" and self.tokens[k - 1].text != "::":
                return self.tokens[first].text == "delete"
        text = self.tokens[k].text
        return text in ("(", "[", ".", "->", "++", "--") or (text in ASSIGNMENTS and self.tokens[k].before)

    def _if_end(self, i):
        """The last token of the `if` at i, None where it has an `else` or goes on otherwise."""
        k = self.tokens[i + 1].match + 1
        if k in self.source.blocks:
            end = self.tokens[k].match
        else:
            if self.tokens[k].text in ("if", "for", "while", "do", "switch"):
                return None
            end = k
            while not self.source.is_statement_end(end):
                end = self.source.forth(end)
                if end >= len(self.tokens):
                    return None
        return None if self.tokens[end + 1].text == "else" else end

    def _order(self, i):
        """Two tests that leave one after the other, the other way round."""
        if self.source.statement_start(i) != i or self.tokens[i - 1].text in ("else", ")"):
            return
        end = self._if_end(i)
        if end is None or self.tokens[end + 1].text != "if" or self.tokens[end + 2].text != "(":
            return
        second_end = self._if_end(end + 1)
        plain = self.source.plain
        if second_end is None:
            return
        one = plain(self.tokens[i].start, self.tokens[end].end)
        two = plain(self.tokens[end + 1].start, self.tokens[second_end].end)
        leaving = r"\b(return|continue|break|throw|Throw\w*)\b"
        if re.search(leaving, one) and re.search(leaving, two):
            self._add(i, i, second_end, "order", "if a; if b -> if b; if a", f"{two} {one}", "order")


def mutants_of(source):
    return Finder(source).all()
