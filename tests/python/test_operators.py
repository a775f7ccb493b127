"""Every operator through its function and through its class, against the twins."""

from __future__ import annotations

import numpy as np
import pytest

import gridmill as gm
import twins
from cases import (
    MASKS,
    SHAPES,
    SHORT_LIST,
    TYPES,
    Case,
    assert_same,
    like,
    mask_of,
    one_band,
    samples,
    seeded,
)
from gridmill import core

FORMS = {
    "absolute": core.DiffType.eDIFF_ABSOLUTE,
    "forward": core.DiffType.eDIFF_FORWARD,
    "backward": core.DiffType.eDIFF_BACKWARD,
}
FORMS2 = {"absolute": core.DiffType2.eDIFF2_ABSOLUTE, "signed": core.DiffType2.eDIFF2_SIGNED}
CODES = {"absolute": 0, "forward": 1, "backward": 2, "signed": 1}
NAMES = (
    "NGRDI",
    "EXCESS_GREEN",
    "DVI",
    "RVI",
    "NDVI",
    "TVI",
    "SAVI",
    "MSAVI2",
    "GEMI",
    "GREENNESS",
    "MCARI",
    "MTVI1",
)
ROLES = ("blue", "green", "red", "red_edge", "nir", "swir1", "swir2")


def cases_of(name: str, dtype: str, outputs=TYPES, largest: int = 64):
    """Each mask with each size up to `largest`, and every output type at least once."""
    rng = seeded(name, dtype)
    shapes = [shape for shape in SHAPES if max(shape) <= largest]
    turn = int(rng.integers(len(outputs)))
    for masking in MASKS:
        for shape in shapes:
            yield Case(rng, shape, dtype, outputs[turn % len(outputs)], masking)
            turn += 1


def all_types(test):
    return pytest.mark.parametrize("dtype", TYPES)(test)


def all_short(test):
    return pytest.mark.parametrize("dtype", SHORT_LIST)(test)


def copy_of_class(operator, *arguments):
    """What `Process` writes; the last argument is the output."""
    assert operator.Process(*arguments) is None
    return arguments[-1]


def setters(operator, **values):
    """Calls Set<Name>(value) for each name."""
    for name, value in values.items():
        getattr(operator, f"Set{name}")(value)
    return operator


# Filters


@all_types
def test_average_channels(dtype):
    for case in cases_of("average", dtype):
        image, mask = case.image(int(case.rng.integers(1, 5))), case.mask()
        nodata = float(image.flat[-1])
        want = twins.average_channels(image, mask, case.out, nodata)
        got = gm.average_channels(case.flat(image), nodata=nodata, mask=mask, dtype=case.out)
        assert_same(got, one_band(want), f"{case}")
        operator = core.AverageChannels()
        operator.SetNodata(nodata)
        assert_same(copy_of_class(operator, image, mask, case.target(1)), want, f"class, {case}")


def padded(image, mask):
    """An image with the margin of its edge pixels, and the mask with theirs."""
    around = np.pad(image, ((1, 1), (1, 1), (0, 0)), "edge")
    return around, None if mask is None else np.pad(mask, 1, "edge")


def check_degrees(single, wants, level, mask, background, what):
    """Exact but for the angle, which may be either of the neighbours of the rounded one."""
    want = wants[1]
    for neighbour in (wants[0], wants[2]):
        want = np.where(~level & (single == neighbour), neighbour, want)
    want[~twins.everywhere(mask, single)] = background
    assert_same(single, want, what)


@all_types
def test_slope_is_the_angle_of_the_cell(dtype):
    for case in cases_of("slope", dtype, ("float32",)):
        bands = int(case.rng.integers(1, 4))
        image, mask = case.image(bands, finite=True), case.mask()
        dx, dy, scale = 2.5, 30.0, 0.5
        around, valid = padded(image, mask)
        wants, level = twins.slope_degrees(around, valid, dx, dy, scale)
        given = case.flat(image)
        got = gm.slope(given, cellsize=(dx, dy), z_factor=scale, background=-5, mask=mask)
        check_degrees(got.reshape(level.shape), wants, level, mask, -5, f"{case}")
        operator = setters(core.FilterSlp(dx, dy, scale), Background=-5)
        target = case.target(bands)
        operator.Process(around, valid, target, margin=1)
        assert_same(got, like(target, given), f"class, {case}")


