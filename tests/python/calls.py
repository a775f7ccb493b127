"""A plain call of every function and a plain object of every class, for the tests that treat all alike."""

from __future__ import annotations

from dataclasses import dataclass
from typing import Any, Callable

import numpy as np

import gridmill as gm
from cases import SHORT_LIST, finite_samples
from gridmill import core

RASTERS = ("elevation", "image", "reference")
LIMITS = {"minimum": (0, 0, 0), "maximum": (90, 90, 90), "background": (1, 2, 3)}
BANDS = {"red": 0, "nir": 1}


@dataclass(frozen=True)
class Function:
    """What a function takes beside its rasters, and what it makes of them."""

    name: str
    bands: int = 1
    raster: str = "image"
    reference: bool = False
    arguments: tuple = ()
    short_list: bool = False
    has_out: bool = True
    masks: tuple = ("mask",)

    def images(self, rng, shape, dtype) -> dict[str, np.ndarray]:
        full = shape if self.bands == 1 else (*shape, self.bands)
        images = {self.raster: finite_samples(rng, full, dtype)}
        if self.reference:
            images["reference"] = finite_samples(rng, full, dtype)
        return images

    def call(self, images, **more) -> Any:
        return getattr(gm, self.name)(**{**dict(self.arguments), **images, **more})


def function(name: str, bands: int = 1, **named) -> Function:
    arguments = tuple(named.pop("arguments", {}).items())
    return Function(name, bands, arguments=arguments, **named)


def dates(name: str, bands: int = 2, **named) -> Function:
    return function(name, bands, reference=True, **named)


TWO = {"short_list": True, "masks": ("mask", "reference_mask")}
FUNCTIONS = (
    function("slope", 2, raster="elevation", arguments={"cellsize": 10.0}),
    function("aspect", raster="elevation", arguments={"cellsize": 10.0}),
    function("average_channels", 3),
    function("threshold", arguments={"minimum": 10, "maximum": 50}),
    function("range_classes", arguments={"ranges": [(0, 30), (30, 60)]}),
    function("normalize", 2, arguments={"minimum": 5, "maximum": (60, 70)}),
    function("percentile_stretch", 2),
    function("intensity_percentile", 3),
    function("mirror", 2, arguments={"axis": "vert"}),
    function("vegetation_indices", 2, arguments={"indices": ("NDVI", "DVI"), "bands": BANDS}),
    function("squared_gradient", 2, has_out=False),
    function("vollath", 2, has_out=False),
    dates("difference"),
    dates("channel_difference"),
    dates("channel_difference_two_masks", **TWO),
    dates("channel_ratio", short_list=True),
    dates("channel_ratio_two_masks", **TWO),
    dates("combine"),
    dates("intensity_ratio"),
    dates("magnitude_change"),
    dates("tasseled_cap_change", 4, arguments={"sensor": "QuickBird"}),
    function("statistics", 2, has_out=False),
    function("histogram", 2, has_out=False),
    function("transfer", 2, arguments={"in_region": (0, 0, 8, 6), "out_region": (0, 0, 8, 6)}),
    function("synthetic_blue", 3, arguments=LIMITS),
    function("natural_color", 3, arguments=LIMITS),
)
BY_NAME = {each.name: each for each in FUNCTIONS}
WITH_OUT = tuple(each for each in FUNCTIONS if each.has_out)


def type_for(each: Function, dtype: str) -> str:
    """The type itself, or another one where the function does not take it."""
    return dtype if not each.short_list or dtype in SHORT_LIST else "uint16"


def parts(result) -> list[np.ndarray]:
    """The arrays of a result, whatever it is made of."""
    if isinstance(result, np.ndarray):
        return [result]
    names = ("left", "right", "counts", "minimum", "maximum", "histogram")
    return [np.asarray(getattr(result, name)) for name in names if hasattr(result, name)]


@dataclass(frozen=True)
class Operator:
    """How to make an object of a class, and what it processes."""

    name: str
    make: Callable[[], Any]
    kind: str = "filter"
    bands: int = 2
    out_bands: int = 2
    short_list: bool = False

    @property
    def has_out(self) -> bool:
        return self.kind != "result"

    def run(self, operator, image, mask=None, reference=None, out=None) -> np.ndarray:
        """What `Process` writes, or the results of an operator without an output."""
        second = image if reference is None else reference
        if self.kind == "result":
            operator.Process(image, mask)
            return results(operator)
        if self.kind == "terrain":
            operator.Process(image, mask, out, margin=1)
        elif self.kind == "change":
            operator.Process(image, second, mask, out)
        elif self.kind == "two masks":
            operator.Process(image, second, mask, None, out)
        else:
            operator.Process(image, mask, out)
        return out

    def image(self, rng, shape, dtype) -> np.ndarray:
        margin = 2 if self.kind == "terrain" else 0
        return finite_samples(rng, (shape[0] + margin, shape[1] + margin, self.bands), dtype)

    def out(self, shape, dtype) -> np.ndarray:
        return np.full((*shape, self.out_bands), 77, dtype)


