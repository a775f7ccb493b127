"""From the bands of one image to others: means, vegetation indices, synthetic colours."""

from __future__ import annotations

import functools
from typing import Any, Dict, List, Mapping, NamedTuple, Optional, Sequence, Tuple, Union

import numpy as np
from numpy.typing import ArrayLike, DTypeLike

from . import _core
from ._arguments import (
    bands_of,
    counted,
    image_of,
    mask_of,
    number,
    numbers,
    pixels_of,
    result_for,
    row_blocks,
    shown,
    threads_of,
    type_error,
    unknown_name,
    value_error,
    whole,
)
from ._arrays import raster_function
from ._types import same, single

#: A name, or an entry of the enum.
Index = Union[str, _core.VegetationIndex]

_ROLES = {
    "blue": _core.BandRole.eBAND_BLUE,
    "green": _core.BandRole.eBAND_GREEN,
    "red": _core.BandRole.eBAND_RED,
    "red_edge": _core.BandRole.eBAND_RED_EDGE,
    "nir": _core.BandRole.eBAND_NIR,
    "swir1": _core.BandRole.eBAND_SWIR1,
    "swir2": _core.BandRole.eBAND_SWIR2,
}
_ROLE_CODES = {name: int(role) for name, role in _ROLES.items()}
_UNUSED = len(_ROLES)

#: In the order of their codes: the bands that each index needs.
_NEEDED = {
    "NGRDI": ("green", "red"),
    "EXCESS_GREEN": ("blue", "green", "red"),
    "DVI": ("red", "nir"),
    "RVI": ("red", "nir"),
    "NDVI": ("red", "nir"),
    "TVI": ("red", "nir"),
    "SAVI": ("red", "nir"),
    "MSAVI2": ("red", "nir"),
    "GEMI": ("red", "nir"),
    "GREENNESS": ("blue", "green", "red", "nir", "swir1", "swir2"),
    "MCARI": ("green", "red", "red_edge"),
    "MTVI1": ("green", "red", "nir"),
}
_INDICES = tuple(_NEEDED)
_INDEX_CODES = {name: code for code, name in enumerate(_INDICES)}


@raster_function(rasters=("image",), masks=("mask",), blocks="map")
def average_channels(
    image: ArrayLike,
    *,
    nodata: float = 0.0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
    num_threads: Optional[int] = None,
) -> np.ndarray:
    """The arithmetic mean of each pixel's bands.

    Parameters
    ----------
    image : array_like
        (height, width) or (height, width, bands).
    nodata : float, optional
        A pixel with a sample within 1e-9 of it holds `nodata`, rounded to the result's type. NaN equals no
        sample.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. A masked pixel holds `nodata`, cast to the type of the image
        and then to that of the result, neither rounded nor limited: -1 of an int16 image is 255 in uint8.
    dtype : dtype_like, optional
        Type of the result, one of the ten; float32 by default.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.
    num_threads : int, optional
        From 1 to 256; by default what OpenMP decides. It never changes a bit of the result.

    Returns
    -------
    ndarray
        (height, width).

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    The sum runs in single precision, in the order of the bands. With the default a sample of exactly 0 makes
    its pixel no-data.

    References
    ----------
    The arithmetic mean.

    Examples
    --------
    >>> average_channels([[[10, 20, 31]]], dtype="uint8")
    array([[20]], dtype=uint8)
    """
    samples = image_of("image", image)
    operator = _core.AverageChannels(number("nodata", nodata))
    valid = mask_of("mask", mask, samples)
    result = result_for(samples.shape[:2], single, samples.dtype, dtype, out, (image, mask))
    threads = threads_of(num_threads)
    if result.size:
        operator.Process(samples, valid, result, threads)
    return result


