"""Mirroring, and moving pixels between regions."""

from __future__ import annotations

from typing import Any, Optional, Sequence, Tuple

import numpy as np
from numpy.typing import ArrayLike, DTypeLike

from . import _core
from ._arguments import (
    fill_masked,
    held_by,
    image_of,
    mask_of,
    region_of,
    result_for,
    shown,
    type_error,
    unknown_name,
    value_error,
    wholes,
)
from ._arrays import raster_function
from ._types import UINT8, same

#: x, y, width and height.
Region = Sequence[int]

_AXES = ("vert", "hori")


@raster_function(rasters=("image",), masks=("mask",), blocks="mirror")
def mirror(
    image: ArrayLike,
    axis: str,
    *,
    window: Optional[Region] = None,
    crop: bool = False,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """A mirrored image, or one in which a window is mirrored.

    Parameters
    ----------
    image : array_like
        (height, width) or (height, width, bands).
    axis : {"vert", "hori"}
        "vert" reverses the pixels within each row, "hori" those within each column; in upper or lower case.
    window : (int, int, int, int), optional
        x, y, width and height of the part that is mirrored, which lies in the image; the rest is copied.
        None: all of the image, or where the mask is True.
    crop : bool, optional
        Return the mirrored window alone.
    mask : ndarray of bool, optional
        (height, width). True marks the pixels that are mirrored, within `window`, or without one within the
        least rectangle around them; all others stay where they are. Not together with `crop`.
    dtype : dtype_like, optional
        Type of the result, one of the ten; by default that of the image.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        Of the shape of `image`; with `crop` of the height and width of `window`.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described, a mask that leads out of the image among them.

    Notes
    -----
    All samples go through single precision: float64, 32-bit and 64-bit ones are rounded to it, and a negative
    int64 becomes 0. Marked pixels of a row, or column, with a gap between them are counted as if there were
    none: the first of them gets the last pixel of the window, the next one the last but one, and so on; those
    behind the run that this fills stay as they are.

    References
    ----------
    The geometry above.

    Examples
    --------
    >>> mirror(np.array([[1, 2, 3]], dtype="uint8"), "vert")
    array([[3, 2, 1]], dtype=uint8)
    """
    samples = image_of("image", image)
    axis = _axis_of(axis)
    if window is not None:
        window = _window_of(window, samples)
    marked = mask_of("mask", mask, samples)
    if crop and marked is not None:
        raise value_error("mask", "given with crop=True", "None, since all of the window is mirrored")
    if crop and window is not None:
        x, y, width, height = window
        samples = np.ascontiguousarray(samples[y : y + height, x : x + width])
        window = None
    result = result_for(samples.shape, same, samples.dtype, dtype, out, (image, mask))
    if result.size == 0:
        return result
    operator = _core.MirrorImg()
    operator.SetAxis(axis)
    window, marked = _marks_of(window, marked, samples)
    if window is not None:
        operator.SetWindow(list(window))
    operator.Process(samples, marked, result)
    if mask is not None:
        _keep_passed_over(operator, samples, marked, axis, result)
    return result


def _keep_passed_over(
    operator: _core.MirrorImg, image: np.ndarray, marked: np.ndarray, axis: str, result: np.ndarray
) -> None:
    """Marked pixels behind a gap, to which the core writes nothing, stay as they are."""
    along = 1 if axis.lower() == "vert" else 0
    positions = np.arange(marked.shape[along]).reshape((1, -1) if along else (-1, 1))
    end = marked.argmax(axis=along) + marked.sum(axis=along)
    passed_over = marked & (positions >= np.expand_dims(end, along))
    if passed_over.any():
        copied = np.empty_like(result)
        operator.Process(image, np.zeros_like(marked), copied)
        result[passed_over] = copied[passed_over]


def _axis_of(axis: Any) -> str:
    if not isinstance(axis, str):
        raise type_error("axis", shown(axis), "'vert' or 'hori'")
    if axis.lower() not in _AXES:
        raise unknown_name("axis", axis, _AXES)
    return axis


def _window_of(window: Any, image: np.ndarray) -> Tuple[int, ...]:
    x, y, width, height = region = region_of("window", window)
    if x + width > image.shape[1] or y + height > image.shape[0]:
        raise value_error("window", f"{region}", f"one within {image.shape[1]} x {image.shape[0]} pixels")
    return region


def _marks_of(
    window: Optional[Tuple[int, ...]], marked: Optional[np.ndarray], image: np.ndarray
) -> Tuple[Optional[Tuple[int, ...]], Optional[np.ndarray]]:
    """The window and the marks that the core needs: it goes by the marks for the place, by the window for the
    extent."""
    if marked is None and window is not None:
        x, y, width, height = window
        marked = np.zeros(image.shape[:2], bool)
        marked[y : y + height, x : x + width] = True
    elif marked is not None and window is None:
        rows, columns = np.flatnonzero(marked.any(axis=1)), np.flatnonzero(marked.any(axis=0))
        if rows.size:
            window = (columns[0], rows[0], columns[-1] - columns[0] + 1, rows[-1] - rows[0] + 1)
            window = tuple(int(entry) for entry in window)
    return window, marked


@raster_function(rasters=("image",), masks=("mask",), blocks="transfer")
def transfer(
    image: ArrayLike,
    in_region: Region,
    out_region: Region,
    *,
    shape: Optional[Tuple[int, int]] = None,
    in_origin: Tuple[int, int] = (0, 0),
    out_origin: Tuple[int, int] = (0, 0),
    fill: float = 0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
) -> np.ndarray:
    """The nearest pixels of a region of an image, brought to a region of another scale.

    Image and result may be pieces of larger images: the regions are in the coordinates of the whole images,
    and the origins say where a piece begins. So a result can be made piece by piece.

    Parameters
    ----------
    image : array_like
        (height, width) or (height, width, bands).
    in_region, out_region : (int, int, int, int)
        Source and target: x, y, width and height in pixels of the whole images, with at least one pixel.
    shape : (int, int), optional
        Height and width of the result; None: those of `out_region`.
    in_origin, out_origin : (int, int), optional
        x and y of the first pixel of image and result in the whole images.
    fill : float, optional
        What a pixel holds whose source is masked: a number that the result's type holds.
    mask : ndarray of bool, optional
        (height, width) of `image`, True for a valid pixel.
    dtype : dtype_like, optional
        Type of the result, one of the ten; by default that of the image.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.

    Returns
    -------
    ndarray
        (height, width) or (height, width, bands), with the bands of `image`.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described, an image without pixels for a result with some among them.

    Notes
    -----
    On each axis result pixel p gets image pixel (p - out start + out origin) / scale + in start - in origin +
    0.5, truncated and limited to the image, where the scale is the extent of `out_region` by that of
    `in_region`: of a scale of 2 pixels 0, 1, 2, 3 get 0, 1, 1, 2. Pixels of the image past the edges of
    `in_region` are taken too. A pixel of the result left of `out_region` wraps: with a scale up to about 2 it
    gets the first column of the image, with a larger one the last; above it the same with rows. Samples are
    cast, neither rounded nor limited: 300.7 is 44 in uint8.

    References
    ----------
    Nearest-neighbour resampling, Richards and Jia (2006), "Remote Sensing Digital Image Analysis", chapter 2.

    Examples
    --------
    >>> transfer(np.array([[1, 2, 3]], dtype="uint8"), (0, 0, 2, 1), (0, 0, 4, 1))
    array([[1, 2, 2, 3]], dtype=uint8)
    """
    samples = image_of("image", image)
    operator = _transferring(in_region, out_region)
    size = _size_of(shape, out_region)
    origins = _origin_of("in_origin", in_origin), _origin_of("out_origin", out_origin)
    valid = mask_of("mask", mask, samples)
    result = result_for(size + samples.shape[2:], same, samples.dtype, dtype, out, (image, mask))
    fill = held_by("fill", fill, result.dtype)
    if result.size == 0:
        return result
    if samples.size == 0:
        raise value_error("image", f"shape {samples.shape}", "at least one pixel")
    operator.Process(samples, None, result, *origins)
    if valid is not None:
        moved = np.empty(size, UINT8)
        _transferring(in_region, out_region).Process(valid.view(UINT8), None, moved, *origins)
        fill_masked(result, moved.view(bool), fill)
    return result


def _transferring(in_region: Any, out_region: Any) -> _core.IIIDataTransfer:
    operator = _core.IIIDataTransfer()
    operator.SetInRegion(list(_filled_region("in_region", in_region)))
    operator.SetOutRegion(list(_filled_region("out_region", out_region)))
    return operator


def _filled_region(argument: str, value: Any) -> Tuple[int, ...]:
    region = region_of(argument, value)
    if region[2] == 0 or region[3] == 0:
        raise value_error(argument, f"{region}", "at least one pixel")
    return region


def _size_of(shape: Any, out_region: Region) -> Tuple[int, ...]:
    if shape is None:
        return int(out_region[3]), int(out_region[2])
    return wholes("shape", shape, 2, "(height, width)")


def _origin_of(argument: str, value: Any) -> Tuple[int, ...]:
    return wholes(argument, value, 2, "(x, y)")
