"""A C++ source as tokens, as far as mutants need to know it.

The sources are in the house's format, and blanks tell what only a compiler could tell otherwise: binary
operators stand between blanks, the signs of pointers, references and template arguments do not.
"""

import bisect
import re

TOKEN = re.compile(
    r"""(?P<blank>\s+|\\\n)
      |(?P<comment>//[^\n]*|/\*.*?\*/)
      |(?P<string>(?:u8|[uUL])?R"(?P<mark>[^(\s]*)\(.*?\)(?P=mark)"|(?:u8|[uUL])?"(?:\\.|[^"\\])*")
      |(?P<char>(?:u8|[uUL])?'(?:\\.|[^'\\])+')
      |(?P<number>0[xX][0-9a-fA-F']*\.?[0-9a-fA-F']*(?:[pP][+-]?\d+)?[uUlLfF]*
                 |(?:\d[\d']*\.?[\d']*|\.\d[\d']*)(?:[eE][+-]?\d+)?[uUlLfF]*)
      |(?P<name>[A-Za-z_]\w*)
      |(?P<operator><=>|<<=|->\*|\.\.\.|::|->|\+\+|--|<<|<=|==|!=|&&|\|\||[-+*/%&|^]=|>|.)""",
    re.VERBOSE | re.DOTALL,
)
CLOSING = {"(": ")", "[": "]", "{": "}"}
# What the compiler of the mutants defines and does not define.
DEFINED = {"__SSE2__", "__GNUC__", "__x86_64__", "GRIDMILL_PINNED"}


class Token:
    __slots__ = ("kind", "text", "start", "end", "before", "after", "match", "parent", "angle")

    def __init__(self, kind, text, start):
        self.kind, self.text, self.start, self.end = kind, text, start, start + len(text)
        self.before = self.after = False  # a blank stands there
        self.match = None  # of a bracket: the other one
        self.parent = None  # the innermost bracket that is open
        self.angle = False  # within template arguments or parameters

    @property
    def binary(self):
        return self.before and self.after


def holds(condition):
    """The value of a preprocessor condition for the compiler of the mutants."""
    text = re.sub(r"defined\s*\(?\s*(\w+)\s*\)?", lambda m: str(m[1] in DEFINED), condition)
    text = text.replace("&&", " and ").replace("||", " or ").replace("!", " not ")
    return bool(eval(text, {"__builtins__": {}}))  # only True, False and operators are left


def blank_directives(text):
    """The text with blanks instead of preprocessor lines and of what they leave out."""
    lines, active, going_on = [], [True], False
    for line in text.split("\n"):
        directive = re.match(r"\s*#\s*(\w+)\s*(.*)", line)
        keep = active[-1] and not directive and not going_on
        if directive:
            name, rest = directive[1], directive[2]
            if name in ("if", "ifdef", "ifndef"):
                met = holds(rest) if name == "if" else (rest.strip() in DEFINED) == (name == "ifdef")
                active.append(active[-1] and met)
            elif name == "else":
                active[-1] = not active[-1] and active[-2]
            elif name == "elif":
                raise ValueError("#elif is more than this reader knows")
            elif name == "endif":
                active.pop()
        going_on = (directive is not None or going_on) and line.endswith("\\")
        lines.append(line if keep else " " * len(line))
    return "\n".join(lines)


