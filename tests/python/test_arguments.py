"""Bad arguments: what is raised, which argument the message names, and what it says."""

from __future__ import annotations

import re

import numpy as np
import pytest

import gridmill as gm
from calls import BY_NAME, FUNCTIONS, RASTERS, WITH_OUT, named, type_for
from cases import SHORT_LIST, TYPES, assert_same, seeded

SHAPE = (6, 8)
NAN, INFINITY = float("nan"), float("inf")


def zeros(*shape, dtype="uint8"):
    return np.zeros(shape, dtype)


def histogram_of(bands, bins=4):
    return gm.Histogram(
        np.ones((bands, bins), np.int32), np.zeros(bands, np.float32), np.ones(bands, np.float32)
    )


# function, changed arguments, exception, the argument that the message names, words that it holds
BAD = [
    # terrain
    ("slope", {"cellsize": None}, (TypeError, ValueError), "cellsize", ["expected"]),
    ("slope", {"cellsize": 0}, ValueError, "cellsize", ["0"]),
    ("slope", {"cellsize": -2.5}, ValueError, "cellsize", ["-2.5"]),
    ("slope", {"cellsize": NAN}, ValueError, "cellsize", ["nan"]),
    ("slope", {"cellsize": (1, INFINITY)}, ValueError, "cellsize", ["inf"]),
    ("slope", {"cellsize": (1, 2, 3)}, ValueError, "cellsize", ["3"]),
    ("slope", {"cellsize": "ten"}, TypeError, "cellsize", ["ten|str"]),
    ("slope", {"z_factor": "high"}, TypeError, "z_factor", ["high|str"]),
    ("slope", {"edge": "wrap"}, ValueError, "edge", ["wrap", "nearest", "reflect"]),
    ("slope", {"edge": [1]}, TypeError, "edge", []),
    ("slope", {"margin": 2}, ValueError, "margin", ["2", "0", "1"]),
    ("slope", {"margin": -1}, ValueError, "margin", ["-1"]),
    ("slope", {"background": "none"}, TypeError, "background", ["none|str"]),
    ("slope", {"num_threads": 0}, ValueError, "num_threads", ["0"]),
    ("slope", {"num_threads": -3}, ValueError, "num_threads", ["-3"]),
    ("slope", {"num_threads": 1.5}, TypeError, "num_threads", ["1.5|float"]),
    ("slope", {"elevation": zeros(1, 5), "margin": 1}, ValueError, "elevation", ["1"]),
    ("aspect", {"elevation": zeros(6, 8, 2)}, ValueError, "elevation", ["2", "one|1"]),
    ("aspect", {"flat": "level"}, TypeError, "flat", ["level|str"]),
    ("aspect", {"cellsize": None}, (TypeError, ValueError), "cellsize", ["expected"]),
    ("average_channels", {"nodata": "none"}, TypeError, "nodata", ["none|str"]),
    ("average_channels", {"nodata": None}, TypeError, "nodata", ["None"]),
    ("average_channels", {"num_threads": 0}, ValueError, "num_threads", ["0"]),
    # classes
    ("threshold", {"image": zeros(6, 8, 2)}, ValueError, "image", ["2", "one|1"]),
    ("threshold", {"minimum": "low"}, TypeError, "minimum", ["low|str"]),
    ("threshold", {"maximum": None}, TypeError, "maximum", ["None"]),
    ("range_classes", {"image": zeros(6, 8, 2)}, ValueError, "image", ["2", "one|1"]),
    ("range_classes", {"ranges": 5}, TypeError, "ranges", ["5|int"]),
    ("range_classes", {"ranges": [(1, 2, 3)]}, (TypeError, ValueError), "ranges", ["3"]),
    ("range_classes", {"ranges": [(1, "two")]}, TypeError, "ranges", ["two|str"]),
    # stretches
    ("normalize", {"minimum": (1, 2, 3)}, ValueError, "minimum", ["3", "2"]),
    ("normalize", {"maximum": "high"}, TypeError, "maximum", ["high|str"]),
    ("normalize", {"nodata": "none"}, TypeError, "nodata", ["none|str"]),
    ("percentile_stretch", {"histogram": 5}, TypeError, "histogram", ["5|int"]),
    ("percentile_stretch", {"histogram": histogram_of(3)}, ValueError, "histogram", ["3", "2"]),
    ("intensity_percentile", {"image": zeros(6, 8, 2)}, ValueError, "image", ["2", "3"]),
    ("intensity_percentile", {"sign": "up"}, ValueError, "sign", ["up", "absolute", "forward", "backward"]),
    ("intensity_percentile", {"sign": 1}, (TypeError, ValueError), "sign", ["1|int"]),
    ("intensity_percentile", {"histogram": histogram_of(2)}, ValueError, "histogram", ["2", "3"]),
    # geometry
    ("mirror", {"axis": "diagonal"}, ValueError, "axis", ["diagonal", "(?i)vert", "(?i)hori"]),
    ("mirror", {"axis": 1}, (TypeError, ValueError), "axis", ["1|int"]),
    ("mirror", {"window": (0, 0, 9, 6)}, ValueError, "window", ["9"]),
    ("mirror", {"window": (5, 0, 4, 6)}, ValueError, "window", ["5"]),
    ("mirror", {"window": (-1, 0, 2, 2)}, ValueError, "window", ["-1"]),
    ("mirror", {"window": (0, 0, 2)}, ValueError, "window", ["3", "4|four|width"]),
    ("mirror", {"window": (0, 0, 2.5, 2)}, TypeError, "window", ["2.5|float"]),
    ("transfer", {"in_region": (0, 0, 8)}, ValueError, "in_region", ["3", "4|four|width"]),
    ("transfer", {"in_region": (0, -1, 8, 6)}, ValueError, "in_region", ["-1"]),
    ("transfer", {"out_region": (0, 0, 8, "six")}, TypeError, "out_region", ["six|str"]),
    (
        "transfer",
        {"out_region": (0, 0, 2**32, 6)},
        (ValueError, OverflowError),
        "out_region",
        ["4294967296"],
    ),
    ("transfer", {"shape": (4,)}, ValueError, "shape", ["1|4"]),
    ("transfer", {"shape": (4, -2)}, ValueError, "shape", ["-2"]),
    ("transfer", {"in_origin": (1, -1)}, ValueError, "in_origin", ["-1"]),
    ("transfer", {"out_origin": 7}, TypeError, "out_origin", ["7|int"]),
    ("transfer", {"fill": "none"}, TypeError, "fill", ["none|str"]),
    # vegetation indices
    ("vegetation_indices", {"indices": ["NVDI"]}, ValueError, "indices", ["NVDI", "NDVI", "MTVI1", "GEMI"]),
    ("vegetation_indices", {"indices": []}, ValueError, "indices", ["expected"]),
    ("vegetation_indices", {"indices": [99]}, (TypeError, ValueError), "indices", ["99"]),
    ("vegetation_indices", {"indices": 5}, TypeError, "indices", ["5|int"]),
    ("vegetation_indices", {"bands": {"red": 0}}, ValueError, "bands", ["nir", "NDVI|DVI"]),
    ("vegetation_indices", {"bands": {"red": 0, "nir": 2}}, ValueError, "bands", ["2"]),
    ("vegetation_indices", {"bands": {"red": -1, "nir": 1}}, ValueError, "bands", ["-1"]),
    ("vegetation_indices", {"bands": {"red": 0, "nri": 1}}, ValueError, "bands", ["nri", "nir"]),
    ("vegetation_indices", {"bands": {"red": 0, "nir": "one"}}, TypeError, "bands", ["one|str"]),
    ("vegetation_indices", {"bands": [0, 1]}, TypeError, "bands", ["list"]),
    ("vegetation_indices", {"image": None}, (TypeError, ValueError), r"(bands(\[.*\])?|image)", ["expected"]),
    (
        "vegetation_indices",
        {"image": None, "bands": {"red": zeros(6, 8), "nir": zeros(6, 7)}},
        ValueError,
        r"bands(\[.*\])?",
        ["nir|red", "7"],
    ),
    (
        "vegetation_indices",
        {"image": None, "bands": {"red": zeros(6, 8), "nir": zeros(6, 8, dtype="int16")}},
        TypeError,
        r"bands(\[.*\])?",
        ["int16"],
    ),
    # focus measures
    ("squared_gradient", {"background": 5}, TypeError, "background", ["5|int"]),
    ("squared_gradient", {"background": (1, 2, 3)}, ValueError, "background", ["3"]),
    ("squared_gradient", {"nodata": "none"}, TypeError, "nodata", ["none|str"]),
    ("vollath", {"background": (1,)}, ValueError, "background", ["1"]),
    ("vollath", {"nodata": None}, TypeError, "nodata", ["None"]),
    # statistics
    ("statistics", {"bits": 12}, ValueError, "bits", ["12", "8", "16"]),
    ("statistics", {"image": zeros(6, 8, dtype="uint16"), "bits": 8}, ValueError, "bits", ["8", "uint16"]),
    (
        "statistics",
        {"image": zeros(6, 8, 2), "synthetic_blue": True},
        ValueError,
        "(image|synthetic_blue)",
        ["2", "3|three"],
    ),
    ("histogram", {"bins": 0}, ValueError, "bins", ["0"]),
    ("histogram", {"bins": "many"}, TypeError, "bins", ["many|str"]),
    ("histogram", {"minimum": "low"}, TypeError, "minimum", ["low|str"]),
    ("histogram", {"maximum": (1, 2, 3)}, ValueError, "maximum", ["3", "2"]),
]

