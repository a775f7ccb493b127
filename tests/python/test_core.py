"""The classes of gridmill.core: parameters, results, kept processors, threads and failures."""

from __future__ import annotations

import copy
import pickle
import threading

import numpy as np
import pytest

from calls import CLASS_BY_NAME, CLASSES, named
from cases import SHORT_LIST, TYPES, assert_same, seeded
from gridmill import core

SHAPE = (6, 8)


@pytest.fixture(autouse=True)
def quiet(capfd):
    """The squared gradient prints a line with every call."""
    yield
    capfd.readouterr()


def type_for(each, dtype):
    return dtype if not each.short_list or dtype in SHORT_LIST else "uint16"


def run(each, operator, dtype="uint8", out_type="float32", seed=0, shape=SHAPE, mask=None):
    if mask is not None and each.kind == "terrain":
        mask = np.pad(mask, 1)
    image = each.image(seeded(each.name, seed, dtype), shape, type_for(each, dtype))
    reference = each.image(seeded(each.name, seed, dtype, "reference"), shape, type_for(each, dtype))
    out = each.out(shape, type_for(each, out_type)) if each.has_out else None
    return each.run(operator, image, mask, reference, out)


# Parameters

ABSOLUTE, FORWARD, BACKWARD = (core.DiffType(value) for value in range(3))
SIGNED = core.DiffType2.eDIFF2_SIGNED
CHANGE = {"noData": 0.0, "imgNoData": [], "refNoData": []}
RATIO = {"noData": np.float32(3.4e38), "imgNoData": [], "refNoData": []}
FOCUS = {"backgroundLow": -1e7, "backgroundHigh": 1e7, "failure": -32767.0}

# class, arguments, fields as they are at first
DEFAULTS = [
    ("AverageChannels", (), {"noData": 0.0}),
    ("AverageChannels", (-1.5,), {"noData": -1.5}),
    ("FilterSlp", (), {"XSIZE": 1.0, "YSIZE": 1.0, "ELSZ": 1.0, "Background": 0.0}),
    ("FilterSlp", (2, 3, 4), {"XSIZE": 2.0, "YSIZE": 3.0, "ELSZ": 4.0}),
    ("FilterAsp", (), {"ZeroSlope": 510.0, "XSIZE": 0.0, "YSIZE": 0.0, "ELSZ": 1.0, "Background": 0.0}),
    ("BitmapFiltering", (), {"thresholdMin": 0.0, "thresholdMax": 0.0}),
    ("BitmapFiltering", (3, 4), {"thresholdMin": 3.0, "thresholdMax": 4.0}),
    ("IntenPercent", (), {"Min": 0.0, "Max": 0.0, "NoData": 0.0, "Scale": 0.0, "Bins": [], "Type": ABSOLUTE}),
    ("MirrorImg", (), {"Axis": "", "Window": [], "isNewFile": False}),
    ("Normalize", (), {"MinData": [], "MaxData": [], "NoData": 0.0}),
    ("Percentile", (), {"MinData": [], "MaxData": [], "NoData": 0.0, "BinNum": 0}),
    ("VegIndex", (), {"requestedIndex": [], "bandIndex": []}),
    ("SqrGradientEvaluation", (), FOCUS),
    ("VollathEvaluation", (), FOCUS),
    ("SingleChange", (FORWARD,), {"type": FORWARD}),
    ("ChanDiffChange", (BACKWARD,), {"type": BACKWARD, **CHANGE}),
    ("ChanDiffChange2", (SIGNED,), {"type": SIGNED, **CHANGE}),
    ("ChanRatioChange", (SIGNED,), {"type": SIGNED, **RATIO}),
    ("ChanRatioChange2", (FORWARD,), {"type": FORWARD, **RATIO}),
    ("CombChange", (ABSOLUTE,), {"type": ABSOLUTE, **CHANGE}),
    ("IntenRatioChange", (ABSOLUTE,), {"type": ABSOLUTE, **CHANGE}),
    ("MagnitudeChange", (FORWARD,), {"type": FORWARD, **CHANGE}),
    (
        "TCGNChange",
        ("Ikonos", "QuickBird", FORWARD),
        {"sensorType": "Ikonos", "refSensorType": "QuickBird", "type": FORWARD, **CHANGE},
    ),
    (
        "TCSBChange",
        ("Ikonos", "QuickBird", FORWARD),
        {"sensorType": "Ikonos", "refSensorType": "QuickBird", "type": FORWARD, **CHANGE},
    ),
    (
        "RasterStatistics",
        (),
        {"histogramType": -1, "method": core.StatisticsMethod.eSTATISTICS_SYNTHETIC_BLUE},
    ),
    ("RangeClasses", (), {"minRange": [], "maxRange": [], "classCount": -1}),
    (
        "IIIDataTransfer",
        (),
        {
            "inRegion": [0, 0, 0, 0],
            "outRegion": [0, 0, 0, 0],
            "resampleType": core.ResampleType.eRESAMPLE_NEAREST,
        },
    ),
    ("SPOTBlue", (), {"min": [], "max": [], "scale": [], "backGround": [], "trim": False}),
]

