"""Slope and aspect of elevations."""

from __future__ import annotations

from typing import Any, Optional, Sequence, Tuple, Union

import numpy as np
from numpy.typing import ArrayLike, DTypeLike

from . import _core
from ._arguments import (
    finite,
    held_by,
    image_of,
    mask_of,
    number,
    positive,
    result_for,
    shown,
    single_band,
    threads_of,
    type_error,
    unknown_name,
    value_error,
)
from ._arrays import raster_function
from ._types import single

#: How the margin is filled: one of the two names, or a number.
Edge = Union[str, float]
Spacing = Union[float, Sequence[float]]
Operator = Union[_core.FilterSlp, _core.FilterAsp]

_EDGES = ("nearest", "reflect")
_SPACINGS = "one number above 0, or two: (dx, dy)"


@raster_function(rasters=("elevation",), masks=("mask",), blocks="overlap")
def slope(
    elevation: ArrayLike,
    *,
    cellsize: Optional[Spacing] = None,
    z_factor: Optional[float] = None,
    edge: Edge = "nearest",
    margin: int = 0,
    background: float = 0.0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
    num_threads: Optional[int] = None,
) -> np.ndarray:
    """Terrain slope in degrees, from 0 to 90.

    The slope of a pixel is the angle between the vertical and the normal of the surface through a cell of 2 x
    2 pixels: itself, its right neighbour, the one below, and the one below to the right.

    Parameters
    ----------
    elevation : array_like
        (height, width) or (height, width, bands); each band is treated by itself. Elevations in any unit.
    cellsize : float or (float, float)
        Spacing of the pixels, one number or (dx, dy), finite and above 0, in the unit of the elevations times
        `z_factor`. Plain arrays need it; a DataArray brings it along with its coordinates.
    z_factor : float, optional
        Factor on every difference of elevations; None stands for 1.
    edge : {"nearest", "reflect"} or float, optional
        What continues the elevations by one pixel past the right and the lower edge: the pixel at the edge,
        the one before it, or a number that the type of the elevations holds.
    margin : {0, 1}, optional
        1: the array brings a margin of one pixel on each side, which gets no result; `edge` has no effect.
    background : float, optional
        What a masked pixel holds.
    mask : ndarray of bool, optional
        (height, width) of `elevation`, True for a valid pixel.
    dtype : dtype_like, optional
        Type of the result, one of the ten; float32 by default.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.
    num_threads : int, optional
        From 1 to 256; by default what OpenMP decides. It never changes a bit of the result.

    Returns
    -------
    ndarray
        Degrees, of the shape of `elevation`, with `margin=1` two rows and columns less.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described, `cellsize` not given among them.

    Notes
    -----
    Every type but float32, float64 among them, gets whole degrees. A masked neighbour counts as level with
    the pixel. A NaN in the cell gives NaN in float32; in all other types it gives -2147483648, within the
    range of the type. All arithmetic is in single precision.

    References
    ----------
    Jones (1998), "A comparison of algorithms used to compute hill slope as a property of the DEM", Computers
    & Geosciences 24(4), on the averaged-edge gradient and its kin.

    Examples
    --------
    >>> slope([[0.0, 1.0, 2.0], [0.0, 1.0, 2.0]], cellsize=1)
    array([[45., 45.,  0.],
           [45., 45.,  0.]], dtype=float32)
    """
    image = image_of("elevation", elevation)
    operator = _core.FilterSlp(*_spacings(cellsize), _factor(z_factor))
    operator.SetBackground(number("background", background))
    edge = _edge_of(edge, image.dtype)
    valid = mask_of("mask", mask, image)
    shape = _without_margin(image, margin) + image.shape[2:]
    result = result_for(shape, single, image.dtype, dtype, out, (elevation, mask))
    _run(operator, image, valid, result, margin, edge, threads_of(num_threads))
    return result


@raster_function(rasters=("elevation",), masks=("mask",), blocks="overlap")
def aspect(
    elevation: ArrayLike,
    *,
    cellsize: Optional[Spacing] = None,
    z_factor: Optional[float] = None,
    edge: Edge = "nearest",
    margin: int = 0,
    flat: float = 510.0,
    background: float = 0.0,
    mask: Optional[np.ndarray] = None,
    dtype: Optional[DTypeLike] = None,
    out: Optional[np.ndarray] = None,
    num_threads: Optional[int] = None,
) -> np.ndarray:
    """Terrain aspect in degrees, from 0 to 360: the direction in which the surface falls away.

    0 is towards the top of the array, 90 towards increasing x, 180 towards increasing y, 270 towards
    decreasing x. The surface of a pixel is that of `slope`.

    Parameters
    ----------
    elevation : array_like
        (height, width), or (height, width, 1). Elevations in any unit.
    cellsize : float or (float, float)
        Spacing of the pixels, one number or (dx, dy), finite and above 0. Plain arrays need it; a DataArray
        brings it along with its coordinates.
    z_factor : float, optional
        Factor on every difference of elevations; None stands for 1.
    edge : {"nearest", "reflect"} or float, optional
        What continues the elevations by one pixel past the right and the lower edge: the pixel at the edge,
        the one before it, or a number that the type of the elevations holds.
    margin : {0, 1}, optional
        1: the array brings a margin of one pixel on each side, which gets no result; `edge` has no effect.
    flat : float, optional
        What a pixel without a direction holds: one of a flat cell, or with a masked neighbour in its cell.
    background : float, optional
        What a masked pixel holds.
    mask : ndarray of bool, optional
        (height, width) of `elevation`, True for a valid pixel.
    dtype : dtype_like, optional
        Type of the result, one of the ten; float32 by default.
    out : ndarray, optional
        C-contiguous array of the result's shape, of one of the ten types, to write to and to return.
    num_threads : int, optional
        From 1 to 256; by default what OpenMP decides. It never changes a bit of the result.

    Returns
    -------
    ndarray
        Degrees, (height, width), with `margin=1` two rows and columns less.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described, `cellsize` not given among them.

    Notes
    -----
    int8 and uint8 results hold half the degrees, but `flat` as it is: 510 is 255 in uint8. Whole degrees are
    rounded, so that 359.7 becomes 360 and not 0. All arithmetic is in single precision.

    References
    ----------
    The direction of the horizontal part of the normal that `slope` describes.

    Examples
    --------
    >>> aspect([[1.0, 0.0], [1.0, 0.0]], cellsize=1)
    array([[ 90., 510.],
           [ 90., 510.]], dtype=float32)
    """
    image = single_band("elevation", image_of("elevation", elevation))
    operator = _core.FilterAsp()
    dx, dy = _spacings(cellsize)
    operator.SetXSIZE(dx)
    operator.SetYSIZE(dy)
    operator.SetELSZ(_factor(z_factor))
    operator.SetZeroSlope(number("flat", flat))
    operator.SetBackground(number("background", background))
    edge = _edge_of(edge, image.dtype)
    valid = mask_of("mask", mask, image)
    shape = _without_margin(image, margin)
    result = result_for(shape, single, image.dtype, dtype, out, (elevation, mask))
    _run(operator, image, valid, result, margin, edge, threads_of(num_threads))
    return result


