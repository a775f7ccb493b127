"""The public functions on dask arrays: lazily, block by block, with the bits of one call on the whole array.

Height and width are cut as the first dask array has them, all other arrays likewise; the bands of a block are
together. Blocks run the public numpy functions on one thread.
"""

from __future__ import annotations

import functools
import math
from dataclasses import dataclass, replace
from typing import Any, Callable, NamedTuple, Sequence

import dask.array as da
import numpy as np
from dask.base import tokenize
from dask.delayed import Delayed, delayed
from dask.highlevelgraph import HighLevelGraph

from . import geometry, summary
from ._arguments import image_of, per_band, type_error, value_error
from ._arrays import RasterFunction, is_lazy
from ._types import COUNTED_TYPES

Chunks = tuple[int, ...]

_SIDE = 3  # of the arrays on which a function is tried: wide enough for a margin of 1
_MERGED_AT_ONCE = 8
_WRAP = 2**32  # the operator's coordinates wrap


@dataclass(frozen=True)
class Work:
    """A call that has been checked."""

    described: RasterFunction
    arguments: dict[str, Any]  #: with None in place of rasters and masks
    operands: dict[str, da.Array]  #: rasters and masks of one chunking
    trial: Any  #: what the function returns for a few pixels

    @property
    def image(self) -> da.Array:
        return next(iter(self.operands.values()))

    @property
    def block_function(self) -> Callable[..., Any]:
        """The function of one block, whose operands it takes one by one."""
        return functools.partial(_run, self.described.call, tuple(self.operands), self.arguments)


def call(described: RasterFunction, arguments: dict[str, Any]) -> Any:
    """Call a public function whose arguments hold a dask array."""
    if arguments.get("out") is not None:
        raise type_error("out", "an array", "None with dask arrays, whose results are new")
    operands = _operands(described, arguments)
    held = described.replaced(arguments, dict.fromkeys(operands))
    trial = _try(described, held, operands)
    if described.takes("num_threads"):
        held["num_threads"] = 1
    return _WAYS[described.blocks](Work(described, held, operands, trial))


# ---- operands


def _operands(described: RasterFunction, arguments: dict[str, Any]) -> dict[str, da.Array]:
    """All rasters and masks as dask arrays of one size and one chunking."""
    given = {}
    for name, value in described.operands(arguments):
        if isinstance(value, np.ma.MaskedArray):
            raise type_error(name, "a masked array", "its data, with mask=~numpy.ma.getmaskarray(...)")
        given[name] = value if is_lazy(value) else np.asarray(value)
    for name, array in given.items():
        _check_shape(name, array, described.is_mask(name))
    first, image = next(iter(given.items()))
    for name, array in given.items():
        if array.shape[:2] != image.shape[:2]:
            raise value_error(
                name, f"shape {array.shape}", f"the height and width of {first}, {image.shape[:2]}"
            )
    cut = next(array for array in given.values() if is_lazy(array))
    rows, columns = (tuple(size for size in sizes if size) or (0,) for sizes in cut.chunks[:2])
    return {name: _cut(array, rows, columns) for name, array in given.items()}


def _check_shape(name: str, array: Any, mask: bool) -> None:
    if any(math.isnan(size) for size in array.shape):
        raise value_error(
            name, "a dask array of unknown shape", "a known one, as after compute_chunk_sizes()"
        )
    if array.ndim != 2 and (mask or array.ndim != 3):
        expected = "(height, width)" if mask else "(height, width) or (height, width, bands)"
        raise value_error(name, f"shape {array.shape}", expected)


def _cut(array: Any, rows: Chunks, columns: Chunks) -> da.Array:
    """The array in these chunks, with all bands of a pixel in one."""
    chunks = (rows, columns) + tuple((size,) for size in array.shape[2:])
    return array.rechunk(chunks) if is_lazy(array) else da.from_array(array, chunks=chunks)


def _try(described: RasterFunction, arguments: dict[str, Any], operands: dict[str, da.Array]) -> Any:
    """Let the numpy function check all arguments on a few pixels, and say what its results look like."""
    side = 0 if described.blocks == "whole" else _SIDE  # the focus measures print what they find
    few = {}
    for name, array in operands.items():
        make = np.ones if described.is_mask(name) else np.zeros
        shape = tuple(min(size, side) for size in array.shape[:2])
        few[name] = make(shape + array.shape[2:], array.dtype)
    tried = described.replaced(arguments, few)
    tried.update(_tried_otherwise(described, arguments))
    return described.call(**tried)