def results(operator) -> np.ndarray:
    if hasattr(operator, "GetEvaluation"):
        return np.array(operator.GetEvaluation())
    if hasattr(operator, "GetLeftEq"):
        return np.array(operator.GetLeftEq() + operator.GetRightEq())
    counts = [operator.GetPixelCounts(c) for c in range(len(operator.GetMinValue()))]
    return np.array([*operator.GetMinValue(), *operator.GetMaxValue(), *np.concatenate(counts)], np.float64)


def configured(kind, *arguments, **values):
    """An object, with Set<Name>(value) called for each name."""

    def make():
        operator = kind(*arguments)
        for name, value in values.items():
            if name.startswith("Init") or name == "IsNewFile":
                getattr(operator, name)(value)
            else:
                getattr(operator, f"Set{name}")(value)
        return operator

    return make


def change(name: str, *arguments, **named) -> Operator:
    kind = "two masks" if name in ("ChanDiffChange2", "ChanRatioChange") else "change"
    form = core.DiffType2.eDIFF2_SIGNED if kind == "two masks" else core.DiffType.eDIFF_FORWARD
    return Operator(name, configured(getattr(core, name), *arguments, form), kind, **named)


def percentile():
    operator = configured(core.Percentile, MinData=[0, 0], MaxData=[60, 70], BinNum=2)()
    operator.SetCoefficients([1, 2, 3, 4])
    return operator


def operator(name: str, **named) -> Operator:
    shape = {key: named.pop(key) for key in ("kind", "bands", "out_bands") if key in named}
    return Operator(name, configured(getattr(core, name), **named), **shape)


CLASSES = (
    operator("AverageChannels", out_bands=1),
    Operator("FilterSlp", configured(core.FilterSlp, 2.0, 3.0), "terrain"),
    operator("FilterAsp", kind="terrain", bands=1, out_bands=1, XSIZE=2.0, YSIZE=3.0),
    operator("BitmapFiltering", bands=1, out_bands=1, ThresholdMin=10, ThresholdMax=50),
    operator(
        "IntenPercent",
        bands=3,
        out_bands=4,
        Min=0,
        Max=90,
        Scale=3 / 90,
        Bins=[1, 2, 3],
        Type=core.DiffType.eDIFF_ABSOLUTE,
    ),
    operator("MirrorImg", Axis="VERT", IsNewFile=False),
    operator("Normalize", MinData=[5, 5], MaxData=[60, 70]),
    Operator("Percentile", percentile),
    operator("VegIndex", BandIndex=[2, 4], RequestedIndex=[0, 0, 1, 0, 1, 0, 0, 0, 0, 0, 0, 0]),
    operator("SqrGradientEvaluation", kind="result", InitEvaluation=2),
    operator("VollathEvaluation", kind="result"),
    change("SingleChange", out_bands=1),
    change("ChanDiffChange"),
    change("ChanDiffChange2", short_list=True),
    change("ChanRatioChange", short_list=True),
    change("ChanRatioChange2", short_list=True),
    change("CombChange", out_bands=4),
    change("IntenRatioChange", out_bands=4),
    change("MagnitudeChange", out_bands=3),
    change("TCGNChange", "QuickBird", "Ikonos", bands=4, out_bands=3),
    change("TCSBChange", "QuickBird", "Ikonos", bands=4, out_bands=3),
    operator(
        "RasterStatistics",
        kind="result",
        Chans=[0, 1],
        Type=16,
        Method=core.StatisticsMethod.eSTATISTICS_PLAIN,
    ),
    operator("RangeClasses", bands=1, out_bands=1, NumClasses=2, MinRange=[0, 30], MaxRange=[30, 60]),
    operator("IIIDataTransfer", InRegion=[0, 0, 8, 6], OutRegion=[0, 0, 8, 6]),
    operator(
        "SPOTBlue", bands=3, out_bands=3, Min=[0, 0, 0], Max=[90, 90, 90], BackGround=[1, 2, 3], Trim=False
    ),
)
CLASS_BY_NAME = {each.name: each for each in CLASSES}


def named(table):
    """Parameters of a test, one for each function or class."""
    return {"argvalues": table, "ids": [each.name for each in table]}
