"""Arbitrary arrays and arguments at every function and class.

Whatever comes in, a call returns or raises one of a few exceptions: no other one and no crash. This is the
file to run with the address sanitizer, and with HYPOTHESIS_PROFILE=long for a long search.
"""

from __future__ import annotations

import threading

import numpy as np
import pytest
from hypothesis import given, note
from hypothesis import strategies as st

import gridmill as gm
from calls import CLASSES, FUNCTIONS, RASTERS, named, type_for
from cases import TYPES, samples
from gridmill import core

ALLOWED = (ValueError, TypeError, gm.GridmillError, OverflowError, MemoryError)
ODD_TYPES = (
    "bool",
    "float16",
    "longdouble",
    "complex64",
    "complex128",
    ">i2",
    ">f4",
    ">f8",
    "datetime64[s]",
    "S3",
    "U2",
    "u1,f4",
    "object",
)


@pytest.fixture(autouse=True)
def quiet(capfd):
    """The squared gradient prints a line with every call."""
    yield
    capfd.readouterr()


# Numbers that are special to some type, and none that a loop or an array of that length could bear to reach
# for: either small or beyond all memory.
WHOLE = st.sampled_from(
    (
        -(2**63),
        -(2**31) - 1,
        -2,
        -1,
        0,
        1,
        2,
        3,
        4,
        5,
        8,
        16,
        255,
        256,
        2**40,
        2**63,
        2**64,
        2**70,
    )
)
REAL = st.sampled_from(
    (
        -np.inf,
        -3.4e38,
        -1e20,
        -2.5,
        -1,
        -0.0,
        0,
        1e-45,
        0.5,
        1,
        2.5,
        7,
        90,
        510,
        1e7,
        3.4e38,
        1e39,
        1e308,
        np.inf,
        np.nan,
        2**70,
        np.float32(3),
        np.int8(-4),
        True,
    )
)
WORDS = st.sampled_from(
    (
        "",
        "vert",
        "HORI",
        "nearest",
        "reflect",
        "wrap",
        "absolute",
        "forward",
        "backward",
        "signed",
        "greenness",
        "brightness",
        "Ikonos",
        "QuickBird",
        "Landsat-7 ETM+",
        "Landsat-5 MSS",
        "NDVI",
        "savi",
        "red",
        "float32",
        "int8",
        "complex64",
        "\0",
        "ü" * 50,
    )
)


class Hostile:
    """An object whose conversions fail in an unusual way."""

    def __float__(self):
        raise ValueError("no float")

    def __len__(self):
        raise TypeError("no length")


ODD = st.sampled_from(
    (
        None,
        (),
        [],
        {},
        {"red": 0},
        object(),
        Hostile(),
        b"bytes",
        1j,
        range(3),
        slice(2),
        np.nan,
        np.zeros(0),
        np.zeros((2, 2)),
        core.DiffType.eDIFF_FORWARD,
        float,
        "vert",
    )
)
NUMBERS = st.lists(REAL | WHOLE, max_size=6) | st.tuples(REAL, REAL) | st.tuples(REAL, REAL, REAL)
WHOLES = (
    st.lists(WHOLE, max_size=5) | st.tuples(*[st.integers(-1, 9)] * 4) | st.tuples(*[st.integers(0, 4)] * 2)
)
ANYTHING = REAL | WHOLE | WORDS | ODD | NUMBERS | WHOLES


# Arrays


def laid_out(array, layout):
    """The same values in another layout."""
    if layout == "fortran":
        return np.asfortranarray(array)
    array = np.asarray(array)
    if layout == "strided":
        wide = np.zeros([2 * n for n in array.shape], array.dtype)
        view = wide[(*(slice(None, None, 2) for _ in array.shape), ...)]
        view[...] = array
        return view
    if layout == "backwards":
        return array[tuple(slice(None, None, -1) for _ in array.shape)]
    if layout == "broadcast":
        return (
            np.broadcast_to(array.ravel()[:1].reshape([1] * array.ndim), array.shape) if array.size else array
        )
    if layout == "read-only":
        array.flags.writeable = False
    return array