IMAGE_NODATA = [
    ("SetNoData", (-9,), "noData", -9.0),
    ("SetImgNoData", ([1, 2],), "imgNoData", [1.0, 2.0]),
    ("SetRefNoData", ((3, 4),), "refNoData", [3.0, 4.0]),
]
DIRECTION = [("SetType", (BACKWARD,), "type", BACKWARD)]
SENSORS = [
    ("SetSensorType", ("Ikonos",), "sensorType", "Ikonos"),
    ("SetRefSensorType", ("anything",), "refSensorType", "anything"),
]
FAILURE = [("SetFailure", (7,), "failure", 7.0), ("SetBackground", (1, 2), "backgroundHigh", 2.0)]

# class, setter, its arguments, field, what it then holds
SETTERS = {
    "AverageChannels": [("SetNodata", (5,), "noData", 5.0)],
    "FilterSlp": [(f"Set{name}", (2.5,), name, 2.5) for name in ("XSIZE", "YSIZE", "ELSZ", "Background")],
    "FilterAsp": [
        (f"Set{name}", (2.5,), name, 2.5) for name in ("ZeroSlope", "XSIZE", "YSIZE", "ELSZ", "Background")
    ],
    "BitmapFiltering": [
        ("SetThresholdMin", (1,), "thresholdMin", 1.0),
        ("SetThresholdMax", (2,), "thresholdMax", 2.0),
    ],
    "IntenPercent": [
        ("SetMin", (1,), "Min", 1.0),
        ("SetMax", (2,), "Max", 2.0),
        ("SetNoData", (3,), "NoData", 3.0),
        ("SetScale", (4,), "Scale", 4.0),
        ("SetType", (FORWARD,), "Type", FORWARD),
        ("SetBins", ([1, 2],), "Bins", [1, 2]),
        ("SetBins", ((3,),), "Bins", [1, 2, 3]),
    ],
    "MirrorImg": [
        ("SetAxis", ("vert",), "Axis", "vert"),
        ("SetWindow", ([1, 2, 3, 4],), "Window", [1, 2, 3, 4]),
        ("IsNewFile", (True,), "isNewFile", True),
    ],
    "Normalize": [
        ("SetMinData", ([1],), "MinData", [1.0]),
        ("SetMaxData", ((2, 3),), "MaxData", [2.0, 3.0]),
        ("SetNoData", (4,), "NoData", 4.0),
    ],
    "Percentile": [
        ("SetMinData", ([1],), "MinData", [1.0]),
        ("SetMaxData", ((2,),), "MaxData", [2.0]),
        ("SetNoData", (4,), "NoData", 4.0),
        ("SetBinNum", (3,), "BinNum", 3),
    ],
    "VegIndex": [
        ("SetRequestedIndex", ([1] * 12,), "requestedIndex", [1] * 12),
        ("SetBandIndex", ((2, 4),), "bandIndex", [2, 4]),
    ],
    "SqrGradientEvaluation": FAILURE,
    "VollathEvaluation": FAILURE,
    "SingleChange": DIRECTION,
    "ChanDiffChange": DIRECTION + IMAGE_NODATA,
    "ChanDiffChange2": [
        ("SetType", (core.DiffType2.eDIFF2_ABSOLUTE,), "type", core.DiffType2.eDIFF2_ABSOLUTE),
        *IMAGE_NODATA,
    ],
    "ChanRatioChange": IMAGE_NODATA,
    "ChanRatioChange2": DIRECTION + IMAGE_NODATA,
    "CombChange": DIRECTION + IMAGE_NODATA,
    "IntenRatioChange": DIRECTION + IMAGE_NODATA,
    "MagnitudeChange": DIRECTION + IMAGE_NODATA,
    "TCGNChange": DIRECTION + IMAGE_NODATA + SENSORS,
    "TCSBChange": DIRECTION + IMAGE_NODATA + SENSORS,
    "RasterStatistics": [
        ("SetChans", ([0, 1],), "channels", [0, 1]),
        ("SetChans", ([4],), "channels", [0, 1, 4]),
        ("SetType", (8,), "histogramType", 8),
        (
            "SetMethod",
            (core.StatisticsMethod.eSTATISTICS_PLAIN,),
            "method",
            core.StatisticsMethod.eSTATISTICS_PLAIN,
        ),
    ],
    "RangeClasses": [
        ("SetNumClasses", (3,), "classCount", 3),
        ("SetMinRange", ([1],), "minRange", [1.0]),
        ("SetMaxRange", ([2],), "maxRange", [2.0]),
        ("SetNoData", (9,), "noData", 9.0),
    ],
    "IIIDataTransfer": [
        ("SetInRegion", ([1, 2, 3, 4],), "inRegion", [1, 2, 3, 4]),
        ("SetOutRegion", ((5, 6, 7, 8),), "outRegion", [5, 6, 7, 8]),
    ],
    "SPOTBlue": [
        ("SetMin", ([1],), "min", [1.0]),
        ("SetMin", ([2],), "min", [1.0, 2.0]),
        ("SetMax", ([3],), "max", [3.0]),
        ("SetScale", ((4,),), "scale", [4.0]),
        ("SetBackGround", ([5],), "backGround", [5.0]),
        ("SetTrim", (True,), "trim", True),
    ],
}