@raster_function(rasters=("image", "bands"), masks=("mask",), blocks="map")
def vegetation_indices(
    indices: Union[Index, Sequence[Index]],
    image: Optional[ArrayLike] = None,
    *,
    bands: Mapping[str, Any],
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """Vegetation indices, as many as twelve in one pass.

    Parameters
    ----------
    indices : str, VegetationIndex, or sequence of them
        Names in upper or lower case: NGRDI, EXCESS_GREEN, DVI, RVI, NDVI, TVI, SAVI, MSAVI2, GEMI, GREENNESS,
        MCARI, MTVI1. One may come twice.
    image : array_like, optional
        (height, width) or (height, width, bands), reflectances or counts.
    bands : dict
        Which band has which role: blue, green, red, red_edge (about 700 nm), nir, swir1, swir2. With an image
        the numbers of its bands from 0 on, as in `{"red": 2, "nir": 3}`; without, arrays of (height, width)
        of one type. Those that no index needs are not read.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. A masked pixel holds -1e20 in each index, in an integer type
        limited to its range, and 0 in 64-bit ones.
    dtype : dtype_like, optional
        Type of the result, one of the ten; float32 by default. Indices from -1 to 1 need a floating type.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        (height, width, number of indices), in the order asked for.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described: an unknown index or role, a role that an index needs and
        `bands` has not.

    Notes
    -----
    With B, G, R, E, N, S1, S2 for the bands in the order of the roles, in double precision:

    - NGRDI: (G - R) / (G + R), 0 for G + R = 0. Tucker (1979), Remote Sensing of Environment 8(2).
    - EXCESS_GREEN, scaled: ((G + 255) - (R + B) 0.5) 0.5. Woebbecke et al. (1995), Transactions of the ASAE
      38(1).
    - DVI: N - R. Richardson and Wiegand (1977), Photogrammetric Engineering and Remote Sensing 43(12).
    - RVI: N / R, 0 for R = 0. Jordan (1969), Ecology 50(4).
    - NDVI: (N - R) / (N + R) within -1 to 1, 0 for N + R = 0. Rouse et al. (1974), NASA SP-351.
    - TVI: sqrt((N - R) / (N + R) + 0.5), 0 for N + R = 0. Deering et al. (1975), 10th International Symposium
      on Remote Sensing of Environment.
    - SAVI: ((N - R) / (N + R + 0.5)) 1.5 within -1 to 1, 0 for N + R + 0.5 = 0. Huete (1988), Remote Sensing
      of Environment 25(3).
    - MSAVI2: ((N + 1) 2 - sqrt((2 N + 1)^2 - 8 (N - R))) 0.5, which is 0.5 above its form in the literature.
      Qi et al. (1994), Remote Sensing of Environment 48(2).
    - GEMI: (1 - eta / 4) eta - (R - 0.125) / (1 - R), 0 for R = 1, with eta = (2 (N^2 - R^2) + 1.5 N + 0.5 R)
      / (N + R + 0.5), 0 for a divisor of 0. Pinty and Verstraete (1992), Vegetatio 101(1).
    - GREENNESS: -0.2848 B - 0.2435 G - 0.5436 R + 0.7243 N + 0.084 S1 - 1.18 S2. The last weight is not the
      -0.18 of the literature, and makes it negative nearly everywhere; `tasseled_cap_change` has that of the
      literature. After Crist and Cicone (1984), IEEE Transactions on Geoscience and Remote Sensing GE-22(3).
    - MCARI: ((E - R) - 0.2 (E - G)) (E / R), 0 for R = 0. Daughtry et al. (2000), Remote Sensing of
      Environment 74(2).
    - MTVI1: 1.2 (1.2 (N - G) - 2.5 (R - G)). Haboudane et al. (2004), Remote Sensing of Environment 90(3).

    TVI and MSAVI2 are NaN where what is under the root is negative. Samples are read in single precision.

    References
    ----------
    Beside each index, in the notes.

    Examples
    --------
    >>> vegetation_indices("NDVI", bands={"red": np.array([[0.25]]), "nir": np.array([[0.75]])})
    array([[[0.5]]], dtype=float32)
    """
    plan = _plan_of(indices)
    _check_roles(bands, plan)
    if image is None:
        sources = _arrays_of(bands, plan)
        shape, of, inputs = sources[0].shape, sources[0].dtype, (*bands.values(), mask)
        roles = [_ROLE_CODES[role] for role in plan.needed]
        valid = mask_of("mask", mask, sources[0])
    else:
        samples = image_of("image", image)
        shape, of, inputs = samples.shape[:2], samples.dtype, (image, mask)
        roles = _roles_of(bands, plan, bands_of(samples))
        valid = mask_of("mask", mask, samples)
    result = result_for((shape[0], shape[1], len(plan.order)), single, of, dtype, out, inputs)
    if result.size == 0:
        return result
    operator = _core.VegIndex()
    operator.SetRequestedIndex(plan.requests)
    operator.SetBandIndex(roles)
    if image is None:
        _run_blocks(operator, sources, None, valid, result, plan)
    elif plan.straight:
        operator.Process(samples, valid, result)
    else:
        _run_blocks(operator, None, samples, valid, result, plan)
    return result


class _Plan(NamedTuple):
    """What was asked for."""

    order: Tuple[int, ...]  # of the code order, the place of each index asked for
    requests: List[int]  # as the core takes them
    needed: Dict[str, List[str]]  # the roles, and the indices that need them
    straight: bool  # the core's order is the one asked for


def _plan_of(indices: Any) -> _Plan:
    if isinstance(indices, (str, _core.VegetationIndex)):
        indices = (indices,)
    elif not isinstance(indices, (list, tuple)):
        raise type_error("indices", shown(indices), "names, or VegetationIndex values")
    try:
        return _plan_for(*indices)
    except TypeError:  # an entry that cannot be looked up
        return _plan_for.__wrapped__(*indices)


@functools.lru_cache(maxsize=64, typed=True)
def _plan_for(*indices: Any) -> _Plan:
    codes = [_code_of(index) for index in indices]
    if not codes:
        raise value_error("indices", "none", "at least one index")
    requested = sorted(set(codes))
    requests = [0] * len(_INDICES)
    needed: Dict[str, List[str]] = {}
    for code in requested:
        requests[code] = 1
        name = _INDICES[code]
        for role in _NEEDED[name]:
            needed.setdefault(role, []).append(name)
    order = tuple(requested.index(code) for code in codes)
    return _Plan(order, requests, needed, codes == requested)


def _code_of(index: Any) -> int:
    if isinstance(index, str):
        code = _INDEX_CODES.get(index.upper())
        if code is None:
            raise unknown_name("indices", index, _INDICES)
        return code
    if isinstance(index, _core.VegetationIndex):
        return int(index)
    raise type_error("indices", shown(index), "names, or VegetationIndex values")


def _check_roles(bands: Any, plan: _Plan) -> None:
    if not isinstance(bands, Mapping):
        raise type_error("bands", type(bands).__name__, "a dict from role to band")
    for role in bands:
        if role not in _ROLE_CODES:
            if isinstance(role, str):
                raise unknown_name("bands", role, _ROLE_CODES)
            raise type_error("bands", shown(role), "roles by name")
    for role, names in plan.needed.items():
        if role not in bands:
            came = f"no {role!r}, needed by {', '.join(names)}"
            raise value_error("bands", came, "a band for each role that is needed")


def _roles_of(bands: Mapping[str, Any], plan: _Plan, count: int) -> List[int]:
    """The role of each band of an image."""
    roles = [_UNUSED] * count
    for role, band in bands.items():
        band = whole("bands", band, 0, count - 1)
        if role not in plan.needed:
            continue
        if roles[band] != _UNUSED:
            raise value_error("bands", f"band {band} for two roles", "a band of its own for each role")
        roles[band] = _ROLE_CODES[role]
    return roles


def _arrays_of(bands: Mapping[str, Any], plan: _Plan) -> List[np.ndarray]:
    """The bands that are needed, with their own strides."""
    arrays = {}
    for role, band in bands.items():
        if np.ndim(band) != 2:
            came = f"{role!r} of {np.ndim(band)} dimensions"
            raise value_error("bands", came, "arrays of (height, width), or numbers with an image")
        arrays[role] = pixels_of("bands", band)
    name = next(iter(plan.needed))
    first = arrays[name]
    for role, array in arrays.items():
        if array.shape != first.shape:
            raise value_error("bands", f"{role!r} of shape {array.shape}", f"{first.shape}, as {name!r}")
        if array.dtype != first.dtype:
            raise type_error("bands", f"{role!r} of {array.dtype}", f"{first.dtype}, as {name!r}")
    return [arrays[role] for role in plan.needed]


def _run_blocks(
    operator: _core.VegIndex,
    sources: Optional[List[np.ndarray]],
    image: Optional[np.ndarray],
    mask: Optional[np.ndarray],
    result: np.ndarray,
    plan: _Plan,
) -> None:
    """In blocks of rows, what the core cannot do in place: put bands side by side, and indices in order."""
    of = image if sources is None else sources[0]
    count = len(sources) if sources is not None else 1
    for rows in row_blocks(result.shape[0], of.nbytes // of.shape[0] * count):
        pixels = image[rows] if sources is None else np.stack([source[rows] for source in sources], axis=-1)
        valid = None if mask is None else mask[rows]
        if plan.straight:
            operator.Process(pixels, valid, result[rows])
            continue
        in_code_order = np.empty(pixels.shape[:2] + (sum(plan.requests),), result.dtype)
        operator.Process(pixels, valid, in_code_order)
        np.take(in_code_order, plan.order, axis=2, out=result[rows])


@raster_function(rasters=("image",), masks=("mask",), blocks="map")
def synthetic_blue(
    image: ArrayLike,
    *,
    minimum: Sequence[float],
    maximum: Sequence[float],
    background: Sequence[float],
    scale: Optional[Sequence[float]] = None,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """A blue band for a sensor of green, red and near infrared.

    With the samples s0, s1 and s2: blue = s0 0.873393 + 13.9054 - s1 0.138254 - s2 0.100616, limited to 0 to
    255.

    Parameters
    ----------
    image : array_like
        (height, width, bands): green, red, near infrared; further bands are not read.
    minimum, maximum : (float, float, float)
        The range of green, red and the synthetic blue, ends included. A pixel outside is background. NaN is
        no bound.
    background : (float, float, float)
        A sample of green, red or near infrared that equals its entry, both truncated to whole numbers, makes
        the pixel background. Such a pixel holds the first entry, cast to the result's type.
    scale : (float, float, float), optional
        Stretch the blue to (blue - minimum) scale, with the last entries of both, instead of limiting it.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. A masked pixel is background.
    dtype : dtype_like, optional
        Type of the result, one of the ten; by default that of the image.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        (height, width).

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    Background is compared in whole numbers of 32 bits: a sample of 7.9 equals a background of 7.2, and 300 is
    none of an uint8 image. An image of more than three bands is copied.

    References
    ----------
    The weighted sum above.

    Examples
    --------
    >>> zero = np.zeros((1, 1, 3), "uint8")
    >>> synthetic_blue(zero, minimum=[0] * 3, maximum=[255] * 3, background=[-1] * 3)
    array([[14]], dtype=uint8)
    """
    return _coloured(image, (), (minimum, maximum, background, scale), mask, dtype, out)


@raster_function(rasters=("image",), masks=("mask",), blocks="map")
def natural_color(
    image: ArrayLike,
    *,
    minimum: Sequence[float],
    maximum: Sequence[float],
    background: Sequence[float],
    scale: Optional[Sequence[float]] = None,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """Red, green and a synthetic blue for a sensor of green, red and near infrared.

    The blue is that of `synthetic_blue`.

    Parameters
    ----------
    image : array_like
        (height, width, bands): green, red, near infrared; further bands are not read.
    minimum, maximum : (float, float, float)
        The range of green, red and the synthetic blue, ends included. A pixel outside is background. NaN is
        no bound.
    background : (float, float, float)
        A sample of green, red or near infrared that equals its entry, both truncated to whole numbers, makes
        the pixel background. Such a pixel holds the three entries, as red, green and blue in this order, cast
        to the result's type.
    scale : (float, float, float), optional
        Stretch each of green, red and blue to (sample - minimum) scale, with the entries of its own band.
        None: red and green are cast, the blue is limited to 0 to 255.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. A masked pixel is background.
    dtype : dtype_like, optional
        Type of the result, one of the ten; by default that of the image.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        (height, width, 3): red, green, blue.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    A valid pixel swaps the first two bands, a background pixel keeps the order of `background`. Background is
    compared in whole numbers of 32 bits: a sample of 7.9 equals a background of 7.2, and 300 is none of an
    uint8 image. An image of more than three bands is copied.

    References
    ----------
    The weighted sum of `synthetic_blue`.

    Examples
    --------
    >>> pixel = np.array([[[10, 20, 0]]], "uint8")
    >>> natural_color(pixel, minimum=[0] * 3, maximum=[255] * 3, background=[-1] * 3)
    array([[[20, 10, 20]]], dtype=uint8)
    """
    return _coloured(image, (3,), (minimum, maximum, background, scale), mask, dtype, out)


def _coloured(
    image: Any, bands: Tuple[int, ...], parameters: Tuple[Any, ...], mask: Any, dtype: Any, out: Any
) -> np.ndarray:
    samples = image_of("image", image)
    if bands_of(samples) < 3:
        came = counted(bands_of(samples))
        raise value_error("image", came, "three bands or more: green, red, near infrared")
    operator = _core.SPOTBlue()
    minimum, maximum, background, scale = parameters
    operator.SetMin(_three("minimum", minimum))
    operator.SetMax(_three("maximum", maximum))
    operator.SetBackGround(_three("background", background))
    if scale is not None:
        operator.SetScale(_three("scale", scale))
    operator.SetTrim(scale is not None)
    valid = mask_of("mask", mask, samples)
    result = result_for(samples.shape[:2] + bands, same, samples.dtype, dtype, out, (image, mask))
    if result.size:
        operator.Process(np.ascontiguousarray(samples[..., :3]), valid, result)
    return result


def _three(argument: str, value: Any) -> List[float]:
    return numbers(argument, value, 3, "three numbers")