LAYOUTS = st.sampled_from(
    ("plain", "plain", "plain", "fortran", "strided", "backwards", "broadcast", "read-only")
)


def filled(seed: int, shape, dtype: str) -> np.ndarray:
    rng = np.random.default_rng(seed)
    if dtype in TYPES:
        return samples(rng, shape, dtype)
    if dtype == "bool":
        return rng.random(shape) < 0.7
    array = np.zeros(shape, dtype)
    if np.dtype(dtype).kind in "fc":
        array[...] = rng.standard_normal(shape) * 100
    return array


@st.composite
def arrays(draw, shape=None, dtype=None):
    if shape is None:
        shape = draw(st.lists(st.integers(0, 7), max_size=4).map(tuple))
    if dtype is None:
        dtype = draw(st.sampled_from(TYPES + ODD_TYPES))
    return laid_out(filled(draw(st.integers(0, 2**32 - 1)), shape, dtype), draw(LAYOUTS))


SIZES = st.tuples(st.integers(0, 9), st.integers(0, 9))
REAL_TYPES = st.sampled_from(TYPES)


# Functions


@st.composite
def indices(draw):
    """Vegetation indices with roles of bands, mostly sensible ones."""
    names = st.sampled_from(("NDVI", "savi", "GEMI", "MTVI1", "nonsense", core.VegetationIndex.eINDEX_TVI, 3))
    roles = st.sampled_from(("red", "green", "blue", "nir", "red_edge", "swir1", "swir2", "nri"))
    bands = st.dictionaries(roles, st.integers(-1, 5) | arrays(), max_size=7)
    return {"indices": draw(st.lists(names, max_size=4)), "bands": draw(bands)}


def histogram_arguments():
    counts = arrays(dtype="int32") | arrays() | ODD
    bounds = arrays(dtype="float32") | NUMBERS | ODD
    return st.tuples(counts, bounds, bounds)


@st.composite
def calls(draw, each):
    """A plain call with some of its arguments replaced."""
    shape, dtype = draw(SIZES), draw(REAL_TYPES)
    seed = draw(st.integers(0, 2**32 - 1))
    images = each.images(np.random.default_rng(seed), shape, type_for(each, dtype))
    if each.name == "transfer":
        images["shape"] = (3, 4)
    if draw(st.booleans()):
        images = {
            name: laid_out(image, draw(LAYOUTS)) if isinstance(image, np.ndarray) else image
            for name, image in images.items()
        }
    for name in draw(st.lists(st.sampled_from(arguments_of(each)), max_size=3, unique=True)):
        images[name] = draw(argument(each, name, shape))
    if each.name == "vegetation_indices" and draw(st.booleans()):
        images |= draw(indices())
    return images


def arguments_of(each) -> tuple[str, ...]:
    parameters = [name for name, _ in each.arguments] + [each.raster, *each.masks]
    parameters += (
        ["reference", "form", "nodata", "reference_nodata", "fill"] if each.reference else ["nodata"]
    )
    parameters += ["out", "out", "dtype"] if each.has_out else []
    more = {
        "slope": ["cellsize", "z_factor", "edge", "margin", "background", "num_threads"],
        "aspect": ["cellsize", "z_factor", "edge", "margin", "background", "num_threads", "flat"],
        "average_channels": ["num_threads"],
        "percentile_stretch": ["histogram"],
        "intensity_percentile": ["histogram", "sign"],
        "mirror": ["window", "window", "crop"],
        "squared_gradient": ["background"],
        "vollath": ["background"],
        "statistics": ["synthetic_blue", "bits"],
        "histogram": ["bins", "minimum", "maximum"],
        "transfer": ["shape", "in_origin", "out_origin", "fill"],
        "synthetic_blue": ["scale"],
        "natural_color": ["scale"],
        "tasseled_cap_change": ["reference_sensor", "component"],
    }
    return tuple(parameters + more.get(each.name, []))