@all_types
def test_slope_in_other_types_holds_whole_degrees(dtype):
    for case in cases_of("whole slope", dtype):
        image, mask = case.image(2), case.mask()
        single = gm.slope(image, cellsize=3, mask=mask, background=1.5)
        got = gm.slope(image, cellsize=3, mask=mask, background=1.5, dtype=case.out)
        want = single
        if case.out != "float32":
            whole = twins.plain_cast(single + np.float32(0.5), np.int32)
            want = twins.clip_to(whole, case.out)
            want[~twins.everywhere(mask, image)] = twins.clip_to(np.float32(1.5), case.out)
        assert_same(got, want, f"{case}")


@all_types
def test_aspect_is_the_direction_of_the_fall(dtype):
    for case in cases_of("aspect", dtype, ("float32",)):
        image, mask = case.image(1, finite=True), case.mask()
        dx, dy, scale = 10.0, 4.0, 2.0
        around, valid = padded(image, mask)
        wants, level = twins.aspect_degrees(around, valid, dx, dy, scale, -1.0)
        got = gm.aspect(
            case.flat(image), cellsize=(dx, dy), z_factor=scale, flat=-1, background=-2, mask=mask
        )
        check_degrees(got[..., None], wants, level, mask, -2, f"{case}")
        operator = setters(core.FilterAsp(), XSIZE=dx, YSIZE=dy, ELSZ=scale, ZeroSlope=-1, Background=-2)
        target = case.target(1)
        operator.Process(around, valid, target, margin=1)
        assert_same(got, one_band(target), f"class, {case}")


@all_types
def test_aspect_in_other_types_is_rounded_and_halved_in_bytes(dtype):
    for case in cases_of("rounded aspect", dtype):
        image, mask = case.image(1, finite=True), case.mask()
        single = gm.aspect(image, cellsize=3, mask=mask, flat=-1.0, background=-2.0)
        got = gm.aspect(image, cellsize=3, mask=mask, flat=-1.0, background=-2.0, dtype=case.out)
        halves = np.dtype(case.out).itemsize == 1
        value = np.where(single >= 0, single * np.float32(0.5), single) if halves else single
        assert_same(got, twins.clip_to(value, case.out), f"{case}")


def test_slope_and_aspect_of_the_headers_examples():
    cell = np.array([[0, 1], [0, 1]], np.float32)
    image = np.pad(cell, ((1, 1), (1, 1)), "edge")
    assert gm.slope(image, cellsize=1)[1, 1] == 45
    assert gm.aspect(1 - image, cellsize=1)[1, 1] == 90


@all_types
def test_threshold(dtype):
    for case in cases_of("threshold", dtype):
        image, mask = case.image(1), case.mask()
        low, high = float(case.rng.integers(-10, 60)), float(case.rng.integers(0, 90))
        want = twins.threshold(image, mask, case.out, low, high)
        got = gm.threshold(case.flat(image), low, high, mask=mask, dtype=case.out)
        assert_same(got, one_band(want), f"{case}")
        operator = setters(core.BitmapFiltering(), ThresholdMin=low, ThresholdMax=high)
        assert_same(copy_of_class(operator, image, mask, case.target(1)), want, f"class, {case}")


@all_types
def test_intensity_percentile(dtype):
    counts = [4, 0, 7, 1, 0, 0, 2, 9, 3, 30]
    for case in cases_of("intensity", dtype, largest=9):
        image, mask = case.image(3, finite=True), case.mask()
        sign = str(case.rng.choice(sorted(FORMS)))
        nodata = float(image.flat[2])
        histogram = gm.Histogram(
            np.array([[0] * 10, [0] * 10, counts], np.int32),
            np.array([0, 0, 5], np.float32),
            np.array([1, 1, 85], np.float32),
        )
        want = twins.intensity_percentile(
            image, mask, case.out, counts, 5.0, 85.0, 10 / 80, CODES[sign], nodata
        )
        got = gm.intensity_percentile(image, histogram, sign=sign, nodata=nodata, mask=mask, dtype=case.out)
        assert_same(got, want, f"{case} {sign}")
        operator = setters(
            core.IntenPercent(),
            Min=5.0,
            Max=85.0,
            Scale=10 / 80,
            NoData=nodata,
            Type=FORMS[sign],
            Bins=counts,
        )
        assert_same(copy_of_class(operator, image, mask, case.target(4)), want, f"class, {case}")


