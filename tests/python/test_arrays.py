"""What the functions make of arrays: layouts, copies, outputs, margins, masks and no-data."""

from __future__ import annotations

import tracemalloc

import numpy as np
import pytest

import gridmill as gm
from calls import BANDS, BY_NAME, FUNCTIONS, RASTERS, WITH_OUT, named, parts, type_for
from cases import TYPES, assert_same, finite_samples, seeded

SHAPE = (6, 8)


def strided(array):
    """Every other element of a larger array, in each direction."""
    wide = np.zeros([2 * n for n in array.shape], array.dtype)
    view = wide[tuple(slice(1, None, 2) for _ in array.shape)]
    view[...] = array
    return view


def backwards(array):
    every = tuple(slice(None, None, -1) for _ in array.shape)
    return np.ascontiguousarray(array[every])[every]


def read_only(array):
    copy = array.copy()
    copy.flags.writeable = False
    return copy


def misaligned(array):
    buffer = np.zeros(array.nbytes + 1, np.uint8)
    view = buffer[1:].view(array.dtype).reshape(array.shape)
    view[...] = array
    return view


LAYOUTS = {
    "strided": strided,
    "backwards": backwards,
    "fortran": np.asfortranarray,
    "big-endian": lambda array: array.astype(array.dtype.newbyteorder(">")),
    "read-only": read_only,
    "misaligned": misaligned,
}


def same_results(got, want) -> None:
    assert type(got) is type(want)
    for one, other in zip(parts(got), parts(want)):
        assert_same(one, other)


@pytest.fixture(autouse=True)
def quiet(capfd):
    """The squared gradient prints a line with every call."""
    yield
    capfd.readouterr()


@pytest.mark.parametrize("layout", LAYOUTS)
@pytest.mark.parametrize("each", **named(FUNCTIONS))
def test_layout_of_an_input_makes_no_difference(each, layout):
    for dtype in ("uint8", "float32", "int64"):
        rng = seeded(each.name, layout, dtype)
        images = each.images(rng, SHAPE, type_for(each, dtype))
        masks = {name: rng.random(SHAPE) < 0.8 for name in each.masks}
        if each.name == "mirror":  # its mask marks a window
            masks["mask"][...] = np.arange(SHAPE[0])[:, None] % 2 == 0
        lay = LAYOUTS[layout]
        want = each.call(images, **masks)
        before = {name: image.copy() for name, image in images.items()}
        odd = {name: lay(array) for name, array in {**images, **masks}.items()}
        same_results(each.call(odd), want)
        for name, image in before.items():
            assert_same(np.asarray(odd[name], image.dtype), image)


@pytest.mark.parametrize("each", **named(WITH_OUT))
def test_contiguous_inputs_are_not_copied(each):
    images = each.images(seeded(each.name), (700, 800), "uint8")
    size = 700 * 800
    if each.name in ("percentile_stretch", "intensity_percentile"):
        images["histogram"] = gm.histogram(images["image"])
    if each.name == "vegetation_indices":  # in the order of the codes
        images["indices"] = ("DVI", "NDVI")
    if each.name == "transfer":
        images |= {"in_region": (0, 0, 800, 700), "out_region": (0, 0, 800, 700)}
    out = np.empty_like(each.call(images))
    tracemalloc.start()
    try:
        each.call(images, out=out)
        _, peak = tracemalloc.get_traced_memory()
    finally:
        tracemalloc.stop()
    assert peak < size / 2


def test_arrays_over_a_read_only_file_are_taken(tmp_path):
    image = finite_samples(seeded("file"), (*SHAPE, 2), "uint16")
    image.tofile(tmp_path / "image")
    mapped = np.memmap(tmp_path / "image", np.uint16, "r", shape=image.shape)
    assert_same(gm.combine(mapped, mapped), gm.combine(image, image))
    assert_same(gm.slope(mapped, cellsize=1), gm.slope(image, cellsize=1))