def _tried_otherwise(described: RasterFunction, arguments: dict[str, Any]) -> dict[str, Any]:
    """Arguments that do not fit the few pixels."""
    histogram = arguments.get("histogram")
    if isinstance(histogram, tuple) and any(map(is_lazy, histogram)):
        return {"histogram": None}
    if described.blocks == "histogram":
        low, high = arguments["minimum"], arguments["maximum"]
        return {"minimum": high if low is None else low, "maximum": low if high is None else high}
    if described.blocks == "mirror":
        return {"window": None, "crop": False}
    if described.blocks == "transfer":
        size = geometry._size_of(
            arguments["shape"], geometry.region_of("out_region", arguments["out_region"])
        )
        return {"shape": tuple(min(extent, 1) for extent in size)}
    return {}


# ---- blocks


def _run(
    function: Callable[..., Any],
    names: Sequence[str],
    arguments: dict[str, Any],
    *blocks: Any,
    **computed: Any,
) -> Any:
    """One block of a result. `computed` are arguments that came out of the graph."""
    operands = dict(zip(names, map(_block, blocks)))
    described = function.raster_function  # type: ignore[attr-defined]
    return function(**{**described.replaced(arguments, operands), **computed})


def _block(value: Any) -> Any:
    """A block, without the list in which the only block of the bands comes."""
    while isinstance(value, list):
        (value,) = value
    return value


def _blockwise(
    function: Callable[..., Any],
    operands: Sequence[da.Array],
    trial: np.ndarray,
    chunks: tuple[Chunks, Chunks],
    places: Sequence[da.Array] = (),
    **computed: Any,
) -> da.Array:
    """Blocks like `trial` in these chunks, each from the blocks at its place; row and column may lead."""
    pairs: list[Any] = [entry for pair in zip(places, "yx") for entry in pair]
    for number, array in enumerate(operands):
        pairs += [array, ("y", "x", f"bands of {number}")[: array.ndim]]
    more = {"bands": trial.shape[2]} if trial.ndim == 3 else {}
    return da.blockwise(
        function,
        ("y", "x", *more),
        *pairs,
        new_axes=more,
        adjust_chunks=dict(zip("yx", chunks)),
        align_arrays=False,
        dtype=trial.dtype,
        meta=np.empty((0,) * trial.ndim, trial.dtype),
        token="gridmill",
        **computed,
    )


def _map(work: Work, **computed: Any) -> da.Array:
    operands = list(work.operands.values())
    return _blockwise(work.block_function, operands, work.trial, work.image.chunks[:2], **computed)


def _in_one_block(work: Work) -> Work:
    return replace(work, operands={name: array.rechunk(-1) for name, array in work.operands.items()})


# ---- neighbours


def _overlap(work: Work) -> da.Array:
    """Blocks with a pixel of their neighbours on each side; at the edges of the image the blocks pad."""
    if work.image.size == 0:
        return _map(work)
    margin = int(work.arguments["margin"])
    operands = work.operands
    if margin:
        rows, columns = (_with_wide_ends(sizes) for sizes in work.image.chunks[:2])
        operands = {name: _cut(array, rows, columns) for name, array in operands.items()}
    rows, columns = next(iter(operands.values())).chunks[:2]
    wide = [da.overlap.overlap(array, {0: 1, 1: 1}, "none") for array in operands.values()]
    function = functools.partial(_run_with_margin, work.block_function, (len(rows), len(columns)), margin)
    places = [da.from_array(np.arange(len(sizes)), chunks=1) for sizes in (rows, columns)]
    return _blockwise(function, wide, work.trial, (_inner(rows, margin), _inner(columns, margin)), places)


def _with_wide_ends(chunks: Chunks) -> Chunks:
    """The chunks such that the first and the last one hold more than a margin of 1."""
    sizes = list(chunks)
    while len(sizes) > 1 and sizes[0] < 2:
        sizes[:2] = [sizes[0] + sizes[1]]
    while len(sizes) > 1 and sizes[-1] < 2:
        sizes[-2:] = [sizes[-2] + sizes[-1]]
    return tuple(sizes)


def _inner(chunks: Chunks, margin: int) -> Chunks:
    """The chunks of the result: the array's own margin has none."""
    sizes = list(chunks)
    sizes[0] -= margin
    sizes[-1] -= margin
    return tuple(sizes)