def rectangle(rng, shape) -> tuple[int, int, int, int]:
    """A window (x, y, width, height) within the shape."""
    h, w = shape
    x, y = int(rng.integers(w)), int(rng.integers(h))
    return x, y, int(rng.integers(1, w - x + 1)), int(rng.integers(1, h - y + 1))


@all_types
@pytest.mark.parametrize("axis", ["VERT", "hori"])
def test_mirror(dtype, axis):
    for case in cases_of(f"mirror {axis}", dtype):
        image = case.image(int(case.rng.integers(1, 4)))
        want = twins.mirror(image, None, case.out, axis)
        given = case.flat(image)
        assert_same(gm.mirror(given, axis, dtype=case.out), like(want, given), f"{case}")
        operator = setters(core.MirrorImg(), Axis=axis)
        operator.IsNewFile(False)
        assert_same(copy_of_class(operator, image, None, case.target(image.shape[2])), want, f"class, {case}")


@all_types
@pytest.mark.parametrize("axis", ["vert", "HORI"])
def test_mirror_of_a_window(dtype, axis):
    for case in cases_of(f"window {axis}", dtype):
        image = case.image(2)
        x, y, w, h = window = rectangle(case.rng, case.shape)
        marked = np.zeros(case.shape, bool)
        marked[y : y + h, x : x + w] = True
        want = twins.mirror(image, marked, case.out, axis, window)
        assert_same(gm.mirror(image, axis, window=window, dtype=case.out), want, f"{case} {window}")
        operator = setters(core.MirrorImg(), Axis=axis, Window=window)
        operator.IsNewFile(False)
        assert_same(copy_of_class(operator, image, marked, case.target(2)), want, f"class, {case} {window}")
        piece = np.ascontiguousarray(image[y : y + h, x : x + w])
        crop = gm.mirror(image, axis, window=window, crop=True, dtype=case.out)
        assert_same(crop, twins.mirror(piece, None, case.out, axis), f"crop, {case} {window}")


def with_masked(result, mask, value):
    result = result.copy()
    result[~twins.everywhere(mask, result)] = value
    return result


@all_types
def test_normalize(dtype):
    for case in cases_of("normalize", dtype):
        bands = int(case.rng.integers(1, 4))
        image, mask = case.image(bands), case.mask()
        low, high = [5.0, -3.5, 20.0][:bands], [60.0, 90.0, 20.0][:bands]
        nodata = float(image.flat[0])
        want = twins.normalize(image, case.out, low, high, nodata)
        operator = setters(core.Normalize(), MinData=low, MaxData=high, NoData=nodata)
        assert_same(copy_of_class(operator, image, mask, case.target(bands)), want, f"class, {case}")
        given = case.flat(image)
        got = gm.normalize(given, low, high, nodata=nodata, mask=mask, dtype=case.out)
        want = with_masked(want, mask, twins.clip_to(np.float32(nodata), case.out))
        assert_same(got, like(want, given), f"{case}")


def test_normalize_finds_the_bounds_of_each_band():
    image = seeded("bounds").integers(1, 200, (9, 8, 2)).astype(np.int16)
    low, high = image.min(axis=(0, 1)), image.max(axis=(0, 1))
    assert_same(gm.normalize(image), twins.normalize(image, "float32", low, high))
    one = image[..., 0]
    assert_same(
        gm.normalize(one, maximum=300), twins.normalize(image[..., :1], "float32", low[:1], [300])[..., 0]
    )
    mask = image[..., 0] > 50
    low, high = image[mask].min(axis=0), image[mask].max(axis=0)
    want = with_masked(twins.normalize(image, "float32", low, high), mask, 0)
    assert_same(gm.normalize(image, mask=mask), want)