@pytest.mark.parametrize("each", **named(WITH_OUT))
def test_result_is_written_to_the_callers_array(each):
    for dtype, out_type in (("uint8", "float32"), ("float32", "int16"), ("uint16", "uint8")):
        images = each.images(seeded(each.name), SHAPE, dtype)
        want = each.call(images, dtype=out_type)
        out = np.full_like(want, 77)
        assert each.call(images, out=out) is out
        assert_same(out, want)
        again = np.full_like(want, 78)
        assert each.call(images, out=again, dtype=out_type) is again
        assert_same(again, want)


def overlapping(images):
    """Views of a buffer that holds an input: as the output, and further on."""
    name = next(name for name in RASTERS if name in images)
    image = images[name]
    buffer = np.zeros(3 * image.nbytes + 64, np.uint8)
    inside = buffer[: image.nbytes].view(image.dtype).reshape(image.shape)
    inside[...] = image
    return {**images, name: inside}, buffer


WRONG_OUTPUTS = {
    "rows": (lambda out: np.full((out.shape[0] + 1, *out.shape[1:]), 77, out.dtype), ValueError),
    "columns": (
        lambda out: np.full((out.shape[0], out.shape[1] - 1, *out.shape[2:]), 77, out.dtype),
        ValueError,
    ),
    "bands": (lambda out: np.full((*out.shape[:2], 9), 77, out.dtype), ValueError),
    "dimensions": (lambda out: np.full(out.size, 77, out.dtype), ValueError),
    "complex": (lambda out: np.full(out.shape, 77, np.complex64), TypeError),
    "half": (lambda out: np.full(out.shape, 77, np.float16), TypeError),
    "bool": (lambda out: np.full(out.shape, True), TypeError),
    "byte order": (lambda out: np.full(out.shape, 77, ">f4"), (TypeError, ValueError)),
    "read-only": (lambda out: read_only(np.full(out.shape, 77, out.dtype)), ValueError),
    "strided": (lambda out: strided(np.full(out.shape, 77, out.dtype)), ValueError),
    "backwards": (lambda out: backwards(np.full(out.shape, 77, out.dtype)), ValueError),
    "misaligned": (lambda out: misaligned(np.full(out.shape, 77, "float32")), ValueError),
}


@pytest.mark.parametrize("wrong", WRONG_OUTPUTS)
@pytest.mark.parametrize("each", **named(WITH_OUT))
def test_wrong_output_is_refused_and_left_alone(each, wrong):
    make, failure = WRONG_OUTPUTS[wrong]
    images = each.images(seeded(each.name), SHAPE, "uint8")
    out = make(each.call(images))
    before = out.copy()
    with pytest.raises(failure, match="^out: .*expected"):
        each.call(images, out=out)
    assert_same(out, before)


@pytest.mark.parametrize("each", **named(WITH_OUT))
def test_output_that_is_no_array_or_of_another_type_than_asked_is_refused(each):
    images = each.images(seeded(each.name), SHAPE, "uint8")
    with pytest.raises(TypeError, match="^out: .*expected"):
        each.call(images, out=[[1]])
    out = np.full_like(each.call(images, dtype="int16"), 77)
    with pytest.raises((TypeError, ValueError), match="^(out|dtype): .*expected"):
        each.call(images, out=out, dtype="uint8")
    assert (out == 77).all()


@pytest.mark.parametrize("each", **named(WITH_OUT))
def test_output_over_an_input_is_refused_and_left_alone(each):
    images, buffer = overlapping(each.images(seeded(each.name), SHAPE, "uint8"))
    shape = each.call(images).shape
    size = int(np.prod(shape))
    for start in (0, 1):
        out = buffer[start : start + size].reshape(shape)
        before = buffer.copy()
        with pytest.raises(ValueError, match="^out: .*expected"):
            each.call(images, out=out)
        assert_same(buffer, before)