def _run_with_margin(
    run: functools.partial,
    counts: tuple[int, int],
    margin: int,
    row: np.ndarray,
    column: np.ndarray,
    *blocks: Any,
) -> np.ndarray:
    """A block that has its neighbours' pixels as its margin; on the outer sides it gets the edge's."""
    function, names, arguments = run.args
    if not margin:
        places = int(row[0]), int(column[0])
        outside = [(int(place == 0), int(place == count - 1)) for place, count in zip(places, counts)]
        masks = [function.raster_function.is_mask(name) for name in names]
        blocks = tuple(
            _padded(_block(block), outside, arguments["edge"], mask) for block, mask in zip(blocks, masks)
        )
    return run.func(function, names, {**arguments, "margin": 1}, *blocks)


def _padded(block: np.ndarray, outside: list[tuple[int, int]], edge: Any, mask: bool) -> np.ndarray:
    """The block continued past the image's edge as the function itself does it."""
    for axis, sides in enumerate(outside):
        widths = [(0, 0)] * block.ndim
        widths[axis] = sides
        if not any(sides):
            continue
        if not isinstance(edge, str):
            block = np.pad(block, widths, constant_values=True if mask else edge)
        else:
            reflects = edge == "reflect" and block.shape[axis] > 1
            block = np.pad(block, widths, mode="reflect" if reflects else "edge")
    return block


# ---- the whole image


def _gathered(parts: da.Array, merge: Callable[[list[Any]], Any], finish: Callable[[Any], Any]) -> Delayed:
    """What all blocks give together, a few at a time."""
    name = "gridmill-gathered-" + tokenize(parts.name, merge, finish)
    layer: dict[Any, Any] = {}
    keys = [(parts.name, *place) for place in np.ndindex(*parts.numblocks)]
    level = 0
    while len(keys) > 1:
        groups = [keys[first : first + _MERGED_AT_ONCE] for first in range(0, len(keys), _MERGED_AT_ONCE)]
        keys = [(name, level, number) for number in range(len(groups))]
        layer.update((key, (merge, group)) for key, group in zip(keys, groups))
        level += 1
    layer[name] = (finish, keys[0])
    return Delayed(name, HighLevelGraph.from_collections(name, layer, dependencies=[parts]))


def _parts(work: Work, function: Callable[..., Any], **computed: Any) -> da.Array:
    """A result of any kind for each block."""
    rows, columns = ((1,) * count for count in work.image.numblocks[:2])
    nothing = np.empty((0, 0), object)
    return _blockwise(function, list(work.operands.values()), nothing, (rows, columns), **computed)


def _itself(value: Any) -> Any:
    return value


def _as_arrays(result: Delayed, trial: Any) -> Any:
    """A computed array, or a tuple of arrays, as dask arrays shaped like those of `trial`."""
    if isinstance(trial, np.ndarray):
        return da.from_delayed(result, trial.shape, dtype=trial.dtype)
    fields = (_as_arrays(result[number], field) for number, field in enumerate(trial))
    return type(trial)(*fields)


def _of_whole(work: Work) -> Any:
    """A sum in the order of the pixels: the image is one block."""
    work = _in_one_block(work)
    return _as_arrays(_gathered(_parts(work, work.block_function), _itself, _itself), work.trial)


# ---- statistics


def _merge_statistics(parts: list[summary.Statistics]) -> summary.Statistics:
    return functools.reduce(summary.Statistics.merge, parts)


def _statistics(work: Work) -> summary.Statistics:
    return _as_arrays(_gathered(_parts(work, work.block_function), _merge_statistics, _itself), work.trial)


def _histogram(work: Work) -> summary.Histogram:
    bins, minimum, maximum = (work.arguments[name] for name in ("bins", "minimum", "maximum"))
    result = _histogram_of(work, None, bins, minimum, maximum)
    arrays = _as_arrays(result, work.trial)
    if not _is_counted(work.image) or bins is not None or minimum is not None and maximum is not None:
        return arrays
    counts = work.trial.counts
    return arrays._replace(counts=da.from_delayed(result[0], (len(counts), np.nan), dtype=counts.dtype))


def _is_counted(image: da.Array) -> bool:
    """Whether each value has a bin, so that the number of bins is known with the values only."""
    return image.dtype.newbyteorder("=") in COUNTED_TYPES


