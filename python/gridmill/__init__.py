"""Raster operators for remote sensing over numpy arrays.

The functions take arrays of (height, width) or (height, width, bands) of ten element types, with masks whose
True is a valid pixel. dask arrays and xarray's DataArrays go in as well, and the same comes out. The
operators as classes, under the names of the C++ library, are in `gridmill.core`.
"""

from . import core
from ._core import GridmillError, VegetationIndex, __version__
from .bands import average_channels, natural_color, synthetic_blue, vegetation_indices
from .change import (
    channel_difference,
    channel_difference_two_masks,
    channel_ratio,
    channel_ratio_two_masks,
    combine,
    difference,
    intensity_ratio,
    magnitude_change,
    tasseled_cap_change,
)
from .classes import range_classes, threshold
from .geometry import mirror, transfer
from .stretch import intensity_percentile, normalize, percentile_stretch
from .summary import Histogram, Statistics, VollathSums, histogram, squared_gradient, statistics, vollath
from .terrain import aspect, slope

__all__ = [
    "GridmillError",
    "Histogram",
    "Statistics",
    "VegetationIndex",
    "VollathSums",
    "__version__",
    "aspect",
    "average_channels",
    "channel_difference",
    "channel_difference_two_masks",
    "channel_ratio",
    "channel_ratio_two_masks",
    "combine",
    "core",
    "difference",
    "histogram",
    "intensity_percentile",
    "intensity_ratio",
    "magnitude_change",
    "mirror",
    "natural_color",
    "normalize",
    "percentile_stretch",
    "range_classes",
    "slope",
    "squared_gradient",
    "statistics",
    "synthetic_blue",
    "tasseled_cap_change",
    "threshold",
    "transfer",
    "vegetation_indices",
    "vollath",
]
