"""The programs in the documents: takes them out, runs them, compares what they print.

A page shows a program in a fenced block of C++ or Python, and right after it in a block of text what it
prints. A page that is short of room says so in the comments of the lines that print instead.

Usage: snippets.py extract <folder> <page>...   write the C++ programs to <folder>/<page>.cpp
       snippets.py cpp <program> <page>         run the compiled program of a page
       snippets.py python <page>...             run the Python programs, each in a namespace of its own
       snippets.py pages <tree>                 check that each operator has a page, its sections and links
"""

import contextlib
import ctypes
import difflib
import os
import pathlib
import re
import subprocess
import sys
import tempfile
import traceback
from typing import Iterator, NamedTuple

SECTIONS = ["Formula", "Types", "Mask and no-data", "Output", "Cost", "C++", "Python", "Deliberate"]
# Headers of no operator, and the one that two operators share.
NO_OPERATORS = {"changeparams", "difftype", "gridmill", "ichange", "iprocessor", "tasseledcapchange"}
SHARED = {"tcgnchange", "tcsbchange"}


class PageError(Exception):
    """What is wrong with a page."""


class Block(NamedTuple):
    """A fenced block: its language, the number of its first line in the page, its text."""

    language: str
    line: int
    text: str


class Snippet(NamedTuple):
    """A program of a page and what it prints."""

    line: int
    code: str
    expected: str


def blocks(page: pathlib.Path) -> Iterator[Block]:
    """The fenced blocks of a page in their order."""
    lines = page.read_text(encoding="utf-8").split("\n")
    opening = None
    for number, line in enumerate(lines, 1):
        if not line.startswith("```"):
            continue
        if opening is None:
            opening = number
            continue
        text = "".join(f"{inner}\n" for inner in lines[opening : number - 1])
        yield Block(lines[opening - 1][3:], opening + 1, text)
        opening = None
    if opening is not None:
        raise PageError(f"{page}:{opening}: a block that does not end")


def snippet(page: pathlib.Path, language: str) -> Snippet:
    """The one program of a page in this language."""
    found = list(blocks(page))
    places = [place for place, block in enumerate(found) if block.language == language]
    if len(places) != 1:
        raise PageError(f"{page}: {len(places)} blocks of {language}; expected one")
    program = found[places[0]]
    after = found[places[0] + 1] if places[0] + 1 < len(found) else None
    end = program.line + program.text.count("\n")
    if after is not None and after.language == "text" and after.line <= end + 3:
        return Snippet(program.line, program.text, after.text)
    said = re.findall(r"print.*?  +(?:#|//) (.*)", program.text)
    if not said:
        raise PageError(f"{page}:{end}: neither a block of text nor a comment says what the program prints")
    return Snippet(program.line, program.text, "".join(f"{line}\n" for line in said))


def compare(page: pathlib.Path, expected: str, printed: str) -> None:
    """Raises with the differences unless the program printed what its page says."""
    if printed != expected:
        pair = (expected.splitlines(), printed.splitlines())
        lines = difflib.unified_diff(*pair, "the page", "printed", lineterm="")
        raise PageError(f"{page}: the program prints something else\n" + "\n".join(lines))


def extract(folder: pathlib.Path, pages: list[pathlib.Path]) -> None:
    """Writes the C++ program of each page. Messages of the compiler name the lines of the page."""
    folder.mkdir(parents=True, exist_ok=True)
    for page in pages:
        found = snippet(page, "cpp")
        program = folder / f"{page.stem.lower()}.cpp"
        text = f'#line {found.line} "{page}"\n{found.code}'
        if not program.exists() or program.read_text(encoding="utf-8") != text:
            program.write_text(text, encoding="utf-8")


def run_cpp(program: str, page: pathlib.Path) -> None:
    """Runs the compiled program of a page."""
    run = subprocess.run([program], capture_output=True, text=True, check=False)
    if run.returncode != 0:
        raise PageError(f"{page}: the program ended with {run.returncode}\n{run.stderr}")
    compare(page, snippet(page, "cpp").expected, run.stdout)