@pytest.mark.parametrize("each", **named(WITH_OUT))
def test_output_over_a_mask_is_refused(each):
    images = each.images(seeded(each.name), SHAPE, "uint8")
    shape = each.call(images).shape
    for name in each.masks:
        buffer = np.ones(max(int(np.prod(shape)), 48), np.uint8)
        mask = buffer[:48].view(bool).reshape(SHAPE)
        with pytest.raises(ValueError, match="^out: .*expected"):
            each.call(images, out=buffer[: int(np.prod(shape))].reshape(shape), **{name: mask})
        assert (buffer == 1).all()


# Margins of the terrain functions

EDGES = {
    "nearest": {"mode": "edge"},
    "reflect": {"mode": "reflect"},
    -7.5: {"mode": "constant", "constant_values": -7},
}


@pytest.mark.parametrize("edge", EDGES)
@pytest.mark.parametrize("each", **named((BY_NAME["slope"], BY_NAME["aspect"])))
def test_edge_is_numpys_padding(each, edge):
    for dtype in ("uint8", "int32", "float32", "float64"):
        rng = seeded(each.name, edge, dtype)
        padding = dict(EDGES[edge])
        if "constant_values" in padding and np.dtype(dtype).kind == "f":
            padding["constant_values"] = edge
        if "constant_values" in padding and dtype == "uint8":
            continue
        value = edge if np.dtype(dtype).kind == "f" or isinstance(edge, str) else -7
        for h in range(1, 7):
            for w in range(1, 7):
                image = each.images(rng, (h, w), dtype)["elevation"]
                around = [(1, 1), (1, 1)] + [(0, 0)] * (image.ndim - 2)
                want = each.call({"elevation": np.pad(image, around, **padding)}, margin=1)
                assert_same(each.call({"elevation": image}, edge=value), want, f"{dtype} {h} x {w}")


@pytest.mark.parametrize("each", **named((BY_NAME["slope"], BY_NAME["aspect"])))
def test_edge_under_a_mask_is_that_of_the_padded_mask(each):
    rng = seeded("masked edge", each.name)
    for edge, padding in (("nearest", "edge"), ("reflect", "reflect")):
        for h in range(1, 7):
            for w in range(1, 7):
                image = each.images(rng, (h, w), "float32")["elevation"]
                mask = rng.random((h, w)) < 0.7
                around = [(1, 1), (1, 1)] + [(0, 0)] * (image.ndim - 2)
                padded = np.pad(image, around, padding)
                want = each.call({"elevation": padded}, margin=1, mask=np.pad(mask, 1, padding))
                got = each.call({"elevation": image}, edge=edge, mask=mask)
                assert_same(got, want, f"{edge} {h} x {w}")


# Masks


@pytest.mark.parametrize("each", **named(FUNCTIONS))
def test_mask_of_all_true_is_none(each):
    for dtype in TYPES:
        images = each.images(seeded(each.name, dtype), SHAPE, type_for(each, dtype))
        want = each.call(images)
        for name in each.masks:
            same_results(each.call(images, **{name: np.ones(SHAPE, bool)}), want)


# What a masked pixel of a `uint8` image holds.
EXCLUDED = {
    "slope": (3, {"background": 3}),
    "aspect": (3, {"background": 3}),
    "average_channels": (3, {"nodata": 3}),
    "threshold": (0, {}),
    "range_classes": (0, {}),
    "normalize": (3, {"nodata": 3}),
    "percentile_stretch": (3, {"nodata": 3}),
    "intensity_percentile": (3, {"nodata": 3}),
    "vegetation_indices": (-1e20, {}),
    "difference": (0, {}),
    "channel_ratio": (3.4e38, {}),
    "channel_ratio_two_masks": (3.4e38, {}),
    "transfer": (3, {"fill": 3}),
    "synthetic_blue": (1, {}),
    "natural_color": ((1, 2, 3), {}),
}