def outputs(shape):
    """Outputs that fit more or less."""
    shapes = st.sampled_from((shape, (*shape, 1), (*shape, 2), (*shape, 3), (*shape, 4), shape[::-1]))
    return shapes.flatmap(lambda chosen: arrays(shape=chosen)) | arrays()


def argument(each, name, shape):
    if name in RASTERS:
        return arrays() | arrays(shape=(*shape, each.bands)) | ODD
    if name in ("mask", "reference_mask"):
        return arrays(shape=shape, dtype="bool") | arrays(dtype="bool") | arrays() | ODD
    if name == "out":
        return outputs(shape)
    if name == "dtype":
        return st.sampled_from(TYPES + ODD_TYPES) | ODD
    if name == "histogram":
        return histogram_arguments() | ODD
    if name == "margin":
        return st.sampled_from((0, 1, 1, 2, -1, True, 1.0)) | ODD
    return ANYTHING


@pytest.mark.parametrize("each", **named(FUNCTIONS))
def test_any_call_of_a_function_returns_or_raises_what_is_allowed(each):
    @given(calls(each))
    def run(arguments):
        note(repr(arguments))
        try:
            if isinstance(arguments.get("histogram"), tuple) and len(arguments["histogram"]) == 3:
                arguments["histogram"] = gm.Histogram(*arguments["histogram"])
            each.call(arguments)
        except ALLOWED:
            pass

    run()


@pytest.mark.parametrize("each", **named(FUNCTIONS))
def test_an_output_that_fits_is_written_within_its_bounds(each):
    """Outputs of all sizes and types, in memory of their own with a guard on both sides."""

    @given(SIZES, REAL_TYPES, REAL_TYPES, st.integers(0, 2**32 - 1))
    def run(shape, dtype, out_type, seed):
        rng = np.random.default_rng(seed)
        images = each.images(rng, shape, type_for(each, dtype))
        masks = {name: rng.random(shape) < 0.5 for name in each.masks if each.name != "mirror"}
        out_type = type_for(each, out_type)
        if not each.has_out:
            try:
                each.call(images, **masks)
            except ValueError:
                assert min(shape) == 0 or not masks["mask"].any()
            return
        try:
            want = each.call(images, **masks, dtype=out_type)
        except ValueError:
            assert min(shape) == 0 or not masks["mask"].any()
            return
        guarded = np.full(want.nbytes + 256, 119, np.uint8)
        out = guarded[128 : 128 + want.nbytes].view(out_type).reshape(want.shape)
        each.call(images, **masks, out=out)
        assert (guarded[:128] == 119).all() and (guarded[128 + want.nbytes :] == 119).all()
        assert out.tobytes() == want.tobytes()

    run()


# Classes

INT = st.sampled_from((-(2**31), -1, 0, 1, 2, 3, 4, 8, 16, 2**31, 2**63))
UNSIGNED = st.sampled_from((0, 1, 2, 3, 4, 5, 6, 7, 8, 2**31, 2**32 - 1, 2**32, -1))
REALS = st.lists(REAL, max_size=5) | st.lists(REAL, min_size=12, max_size=12)
FORM = st.sampled_from([core.DiffType(0), core.DiffType(1), core.DiffType(2), core.DiffType2(1), 3])
SENSOR = st.sampled_from(("Ikonos", "QuickBird", "Landsat-7 ETM+", "Landsat-4 MSS", "none", ""))
COUNTS = st.lists(INT, max_size=8) | arrays(dtype="int32") | arrays()
DECISIONS = st.sampled_from(
    (
        None,
        len,
        lambda pixel: True,
        lambda pixel: False,
        lambda pixel: pixel[0] > 5,
        lambda pixel: pixel,
        lambda pixel: 1 // 0,
        lambda: True,
        5,
    )
)
ORIGIN = st.tuples(UNSIGNED, UNSIGNED)