@all_types
def test_percentile_stretch(dtype):
    counts = [[4, 0, 7, 1, 9, 3, 30], [0, 0, 5, 0, 0, 0, 1]]
    for case in cases_of("percentile", dtype, largest=9):
        bands = int(case.rng.integers(1, 3))
        image, mask = case.image(bands), case.mask()
        low, high, counted = [0.0, 10.5][:bands], [70.0, 80.0][:bands], counts[:bands]
        nodata = float(image.flat[0])
        want = twins.percentile_stretch(image, case.out, counted, low, high, nodata)
        operator = setters(core.Percentile(), MinData=low, MaxData=high, NoData=nodata, BinNum=7)
        operator.SetCoefficients([count for band in counted for count in band])
        assert_same(copy_of_class(operator, image, mask, case.target(bands)), want, f"class, {case}")
        histogram = gm.Histogram(
            np.array(counted, np.int32), np.array(low, np.float32), np.array(high, np.float32)
        )
        given = case.flat(image)
        got = gm.percentile_stretch(given, histogram, nodata=nodata, mask=mask, dtype=case.out)
        want = with_masked(want, mask, twins.clip_to(np.float32(nodata), case.out))
        assert_same(got, like(want, given), f"{case}")


def test_stretches_take_the_histogram_of_the_image():
    image = seeded("stretch").integers(1, 60, (12, 11, 3)).astype(np.uint8)
    mask = image[..., 0] > 10
    for given in (None, mask):
        histogram = gm.histogram(image, mask=given)
        assert_same(
            gm.percentile_stretch(image, mask=given), gm.percentile_stretch(image, histogram, mask=given)
        )
        assert_same(
            gm.intensity_percentile(image, mask=given), gm.intensity_percentile(image, histogram, mask=given)
        )


@all_types
def test_vegetation_indices(dtype):
    for case in cases_of("vegetation", dtype):
        image, mask = case.image(8), case.mask()
        channels = case.rng.permutation(8)
        roles = [99] * 8
        for role in range(7):
            roles[channels[role]] = role
        bands = {name: int(channels[role]) for role, name in enumerate(ROLES)}
        codes = [int(code) for code in case.rng.permutation(12)[: case.rng.integers(1, 13)]]
        want = twins.vegetation_indices(image, mask, case.out, codes, roles)
        got = gm.vegetation_indices([NAMES[k] for k in codes], image, bands=bands, mask=mask, dtype=case.out)
        assert_same(got, want, f"{case} {codes}")
        operator = setters(
            core.VegIndex(), BandIndex=roles, RequestedIndex=[int(code in codes) for code in range(12)]
        )
        want = twins.vegetation_indices(image, mask, case.out, sorted(codes), roles)
        assert_same(copy_of_class(operator, image, mask, case.target(len(codes))), want, f"class, {case}")


# Focus measures


@all_types
def test_squared_gradient(dtype, capfd):
    for case in cases_of("gradient", dtype):
        image, mask = case.image(int(case.rng.integers(1, 4))), case.mask()
        background, failure = (-100.0, 90.0), float(image.flat[0])
        want = twins.squared_gradient(image, mask, background, failure)
        got = gm.squared_gradient(case.flat(image), background=background, nodata=failure, mask=mask)
        assert_same(got, want, f"{case}")
        operator = core.SqrGradientEvaluation()
        operator.SetBackground(*background)
        operator.SetFailure(failure)
        operator.InitEvaluation(image.shape[2])
        operator.Process(image, mask)
        first = np.array(operator.GetEvaluation())
        assert_same(first, want, f"class, {case}")
        operator.Process(image, mask)
        assert_same(np.array(operator.GetEvaluation()), want + (want + want), f"second call, {case}")
    capfd.readouterr()


@all_types
def test_vollath(dtype):
    for case in cases_of("vollath", dtype):
        image, mask = case.image(int(case.rng.integers(1, 4))), case.mask()
        background, failure = (-100.0, 90.0), float(image.flat[0])
        left, right = twins.vollath(image, mask, background, failure)
        got = gm.vollath(case.flat(image), background=background, nodata=failure, mask=mask)
        assert_same(np.asarray(got.left), left, f"{case}")
        assert_same(np.asarray(got.right), right, f"{case}")
        assert_same(np.asarray(got.measure), left - right, f"{case}")
        operator = core.VollathEvaluation()
        operator.SetBackground(*background)
        operator.SetFailure(failure)
        operator.Process(image, mask)
        assert_same(np.array(operator.GetLeftEq()), left, f"class, {case}")
        operator.Process(image, mask)
        assert_same(np.array(operator.GetRightEq()), right + right, f"second call, {case}")


