"""Bitmaps and classes by ranges of values."""

from __future__ import annotations

from typing import Any, List, Optional, Sequence, Tuple

import numpy as np
from numpy.typing import ArrayLike, DTypeLike

from . import _core
from ._arguments import (
    fill_masked,
    image_of,
    mask_of,
    number,
    result_for,
    shown,
    single_band,
    type_error,
    value_error,
)
from ._arrays import raster_function
from ._types import byte


@raster_function(rasters=("image",), masks=("mask",), blocks="map")
def threshold(
    image: ArrayLike,
    minimum: float,
    maximum: float,
    *,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """A bitmap of the samples within a range: 1 inside, 0 outside.

    Parameters
    ----------
    image : array_like
        (height, width), or (height, width, 1).
    minimum, maximum : float
        The range in the unit of the samples; both ends belong to it. A minimum above the maximum makes a
        range that wraps around, as for angles: inside are the samples from `minimum` up and those up to
        `maximum`. With NaN the range wraps too, and the half with the NaN holds nothing.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. A masked pixel holds 0, as one outside the range.
    dtype : dtype_like, optional
        Type of the result, one of the ten; uint8 by default.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        0 and 1, (height, width).

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    Samples and thresholds are compared in single precision. NaN is outside every range.

    References
    ----------
    Density slicing, Richards and Jia (2006), "Remote Sensing Digital Image Analysis", chapter 4.

    Examples
    --------
    >>> threshold([[5, 10, 15, 20]], 10, 15)
    array([[0, 1, 1, 0]], dtype=uint8)
    """
    samples = single_band("image", image_of("image", image))
    operator = _core.BitmapFiltering(number("minimum", minimum), number("maximum", maximum))
    valid = mask_of("mask", mask, samples)
    result = result_for(samples.shape, byte, samples.dtype, dtype, out, (image, mask))
    if result.size:
        operator.Process(samples, valid, result)
    return result


@raster_function(rasters=("image",), masks=("mask",), blocks="map")
def range_classes(
    image: ArrayLike,
    ranges: Sequence[Tuple[float, float]],
    *,
    nodata: float = float("nan"),
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """The number of the range that each sample lies in, from 1 on, and 0 for those in none.

    Parameters
    ----------
    image : array_like
        (height, width), or (height, width, 1).
    ranges : sequence of (float, float)
        (lower, upper) of class 1, 2, ..., in the unit of the samples. Both bounds are exclusive. Where ranges
        overlap, the highest class wins.
    nodata : float, optional
        Samples within 1e-9 of it get 0; NaN, the default, equals no sample.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. A masked pixel gets 0.
    dtype : dtype_like, optional
        Type of the result, one of the ten; uint8 by default.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        Class numbers, (height, width).

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    A sample that equals a bound is not in that range: of ranges that share a bound it is in neither. NaN is
    in no class, nor is an infinite sample. A class number that the result's type does not hold keeps its low
    bits: in uint8 class 300 is 44. Samples and bounds are compared in single precision.

    References
    ----------
    Density slicing, Richards and Jia (2006), "Remote Sensing Digital Image Analysis", chapter 4.

    Examples
    --------
    >>> range_classes([[3, 7, 10, 20]], [(0, 10), (5, 20)])
    array([[1, 2, 2, 0]], dtype=uint8)
    """
    samples = single_band("image", image_of("image", image))
    lower, upper = _bounds_of(ranges)
    operator = _core.RangeClasses()
    operator.SetNumClasses(len(lower))
    operator.SetMinRange(lower)
    operator.SetMaxRange(upper)
    operator.SetNoData(number("nodata", nodata))
    valid = mask_of("mask", mask, samples)
    result = result_for(samples.shape, byte, samples.dtype, dtype, out, (image, mask))
    if result.size:
        operator.Process(samples, None, result)
        fill_masked(result, valid, 0)
    return result


def _bounds_of(ranges: Any) -> Tuple[List[float], List[float]]:
    expected = "a sequence of (lower, upper)"
    if isinstance(ranges, (str, bytes)) or not hasattr(ranges, "__len__"):
        raise type_error("ranges", shown(ranges), expected)
    lower, upper = [], []
    for entry in ranges:
        if isinstance(entry, (str, bytes)) or not hasattr(entry, "__len__"):
            raise type_error("ranges", shown(entry), expected)
        if len(entry) != 2:
            raise value_error("ranges", f"an entry of {len(entry)} numbers", expected)
        lower.append(number("ranges", entry[0]))
        upper.append(number("ranges", entry[1]))
    return lower, upper