def _histogram_of(
    work: Work, band: int | None, bins: int | None = None, minimum: Any = None, maximum: Any = None
) -> Delayed:
    """The histogram of all bands or of one."""
    bands = work.image.shape[2] if work.image.ndim == 3 and band is None else 1
    low = None if minimum is None else per_band("minimum", minimum, bands)
    high = None if maximum is None else per_band("maximum", maximum, bands)
    if _is_counted(work.image):
        parts = _parts(work, functools.partial(_block_statistics, band))
        return _gathered(parts, _merge_statistics, functools.partial(_histogram_of_counts, bins, low, high))
    edges: Any = _extremes(work, band, functools.partial(_edges, low, high))
    parts = _parts(work, functools.partial(_block_counts, band, bins or summary._BINS), edges=edges)
    return delayed(_histogram_of_samples, pure=True)(_gathered(parts, sum, _itself), edges)


def _extremes(work: Work, band: int | None, finish: Callable[[Any], Any]) -> Delayed:
    parts = _parts(work, functools.partial(_block_extremes, band))
    return _gathered(parts, _merge_extremes, finish)


def _operands_of_block(band: int | None, image: Any, mask: Any) -> tuple[np.ndarray, np.ndarray | None]:
    samples = image_of("image", _block(image))
    return samples if band is None else np.ascontiguousarray(samples[..., band]), _block(mask)


def _block_statistics(band: int | None, image: Any, mask: Any = None) -> summary.Statistics:
    samples, valid = _operands_of_block(band, image, mask)
    return summary.statistics(samples, mask=valid)


def _block_extremes(band: int | None, image: Any, mask: Any = None) -> tuple[np.ndarray, np.ndarray]:
    return summary.extremes(*_operands_of_block(band, image, mask))


def _block_counts(
    band: int | None, bins: int, image: Any, mask: Any = None, *, edges: tuple[np.ndarray, np.ndarray]
) -> np.ndarray:
    """The counts in the bins between the edges, not yet divided for the percentile functions."""
    samples, valid = _operands_of_block(band, image, mask)
    low, high = edges
    counts = np.zeros((low.size, bins), np.int64)
    for pixels in summary._valid_pixels(samples, valid):
        by_band = pixels.reshape(-1, low.size).astype(np.float32, copy=False)
        for number in range(low.size):
            counts[number] += summary.binned(by_band[:, number], bins, low[number], high[number])
    return counts


def _merge_extremes(parts: list[tuple[np.ndarray, np.ndarray]]) -> tuple[np.ndarray, np.ndarray]:
    least, greatest = zip(*parts)
    return np.minimum.reduce(least), np.maximum.reduce(greatest)


def _edges(low: Any, high: Any, extremes: tuple[np.ndarray, np.ndarray]) -> tuple[np.ndarray, np.ndarray]:
    """Where the bins of each band begin and end."""
    least, greatest = extremes
    empty = least > greatest
    edges = summary._edges(low, least, empty), summary._edges(high, greatest, empty)
    summary._require_order(*edges)
    return edges


def _histogram_of_counts(
    bins: int | None, low: Any, high: Any, counted: summary.Statistics
) -> summary.Histogram:
    return summary.histogram_of_counts(counted, bins, low, high)


def _histogram_of_samples(counts: np.ndarray, edges: tuple[np.ndarray, np.ndarray]) -> summary.Histogram:
    return summary.Histogram(summary.fitting_counts(counts), *edges)


# ---- stretches


def _stretch(work: Work) -> da.Array:
    """Blocks that share the bounds or the histogram of the whole image."""
    if work.described.name == "normalize":
        return _normalize(work)
    given = work.arguments["histogram"]
    if given is None:
        band = 2 if work.described.name == "intensity_percentile" else None
        given = _histogram_of(work, band)
    # In the graph once, not in each block's task.
    return _map(work, histogram=delayed(given))


def _normalize(work: Work) -> da.Array:
    missing = [name for name in ("minimum", "maximum") if work.arguments[name] is None]
    if not missing:
        return _map(work)
    bounds = _extremes(work, None, _bounds)
    return _map(work, **{name: bounds[("minimum", "maximum").index(name)] for name in missing})


def _bounds(extremes: tuple[np.ndarray, np.ndarray]) -> tuple[list[float], list[float]]:
    least, greatest = extremes
    empty = least > greatest
    return np.where(empty, 0, least).tolist(), np.where(empty, 0, greatest).tolist()


# ---- geometry


def _mirror(work: Work) -> da.Array:
    """Mirrored blocks in the reverse order; a window or a mask may move pixels between any two blocks."""
    window, masked = work.arguments["window"], "mask" in work.operands
    if window is not None:
        window = geometry._window_of(window, work.image)
    if work.arguments["crop"] and masked:
        raise value_error("mask", "given with crop=True", "None, since all of the window is mirrored")
    if work.arguments["crop"]:
        return _mirror_blocks(_cropped(work, window))
    return _mirror_blocks(work) if window is None and not masked else _map(_in_one_block(work))