def test_focus_of_the_headers_examples(capfd):
    assert gm.squared_gradient(np.array([[1, 2], [4, 6]], np.uint8)).tolist() == [25]
    sums = gm.vollath(np.array([[1, 2, 3, 4]], np.uint8))
    assert (list(sums.left), list(sums.right), list(sums.measure)) == ([8], [11], [-3])
    assert capfd.readouterr().out == "\n BEFORE - 101 25.000000\n"


# Two dates


def dates(case, more: int = 0):
    """Image and reference of one type, some samples of which are the same."""
    image = case.image(int(case.rng.integers(1, 4)))
    reference = case.image(image.shape[2] + more)
    bands = image.shape[2]
    reference[..., :bands] = np.where(case.rng.random(image.shape) < 0.3, image, reference[..., :bands])
    return image, reference


def nodata_of(case, image, reference):
    """Arguments of a function, the same per band for a twin."""
    if case.rng.random() < 0.3:
        return {}, None, None
    bands = image.shape[2]
    entries = [float(value) for value in image[0, 0]]
    others = [float(value) for value in reference[-1, -1]]
    if case.rng.random() < 0.5:
        return {"nodata": entries, "reference_nodata": others}, entries, others
    return {"nodata": entries[0]}, [entries[0]] * bands, [entries[0]] * reference.shape[2]


def change_class(kind, entries, others, fill, *arguments):
    operator = kind(*arguments)
    operator.SetNoData(fill)
    if entries is not None:
        operator.SetImgNoData(entries)
        operator.SetRefNoData(others)
    return operator


@all_types
@pytest.mark.parametrize("form", FORMS)
def test_difference(dtype, form):
    for case in cases_of(f"difference {form}", dtype):
        (image, reference), mask = dates(case, 1), case.mask()
        want = twins.difference(image, reference, mask, case.out, CODES[form])
        got = gm.difference(image, reference, form=form, mask=mask, dtype=case.out)
        assert_same(got, one_band(want), f"{case}")
        operator = core.SingleChange(FORMS[form])
        assert_same(copy_of_class(operator, image, reference, mask, case.target(1)), want, f"class, {case}")


@all_types
@pytest.mark.parametrize("form", FORMS)
def test_channel_difference(dtype, form):
    for case in cases_of(f"channel difference {form}", dtype):
        (image, reference), mask = dates(case, 1), case.mask()
        named, entries, others = nodata_of(case, image, reference)
        want = twins.channel_difference(
            image, reference, mask, case.out, CODES[form], entries, others, -9999.0
        )
        got = gm.channel_difference(
            image, reference, form=form, fill=-9999.0, mask=mask, dtype=case.out, **named
        )
        assert_same(got, want, f"{case} {named}")
        operator = change_class(core.ChanDiffChange, entries, others, -9999.0, FORMS[form])
        target = case.target(image.shape[2])
        assert_same(copy_of_class(operator, image, reference, mask, target), want, f"class, {case} {named}")


def unlike_dates(case):
    """Image and reference of the short list, each of its own type."""
    other = str(case.rng.choice(SHORT_LIST))
    image = case.image(int(case.rng.integers(1, 4)))
    return image, case.image(image.shape[2], dtype=other)


@all_short
@pytest.mark.parametrize("form", FORMS2)
def test_channel_difference_two_masks(dtype, form):
    for case in cases_of(f"two masks {form}", dtype, SHORT_LIST):
        (image, reference), mask = unlike_dates(case), case.mask()
        second = mask_of(case.rng, case.shape, str(case.rng.choice(MASKS)))
        named, entries, others = nodata_of(case, image, reference)
        want = twins.channel_difference_two_masks(
            image, reference, mask, second, case.out, CODES[form], entries, others, -3.0
        )
        got = gm.channel_difference_two_masks(
            image, reference, form=form, fill=-3.0, mask=mask, reference_mask=second, dtype=case.out, **named
        )
        assert_same(got, want, f"{case} {reference.dtype}")
        operator = change_class(core.ChanDiffChange2, entries, others, -3.0, FORMS2[form])
        target = case.target(image.shape[2])
        got = copy_of_class(operator, image, reference, mask, second, target)
        assert_same(got, want, f"class, {case} {reference.dtype}")


