"""The table of default types in docs/python.md, cell by cell."""

from __future__ import annotations

import re
from pathlib import Path

import numpy as np
import pytest

from calls import BY_NAME, FUNCTIONS, WITH_OUT, named, parts, type_for
from cases import SHORT_LIST, TYPES, seeded

DOCUMENT = Path(__file__).parents[2] / "docs" / "python.md"
SHAPE = (6, 8)


def table() -> dict[tuple[str, str], str]:
    """(function, image type) -> result type, `-` for a refused one."""
    section = DOCUMENT.read_text().split("\n## Default types\n")[1].split("\n## ")[0]
    rows = [
        [cell.strip() for cell in line.strip("|").split("|")]
        for line in section.splitlines()
        if line.startswith("|")
    ]
    columns = [re.findall(r"`(\w+)`", cell) for cell in rows[0]]
    cells = {}
    for row in rows[2:]:
        for functions, cell in zip(columns[1:], row[1:]):
            cells |= {(function, row[0]): cell for function in functions}
    return cells


TABLE = table()


@pytest.fixture(autouse=True)
def quiet(capfd):
    """The squared gradient prints a line with every call."""
    yield
    capfd.readouterr()


def test_table_has_every_function_and_type():
    apart = {"statistics", "histogram"}
    names = {each.name for each in FUNCTIONS} - apart
    assert set(TABLE) == {(name, dtype) for name in names for dtype in TYPES}


@pytest.mark.parametrize("function,dtype", TABLE, ids=[f"{function}-{dtype}" for function, dtype in TABLE])
def test_result_has_the_type_of_the_table(function, dtype):
    each = BY_NAME[function]
    images = each.images(seeded(function), SHAPE, dtype)
    if TABLE[function, dtype] == "-":
        with pytest.raises(TypeError, match=f"^(image|reference): .*{dtype}.*expected"):
            each.call(images)
    else:
        result = each.call(images)
        assert [array.dtype for array in parts(result)] == [TABLE[function, dtype]] * len(parts(result))


def test_table_says_what_was_meant():
    """The table again, so that neither the document nor the package changes alone."""
    wide = {name: np.dtype(name).itemsize > 2 for name in TYPES}
    step = {
        "int8": "int16",
        "uint8": "int16",
        "int16": "int32",
        "uint16": "int32",
        "float32": "float32",
        "float64": "float64",
    }
    kept = ("mirror", "transfer", "combine", "synthetic_blue", "natural_color")
    for (function, dtype), cell in TABLE.items():
        if BY_NAME[function].short_list:
            want = "float32" if dtype in SHORT_LIST else "-"
        elif function in ("threshold", "range_classes"):
            want = "uint8"
        elif function in kept:
            want = dtype
        elif function == "channel_difference":
            want = step.get(dtype, "int64")
        elif function in ("intensity_ratio", "magnitude_change", "tasseled_cap_change"):
            want = "float64" if wide[dtype] and dtype != "float32" else "float32"
        else:
            want = "float64" if function in ("squared_gradient", "vollath") else "float32"
        assert cell == want, (function, dtype)


@pytest.mark.parametrize("dtype", TYPES)
def test_statistics_and_histogram_have_types_of_their_own(dtype):
    each = BY_NAME["statistics"]
    got = each.call(each.images(seeded(dtype), SHAPE, dtype))
    assert (got.minimum.dtype, got.maximum.dtype, got.histogram.dtype) == (np.float32, np.float32, np.int64)
    assert got.histogram.shape == (2, 256 if np.dtype(dtype).itemsize == 1 else 65536)
    got = BY_NAME["histogram"].call(each.images(seeded(dtype), SHAPE, dtype))
    assert (got.minimum.dtype, got.maximum.dtype, got.counts.dtype) == (np.float32, np.float32, np.int32)


@pytest.mark.parametrize("each", **named(WITH_OUT))
def test_any_type_of_result_may_be_asked_for(each):
    for dtype in TYPES:
        images = each.images(seeded(each.name), SHAPE, type_for(each, dtype))
        for out_type in TYPES:
            if type_for(each, out_type) == out_type:
                assert each.call(images, dtype=out_type).dtype == out_type


@pytest.mark.parametrize("each", **named([each for each in FUNCTIONS if each.short_list]))
def test_reference_of_another_type_of_the_short_list_is_taken(each):
    for dtype in SHORT_LIST:
        images = each.images(seeded(each.name), SHAPE, "uint8")
        images["reference"] = images["reference"].astype(dtype)
        assert each.call(images).dtype == np.float32
