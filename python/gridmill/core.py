"""The operators as classes, under the names of the C++ library.

Each class has the constructor, the setters and the getters of its C++ class; the parameters are attributes to
read. `Process` takes numpy arrays, C-contiguous and of the machine's byte order: images of (height, width) or
(height, width, bands), masks of bool, True for a valid pixel, also for the reference of two dates. It writes
to `out` and returns nothing. The parameters travel to the core when a type is met for the first time: set
them before the first `Process`, and use a new object for others. The functions of `gridmill` do all this for
you.

`GridmillError` is a failure of the core itself.
"""

from ._core import (
    AverageChannels,
    BandRole,
    BitmapFiltering,
    ChanDiffChange,
    ChanDiffChange2,
    ChanRatioChange,
    ChanRatioChange2,
    CombChange,
    DiffType,
    DiffType2,
    FilterAsp,
    FilterSlp,
    GridmillError,
    IIIDataTransfer,
    IntenPercent,
    IntenRatioChange,
    MagnitudeChange,
    MirrorImg,
    Normalize,
    Percentile,
    RangeClasses,
    RasterStatistics,
    ResampleType,
    SingleChange,
    SPOTBlue,
    SqrGradientEvaluation,
    StatisticsMethod,
    TCGNChange,
    TCSBChange,
    VegetationIndex,
    VegIndex,
    VollathEvaluation,
)

__all__ = [
    "AverageChannels",
    "BandRole",
    "BitmapFiltering",
    "ChanDiffChange",
    "ChanDiffChange2",
    "ChanRatioChange",
    "ChanRatioChange2",
    "CombChange",
    "DiffType",
    "DiffType2",
    "FilterAsp",
    "FilterSlp",
    "GridmillError",
    "IIIDataTransfer",
    "IntenPercent",
    "IntenRatioChange",
    "MagnitudeChange",
    "MirrorImg",
    "Normalize",
    "Percentile",
    "RangeClasses",
    "RasterStatistics",
    "ResampleType",
    "SPOTBlue",
    "SingleChange",
    "SqrGradientEvaluation",
    "StatisticsMethod",
    "TCGNChange",
    "TCSBChange",
    "VegIndex",
    "VegetationIndex",
    "VollathEvaluation",
]