@all_short
@pytest.mark.parametrize("form", FORMS2)
def test_channel_ratio_two_masks(dtype, form):
    for case in cases_of(f"ratio, two masks {form}", dtype, SHORT_LIST):
        (image, reference), mask = unlike_dates(case), case.mask()
        second = mask_of(case.rng, case.shape, str(case.rng.choice(MASKS)))
        named, entries, others = nodata_of(case, image, reference)
        want = twins.channel_ratio(
            image, reference, mask, second, case.out, CODES[form], entries, others, 3.4e38
        )
        got = gm.channel_ratio_two_masks(
            image, reference, form=form, mask=mask, reference_mask=second, dtype=case.out, **named
        )
        assert_same(got, want, f"{case} {reference.dtype}")
        operator = change_class(core.ChanRatioChange, entries, others, 3.4e38, FORMS2[form])
        target = case.target(image.shape[2])
        got = copy_of_class(operator, image, reference, mask, second, target)
        assert_same(got, want, f"class, {case} {reference.dtype}")


@all_short
@pytest.mark.parametrize("form", FORMS)
def test_channel_ratio(dtype, form):
    for case in cases_of(f"ratio {form}", dtype, SHORT_LIST):
        (image, reference), mask = unlike_dates(case), case.mask()
        named, entries, others = nodata_of(case, image, reference)
        want = twins.channel_ratio(image, reference, mask, None, case.out, CODES[form], entries, others, -1.0)
        got = gm.channel_ratio(image, reference, form=form, fill=-1.0, mask=mask, dtype=case.out, **named)
        assert_same(got, want, f"{case} {reference.dtype}")
        operator = change_class(core.ChanRatioChange2, entries, others, -1.0, FORMS[form])
        target = case.target(image.shape[2])
        got = copy_of_class(operator, image, reference, mask, target)
        assert_same(got, want, f"class, {case} {reference.dtype}")


@all_types
def test_combine(dtype):
    for case in cases_of("combine", dtype):
        (image, reference), mask = dates(case, 1), case.mask()
        want = twins.combine(image, reference, mask, case.out, -7.5)
        got = gm.combine(image, reference, fill=-7.5, mask=mask, dtype=case.out)
        assert_same(got, want, f"{case}")
        operator = change_class(core.CombChange, None, None, -7.5, core.DiffType.eDIFF_ABSOLUTE)
        target = case.target(image.shape[2] + reference.shape[2])
        assert_same(copy_of_class(operator, image, reference, mask, target), want, f"class, {case}")


def check_decibels(got, want, what):
    """Bit for bit, but that the core has a logarithm of its own."""
    decibels, expected = got[..., 2].copy(), want[..., 2]
    if got.dtype.kind == "f":
        with np.errstate(invalid="ignore"):
            near = np.abs(decibels - expected) <= 2 * np.spacing(np.abs(expected))
        decibels = np.where(near, expected, decibels)
    assert_same(np.stack([got[..., 0], got[..., 1], decibels, got[..., 3]], axis=2), want, what)


@all_types
def test_intensity_ratio(dtype):
    for case in cases_of("intensity ratio", dtype):
        (image, reference), mask = dates(case, 1), case.mask()
        named, entries, others = nodata_of(case, image, reference)
        want = twins.intensity_ratio(image, reference, mask, case.out, entries, others, 77.0)
        operator = change_class(core.IntenRatioChange, entries, others, 77.0, core.DiffType.eDIFF_FORWARD)
        target = copy_of_class(operator, image, reference, mask, case.target(4))
        check_decibels(target, want, f"class, {case}")
        got = gm.intensity_ratio(image, reference, fill=77.0, mask=mask, dtype=case.out, **named)
        assert_same(got, target, f"{case}")


@all_types
@pytest.mark.parametrize("form", FORMS)
def test_magnitude_change(dtype, form):
    for case in cases_of(f"magnitude {form}", dtype):
        (image, reference), mask = dates(case, 1), case.mask()
        named, entries, others = nodata_of(case, image, reference)
        want = twins.magnitude_change(image, reference, mask, case.out, CODES[form], entries, others, -1.0)
        got = gm.magnitude_change(image, reference, form=form, fill=-1.0, mask=mask, dtype=case.out, **named)
        assert_same(got, want, f"{case}")
        operator = change_class(core.MagnitudeChange, entries, others, -1.0, FORMS[form])
        got = copy_of_class(operator, image, reference, mask, case.target(3))
        assert_same(got, want, f"class, {case}")