for name in ("synthetic_blue", "natural_color"):
    BAD += [
        (name, {"image": zeros(6, 8, 2)}, ValueError, "image", ["2", "3|three"]),
        (name, {"minimum": (1, 2)}, ValueError, "minimum", ["2", "3|three"]),
        (name, {"maximum": "high"}, TypeError, "maximum", ["high|str"]),
        (name, {"background": None}, TypeError, "background", ["None"]),
        (name, {"scale": (1, 2)}, ValueError, "scale", ["2", "3|three"]),
    ]

DATES = [each.name for each in FUNCTIONS if each.reference]
for name in DATES:
    bands = BY_NAME[name].bands
    BAD += [
        (name, {"reference": zeros(6, 7, bands)}, ValueError, "reference", ["7", "8"]),
        (name, {"reference": zeros(6, 8, bands, dtype="complex64")}, TypeError, "reference", ["complex64"]),
        (name, {"reference": "image"}, TypeError, "reference", ["str|image|<U5"]),
    ]
    if not BY_NAME[name].short_list:
        wrong = zeros(6, 8, bands, dtype="int16")
        BAD += [(name, {"reference": wrong}, TypeError, "reference", ["int16", "uint8"])]
    if name not in ("difference", "combine"):
        BAD += [
            (name, {"reference": zeros(6, 8, 1)}, ValueError, "reference", ["1", str(bands)]),
            (name, {"nodata": [1] * 5}, ValueError, "nodata", ["5", str(bands)]),
            (
                name,
                {"nodata": 1, "reference_nodata": [1] * 7},
                ValueError,
                "reference_nodata",
                ["7", str(bands)],
            ),
            (name, {"nodata": "none"}, TypeError, "nodata", ["none|str"]),
        ]
    if name != "difference":
        BAD += [(name, {"fill": "none"}, TypeError, "fill", ["none|str"])]
    if name not in ("combine", "intensity_ratio"):
        forms = ["absolute", "signed"] if "two_masks" in name else ["absolute", "forward", "backward"]
        unknown = "forward" if "two_masks" in name else "signed"
        BAD += [(name, {"form": unknown}, ValueError, "form", [unknown, *forms])]
    if BY_NAME[name].short_list:
        for dtype in ("int8", "float64", "uint32"):
            images = {raster: zeros(6, 8, bands, dtype=dtype) for raster in ("image", "reference")}
            BAD += [(name, images, TypeError, "image", [dtype, *SHORT_LIST])]
            BAD += [(name, {"dtype": dtype}, TypeError, "dtype", [dtype, *SHORT_LIST])]