def _cropped(work: Work, window: tuple[int, ...] | None) -> Work:
    x, y, width, height = window or (0, 0, work.image.shape[1], work.image.shape[0])
    part = work.image[y : y + height, x : x + width]
    return replace(
        work, arguments={**work.arguments, "window": None, "crop": False}, operands={"image": part}
    )


def _mirror_blocks(work: Work) -> da.Array:
    mirrored = _map(work)
    return mirrored.blocks[:, ::-1] if work.arguments["axis"].lower() == "vert" else mirrored.blocks[::-1]


def _transfer(work: Work) -> da.Array:
    """Blocks that each come from one block of the image."""
    rows, columns = (_runs(_sources(work, axis), work.image.chunks[axis]) for axis in (0, 1))
    function = functools.partial(_transfer_block, work.block_function)
    name = "gridmill-transfer-" + tokenize(function, [array.name for array in work.operands.values()])
    last = (0,) * (work.trial.ndim - 2)
    layer = {}
    for i, row in enumerate(rows):
        for j, column in enumerate(columns):
            keys = [
                (array.name, row.chunk, column.chunk) + (0,) * (array.ndim - 2)
                for array in work.operands.values()
            ]
            layer[(name, i, j, *last)] = (function, list(row), list(column), *keys)
    graph = HighLevelGraph.from_collections(name, layer, dependencies=list(work.operands.values()))
    chunks = tuple(tuple(run.count for run in runs) for runs in (rows, columns))
    bands = tuple((size,) for size in work.trial.shape[2:])
    return da.Array(graph, name, chunks + bands, meta=np.empty((0,) * work.trial.ndim, work.trial.dtype))


class Run(NamedTuple):
    """Pixels of the result that follow each other and come from one chunk of the image, on one axis."""

    first: int
    count: int
    chunk: int
    start: int  #: of the chunk, in the image


def _sources(work: Work, axis: int) -> np.ndarray:
    """Where each row or column of the result is taken from: the operator itself transfers their numbers."""
    extent = work.image.shape[axis]
    shape = geometry._size_of(work.arguments["shape"], work.arguments["out_region"])
    numbers = np.arange(extent, dtype=np.uint32).reshape((-1, 1) if axis == 0 else (1, -1))
    line = (shape[0], 1) if axis == 0 else (1, shape[1])
    asked = {**work.arguments, "shape": line, "dtype": None, "fill": 0, "image": numbers, "mask": None}
    return work.described.call(**asked).ravel()


def _runs(sources: np.ndarray, chunks: Chunks) -> list[Run]:
    """The result's chunks: cut where the source chunk changes, none longer than the longest of the image."""
    ends = np.cumsum(chunks)
    held = np.searchsorted(ends, sources, side="right")
    cuts = [0, *(np.flatnonzero(np.diff(held)) + 1).tolist(), len(held)]
    longest = max(chunks)
    runs = []
    for begin, end in zip(cuts, cuts[1:]):
        chunk = int(held[begin]) if end > begin else 0
        start = int(ends[chunk]) - chunks[chunk]
        runs += [Run(first, min(longest, end - first), chunk, start) for first in range(begin, end, longest)]
    return runs or [Run(0, 0, 0, 0)]


def _transfer_block(
    run: functools.partial, row: Sequence[int], column: Sequence[int], *blocks: Any
) -> np.ndarray:
    """A block of the result. Image and result are pieces of larger ones, which the origins say."""
    function, names, arguments = run.args
    row, column = Run(*row), Run(*column)
    in_x, in_y = arguments["in_origin"]
    out_x, out_y = arguments["out_origin"]
    piece = {
        "shape": (row.count, column.count),
        "in_origin": (in_x + column.start, in_y + row.start),
        "out_origin": ((out_x + column.first) % _WRAP, (out_y + row.first) % _WRAP),
    }
    return run.func(function, names, {**arguments, **piece}, *blocks)


_WAYS: dict[str, Callable[[Work], Any]] = {
    "map": _map,
    "overlap": _overlap,
    "statistics": _statistics,
    "histogram": _histogram,
    "stretch": _stretch,
    "mirror": _mirror,
    "transfer": _transfer,
    "whole": _of_whole,
}