@all_types
@pytest.mark.parametrize("component", ["greenness", "brightness"])
def test_tasseled_cap_change(dtype, component):
    kind = core.TCGNChange if component == "greenness" else core.TCSBChange
    for case in cases_of(component, dtype):
        sensors = [str(case.rng.choice(twins.SENSORS)) for _ in range(2)]
        form, mask = str(case.rng.choice(sorted(FORMS))), case.mask()
        image = case.image(twins.bands_of(sensors[0]))
        reference = case.image(max(twins.bands_of(sensors[1]), image.shape[2]))
        named, entries, others = nodata_of(case, image, reference)
        want = twins.tasseled_cap_change(
            image, reference, mask, case.out, sensors, CODES[form], component == "greenness", entries, others
        )
        got = gm.tasseled_cap_change(
            image,
            reference,
            sensor=sensors[0],
            reference_sensor=sensors[1],
            component=component,
            form=form,
            mask=mask,
            dtype=case.out,
            **named,
        )
        assert_same(got, want, f"{case} {sensors} {form}")
        operator = change_class(kind, entries, others, 0.0, *sensors, FORMS[form])
        got = copy_of_class(operator, image, reference, mask, case.target(3))
        assert_same(got, want, f"class, {case} {sensors} {form}")


def test_change_of_the_headers_examples():
    a, b = np.array([[10]], np.uint8), np.array([[250]], np.uint8)
    assert [gm.difference(a, b, form=form).item() for form in FORMS] == [240, 240, -240]
    byte = {"dtype": "uint8"}
    assert [gm.channel_difference(a, b, form=form, **byte).item() for form in FORMS] == [240, 16, 240]
    assert gm.channel_ratio(a, np.array([[4]], np.float32), form="backward").item() == 2.5
    assert gm.channel_ratio_two_masks(a, np.array([[4]], np.uint8), **byte).item() == 3
    five, minus = np.array([[5]], np.uint8), np.array([[-3]], np.int16)
    assert gm.channel_difference_two_masks(five, minus, dtype="uint16").item() == 65531
    pixel = np.array([[[0, 0, 0, 100]]], np.uint8)
    for component, weight in (("greenness", 78), ("brightness", 60.4)):
        got = gm.tasseled_cap_change(pixel, pixel, sensor="QuickBird", component=component)
        assert got.tolist() == [[[np.float32(weight), np.float32(weight), 0]]]
    got = gm.magnitude_change(np.array([[[3, 4]]], np.int16), np.array([[[6, 8]]], np.int16), form="forward")
    assert got.tolist() == [[[5, 10, -5]]]
    got = gm.intensity_ratio(np.array([[[100, 200]]], np.uint8), np.array([[[50, 100]]], np.uint8))
    assert got.tolist() == [[[150, 75, np.float32(10 * np.log10(2)), 0]]]


# Services


@all_types
@pytest.mark.parametrize("synthetic_blue", [False, True])
def test_statistics(dtype, synthetic_blue):
    for case in cases_of(f"statistics {synthetic_blue}", dtype, largest=9):
        image, mask = case.image(3), case.mask()
        number = 8 if np.dtype(dtype).itemsize == 1 else 16
        low, high, counts = twins.statistics(image, mask, 2**number, synthetic_blue)
        got = gm.statistics(image, synthetic_blue=synthetic_blue, mask=mask)
        assert_same(got.minimum, low, f"{case}")
        assert_same(got.maximum, high, f"{case}")
        assert_same(got.histogram, counts, f"{case}")
        operator = core.RasterStatistics()
        operator.SetChans([0, 1, 2])
        operator.SetType(number)
        operator.SetMethod(core.StatisticsMethod(int(synthetic_blue)))
        operator.Process(image, None)
        low, high, counts = twins.statistics(image, None, 2**number, synthetic_blue)
        assert operator.GetMinValue() == low.tolist() and operator.GetMaxValue() == high.tolist()
        for c in range(3):
            assert_same(operator.GetPixelCounts(c), counts[c].astype(np.int32), f"class, {case}")


def test_statistics_merge_to_those_of_the_whole():
    image = samples(seeded("merge"), (20, 9, 3), "uint16")
    whole, parts = gm.statistics(image), gm.statistics(image[:7]).merge(gm.statistics(image[7:]))
    for name in ("minimum", "maximum", "histogram"):
        assert_same(getattr(parts, name), getattr(whole, name), name)
    assert whole.histogram.sum() == image.size