def change_setters():
    return {"SetType": [FORM], "SetNoData": [REAL], "SetImgNoData": [REALS], "SetRefNoData": [REALS]}


def cap_setters():
    return {**change_setters(), "SetSensorType": [SENSOR], "SetRefSensorType": [SENSOR]}


def focus_setters():
    return {"SetBackground": [REAL, REAL], "SetFailure": [REAL], "InitEvaluation": [UNSIGNED]}


SETTERS = {
    "AverageChannels": {"SetNodata": [REAL]},
    "FilterSlp": {"SetXSIZE": [REAL], "SetYSIZE": [REAL], "SetELSZ": [REAL], "SetBackground": [REAL]},
    "FilterAsp": {"SetXSIZE": [REAL], "SetYSIZE": [REAL], "SetELSZ": [REAL], "SetZeroSlope": [REAL]},
    "BitmapFiltering": {"SetThresholdMin": [REAL], "SetThresholdMax": [REAL]},
    "IntenPercent": {
        "SetMin": [REAL],
        "SetMax": [REAL],
        "SetNoData": [REAL],
        "SetScale": [REAL],
        "SetType": [FORM],
        "SetBins": [COUNTS],
    },
    "MirrorImg": {
        "SetAxis": [WORDS],
        "SetWindow": [st.lists(UNSIGNED, max_size=5)],
        "IsNewFile": [st.booleans()],
    },
    "Normalize": {"SetMinData": [REALS], "SetMaxData": [REALS], "SetNoData": [REAL]},
    "Percentile": {
        "SetMinData": [REALS],
        "SetMaxData": [REALS],
        "SetNoData": [REAL],
        "SetBinNum": [INT],
        "SetCoefficients": [COUNTS],
    },
    "VegIndex": {
        "SetRequestedIndex": [st.lists(UNSIGNED, min_size=10, max_size=13)],
        "SetBandIndex": [st.lists(UNSIGNED, max_size=8)],
    },
    "SqrGradientEvaluation": focus_setters(),
    "VollathEvaluation": focus_setters(),
    "SingleChange": {"SetType": [FORM]},
    "TCGNChange": cap_setters(),
    "TCSBChange": cap_setters(),
    "RasterStatistics": {
        "SetChans": [st.lists(UNSIGNED, max_size=4)],
        "SetType": [INT],
        "SetMask": [DECISIONS],
        "SetMethod": [st.sampled_from([core.StatisticsMethod(0), core.StatisticsMethod(1), 7])],
    },
    "RangeClasses": {
        "SetNumClasses": [INT],
        "SetMinRange": [REALS],
        "SetMaxRange": [REALS],
        "SetNoData": [REAL],
        "SetMask": [DECISIONS],
    },
    "IIIDataTransfer": {
        "SetInRegion": [st.lists(UNSIGNED, max_size=5)],
        "SetOutRegion": [st.lists(UNSIGNED, max_size=5)],
        "SetResampleType": [st.sampled_from([core.ResampleType(0), 1])],
    },
    "SPOTBlue": {
        "SetMin": [REALS],
        "SetMax": [REALS],
        "SetScale": [REALS],
        "SetBackGround": [REALS],
        "SetTrim": [st.booleans()],
    },
}
GETTERS = (
    "GetMinValue",
    "GetMaxValue",
    "GetClassNumber",
    "GetMinRangeValue",
    "GetMaxRangeValue",
    "GetEvaluation",
    "GetLeftEq",
    "GetRightEq",
)


