"""Two dates: differences, ratios, magnitudes and tasseled caps of an image and its reference."""

from __future__ import annotations

from typing import AbstractSet, Any, Mapping, Optional, Sequence, Tuple, Union

import numpy as np
from numpy.typing import ArrayLike, DTypeLike

from . import _core
from ._arguments import (
    bands_of,
    choice,
    counted,
    image_of,
    is_one,
    mask_of,
    number,
    per_band,
    result_for,
    type_error,
    value_error,
)
from ._arrays import raster_function
from ._types import PIXEL_TYPES, SHORT_TYPES, difference_type, precise, same, single

#: One value, or one for each band; None: no test.
NoData = Union[None, float, Sequence[float]]

_FORMS = {
    "absolute": _core.DiffType.eDIFF_ABSOLUTE,
    "forward": _core.DiffType.eDIFF_FORWARD,
    "backward": _core.DiffType.eDIFF_BACKWARD,
}
_TWO_MASK_FORMS = {
    "absolute": _core.DiffType2.eDIFF2_ABSOLUTE,
    "signed": _core.DiffType2.eDIFF2_SIGNED,
}
_COMPONENTS = {"greenness": _core.TCGNChange, "brightness": _core.TCSBChange}

#: The bands of each sensor.
_SENSORS = {
    "Landsat-4 MSS": 4,
    "Landsat-5 MSS": 4,
    "Landsat-4 TM": 6,
    "Landsat-5 TM": 6,
    "Landsat-7 ETM+": 6,
    "Ikonos": 4,
    "QuickBird": 4,
}