BAD += [
    (
        "tasseled_cap_change",
        {"sensor": "Landsat 5 TM"},
        ValueError,
        "sensor",
        ["Landsat 5 TM", "Landsat-5 TM", "QuickBird", "Ikonos"],
    ),
    ("tasseled_cap_change", {"sensor": None}, (TypeError, ValueError), "sensor", ["None"]),
    (
        "tasseled_cap_change",
        {"reference_sensor": "Quickbird"},
        ValueError,
        "reference_sensor",
        ["Quickbird", "QuickBird"],
    ),
    ("tasseled_cap_change", {"sensor": "Landsat-7 ETM+"}, ValueError, "image", ["4", "6|six"]),
    ("tasseled_cap_change", {"reference_sensor": "Landsat-7 ETM+"}, ValueError, "reference", ["4", "6|six"]),
    (
        "tasseled_cap_change",
        {"component": "wetness"},
        ValueError,
        "component",
        ["wetness", "greenness", "brightness"],
    ),
]


def refuse(name, changed, failure, argument, words):
    each = BY_NAME[name]
    images = each.images(seeded(name), SHAPE, "uint8")
    more = {}
    if each.has_out and "dtype" not in changed:
        more["out"] = np.full_like(each.call(images), 77)
    with pytest.raises(failure) as caught:
        each.call(images, **{**more, **changed})
    message = str(caught.value)
    assert re.match(f"{argument}: ", message), message
    assert "expected" in message, message
    for word in words:
        assert re.search(word if "|" in word or "(?" in word else re.escape(word), message), message
    if more:
        assert (more["out"] == 77).all(), "the output is written before the check"


def label(row) -> str:
    return f"{row[0]}-{'-'.join(row[1])}"


@pytest.mark.parametrize("row", BAD, ids=label)
def test_bad_argument_is_refused_by_its_name(row):
    refuse(*row)