def _spacings(cellsize: Any) -> Tuple[float, float]:
    if cellsize is None:
        raise type_error("cellsize", "None", _SPACINGS)
    if isinstance(cellsize, (tuple, list)) or isinstance(cellsize, np.ndarray) and cellsize.ndim == 1:
        if len(cellsize) != 2:
            raise value_error("cellsize", f"{len(cellsize)} numbers", _SPACINGS)
        return positive("cellsize", cellsize[0]), positive("cellsize", cellsize[1])
    spacing = positive("cellsize", cellsize)
    return spacing, spacing


def _factor(z_factor: Any) -> float:
    return 1.0 if z_factor is None else finite("z_factor", z_factor)


def _edge_of(edge: Any, dtype: np.dtype) -> Any:
    if isinstance(edge, str):
        if edge in _EDGES:
            return edge
        raise unknown_name("edge", edge, _EDGES)
    return held_by("edge", edge, dtype)


def _without_margin(image: np.ndarray, margin: Any) -> Tuple[int, ...]:
    height, width = image.shape[:2]
    if isinstance(margin, bool) or margin not in (0, 1):
        raise value_error("margin", shown(margin), "0 or 1")
    if margin == 0:
        return height, width
    if height < 2 or width < 2:
        raise value_error("elevation", f"shape {image.shape}", "at least 2 x 2 pixels with margin=1")
    return height - 2, width - 2


def _run(
    operator: Operator,
    image: np.ndarray,
    mask: Optional[np.ndarray],
    result: np.ndarray,
    margin: int,
    edge: Any,
    threads: Optional[int],
) -> None:
    if result.size == 0:
        return
    if margin:
        operator.Process(image, mask, result, 1, 0, threads)
        return
    height, width = image.shape[:2]
    all_rows, all_columns = np.arange(-1, height + 1), np.arange(-1, width + 1)
    if height < 3 or width < 3:
        result[...] = _run_part(operator, image, mask, result, all_rows, all_columns, edge)
        return
    operator.Process(image, mask, result, 1, 1, threads)  # all but the border, without a copy
    rows = _run_part(operator, image, mask, result, _first_and_last(height), all_columns, edge)
    columns = _run_part(operator, image, mask, result, None, _first_and_last(width), edge)
    result[0], result[-1] = rows[0], rows[2]
    result[1:-1, 0], result[1:-1, -1] = columns[:, 0], columns[:, 2]


def _first_and_last(length: int) -> np.ndarray:
    """Positions whose results are those of the first pixel, one without meaning, and those of the last."""
    return np.array((-1, 0, 1, length - 1, length))


def _run_part(
    operator: Operator,
    image: np.ndarray,
    mask: Optional[np.ndarray],
    result: np.ndarray,
    rows: Optional[np.ndarray],
    columns: np.ndarray,
    edge: Any,
) -> np.ndarray:
    """The results of the pixels at these positions, of which the outermost are a margin."""
    part = _taken(_taken(image, rows, 0, edge), columns, 1, edge)
    valid = None
    if mask is not None:
        edge_of_mask = edge if isinstance(edge, str) else True
        valid = _taken(_taken(mask, rows, 0, edge_of_mask), columns, 1, edge_of_mask)
    of_part = np.empty((part.shape[0] - 2, part.shape[1] - 2) + result.shape[2:], result.dtype)
    operator.Process(part, valid, of_part, 1, 0, 1)
    return of_part


def _taken(image: np.ndarray, positions: Optional[np.ndarray], axis: int, edge: Any) -> np.ndarray:
    """Rows or columns at these positions, None for all; the first may be -1 and the last the length, which
    are filled as numpy.pad fills them."""
    if positions is None:
        return image
    length = image.shape[axis]
    indices = positions.copy()
    before, behind = indices[0] < 0, indices[-1] == length
    inwards = min(1, length - 1) if edge == "reflect" else 0
    if before:
        indices[0] = inwards
    if behind:
        indices[-1] = length - 1 - inwards
    part = image.take(indices, axis)
    if not isinstance(edge, str):
        lines = part if axis == 0 else part.swapaxes(0, 1)
        if before:
            lines[0] = edge
        if behind:
            lines[-1] = edge
    return part
