"""Contrast stretches."""

from __future__ import annotations

from typing import Any, List, Optional, Sequence, Tuple, Union

import numpy as np
from numpy.typing import ArrayLike, DTypeLike

from . import _core
from ._arguments import (
    as_stored,
    bands_of,
    choice,
    fill_masked,
    image_of,
    mask_of,
    number,
    per_band,
    result_for,
    type_error,
    value_error,
)
from ._arrays import raster_function
from ._types import single
from .summary import Histogram, extremes, fitting_counts, histogram as histogram_of

_SIGNS = {
    "absolute": _core.DiffType.eDIFF_ABSOLUTE,
    "forward": _core.DiffType.eDIFF_FORWARD,
    "backward": _core.DiffType.eDIFF_BACKWARD,
}


@raster_function(rasters=("image",), masks=("mask",), blocks="stretch")
def normalize(
    image: ArrayLike,
    minimum: Union[None, float, Sequence[float]] = None,
    maximum: Union[None, float, Sequence[float]] = None,
    *,
    nodata: float = 0.0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """Every sample as a percentage of the range of its band, from 0 to 100.

    Parameters
    ----------
    image : array_like
        (height, width) or (height, width, bands).
    minimum, maximum : float or sequence of float, optional
        The samples that get 0 and 100, one number or one for each band. None: the least and the greatest
        finite sample of each band among the valid pixels, those that equal `nodata` included.
    nodata : float, optional
        A sample within 1e-9 of it is written as it. NaN equals no sample. With the default, samples of
        exactly 0 stay 0, whatever the range.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. A masked pixel holds `nodata`, rounded to the result's type.
    dtype : dtype_like, optional
        Type of the result, one of the ten; float32 by default.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        Percent, of the shape of `image`.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    If the minimum is not below the maximum, samples up to it give 0 and those beyond give 100. NaN gives NaN
    in the floating types. Samples and bounds are taken in single precision.

    References
    ----------
    The linear contrast stretch, Richards and Jia (2006), "Remote Sensing Digital Image Analysis", section
    4.3.

    Examples
    --------
    >>> normalize([[5, 10, 15, 30, 40]], 10, 30)
    array([[  0.,   0.,  25., 100., 100.]], dtype=float32)
    """
    samples = image_of("image", image)
    operator = _core.Normalize()
    nodata = number("nodata", nodata)
    operator.SetNoData(nodata)
    valid = mask_of("mask", mask, samples)
    low = None if minimum is None else per_band("minimum", minimum, bands_of(samples))
    high = None if maximum is None else per_band("maximum", maximum, bands_of(samples))
    result = result_for(samples.shape, single, samples.dtype, dtype, out, (image, mask))
    if result.size == 0:
        return result
    if low is None or high is None:
        least, greatest = bounds_of(samples, valid)
        low, high = low or least, high or greatest
    operator.SetMinData(low)
    operator.SetMaxData(high)
    operator.Process(samples, None, result)
    if valid is not None:
        fill_masked(result, valid, as_stored(nodata, result.dtype))
    return result


def bounds_of(image: np.ndarray, mask: Optional[np.ndarray]) -> Tuple[List[float], List[float]]:
    """The bounds of each band that `normalize` takes if it is given none; 0 of a band without a sample."""
    least, greatest = extremes(image, mask)
    empty = least > greatest
    return np.where(empty, 0, least).tolist(), np.where(empty, 0, greatest).tolist()


@raster_function(rasters=("image",), masks=("mask",), blocks="stretch")
def percentile_stretch(
    image: ArrayLike,
    histogram: Optional[Histogram] = None,
    *,
    nodata: float = 0.0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """Every sample as its percentile: the percentage of its band's samples that lie below it.

    The percentile is read off a cubic spline through the cumulative percentages at the edges of the bins.

    Parameters
    ----------
    image : array_like
        (height, width) or (height, width, bands).
    histogram : Histogram, optional
        Counts and ranges of all bands, as the function `histogram` gives them. None: `histogram(image,
        mask=mask)`, in which samples that equal `nodata` count too; mask them to leave them out.
    nodata : float, optional
        A sample within 1e-9 of it is written as it. NaN equals no sample. With the default, samples of
        exactly 0 stay 0.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. A masked pixel holds `nodata`, rounded to the result's type.
    dtype : dtype_like, optional
        Type of the result, one of the ten; float32 by default.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        Percent, of the shape of `image`.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    The spline's value is cast to the type of the image: of integers the percentiles are whole numbers,
    rounded down, and where the spline runs below 0 an unsigned one wraps, to 255 or 254 in uint8. Give
    `image.astype("float32")` to keep the fractions. The spline may run past 0 and 100 by a little. NaN gives
    0.

    References
    ----------
    Histogram equalisation, Richards and Jia (2006), "Remote Sensing Digital Image Analysis", section 4.4; on
    cubic splines through knots at equal steps, Press et al. (2007), "Numerical Recipes", section 3.3.

    Examples
    --------
    >>> of = Histogram(np.array([[1, 1, 1, 1]]), np.array([0]), np.array([4]))
    >>> percentile_stretch([[1.0, 2.0, 3.0]], of)
    array([[25., 50., 75.]], dtype=float32)
    """
    samples = image_of("image", image)
    nodata = number("nodata", nodata)
    valid = mask_of("mask", mask, samples)
    if histogram is not None:
        histogram = _checked(histogram, (bands_of(samples),))
    result = result_for(samples.shape, single, samples.dtype, dtype, out, (image, mask))
    if result.size == 0:
        return result
    counts, low, high = histogram_of(samples, mask=valid) if histogram is None else histogram
    operator = _core.Percentile()
    operator.SetNoData(nodata)
    operator.SetMinData(low.tolist())
    operator.SetMaxData(high.tolist())
    operator.SetBinNum(counts.shape[1])
    operator.SetCoefficients(counts.ravel())
    operator.Process(samples, None, result)
    if valid is not None:
        fill_masked(result, valid, as_stored(nodata, result.dtype))
    return result


@raster_function(rasters=("image",), masks=("mask",), blocks="stretch")
def intensity_percentile(
    image: ArrayLike,
    histogram: Optional[Histogram] = None,
    *,
    sign: str = "absolute",
    nodata: float = 0.0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """The percentile of an intensity, with a sign from the comparison of two other bands.

    Parameters
    ----------
    image : array_like
        (height, width, 3): two values to compare, and the intensity.
    histogram : Histogram, optional
        Counts and range of the intensity, or of all three bands, as the function `histogram` gives them.
        None: that of the third band of the valid pixels.
    sign : {"absolute", "forward", "backward"}, optional
        "forward" makes the percentile negative where band 1 is above band 0, "backward" where band 0 is above
        band 1.
    nodata : float, optional
        An intensity that equals it is written as it, without a sign. NaN equals none.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. A masked pixel holds `nodata`, cast to the type of the image,
        in all four bands.
    dtype : dtype_like, optional
        Type of the result, one of the ten; float32 by default.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        (height, width, 4): the three bands of the image, and the percentile from 0 to 100 with its sign.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    The spline's value is cast to the type of the image: of integers the percentiles are whole numbers,
    rounded down, and where the spline runs below 0 an unsigned one wraps. A negative percentile is 0 in
    unsigned and 64-bit results. An intensity of NaN gives 0. The core keeps the memory of the spline: each
    call leaves 68 bytes for each bin behind.

    References
    ----------
    On cubic splines through knots at equal steps, Press et al. (2007), "Numerical Recipes", section 3.3.

    Examples
    --------
    >>> of = Histogram(np.array([[1, 1, 1, 1]]), np.array([0]), np.array([4]))
    >>> intensity_percentile([[[5.0, 6.0, 2.0]]], of, sign="forward")
    array([[[  5.,   6.,   2., -50.]]], dtype=float32)
    """
    samples = image_of("image", image)
    if samples.ndim != 3 or samples.shape[2] != 3:
        raise value_error("image", f"shape {samples.shape}", "(height, width, 3)")
    operator = _core.IntenPercent()
    operator.SetType(choice("sign", sign, _SIGNS))
    operator.SetNoData(number("nodata", nodata))
    valid = mask_of("mask", mask, samples)
    if histogram is not None:
        histogram = _checked(histogram, (1, 3))
    result = result_for(samples.shape[:2] + (4,), single, samples.dtype, dtype, out, (image, mask))
    if result.size == 0:
        return result
    if histogram is None:
        histogram = histogram_of(np.ascontiguousarray(samples[..., 2]), mask=valid)
    counts, low, high = (of[-1] for of in histogram)
    operator.SetMin(float(low))
    operator.SetMax(float(high))
    operator.SetScale(counts.size / (float(high) - float(low)) if high > low else 1.0)
    operator.SetBins(counts)
    operator.Process(samples, valid, result)
    return result


def _checked(given: Any, bands: Tuple[int, ...]) -> Histogram:
    """A histogram of one of these numbers of bands, with counts that the core can take."""
    if not isinstance(given, tuple) or len(given) != 3:
        raise type_error("histogram", type(given).__name__, "a Histogram, as histogram() returns it")
    counts, low, high = (np.asarray(of) for of in given)
    if counts.dtype.kind not in "iu":
        raise type_error("histogram", f"counts of {counts.dtype}", "whole numbers")
    if counts.ndim != 2 or counts.shape[0] not in bands or counts.shape[1] < 1:
        expected = " or ".join(str(count) for count in bands)
        raise value_error("histogram", f"counts of shape {counts.shape}", f"({expected}, bins)")
    if counts.min() < 0:
        raise value_error("histogram", f"a count of {counts.min()}", "counts from 0 on")
    for name, of in (("minimum", low), ("maximum", high)):
        if of.dtype.kind not in "iuf":
            raise type_error("histogram", f"a {name} of {of.dtype}", "numbers")
        if of.shape != counts.shape[:1]:
            raise value_error("histogram", f"a {name} of shape {of.shape}", str(counts.shape[:1]))
    return Histogram(fitting_counts(counts), low, high)