@pytest.mark.parametrize("each", **named([each for each in WITH_OUT if each.name != "mirror"]))
def test_false_excludes_a_pixel_in_every_mask(each):
    value, more = EXCLUDED.get(each.name, (3, {"fill": 3}))
    images = each.images(seeded(each.name), SHAPE, "uint8")
    images = {name: image | 1 for name, image in images.items()}
    if each.name in ("percentile_stretch", "intensity_percentile"):
        more |= {"histogram": gm.histogram(images["image"])}
    for name in each.masks:
        mask = np.ones(SHAPE, bool)
        mask[2, 3] = mask[5, 7] = False
        plain, got = each.call(images, **more), each.call(images, **{name: mask}, **more)
        want = np.broadcast_to(np.asarray(value, got.dtype), got[~mask].shape)
        assert_same(got[~mask], want.copy(), name)
        if each.name not in ("slope", "aspect"):
            assert_same(got[mask], plain[mask], name)


@pytest.mark.parametrize("each", **named((BY_NAME["statistics"], BY_NAME["histogram"])))
def test_masked_pixels_do_not_count(each):
    for dtype in ("uint8", "uint16", "float32"):
        images = each.images(seeded(each.name, dtype), SHAPE, dtype)
        mask = np.zeros(SHAPE, bool)
        mask[:3] = True
        same_results(each.call(images, mask=mask), each.call({"image": images["image"][:3]}))


def test_histogram_has_a_bin_for_each_value_of_small_unsigned_types():
    for dtype in ("uint8", "uint16"):
        image = seeded("bins").integers(3, 40, (9, 8, 2)).astype(dtype)
        image[..., 1] += 20
        got = gm.histogram(image)
        low, high = image.min(axis=(0, 1)), image.max(axis=(0, 1))
        bins = int((high - low).max()) + 1
        want = [np.bincount(image[..., c].ravel() - low[c], minlength=bins) for c in range(2)]
        assert_same(got.counts, np.array(want, np.int32))
        assert_same(got.minimum, low.astype(np.float32))
        assert_same(got.maximum, low.astype(np.float32) + np.float32(bins))


def test_histogram_of_other_types_has_equal_bins():
    for dtype in ("int8", "int16", "int32", "float32", "float64"):
        image = seeded("equal bins").integers(-50, 40, (9, 8, 2)).astype(dtype)
        got = gm.histogram(image)
        want = [np.histogram(image[..., c], 256)[0] for c in range(2)]
        assert_same(got.counts, np.array(want, np.int32))
        assert_same(got.minimum, image.min(axis=(0, 1)).astype(np.float32))
        assert_same(got.maximum, image.max(axis=(0, 1)).astype(np.float32))


def test_histogram_takes_bins_and_ends_of_its_own():
    for dtype in ("uint8", "int16", "float32"):
        image = seeded("ends").integers(5, 60, (9, 8, 2)).astype(dtype)
        got = gm.histogram(image, bins=10, minimum=0, maximum=(100, 80))
        want = [np.histogram(image[..., c], 10, (0, (100, 80)[c]))[0] for c in range(2)]
        assert_same(got.counts, np.array(want, np.int32))
        assert got.minimum.tolist() == [0, 0] and got.maximum.tolist() == [100, 80]


# Windows of the mirror


@pytest.mark.parametrize("axis", ["vert", "hori"])
def test_masked_pixels_are_not_mirrored(axis):
    image = finite_samples(seeded("marked", axis), (*SHAPE, 2), "uint8")
    mask = np.zeros(SHAPE, bool)
    mask[1:4] = axis == "vert"
    mask[:, 2:5] |= axis == "hori"
    want = np.where(mask[..., None], image[:, ::-1] if axis == "vert" else image[::-1], image)
    assert_same(gm.mirror(image, axis, mask=mask), want)


@pytest.mark.parametrize("axis", ["vert", "hori"])
def test_mask_with_gaps_gives_one_result_or_is_refused(axis):
    image = finite_samples(seeded("gaps", axis), (*SHAPE, 2), "uint8")
    mask = np.ones(SHAPE, bool)
    mask[3, 2] = mask[4, 5] = False
    outs = [np.full_like(image, value) for value in (1, 2)]
    try:
        results = [gm.mirror(image, axis, mask=mask, out=out) for out in outs]
    except ValueError as failure:
        assert str(failure).startswith("mask: ")
        assert (outs[0] == 1).all()
    else:
        assert_same(results[0], results[1])