def value_of(operator, field):
    value = getattr(operator, field)
    return list(value) if isinstance(value, (list, tuple)) else value


@pytest.mark.parametrize("name,arguments,fields", DEFAULTS, ids=[f"{row[0]}{row[1]}" for row in DEFAULTS])
def test_new_object_has_the_defaults_of_the_core(name, arguments, fields):
    operator = getattr(core, name)(*arguments)
    assert {field: value_of(operator, field) for field in fields} == fields


@pytest.mark.parametrize("name", SETTERS)
def test_setter_sets_its_field(name):
    arguments = next(row[1] for row in DEFAULTS if row[0] == name)
    operator = getattr(core, name)(*arguments)
    for setter, given, field, value in SETTERS[name]:
        getattr(operator, setter)(*given)
        assert value_of(operator, field) == value, setter


def test_every_class_is_tested_here():
    names = {each.name for each in CLASSES}
    assert len(names) == 25 and names == set(SETTERS) == {row[0] for row in DEFAULTS}
    assert names == {name for name, kind in vars(core).items() if hasattr(kind, "Process")}


@pytest.mark.parametrize("name", SETTERS)
def test_field_is_read_only(name):
    arguments = next(row[1] for row in DEFAULTS if row[0] == name)
    operator = getattr(core, name)(*arguments)
    for _, _, field, value in SETTERS[name]:
        with pytest.raises(AttributeError):
            setattr(operator, field, value)