@raster_function(rasters=("image", "reference"), masks=("mask",), blocks="map")
def difference(
    image: ArrayLike,
    reference: ArrayLike,
    *,
    form: str = "absolute",
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """The difference of the first bands of two dates.

    Parameters
    ----------
    image, reference : array_like
        (height, width) or (height, width, bands), of one size and type; the first band of each is read.
    form : {"absolute", "forward", "backward"}, optional
        "forward" is reference - image, "backward" image - reference: the reverse of all other functions of
        two dates.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. A masked pixel holds 0, as one without a difference does.
    dtype : dtype_like, optional
        Type of the result, one of the ten; float32 by default. Integers are rounded and limited to their
        range.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        (height, width), in the unit of the samples.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    float64, 32-bit and 64-bit samples are rounded to single precision before they are subtracted.

    References
    ----------
    Image differencing, Singh (1989), "Digital change detection techniques using remotely-sensed data",
    International Journal of Remote Sensing 10(6).

    Examples
    --------
    >>> difference(np.array([[10]], "uint8"), np.array([[250]], "uint8"), form="forward")
    array([[240.]], dtype=float32)
    """
    now, before = _dates_of(image, reference)
    operator = _core.SingleChange(choice("form", form, _FORMS))
    valid = mask_of("mask", mask, now)
    inputs = (image, reference, mask)
    result = result_for(now.shape[:2], single, now.dtype, dtype, out, inputs)
    if result.size:
        operator.Process(now, before, valid, result)
    return result


@raster_function(rasters=("image", "reference"), masks=("mask",), blocks="map")
def channel_difference(
    image: ArrayLike,
    reference: ArrayLike,
    *,
    form: str = "absolute",
    nodata: NoData = None,
    reference_nodata: NoData = None,
    fill: float = 0.0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """The difference of two dates band by band, in the arithmetic of the result's type.

    Parameters
    ----------
    image, reference : array_like
        (height, width) or (height, width, bands), of one size and type; the reference has at least the bands
        of the image.
    form : {"absolute", "forward", "backward"}, optional
        "forward" is image - reference, "backward" reference - image.
    nodata : float or sequence of float, optional
        No-data value of the image, one or one for each band. A sample of either date that equals its own, in
        single precision, excludes this sample of the result, not the pixel. None: no test; NaN equals no
        sample.
    reference_nodata : float or sequence of float, optional
        That of the reference; None: as `nodata`. Of its bands as many are tested as the image has.
    fill : float, optional
        What a masked pixel and an excluded sample hold, rounded to the result's type.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel.
    dtype : dtype_like, optional
        Type of the result, one of the ten. By default int16 from 8-bit types, int32 from 16-bit types, int64
        from all wider integers, and the floating types themselves.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        Of the shape of `image`, in the unit of the samples.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    Both samples are cast to the result's type, without rounding, and subtracted in it: integers wrap where it
    is too narrow, as it may be for 64-bit samples by default, and an absolute difference can come out
    negative.

    References
    ----------
    Image differencing, Singh (1989), "Digital change detection techniques using remotely-sensed data",
    International Journal of Remote Sensing 10(6).

    Examples
    --------
    >>> channel_difference(np.array([[10]], "uint8"), np.array([[250]], "uint8"), form="forward")
    array([[-240]], dtype=int16)
    """
    now, before = _dates_of(image, reference)
    _require_bands(now, before)
    operator = _core.ChanDiffChange(choice("form", form, _FORMS))
    _set_nodata(operator, nodata, reference_nodata, fill, now, before)
    valid = mask_of("mask", mask, now)
    inputs = (image, reference, mask)
    result = result_for(now.shape, difference_type, now.dtype, dtype, out, inputs)
    if result.size:
        operator.Process(now, before, valid, result)
    return result


@raster_function(rasters=("image", "reference"), masks=("mask", "reference_mask"), blocks="map")
def channel_difference_two_masks(
    image: ArrayLike,
    reference: ArrayLike,
    *,
    form: str = "absolute",
    nodata: NoData = None,
    reference_nodata: NoData = None,
    fill: float = 0.0,
    mask: Optional[np.ndarray] = None,
    reference_mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """The difference of two dates band by band, of unlike types and with a mask each.

    Parameters
    ----------
    image, reference : array_like
        (height, width) or (height, width, bands) of one size, each of uint8, int16, uint16 or float32; the
        reference has at least the bands of the image.
    form : {"absolute", "signed"}, optional
        "signed" is image - reference.
    nodata : float or sequence of float, optional
        No-data value of the image, one or one for each band. A sample of either date that equals its own, in
        single precision, excludes this sample of the result, not the pixel. None: no test; NaN equals no
        sample.
    reference_nodata : float or sequence of float, optional
        That of the reference; None: as `nodata`. Of its bands as many are tested as the image has.
    fill : float, optional
        What a masked pixel and an excluded sample hold, rounded to the result's type.
    mask, reference_mask : ndarray of bool, optional
        (height, width), True for a valid pixel of the image and of the reference. A pixel needs both.
    dtype : dtype_like, optional
        Type of the result, one of the four; float32 by default.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the four types, to write to and to return.

    Returns
    -------
    ndarray
        Of the shape of `image`, in the unit of the samples.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    In an integer result both forms wrap. The absolute form is not symmetric there: both samples cast to the
    result's type decide on the direction, the subtraction takes the image as it stands and the reference
    limited to the type's range.

    References
    ----------
    Image differencing, Singh (1989), "Digital change detection techniques using remotely-sensed data",
    International Journal of Remote Sensing 10(6).

    Examples
    --------
    >>> channel_difference_two_masks(np.array([[5]], "uint8"), np.array([[-3]], "int16"), form="signed")
    array([[8.]], dtype=float32)
    """
    operator = _core.ChanDiffChange2(choice("form", form, _TWO_MASK_FORMS))
    masks = (mask, reference_mask)
    return _two_masks(operator, image, reference, (nodata, reference_nodata, fill), masks, dtype, out)


@raster_function(rasters=("image", "reference"), masks=("mask",), blocks="map")
def channel_ratio(
    image: ArrayLike,
    reference: ArrayLike,
    *,
    form: str = "absolute",
    nodata: NoData = None,
    reference_nodata: NoData = None,
    fill: float = 3.4e38,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """The ratio image / reference of two dates, band by band.

    Parameters
    ----------
    image, reference : array_like
        (height, width) or (height, width, bands) of one size, each of uint8, int16, uint16 or float32; the
        reference has at least the bands of the image.
    form : {"absolute", "forward", "backward"}, optional
        "absolute" drops the sign. The two others mean the same: neither swaps the dates.
    nodata : float or sequence of float, optional
        No-data value of the image, one or one for each band. A sample of either date that equals its own, in
        single precision, excludes this sample of the result, not the pixel. None: no test; NaN equals no
        sample.
    reference_nodata : float or sequence of float, optional
        That of the reference; None: as `nodata`. 0 keeps out the divisions by 0. Of its bands as many are
        tested as the image has.
    fill : float, optional
        What a masked pixel and an excluded sample hold, rounded to the result's type.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel.
    dtype : dtype_like, optional
        Type of the result, one of the four; float32 by default.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the four types, to write to and to return.

    Returns
    -------
    ndarray
        Of the shape of `image`, without a unit.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    A reference of 0 is divided by: it gives an infinity, or NaN for 0 / 0, and in an integer result the end
    of the range, or for NaN 0. Integer results are rounded and limited to their range.

    References
    ----------
    Image ratioing, Singh (1989), "Digital change detection techniques using remotely-sensed data",
    International Journal of Remote Sensing 10(6).

    Examples
    --------
    >>> channel_ratio(np.array([[10]], "uint8"), np.array([[4]], "int16"))
    array([[2.5]], dtype=float32)
    """
    now, before = _dates_of(image, reference, SHORT_TYPES)
    _require_bands(now, before)
    operator = _core.ChanRatioChange2(choice("form", form, _FORMS))
    _set_nodata(operator, nodata, reference_nodata, fill, now, before)
    valid = mask_of("mask", mask, now)
    inputs = (image, reference, mask)
    result = result_for(now.shape, single, now.dtype, dtype, out, inputs, SHORT_TYPES)
    if result.size:
        operator.Process(now, before, valid, result)
    return result


@raster_function(rasters=("image", "reference"), masks=("mask", "reference_mask"), blocks="map")
def channel_ratio_two_masks(
    image: ArrayLike,
    reference: ArrayLike,
    *,
    form: str = "absolute",
    nodata: NoData = None,
    reference_nodata: NoData = None,
    fill: float = 3.4e38,
    mask: Optional[np.ndarray] = None,
    reference_mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """The ratio image / reference of two dates, band by band, with a mask each.

    Parameters
    ----------
    image, reference : array_like
        (height, width) or (height, width, bands) of one size, each of uint8, int16, uint16 or float32; the
        reference has at least the bands of the image.
    form : {"absolute", "signed"}, optional
        "absolute" drops the sign.
    nodata : float or sequence of float, optional
        No-data value of the image, one or one for each band. A sample of either date that equals its own, in
        single precision, excludes this sample of the result, not the pixel. None: no test; NaN equals no
        sample.
    reference_nodata : float or sequence of float, optional
        That of the reference; None: as `nodata`. 0 keeps out the divisions by 0. Of its bands as many are
        tested as the image has.
    fill : float, optional
        What a masked pixel and an excluded sample hold, rounded to the result's type.
    mask, reference_mask : ndarray of bool, optional
        (height, width), True for a valid pixel of the image and of the reference. A pixel needs both.
    dtype : dtype_like, optional
        Type of the result, one of the four; float32 by default.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the four types, to write to and to return.

    Returns
    -------
    ndarray
        Of the shape of `image`, without a unit.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    A reference of 0 is divided by: it gives an infinity, or NaN for 0 / 0, and in an integer result the end
    of the range, or for NaN 0. Integer results are rounded and limited to their range.

    References
    ----------
    Image ratioing, Singh (1989), "Digital change detection techniques using remotely-sensed data",
    International Journal of Remote Sensing 10(6).

    Examples
    --------
    >>> valid = np.array([[True, False]])
    >>> channel_ratio_two_masks(np.float32([[-10, 1]]), np.float32([[4, 1]]), reference_mask=valid, fill=0)
    array([[2.5, 0. ]], dtype=float32)
    """
    operator = _core.ChanRatioChange(choice("form", form, _TWO_MASK_FORMS))
    masks = (mask, reference_mask)
    return _two_masks(operator, image, reference, (nodata, reference_nodata, fill), masks, dtype, out)


@raster_function(rasters=("image", "reference"), masks=("mask",), blocks="map")
def combine(
    image: ArrayLike,
    reference: ArrayLike,
    *,
    fill: float = 0.0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """Two dates side by side: the bands of the image, then those of the reference.

    Parameters
    ----------
    image, reference : array_like
        (height, width) or (height, width, bands), of one size and type, each with any number of bands.
    fill : float, optional
        What a masked pixel holds, rounded to the result's type.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel.
    dtype : dtype_like, optional
        Type of the result, one of the ten; by default that of the image. Integers are rounded and limited to
        their range, but a negative int64 keeps its low bits in a narrower type.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        (height, width, bands of both).

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    References
    ----------
    The composite of dates on which multidate classification works, Singh (1989), "Digital change detection
    techniques using remotely-sensed data", International Journal of Remote Sensing 10(6).

    Examples
    --------
    >>> combine(np.array([[[1, 2, 3]]], "uint8"), np.array([[[4, 5]]], "uint8"))
    array([[[1, 2, 3, 4, 5]]], dtype=uint8)
    """
    now, before = _dates_of(image, reference)
    operator = _core.CombChange(_core.DiffType.eDIFF_ABSOLUTE)
    operator.SetNoData(number("fill", fill))
    valid = mask_of("mask", mask, now)
    shape = now.shape[:2] + (bands_of(now) + bands_of(before),)
    result = result_for(shape, same, now.dtype, dtype, out, (image, reference, mask))
    if result.size:
        operator.Process(now, before, valid, result)
    return result


@raster_function(rasters=("image", "reference"), masks=("mask",), blocks="map")
def intensity_ratio(
    image: ArrayLike,
    reference: ArrayLike,
    *,
    nodata: NoData = None,
    reference_nodata: NoData = None,
    fill: float = 0.0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """The mean intensities of two dates, and their ratio in decibels.

    With the mean S of all bands of the image and T of the reference, the ratio is 10 log10(|S / T|).

    Parameters
    ----------
    image, reference : array_like
        (height, width) or (height, width, bands), of one size and type; the reference has at least the bands
        of the image.
    nodata : float or sequence of float, optional
        No-data value of the image, one or one for each band. A sample of either date that equals its own, in
        single precision, excludes the whole pixel. None: no test; NaN equals no sample.
    reference_nodata : float or sequence of float, optional
        That of the reference, one or one for each of its bands. None: as `nodata`, of which a sequence leaves
        those bands of the reference untested that the image has not.
    fill : float, optional
        What a masked or excluded pixel holds in all four bands, rounded to the result's type.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel.
    dtype : dtype_like, optional
        Type of the result, one of the ten. By default float32 from 8-bit and 16-bit types and float32, else
        float64. Integers are rounded and limited to their range.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        (height, width, 4): S and T in the unit of the samples, the ratio in decibels, and 0.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    Where T is 0 the ratio is 0; where S alone is 0 it is minus infinity.

    References
    ----------
    The log-ratio, Dekker (1998), "Speckle filtering in satellite SAR change detection imagery", International
    Journal of Remote Sensing 19(6).

    Examples
    --------
    >>> intensity_ratio(np.float32([[[100, 200]]]), np.float32([[[50, 100]]]))
    array([[[150.    ,  75.    ,   3.0103,   0.    ]]], dtype=float32)
    """
    operator = _core.IntenRatioChange(_core.DiffType.eDIFF_ABSOLUTE)
    nodatas = (nodata, reference_nodata, fill)
    return _pixelwise(operator, image, reference, nodatas, mask, dtype, out, 4)


@raster_function(rasters=("image", "reference"), masks=("mask",), blocks="map")
def magnitude_change(
    image: ArrayLike,
    reference: ArrayLike,
    *,
    form: str = "absolute",
    nodata: NoData = None,
    reference_nodata: NoData = None,
    fill: float = 0.0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """The lengths of the pixel vectors of two dates, and their difference.

    Parameters
    ----------
    image, reference : array_like
        (height, width) or (height, width, bands), of one size and type; the reference has at least the bands
        of the image.
    form : {"absolute", "forward", "backward"}, optional
        "forward" is image - reference, "backward" reference - image.
    nodata : float or sequence of float, optional
        No-data value of the image, one or one for each band. A sample of either date that equals its own, in
        single precision, excludes the whole pixel. None: no test; NaN equals no sample.
    reference_nodata : float or sequence of float, optional
        That of the reference, one or one for each of its bands. None: as `nodata`, of which a sequence leaves
        those bands of the reference untested that the image has not.
    fill : float, optional
        What a masked or excluded pixel holds in all three bands, rounded to the result's type.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel.
    dtype : dtype_like, optional
        Type of the result, one of the ten. By default float32 from 8-bit and 16-bit types and float32, else
        float64. Integers are rounded and limited to their range.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        (height, width, 3): the magnitudes of image and reference, and their difference, in the unit of the
        samples.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    The squares are formed in the arithmetic of the samples, that of 32-bit integers for 8 and 16 bits, and
    wrap there: an uint16 sample above 46340 has a negative square, and the magnitude may be NaN.

    References
    ----------
    The difference of vector lengths, after the change vector of Malila (1980), "Change vector analysis: an
    approach for detecting forest changes with Landsat", Proc. Machine Processing of Remotely Sensed Data.

    Examples
    --------
    >>> magnitude_change(np.array([[[3, 4]]], "uint8"), np.array([[[6, 8]]], "uint8"), form="forward")
    array([[[ 5., 10., -5.]]], dtype=float32)
    """
    operator = _core.MagnitudeChange(choice("form", form, _FORMS))
    nodatas = (nodata, reference_nodata, fill)
    return _pixelwise(operator, image, reference, nodatas, mask, dtype, out, 3)


@raster_function(rasters=("image", "reference"), masks=("mask",), blocks="map")
def tasseled_cap_change(
    image: ArrayLike,
    reference: ArrayLike,
    *,
    sensor: str,
    reference_sensor: Optional[str] = None,
    component: str = "greenness",
    form: str = "absolute",
    nodata: NoData = None,
    reference_nodata: NoData = None,
    fill: float = 0.0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """The tasseled-cap greenness or brightness of two dates, and their difference.

    Parameters
    ----------
    image, reference : array_like
        (height, width) or (height, width, bands), of one size and type. Each has at least the bands of its
        sensor; with `nodata` the reference has at least those of the image. Further bands have no weight.
    sensor, reference_sensor : str
        "Landsat-4 MSS", "Landsat-5 MSS", "Ikonos" or "QuickBird" of four bands, "Landsat-4 TM", "Landsat-5
        TM" or "Landsat-7 ETM+" of six: 1, 2, 3, 4, 5 and 7. `reference_sensor` None: the same.
    component : {"greenness", "brightness"}, optional
        Which of the two.
    form : {"absolute", "forward", "backward"}, optional
        "forward" is image - reference, "backward" reference - image.
    nodata : float or sequence of float, optional
        No-data value of the image, one or one for each band. A sample of either date that equals its own, in
        single precision, excludes the whole pixel, also in a band without a weight. None: no test; NaN equals
        no sample.
    reference_nodata : float or sequence of float, optional
        That of the reference; None: as `nodata`. Of its bands as many are tested as the image has.
    fill : float, optional
        What a masked or excluded pixel holds in all three bands, rounded to the result's type.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel.
    dtype : dtype_like, optional
        Type of the result, one of the ten. By default float32 from 8-bit and 16-bit types and float32, else
        float64. Integers are rounded and limited to their range.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        (height, width, 3): the component of image and reference, and their difference.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described, an unknown sensor among them.

    Notes
    -----
    The weights are those of the literature below, without an offset, but that of Ikonos for the greenness of
    band 3 is -0.324, and that of ETM+ for the brightness of band 2 is 0.3872.

    References
    ----------
    Kauth and Thomas (1976), "The tasselled cap", for MSS; Crist and Cicone (1984), "A physically-based
    transformation of Thematic Mapper data", IEEE TGRS 22(3), for TM; Huang et al. (2002), "Derivation of a
    tasselled cap transformation based on Landsat 7 at-satellite reflectance", IJRS 23(8), for ETM+; Horne
    (2003), "A tasseled cap transformation for IKONOS images", Proc. ASPRS, for Ikonos; Yarbrough et al.
    (2005), "QuickBird 2 tasseled cap transform coefficients", Proc. Pecora 16, for QuickBird.

    Examples
    --------
    >>> now, before = np.float32([[[0, 0, 0, 100]]]), np.float32([[[0, 0, 0, 0]]])
    >>> tasseled_cap_change(now, before, sensor="QuickBird")
    array([[[78.,  0., 78.]]], dtype=float32)
    """
    operator_class = choice("component", component, _COMPONENTS)
    choice("sensor", sensor, _SENSORS)
    if reference_sensor is None:
        reference_sensor = sensor
    choice("reference_sensor", reference_sensor, _SENSORS)
    operator = operator_class(sensor, reference_sensor, choice("form", form, _FORMS))
    nodatas = (nodata, reference_nodata, fill)
    sensors = {"image": sensor, "reference": reference_sensor}
    return _pixelwise(operator, image, reference, nodatas, mask, dtype, out, 3, sensors)


NoDatas = Tuple[NoData, NoData, float]


def _dates_of(
    image: Any, reference: Any, types: AbstractSet[np.dtype] = PIXEL_TYPES
) -> Tuple[np.ndarray, np.ndarray]:
    """Image and reference, of one size, and of one type where all ten are taken."""
    now, before = image_of("image", image, types), image_of("reference", reference, types)
    if now.shape[:2] != before.shape[:2]:
        expected = f"{now.shape[:2]}, the image's height and width"
        raise value_error("reference", f"shape {before.shape}", expected)
    if types is PIXEL_TYPES and now.dtype != before.dtype:
        raise type_error("reference", f"an array of {before.dtype}", f"{now.dtype}, as the image")
    return now, before


def _require_bands(image: np.ndarray, reference: np.ndarray) -> None:
    if bands_of(reference) < bands_of(image):
        came = counted(bands_of(reference))
        raise value_error("reference", came, f"at least the image's {bands_of(image)}")


def _set_nodata(
    operator: Any, nodata: Any, reference_nodata: Any, fill: Any, image: np.ndarray, reference: np.ndarray
) -> None:
    operator.SetNoData(number("fill", fill))
    if nodata is None and reference_nodata is None:
        return
    bands = bands_of(image)
    # The core tests both dates or none: NaN, which equals no sample, stands for no test of the image alone.
    of_image = [float("nan")] * bands if nodata is None else per_band("nodata", nodata, bands)
    if reference_nodata is None:
        of_reference = of_image[:1] * bands_of(reference) if is_one(nodata) else of_image
    else:
        of_reference = per_band("reference_nodata", reference_nodata, bands_of(reference))
    operator.SetImgNoData(of_image)
    operator.SetRefNoData(of_reference)


def _two_masks(
    operator: Any, image: Any, reference: Any, nodatas: NoDatas, masks: Tuple[Any, Any], dtype: Any, out: Any
) -> np.ndarray:
    now, before = _dates_of(image, reference, SHORT_TYPES)
    _require_bands(now, before)
    _set_nodata(operator, *nodatas, now, before)
    valid = mask_of("mask", masks[0], now)
    reference_valid = mask_of("reference_mask", masks[1], now)
    inputs = (image, reference, *masks)
    result = result_for(now.shape, single, now.dtype, dtype, out, inputs, SHORT_TYPES)
    if result.size:
        operator.Process(now, before, valid, reference_valid, result)
    return result


def _pixelwise(
    operator: Any,
    image: Any,
    reference: Any,
    nodatas: NoDatas,
    mask: Any,
    dtype: Any,
    out: Any,
    bands: int,
    sensors: Optional[Mapping[str, str]] = None,
) -> np.ndarray:
    """A result of this many bands, of operators that exclude whole pixels."""
    now, before = _dates_of(image, reference)
    for argument, sensor in (sensors or {}).items():
        found = bands_of(now if argument == "image" else before)
        if found < _SENSORS[sensor]:
            raise value_error(argument, counted(found), f"at least the {_SENSORS[sensor]} of {sensor}")
    if sensors is None or nodatas[:2] != (None, None):
        _require_bands(now, before)
    _set_nodata(operator, *nodatas, now, before)
    valid = mask_of("mask", mask, now)
    shape = now.shape[:2] + (bands,)
    result = result_for(shape, precise, now.dtype, dtype, out, (image, reference, mask))
    if result.size:
        operator.Process(now, before, valid, result)
    return result