def test_window_of_no_pixels_mirrors_nothing():
    image = finite_samples(seeded("no window"), (*SHAPE, 2), "uint8")
    for window in ((3, 2, 0, 2), (3, 2, 2, 0)):
        assert_same(gm.mirror(image, "vert", window=window), image)
        assert gm.mirror(image, "vert", window=window, crop=True).shape == (window[3], window[2], 2)


# No-data

NODATA = [
    each
    for each in FUNCTIONS
    if each.name
    in (
        "average_channels",
        "range_classes",
        "normalize",
        "percentile_stretch",
        "intensity_percentile",
        "squared_gradient",
        "vollath",
        "channel_difference",
        "channel_difference_two_masks",
        "channel_ratio",
        "channel_ratio_two_masks",
        "intensity_ratio",
        "magnitude_change",
        "tasseled_cap_change",
    )
]


@pytest.mark.parametrize("each", **named(NODATA))
def test_nodata_of_nan_is_taken_and_equals_no_sample(each):
    images = {name: image | 1 for name, image in each.images(seeded(each.name), SHAPE, "uint8").items()}
    want = each.call(images, nodata=-12345.0)
    same_results(each.call(images, nodata=float("nan")), want)


# Vegetation indices


def test_indices_come_in_the_order_asked_for():
    image = finite_samples(seeded("order"), (*SHAPE, 2), "uint8")
    names = ["SAVI", "dvi", "Ndvi", gm.core.VegetationIndex.eINDEX_RVI]
    got = gm.vegetation_indices(names, image, bands=BANDS)
    for position, name in enumerate(names):
        assert_same(got[..., position : position + 1], gm.vegetation_indices([name], image, bands=BANDS))


def test_one_index_may_be_asked_for_twice_or_is_refused():
    image = finite_samples(seeded("twice"), (*SHAPE, 2), "uint8")
    try:
        got = gm.vegetation_indices(["NDVI", "DVI", "NDVI"], image, bands=BANDS)
    except ValueError as failure:
        assert str(failure).startswith("indices: ")
    else:
        assert_same(got[..., 0], got[..., 2])
        assert_same(got[..., :2], gm.vegetation_indices(["NDVI", "DVI"], image, bands=BANDS))


def test_indices_of_separate_bands_are_those_of_the_image():
    for dtype in TYPES:
        image = finite_samples(seeded("bands", dtype), (*SHAPE, 3), dtype)
        mask = image[..., 0] > 5
        want = gm.vegetation_indices(
            ["NDVI", "GEMI", "NGRDI"], image, bands={"nir": 0, "red": 2, "green": 1}, mask=mask
        )
        layers = {"nir": image[..., 0], "red": image[..., 2], "green": np.asfortranarray(image[..., 1])}
        assert_same(gm.vegetation_indices(["NDVI", "GEMI", "NGRDI"], bands=layers, mask=mask), want)


# Empty arrays


@pytest.mark.parametrize("shape", [(0, 5), (5, 0), (0, 0)])
@pytest.mark.parametrize("each", **named(FUNCTIONS))
def test_empty_image_gives_an_empty_result_or_is_refused_by_name(each, shape):
    images = each.images(seeded(each.name), shape, "uint8")
    try:
        result = each.call(images)
    except ValueError as failure:
        assert str(failure).partition(":")[0] in RASTERS, failure
    else:
        if each.has_out and each.name != "transfer":
            assert result.shape[:2] == shape


@pytest.mark.parametrize("each", **named(FUNCTIONS))
def test_image_without_bands_is_refused(each):
    images = {name: np.zeros((3, 4, 0), np.uint8) for name in each.images(seeded(0), (1, 1), "uint8")}
    with pytest.raises(ValueError, match="^(image|elevation|reference): .*expected"):
        each.call(images)