def bad_rasters(raster):
    return [
        ({raster: "raster"}, TypeError, ["str|raster|<U6"]),
        ({raster: None}, TypeError, ["None"]),
        ({raster: zeros(6, 8, 2, dtype="complex64")}, TypeError, ["complex64"]),
        ({raster: zeros(6, 8, 2, dtype="complex128")}, TypeError, ["complex128"]),
        ({raster: zeros(6, 8, 2, dtype="bool")}, TypeError, ["bool"]),
        ({raster: zeros(6, 8, 2, dtype="float16")}, TypeError, ["float16"]),
        ({raster: zeros(6, 8, 2, dtype="longdouble")}, TypeError, ["float128|longdouble"]),
        ({raster: zeros(6, 8, 2, dtype="object")}, TypeError, ["object"]),
        ({raster: zeros(6, 8, 2, dtype="datetime64[s]")}, TypeError, ["datetime64"]),
        ({raster: zeros(6, 8, 2, dtype="u1,f4")}, TypeError, []),
        ({raster: zeros(6, 8, 2, dtype="S3")}, TypeError, []),
        ({raster: zeros()}, ValueError, ["0"]),
        ({raster: zeros(8)}, ValueError, ["1|8"]),
        ({raster: zeros(1, 6, 8, 2)}, ValueError, ["4|1, 6, 8, 2"]),
    ]


@pytest.mark.parametrize("each", **named(FUNCTIONS))
def test_bad_raster_is_refused_by_its_name(each):
    for raster in RASTERS:
        if raster != each.raster and not (raster == "reference" and each.reference):
            continue
        for changed, failure, words in bad_rasters(raster):
            if each.name == "vegetation_indices" and changed[raster] is None:
                continue  # without an image the bands are arrays
            refuse(each.name, changed, failure, raster, words)


@pytest.mark.parametrize("each", **named(FUNCTIONS))
def test_bad_mask_is_refused_by_its_name(each):
    for name in each.masks:
        refuse(each.name, {name: zeros(6, 7, dtype=bool)}, ValueError, name, ["7", "8"])
        refuse(each.name, {name: zeros(6, 8, 1, dtype=bool)}, ValueError, name, ["1"])
        refuse(each.name, {name: zeros(6, 8)}, TypeError, name, ["uint8", "bool"])
        refuse(each.name, {name: "all"}, TypeError, name, ["all|str"])


@pytest.mark.parametrize("each", **named(WITH_OUT))
def test_bad_output_type_is_refused_by_its_name(each):
    for dtype in ("complex64", "complex128", "float16", "bool", "object", "datetime64[s]", "S3"):
        refuse(each.name, {"dtype": dtype}, TypeError, "dtype", [dtype.partition("[")[0]])
    refuse(each.name, {"dtype": "nonsense"}, TypeError, "dtype", ["nonsense"])
    refuse(each.name, {"dtype": 5}, TypeError, "dtype", ["5|int"])


@pytest.mark.parametrize("each", **named(WITH_OUT))
def test_every_spelling_of_an_output_type_is_taken(each):
    images = each.images(seeded(each.name), SHAPE, "uint8")
    want = each.call(images, dtype="float32")
    for spelling in (np.float32, np.dtype("float32"), "f4", ">f4", "single"):
        try:
            got = each.call(images, dtype=spelling)
        except TypeError as failure:
            assert spelling == ">f4" and str(failure).startswith("dtype: ")
        else:
            assert_same(got, want)


@pytest.mark.parametrize("each", **named(FUNCTIONS))
def test_common_arguments_are_named_ones(each):
    images = each.images(seeded(each.name), SHAPE, type_for(each, TYPES[1]))
    with pytest.raises(TypeError):
        each.call(images, nonsense=1)
    with pytest.raises(TypeError):
        getattr(gm, each.name)(*images.values(), *range(8))


@pytest.mark.parametrize("each", **named(FUNCTIONS))
def test_masked_array_is_refused_and_a_list_is_taken(each):
    images = each.images(seeded(each.name), (2, 3), "uint8")
    for name, image in images.items():
        with pytest.raises(TypeError, match=f"^{name}: .*mask.*expected"):
            each.call({**images, name: np.ma.masked_equal(image, 3)})
    each.call(
        {name: image.astype(type_for(each, "float32")).tolist() for name, image in images.items()}
        if not each.short_list
        else images
    )


def test_statistics_of_unlike_images_do_not_merge():
    one, two = gm.statistics(zeros(2, 3)), gm.statistics(zeros(2, 3, 2))
    with pytest.raises(ValueError, match="^other: .*expected"):
        one.merge(two)
    with pytest.raises(ValueError, match="^other: .*expected"):
        one.merge(gm.statistics(zeros(2, 3, dtype="uint16")))