@pytest.mark.parametrize("name", SETTERS)
def test_setter_refuses_what_is_no_value_of_its_type(name):
    arguments = next(row[1] for row in DEFAULTS if row[0] == name)
    operator = getattr(core, name)(*arguments)
    for setter, given, field, _ in SETTERS[name]:
        if setter == "IsNewFile" or setter == "SetTrim":
            continue
        before = repr(value_of(operator, field))
        with pytest.raises((TypeError, ValueError, OverflowError)):
            getattr(operator, setter)(*[object() for _ in given])
        assert repr(value_of(operator, field)) == before


def test_enumerations_have_the_values_of_the_core():
    values = {
        "DiffType": ["eDIFF_ABSOLUTE", "eDIFF_FORWARD", "eDIFF_BACKWARD"],
        "DiffType2": ["eDIFF2_ABSOLUTE", "eDIFF2_SIGNED"],
        "ResampleType": ["eRESAMPLE_NEAREST"],
        "StatisticsMethod": ["eSTATISTICS_PLAIN", "eSTATISTICS_SYNTHETIC_BLUE"],
        "BandRole": [
            f"eBAND_{name}" for name in ("BLUE", "GREEN", "RED", "RED_EDGE", "NIR", "SWIR1", "SWIR2")
        ],
        "VegetationIndex": [
            f"eINDEX_{name}"
            for name in (
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
        ],
    }
    for name, members in values.items():
        kind = getattr(core, name)
        assert [int(getattr(kind, member)) for member in members] == list(range(len(members)))


# Kept processors

# class, a setter with another value than the object has
ANOTHER = {
    "AverageChannels": ("SetNodata", 3),
    "FilterSlp": ("SetXSIZE", 9),
    "FilterAsp": ("SetXSIZE", 9),
    "BitmapFiltering": ("SetThresholdMax", 90),
    "IntenPercent": ("SetMax", 30),
    "MirrorImg": ("SetAxis", "HORI"),
    "Normalize": ("SetMaxData", [30, 30]),
    "Percentile": ("SetMaxData", [30, 30]),
    "VegIndex": ("SetBandIndex", [4, 2]),
    "SingleChange": ("SetType", BACKWARD),
    "ChanDiffChange": ("SetType", BACKWARD),
    "ChanDiffChange2": ("SetType", core.DiffType2.eDIFF2_ABSOLUTE),
    "ChanRatioChange": ("SetNoData", 5),
    "ChanRatioChange2": ("SetNoData", 5),
    "CombChange": ("SetNoData", 5),
    "IntenRatioChange": ("SetNoData", 5),
    "MagnitudeChange": ("SetType", BACKWARD),
    "TCGNChange": ("SetSensorType", "Ikonos"),
    "TCSBChange": ("SetSensorType", "Ikonos"),
    "RangeClasses": ("SetMaxRange", [9, 9]),
    "IIIDataTransfer": ("SetInRegion", [3, 3, 4, 3]),
    "SPOTBlue": ("SetTrim", True),
    "VollathEvaluation": ("SetFailure", 3),
    "SqrGradientEvaluation": ("SetFailure", 3),
}
ONE_TYPE = ("IIIDataTransfer", "SPOTBlue", "RasterStatistics")
INPUT_ALONE = ("BitmapFiltering", "IntenPercent", "SqrGradientEvaluation", "VollathEvaluation")
MASK = np.arange(48).reshape(SHAPE) % 7 != 0


def set_another(operator, name):
    setter, value = ANOTHER[name]
    if name == "SPOTBlue":
        operator.SetScale([2, 2, 2])
    getattr(operator, setter)(value)


@pytest.mark.parametrize("name", [name for name in ANOTHER if CLASS_BY_NAME[name].has_out])
def test_setter_after_process_has_no_effect_until_a_type_changes(name):
    each = CLASS_BY_NAME[name]
    mask = None if name == "MirrorImg" else MASK
    changed = each.make()
    set_another(changed, name)
    first, other = run(each, each.make(), mask=mask), run(each, changed, mask=mask)
    assert not np.array_equal(first, other, equal_nan=True), "the test needs a parameter with an effect"
    operator = each.make()
    assert_same(run(each, operator, mask=mask), first)
    set_another(operator, name)
    assert_same(run(each, operator, mask=mask), first)
    if name not in ONE_TYPE:
        changed = each.make()
        set_another(changed, name)
        assert_same(run(each, operator, "int16", mask=mask), run(each, changed, "int16", mask=mask))


@pytest.mark.parametrize("name", ONE_TYPE)
def test_object_that_is_built_once_refuses_another_type(name):
    each = CLASS_BY_NAME[name]
    operator = each.make()
    want = run(each, operator, "uint8")
    for dtype in TYPES:
        if dtype != "uint8":
            with pytest.raises((TypeError, ValueError), match="uint8"):
                run(each, operator, dtype)
        if dtype != "float32" and each.has_out:
            with pytest.raises((TypeError, ValueError), match="float32"):
                run(each, operator, "uint8", dtype)
    again = run(each, operator, "uint8")
    if each.has_out:
        assert_same(again, want)


@pytest.mark.parametrize("name", ["BitmapFiltering", "IntenPercent"])
def test_object_that_compares_the_input_alone_refuses_another_output(name):
    each = CLASS_BY_NAME[name]
    operator = each.make()
    run(each, operator, "uint8", "float32")
    with pytest.raises((TypeError, ValueError), match="float32"):
        run(each, operator, "uint8", "float64")
    want = run(each, each.make(), "int16", "float64")
    assert_same(run(each, operator, "int16", "float64"), want)


@pytest.mark.parametrize("name", [each.name for each in CLASSES if each.name not in ONE_TYPE + INPUT_ALONE])
def test_object_follows_every_change_of_types(name):
    each = CLASS_BY_NAME[name]
    operator = each.make()
    types = SHORT_LIST if each.short_list else TYPES
    for dtype in types:
        for out_type in (dtype, "float32", "int16"):
            want = run(each, each.make(), dtype, out_type)
            assert_same(run(each, operator, dtype, out_type), want, f"{dtype} {out_type}")


@pytest.mark.parametrize("name", ["SqrGradientEvaluation", "VollathEvaluation"])
def test_focus_measure_keeps_its_number_of_channels(name):
    operator = getattr(core, name)()
    if name.startswith("Sqr"):
        operator.InitEvaluation(2)
    operator.Process(np.ones((4, 5, 2), np.uint8))
    for bands in (1, 3):
        with pytest.raises(ValueError, match="2"):
            operator.Process(np.ones((4, 5, bands), np.uint8))


def test_squared_gradient_has_as_many_results_as_it_was_started_with():
    for channels in range(5):
        operator = core.SqrGradientEvaluation()
        if channels:
            operator.InitEvaluation(channels)
        operator.Process(np.array([[[1, 2, 3]], [[2, 4, 6]]], np.uint8))
        assert operator.GetEvaluation() == [1, 4, 9, 0][:channels]


def test_statistics_add_up_over_calls():
    operator = CLASS_BY_NAME["RasterStatistics"].make()
    assert operator.GetMinValue() == operator.GetMaxValue() == []
    operator.Process(np.full((2, 3, 2), 5, np.uint16))
    operator.Process(np.full((4, 1, 2), 700, np.uint16))
    assert operator.GetMinValue() == [5, 5] and operator.GetMaxValue() == [700, 700]
    counts = operator.GetPixelCounts(1)
    assert counts.dtype == np.int32 and counts.shape == (65536,)
    assert counts[5] == 6 and counts[700] == 4 and counts.sum() == 10
    for position in (2, -1, 2**31):
        with pytest.raises((ValueError, IndexError, TypeError, OverflowError)):
            operator.GetPixelCounts(position)


def test_range_classes_tell_their_last_build():
    operator = CLASS_BY_NAME["RangeClasses"].make()
    assert (operator.GetClassNumber(), operator.GetMinRangeValue(), operator.GetMaxRangeValue()) == (
        -1,
        [],
        [],
    )
    run(CLASS_BY_NAME["RangeClasses"], operator)
    assert operator.GetClassNumber() == 2
    assert operator.GetMinRangeValue() == [0, 30] and operator.GetMaxRangeValue() == [30, 60]


# What memory safety needs


@pytest.mark.parametrize("each", **named([each for each in CLASSES if each.has_out]))
def test_process_refuses_an_output_of_another_size(each):
    for h, w in ((5, 8), (6, 7), (8, 6)):
        if each.name == "IIIDataTransfer":
            continue  # its output has any size
        out = each.out((h, w), "float32")
        image = each.image(seeded(0), SHAPE, "uint8")
        with pytest.raises(ValueError, match="^out: .*expected"):
            each.run(each.make(), image, out=out)
        assert (out == 77).all()


@pytest.mark.parametrize("each", **named(CLASSES))
def test_process_refuses_a_mask_of_another_size(each):
    image = each.image(seeded(0), SHAPE, "uint8")
    out = each.out(SHAPE, "float32") if each.has_out else None
    with pytest.raises(ValueError, match="^mask: .*expected"):
        each.run(each.make(), image, np.ones((3, 3), bool), out=out)
    with pytest.raises((TypeError, ValueError), match="^mask: .*expected"):
        each.run(each.make(), image, np.ones(image.shape[:2], np.uint8), out=out)


@pytest.mark.parametrize("each", **named(CLASSES))
def test_process_refuses_arrays_that_it_would_have_to_copy(each):
    image = each.image(seeded(0), SHAPE, "uint16")
    wide = each.image(seeded(0), (SHAPE[0], 2 * SHAPE[1] + 2), "uint16")[:, : image.shape[1]]
    out = each.out(SHAPE, "float32") if each.has_out else None
    for odd in (
        wide,
        np.asfortranarray(np.broadcast_to(image[..., :1], image.shape[:2] + (3,))),
        image.astype(">u2"),
        image[::-1],
    ):
        with pytest.raises((TypeError, ValueError), match="expected"):
            each.run(each.make(), odd, out=out)
    with pytest.raises((TypeError, ValueError), match="expected"):
        each.run(each.make(), image.tolist(), out=out)
    with pytest.raises((TypeError, ValueError), match="expected"):
        each.run(each.make(), None, out=out)
    if each.has_out:
        out.flags.writeable = False
        with pytest.raises(ValueError, match="^out: .*expected"):
            each.run(each.make(), image, out=out)
        with pytest.raises((TypeError, ValueError), match="^out: .*expected"):
            each.run(each.make(), image, out=None)


@pytest.mark.parametrize("each", **named([each for each in CLASSES if each.has_out]))
def test_process_refuses_an_output_over_its_input(each):
    image = each.image(seeded(0), SHAPE, "uint8")
    size = SHAPE[0] * SHAPE[1] * each.out_bands
    buffer = np.zeros(image.nbytes + size, np.uint8)
    inside = buffer[: image.nbytes].reshape(image.shape)
    inside[...] = image
    for start in (0, image.nbytes - 1):
        out = buffer[start : start + size].reshape(*SHAPE, each.out_bands)
        before = buffer.copy()
        with pytest.raises(ValueError, match="^out: .*expected"):
            each.run(each.make(), inside, reference=image, out=out)
        assert_same(buffer, before)


@pytest.mark.parametrize(
    "name", [each.name for each in CLASSES if each.name not in ("AverageChannels", "MirrorImg")]
)
def test_process_without_its_parameters_is_refused_or_safe(name):
    """Vectors that the core would read past their end."""
    each = CLASS_BY_NAME[name]
    arguments = next(row[1] for row in DEFAULTS if row[0] == name)
    operator = getattr(core, name)(*arguments)
    try:
        run(each, operator)
    except (ValueError, core.GridmillError) as failure:
        assert str(failure)


@pytest.mark.parametrize(
    "name,setter,value",
    [
        ("Normalize", "SetMinData", [1]),
        ("Normalize", "SetMaxData", []),
        ("VegIndex", "SetRequestedIndex", [1] * 11),
        ("VegIndex", "SetBandIndex", [2]),
        ("RangeClasses", "SetMinRange", [1]),
        ("RangeClasses", "SetMaxRange", []),
        ("RangeClasses", "SetNumClasses", 3),
        ("Percentile", "SetBinNum", 5),
    ],
)
def test_short_vector_is_refused(name, setter, value):
    each = CLASS_BY_NAME[name]
    operator = each.make()
    with pytest.raises(ValueError):
        getattr(operator, setter)(value)
        run(each, operator)


@pytest.mark.parametrize("name", ["SetInRegion", "SetOutRegion"])
def test_region_of_fewer_than_four_numbers_is_refused(name):
    operator = core.IIIDataTransfer()
    for region in ([], [1, 2, 3]):
        with pytest.raises(ValueError):
            getattr(operator, name)(region)


def test_mirror_whose_source_leaves_the_image_is_refused():
    image, out = np.zeros((6, 8), np.uint8), np.full((6, 8), 77, np.uint8)
    marked = np.zeros((6, 8), bool)
    marked[:, :2] = True
    for window, mask in (
        ([0, 0, 4, 4], None),
        ([0, 0, 9, 6], None),
        ([0, 0, 1, 6], marked),
        ([0, 0, 2**32 - 1, 6], marked),
    ):
        for axis in ("VERT", "HORI"):
            if axis == "HORI" and window[3] == 6:
                continue
            operator = core.MirrorImg()
            operator.SetAxis(axis)
            operator.SetWindow(window)
            operator.IsNewFile(False)
            with pytest.raises(ValueError, match="expected"):
                operator.Process(image, mask, out)
            assert (out == 77).all()


@pytest.mark.parametrize("axis", ["", "VERTICAL", "H"])
def test_mirror_without_an_axis_writes_nothing(axis):
    out = np.full((6, 8), 77, np.uint8)
    operator = core.MirrorImg()
    operator.SetAxis(axis)
    operator.IsNewFile(False)
    with pytest.raises(ValueError, match="^Axis: .*expected"):
        operator.Process(np.zeros((6, 8), np.uint8), None, out)
    assert (out == 77).all()


def test_new_file_of_the_mirror_is_packed_along_the_flip():
    image = np.arange(24, dtype=np.uint8).reshape(4, 6)
    marked = np.zeros((4, 6), bool)
    marked[1:3, 2:5] = True
    for axis, rows, columns in (("VERT", slice(1, 3), slice(0, 3)), ("HORI", slice(0, 2), slice(2, 5))):
        operator = core.MirrorImg()
        operator.SetAxis(axis)
        operator.SetWindow([2, 1, 3, 2])
        operator.IsNewFile(True)
        out = np.full((4, 6), 77, np.uint8)
        operator.Process(image, marked, out)
        piece = image[1:3, 2:5]
        want = np.full((4, 6), 77, np.uint8)
        want[rows, columns] = piece[:, ::-1] if axis == "VERT" else piece[::-1]
        assert_same(out, want)


@pytest.mark.parametrize("name", ["FilterSlp", "FilterAsp"])
def test_terrain_needs_a_margin(name):
    operator = getattr(core, name)()
    with pytest.raises((ValueError, core.GridmillError), match="(?i)margin"):
        operator.Process(np.zeros((4, 4), np.uint8), None, np.zeros((4, 4), np.uint8))
    for margin in (-1, 3, 2**31, 2**62):
        with pytest.raises((ValueError, TypeError, OverflowError)):
            operator.Process(np.zeros((4, 4), np.uint8), None, np.zeros((2, 2), np.uint8), margin=margin)
        with pytest.raises((ValueError, TypeError, OverflowError)):
            operator.Process(
                np.zeros((4, 4), np.uint8), None, np.zeros((2, 2), np.uint8), margin=1, out_margin=margin
            )


@pytest.mark.parametrize("name", ["FilterSlp", "FilterAsp"])
def test_terrain_leaves_the_margin_of_the_output_alone(name):
    each = CLASS_BY_NAME[name]
    image = each.image(seeded(name), SHAPE, "float32")
    want = each.run(each.make(), image, out=each.out(SHAPE, "float32"))
    out = each.out((10, 12), "float32")
    each.make().Process(image, None, out, margin=1, out_margin=2)
    assert_same(out[2:-2, 2:-2].copy(), want)
    out[2:-2, 2:-2] = 77
    assert (out == 77).all()


def test_complex_images_are_taken_by_their_real_parts():
    image = np.zeros((4, 5, 2), np.complex64)
    image.real = np.arange(40).reshape(4, 5, 2)
    image.imag = 99
    out, want = np.zeros((4, 5, 1), np.float32), np.zeros((4, 5, 1), np.float32)
    core.AverageChannels(-1).Process(image, None, out)
    core.AverageChannels(-1).Process(np.ascontiguousarray(image.real), None, want)
    assert_same(out, want)
    with pytest.raises((TypeError, ValueError, core.GridmillError)):
        core.AverageChannels(-1).Process(image, None, np.zeros((4, 5, 1), np.complex64))


# Failures, threads, copies


@pytest.mark.parametrize("name", ["TCGNChange", "TCSBChange"])
def test_failure_of_the_core_is_a_gridmill_error(name):
    each = CLASS_BY_NAME[name]
    operator = each.make()
    operator.SetSensorType("no sensor")
    with pytest.raises(core.GridmillError, match="Image type not supported"):
        run(each, operator)
    nothing = np.zeros(SHAPE, bool)
    assert_same(run(each, operator, mask=nothing), np.zeros((*SHAPE, 3), np.float32))
    assert issubclass(core.GridmillError, RuntimeError)


@pytest.mark.parametrize("each", **named([each for each in CLASSES if each.has_out]))
def test_two_threads_may_use_one_object(each):
    """They take turns, and each gets the results of its own image."""
    shape = (40, 30)
    if each.name == "IIIDataTransfer":
        shape = SHAPE
    wants = [run(each, each.make(), seed=seed, shape=shape) for seed in range(2)]
    operator, wrong = each.make(), []

    def work(seed):
        try:
            for _ in range(20):
                assert_same(run(each, operator, seed=seed, shape=shape), wants[seed])
        except BaseException as failure:  # a thread has no other way to tell
            wrong.append(failure)

    threads = [threading.Thread(target=work, args=(seed,)) for seed in range(2)]
    for thread in threads:
        thread.start()
    for thread in threads:
        thread.join()
    assert not wrong, wrong


@pytest.mark.parametrize("each", **named(CLASSES))
def test_object_can_be_neither_copied_nor_pickled(each):
    operator = each.make()
    for attempt in (copy.copy, copy.deepcopy, pickle.dumps):
        with pytest.raises(TypeError):
            attempt(operator)


@pytest.mark.parametrize("each", **named(CLASSES))
def test_object_without_its_arguments_or_with_others_is_refused(each):
    with pytest.raises(TypeError):
        getattr(core, each.name)(object())
    with pytest.raises(TypeError):
        each.make().Process()