@all_types
def test_range_classes(dtype):
    ranges = [(0.0, 10.0), (5.0, 20.0), (20.0, 21.5), (90.0, 80.0), (-30.0, 1e9)]
    for case in cases_of("classes", dtype):
        image, mask = case.image(1), case.mask()
        chosen = ranges[: case.rng.integers(1, 6)]
        nodata = float(image.flat[0])
        want = twins.range_classes(image, case.out, chosen, nodata)
        operator = setters(
            core.RangeClasses(),
            NumClasses=len(chosen),
            NoData=nodata,
            MinRange=[low for low, _ in chosen],
            MaxRange=[high for _, high in chosen],
        )
        assert_same(copy_of_class(operator, image, mask, case.target(1)), want, f"class, {case}")
        got = gm.range_classes(case.flat(image), chosen, nodata=nodata, mask=mask, dtype=case.out)
        assert_same(got, one_band(with_masked(want, mask, 0)), f"{case}")


@all_types
def test_transfer(dtype):
    for case in cases_of("transfer", dtype):
        image, mask = case.image(int(case.rng.integers(1, 4))), case.mask()
        h, w, bands = image.shape
        shape = tuple(int(n) for n in case.rng.integers(1, 12, 2))
        given = ((2, 1, w, h), (3, 0, shape[1], shape[0]), (1, 1), (3, 2))
        want, source = twins.transfer(image, case.out, given[0], given[1], shape, *given[2:])
        operator = setters(core.IIIDataTransfer(), InRegion=given[0], OutRegion=given[1])
        target = case.target(bands, shape)
        operator.Process(image, mask, target, in_origin=given[2], out_origin=given[3])
        assert_same(target, want, f"class, {case} {shape}")
        flat = case.flat(image)
        got = gm.transfer(
            flat,
            given[0],
            given[1],
            shape=shape,
            in_origin=given[2],
            out_origin=given[3],
            fill=9,
            mask=mask,
            dtype=case.out,
        )
        if mask is not None:
            want[~mask[source]] = 9
        assert_same(got, like(want, flat), f"{case} {shape}")


BLUE = {"minimum": (0.0, 5.0, -1000.0), "maximum": (200.0, 90.0, 120.0)}


@all_types
@pytest.mark.parametrize("scale", [None, (1.5, 0.75, 2.0)])
def test_synthetic_blue_and_natural_color(dtype, scale):
    for case in cases_of(f"blue {scale}", dtype):
        image, mask = case.image(3), case.mask()
        background = [float(value) for value in case.image(3, finite=True)[0, 0]]
        for bands, function in ((1, gm.synthetic_blue), (3, gm.natural_color)):
            want = twins.spot_blue(image, mask, case.out, bands, background=background, scale=scale, **BLUE)
            got = function(image, background=background, scale=scale, mask=mask, dtype=case.out, **BLUE)
            assert_same(got, one_band(want) if bands == 1 else want, f"{case} {bands}")
            operator = setters(
                core.SPOTBlue(),
                Min=BLUE["minimum"],
                Max=BLUE["maximum"],
                BackGround=background,
                Trim=scale is not None,
                Scale=scale or (),
            )
            got = copy_of_class(operator, image, mask, case.target(bands))
            assert_same(got, want, f"class, {case} {bands}")


def test_services_of_the_headers_examples():
    ranges = [(0, 10), (5, 20)]
    got = gm.range_classes(np.array([[3, 7, 10, 20]], np.int16), ranges)
    assert got.tolist() == [[1, 2, 2, 0]]
    row = np.array([[10, 11, 12, 13]], np.uint8)
    assert gm.transfer(row, (0, 0, 4, 1), (0, 0, 8, 2), shape=(1, 4)).tolist() == [[10, 11, 11, 12]]
    black = np.zeros((1, 1, 3), np.uint8)
    limits = {"minimum": (0, 0, 0), "maximum": (255, 255, 255), "background": (-1, -1, -1)}
    assert gm.synthetic_blue(black, **limits).item() == 14
    got = gm.statistics(np.array([[[100, 50, 20]]], np.uint8), synthetic_blue=True)
    assert got.maximum.tolist() == [100, 50, 92] and got.histogram[2].argmax() == 92