class Source:
    """The tokens of a file without comments, and how brackets pair."""

    def __init__(self, path, text):
        self.path, self.text = path, text
        self.code = blank_directives(text)
        self.starts = [0] + [m.end() for m in re.finditer("\n", text)]
        self.tokens = []
        self._read()
        self._pair()
        self.blocks = {i for i, t in enumerate(self.tokens) if t.text == "{" and self._is_block(i)}

    def line_of(self, position):
        return bisect.bisect_right(self.starts, position)

    def column_of(self, position):
        return position - self.starts[self.line_of(position) - 1] + 1

    def line_text(self, line):
        end = self.starts[line] if line < len(self.starts) else len(self.text)
        return self.text[self.starts[line - 1] : end].strip()

    def plain(self, start, end):
        """The text of a range on one line and without comments."""
        text = re.sub(r"//[^\n]*|/\*.*?\*/", " ", self.text[start:end], flags=re.DOTALL)
        return re.sub(r"\s*\n\s*", " ", text)

    def _read(self):
        position, blank = 0, True
        while position < len(self.code):
            found = TOKEN.match(self.code, position)
            kind, text = found.lastgroup, found[0]
            if kind == "mark":
                kind = "string"
            if kind in ("blank", "comment"):
                blank = True
                if self.tokens:
                    self.tokens[-1].after = True
            else:
                if text == ">" and blank:
                    text = re.match(r">>=|>>|>=|>", self.code[position:])[0]
                token = Token(kind, text, position)
                token.before, blank = blank, False
                self.tokens.append(token)
            position += len(text)

    def _opens_angle(self, i):
        token, previous = self.tokens[i], self.tokens[i - 1] if i else None
        if token.text != "<" or previous is None:
            return False
        return previous.text == "template" or (previous.kind == "name" and not token.before)

    def _pair(self):
        opened = []
        for i, token in enumerate(self.tokens):
            if token.text == ">" and opened and self.tokens[opened[-1]].text == "<":
                self._close(opened.pop(), i)
            elif token.text in (")", "]", "}"):
                self._close(opened.pop(), i)
            token.parent = opened[-1] if opened else None
            token.angle = any(self.tokens[k].text == "<" for k in opened)
            if token.text in CLOSING or self._opens_angle(i):
                opened.append(i)
        if opened:
            raise ValueError(f"{self.path}: a bracket is not closed")

    def _close(self, first, last):
        self.tokens[first].match, self.tokens[last].match = last, first

    def _is_block(self, i):
        """True for the brace of a block or a scope, false for that of an initialiser."""
        token, previous = self.tokens[i], self.tokens[i - 1] if i else None
        if previous is None or previous.text in (")", "]", ";", "}"):
            return True
        if previous.text in ("=", "return", ",", "(", "?", ":", "{") or not token.before:
            return previous.text == "{" and (i - 1) in getattr(self, "blocks", ()) and token.before
        return True

    def is_statement_end(self, i):
        """True for a `;` of a block: not for those in the head of a `for`."""
        parent = self.tokens[i].parent
        return self.tokens[i].text == ";" and (parent is None or parent in self.blocks)

    def back(self, i):
        """The token before i on its level: a pair of brackets counts as one, by the opening one."""
        i -= 1
        if i >= 0 and self.tokens[i].match is not None and self.tokens[i].match < i:
            return self.tokens[i].match
        return i

    def forth(self, i):
        """The token behind i on its level."""
        match = self.tokens[i].match
        return (match if match is not None and match > i else i) + 1

    def is_control(self, i):
        """True if the bracket i opens the head of a control statement."""
        if self.tokens[i].text != "(" or i == 0:
            return False
        head = self.tokens[i - 1].text
        return head in ("if", "for", "while", "switch", "constexpr")

    def statement_start(self, i):
        """The first token of the statement that i belongs to."""
        first = i
        while True:
            k = self.back(first)
            if k < 0 or k == self.tokens[first].parent:
                return first
            token = self.tokens[k]
            if token.text in (";", "else", "do", "try") or k in self.blocks or self.is_control(k):
                return first
            if token.text == ":" and self.tokens[self.back(k)].text in ("public", "private", "protected"):
                return first
            first = k

    def head_of(self, block):
        """The texts of the statement that a block belongs to."""
        first = self.statement_start(block)
        return [t.text for t in self.tokens[first:block] if not t.angle]

    def in_function(self, i):
        """True if a statement at i is executed: the innermost block is no class and no namespace."""
        parent = self.tokens[i].parent
        if parent is None or parent not in self.blocks:
            return False
        head = self.head_of(parent)
        return not {"namespace", "class", "struct", "union", "enum", "extern"} & set(head[:4]) or "(" in head

    def is_constant(self, i):
        """True where the compiler has to know the value itself."""
        while i is not None:
            first = self.statement_start(i)
            texts = [t.text for t in self.tokens[first : i + 1]]
            if "constexpr" in texts and not (
                texts[:2] == ["if", "constexpr"] and self._behind_head(first, i)
            ):
                return "(" not in texts or "=" in texts or texts[:1] == ["if"] or "static" in texts
            if {"static_assert", "using", "enum", "case", "alignas", "requires", "noexcept"} & set(texts):
                return True
            parent = self.tokens[i].parent
            i = None if parent is None or parent in self.blocks else parent
        return False

    def _behind_head(self, first, i):
        return first + 2 < len(self.tokens) and (self.tokens[first + 2].match or i) < i