@contextlib.contextmanager
def captured(printed: list[str]) -> Iterator[None]:
    """Takes what Python and C print to the standard output, in the order in which they print it."""
    libc = ctypes.CDLL(None)
    libc.setvbuf(ctypes.c_void_p.in_dll(libc, "stdout"), None, 2, ctypes.c_size_t(0))  # _IONBF
    sys.stdout.reconfigure(line_buffering=True)
    screen = os.dup(1)
    with tempfile.TemporaryFile() as file:
        os.dup2(file.fileno(), 1)
        try:
            yield
        finally:
            sys.stdout.flush()
            os.dup2(screen, 1)
            os.close(screen)
            file.seek(0)
            printed.append(file.read().decode())


def run_python(page: pathlib.Path) -> None:
    """Runs the Python program of a page. A traceback names the lines of the page."""
    found = snippet(page, "python")
    code = compile("\n" * (found.line - 1) + found.code, str(page), "exec")
    printed: list[str] = []
    try:
        with captured(printed):
            exec(code, {"__name__": "__main__"})
    except (Exception, SystemExit) as error:
        raise PageError(f"{page}: the program fails\n{traceback.format_exc()}") from error
    compare(page, found.expected, printed[0])


def anchors(page: pathlib.Path) -> set[str]:
    """What a link can name in a page: its headings in lower case, with hyphens between the words."""
    headings = re.findall(r"^#+ (.*)$", page.read_text(encoding="utf-8"), re.MULTILINE)
    return {re.sub(r"[^\w -]", "", heading).lower().replace(" ", "-") for heading in headings}


def broken_links(page: pathlib.Path) -> Iterator[str]:
    """The relative links of a page to files and headings that are not there."""
    for name, anchor in re.findall(r"\]\(([^)#]*)#?([^)]*)\)", page.read_text(encoding="utf-8")):
        target = page.parent / name if name else page
        if re.match(r"\w+:", name):
            continue
        if not target.exists():
            yield f"{page}: a link to {name}, which is not there"
        elif anchor and anchor not in anchors(target):
            yield f"{page}: a link to #{anchor} of {target.name}, which is not there"


def page_errors(tree: pathlib.Path) -> Iterator[str]:
    """What is wrong with the set of pages, their sections and their links."""
    folder = tree / "docs" / "operators"
    headers = {header.stem for header in (tree / "processes" / "gridmill").glob("*.h")}
    wanted = headers - NO_OPERATORS | SHARED
    pages = {page.stem: page for page in folder.glob("*.md") if page.stem != "README"}
    yield from (f"{folder / name}.md: is missing" for name in sorted(wanted - set(pages)))
    yield from (f"{pages[name]}: of no operator" for name in sorted(set(pages) - wanted))
    index = (folder / "README.md").read_text(encoding="utf-8")
    unlisted = sorted(name for name in wanted if f"({name}.md)" not in index)
    yield from (f"{folder}/README.md: no link to {name}.md" for name in unlisted)
    for page in pages.values():
        sections = re.findall(r"^## (.*)$", page.read_text(encoding="utf-8"), re.MULTILINE)
        if sections != SECTIONS:
            yield f"{page}: sections {sections}; expected {SECTIONS}"
    for page in [*sorted(folder.glob("*.md")), *sorted((tree / "docs").glob("*.md")), tree / "README.md"]:
        yield from broken_links(page)


def errors_of(pages: list[pathlib.Path]) -> Iterator[str]:
    """What the Python programs of the pages do wrong."""
    for page in pages:
        try:
            run_python(page)
        except PageError as error:
            yield str(error)


def main(command: str = "", *arguments: str) -> int:
    """Runs one command of the usage; 1 if something is wrong."""
    paths = [pathlib.Path(argument) for argument in arguments]
    errors: list[str] = []
    try:
        if command == "extract":
            extract(paths[0], paths[1:])
        elif command == "cpp":
            run_cpp(arguments[0], paths[1])
        elif command == "python":
            errors = list(errors_of(paths))
        elif command == "pages":
            errors = list(page_errors(paths[0]))
        else:
            errors = [__doc__ or ""]
    except PageError as error:
        errors = [str(error)]
    print("\n".join(errors), file=sys.stderr, end="\n" if errors else "")
    return 1 if errors else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