@st.composite
def processed(draw, each):
    """Arguments of `Process` that often fit, and named ones."""
    shape, margin = draw(st.tuples(st.integers(0, 6), st.integers(0, 6))), draw(st.integers(0, 2))
    around = (shape[0] + 2 * margin, shape[1] + 2 * margin)
    size = around if each.kind == "terrain" else shape
    images = st.integers(0, 6).flatmap(lambda bands: arrays(shape=(*size, bands))) | arrays(
        shape=(*size, each.bands), dtype=draw(REAL_TYPES)
    )
    masks = st.none() | arrays(shape=size, dtype="bool") | arrays()
    target = arrays(shape=(*shape, each.out_bands), dtype=draw(REAL_TYPES)) | outputs(shape)
    more = {"margin": margin} if each.kind == "terrain" else {}
    if each.name == "IIIDataTransfer" and draw(st.booleans()):
        more = {"in_origin": draw(ORIGIN), "out_origin": draw(ORIGIN)}
    if each.kind == "terrain" and draw(st.booleans()):
        more = {"margin": draw(st.integers(0, 3)), "out_margin": draw(st.integers(0, 3))}
    if each.name in ("FilterSlp", "FilterAsp", "AverageChannels") and draw(st.booleans()):
        more["num_threads"] = draw(st.sampled_from((1, 2, 5, 0, -1, 2**40, None)))
    image = draw(images)
    given_arguments = [image]
    if each.kind in ("change", "two masks"):
        given_arguments.append(draw(images | st.just(image)))
    given_arguments += [draw(masks) for _ in range(2 if each.kind == "two masks" else 1)]
    if each.has_out:
        given_arguments.append(draw(target | st.just(image)))
    return given_arguments, more


def step(each):
    """A setter, `Process` or a getter, as a name and arguments."""
    setters = SETTERS.get(each.name, change_setters())
    set_one = st.sampled_from(sorted(setters)).flatmap(
        lambda name: st.tuples(st.just(name), st.tuples(*setters[name]), st.just({}))
    )
    process = processed(each).map(lambda given_arguments: ("Process", *given_arguments))
    get = st.sampled_from(GETTERS).map(lambda name: (name, (), {}))
    count = INT.map(lambda position: ("GetPixelCounts", (position,), {}))
    odd = st.sampled_from(sorted(setters)).flatmap(
        lambda name: st.tuples(st.just(name), st.tuples(ODD), st.just({}))
    )
    return set_one | process | process | process | get | count | odd


@pytest.mark.parametrize("each", **named(CLASSES))
def test_any_use_of_an_object_returns_or_raises_what_is_allowed(each):
    @given(st.booleans(), st.lists(step(each), max_size=12))
    def run(plain, steps):
        operator = each.make() if plain else bare(each)
        for name, arguments, more in steps:
            note(f"{name}({arguments}, {more})")
            if not hasattr(operator, name):
                continue
            try:
                getattr(operator, name)(*arguments, **more)
            except (*ALLOWED, ZeroDivisionError):  # a decision raises the latter
                pass

    run()


def bare(each):
    """An object without its parameters."""
    arguments = {"TCGNChange": ("", ""), "TCSBChange": ("", "")}.get(each.name, ())
    if each.kind == "change":
        arguments += (core.DiffType.eDIFF_BACKWARD,)
    if each.kind == "two masks":
        arguments += (core.DiffType2.eDIFF2_ABSOLUTE,)
    return getattr(core, each.name)(*arguments)


@pytest.mark.parametrize("each", **named(CLASSES))
def test_setters_and_calls_on_several_threads_do_no_harm(each):
    @given(st.lists(step(each), min_size=3, max_size=9))
    def run(steps):
        operator, wrong = each.make(), []

        def work(own):
            for name, arguments, more in own:
                try:
                    if hasattr(operator, name):
                        getattr(operator, name)(*arguments, **more)
                except (*ALLOWED, ZeroDivisionError):
                    pass
                except BaseException as failure:  # a thread has no other way to tell
                    wrong.append(failure)

        threads = [threading.Thread(target=work, args=(steps[i::3],)) for i in range(3)]
        for thread in threads:
            thread.start()
        for thread in threads:
            thread.join()
        assert not wrong, wrong

    run()
