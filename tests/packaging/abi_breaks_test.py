#!/usr/bin/env python3
"""packaging/check_abi finds what breaks programs that were linked before, and passes what does not.

Usage: abi_breaks_test.py libgridmill.so [compiler]
"""

import pathlib
import shutil
import subprocess
import sys
import tempfile

ROOT = pathlib.Path(__file__).resolve().parents[2]
OPERATORS = "processes/gridmill/"

# (file, what is replaced, by what) in a private copy of the sources.
EDITS = [
    # A virtual function more.
    (
        OPERATORS + "iprocessor.h",
        "  virtual ~IProcessor() = default;\n",
        "  virtual ~IProcessor() = default;\n  virtual int Added() const { return 0; }\n",
    ),
    # A field less.
    (OPERATORS + "filterslp.h", "  float ELSZ;", "  // "),
    (OPERATORS + "filterslp.h", ", ELSZ(elevationScale)", ""),
    (OPERATORS + "filterslp.h", "ELSZ = value;", "YSIZE = value;"),
    (OPERATORS + "filterslp.cpp", "YSIZE, ELSZ}", "YSIZE, YSIZE}"),
    # Two fields in each other's place: no size changes.
    (OPERATORS + "filterasp.h", "  float XSIZE =", "  float Swapped ="),
    (OPERATORS + "filterasp.h", "  float YSIZE =", "  float XSIZE ="),
    (OPERATORS + "filterasp.h", "  float Swapped =", "  float YSIZE ="),
    # Values of an enumeration in another order.
    (OPERATORS + "difftype.h", "eDIFF_ABSOLUTE", "eDIFF_SWAPPED"),
    (OPERATORS + "difftype.h", "eDIFF_FORWARD", "eDIFF_ABSOLUTE"),
    (OPERATORS + "difftype.h", "eDIFF_SWAPPED", "eDIFF_FORWARD"),
]
EXPECTED = [
    "Added() const",
    "'float ELSZ'",
    "orvik::filters::details::AspParams",
    "eDIFF_FORWARD",
]


def check(root, library, options):
    """The exit status and the words of check_abi over the tree `root`."""
    outcome = subprocess.run(
        [sys.executable, str(ROOT / "packaging" / "check_abi"), "--root", str(root), *options, library],
        capture_output=True, text=True,
    )
    return outcome.returncode, outcome.stdout + outcome.stderr


def break_copy(copy):
    for folder in ("basic", "processes", "cmake"):
        shutil.copytree(ROOT / folder, copy / folder)
    for name, old, new in EDITS:
        path = copy / name
        text = path.read_text(encoding="utf-8")
        if old not in text:
            sys.exit(f"{name} does not hold {old!r}: renew the edits of this test")
        path.write_text(text.replace(old, new), encoding="utf-8")


def main():
    library, compiler = sys.argv[1], sys.argv[2:]
    options = ["--compiler", *compiler] if compiler else []
    with tempfile.TemporaryDirectory() as name:
        copy = pathlib.Path(name)
        break_copy(copy)
        status, words = check(copy, library, options)
    missing = [text for text in EXPECTED if text not in words]
    if status != 1 or missing:
        sys.exit(f"status {status}, not reported: {missing}\n{words}")
    print(f"{len(EXPECTED)} breaks reported")


main()
