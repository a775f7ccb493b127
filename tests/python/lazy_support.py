"""What the tests of dask arrays and DataArrays share: calls of all public functions, and a comparison."""

from __future__ import annotations

from typing import Any, Callable, NamedTuple

import dask.array as da
import numpy as np

import gridmill

TEN_TYPES = ("int8", "uint8", "int16", "uint16", "int32", "uint32", "int64", "uint64", "float32", "float64")
SHORT_TYPES = ("uint8", "int16", "uint16", "float32")


class Case(NamedTuple):
    """How a function can be called."""

    call: Callable[..., Any]  #: with the rasters and masks by name
    bands: tuple[int, ...]  #: of an image; 0 is an image of two dimensions
    reference: int = -1  #: bands of the reference beyond those of the image; -1 is none
    masks: tuple[str, ...] = ("mask",)
    types: tuple[str, ...] = TEN_TYPES
    raster: str = "image"


def _with(function: Callable[..., Any], *args: Any, **kwargs: Any) -> Callable[..., Any]:
    def call(**operands: Any) -> Any:
        image = operands.pop("image") if "image" in operands else operands.pop("elevation")
        return function(image, *args, **kwargs, **operands)

    return call


def _two(function: Callable[..., Any], **kwargs: Any) -> Callable[..., Any]:
    return lambda image, reference, **masks: function(image, reference, **kwargs, **masks)


def _indices(image: Any, **masks: Any) -> Any:
    return gridmill.vegetation_indices(["NDVI", "gemi", "DVI"], image, bands={"red": 1, "nir": 0}, **masks)


def _indices_of_bands(image: Any, **masks: Any) -> Any:
    return gridmill.vegetation_indices("MTVI1", bands={"red": image, "green": image, "nir": image}, **masks)


_TERRAIN = {"raster": "elevation"}
_COLOURS = {"minimum": [5, 5, -500], "maximum": [90, 90, 500], "background": [7, 8, 9]}
_BOTH = ("mask", "reference_mask")

CASES: dict[str, Case] = {
    "slope": Case(_with(gridmill.slope, cellsize=(3, 2), background=-5), (0, 1, 3), **_TERRAIN),
    "slope reflect": Case(_with(gridmill.slope, cellsize=9, edge="reflect"), (0, 2), **_TERRAIN),
    "slope number": Case(_with(gridmill.slope, cellsize=9, edge=100, z_factor=2), (0, 2), **_TERRAIN),
    "slope uint8": Case(_with(gridmill.slope, cellsize=(3, 2), dtype="uint8"), (0,), **_TERRAIN),
    "aspect": Case(_with(gridmill.aspect, cellsize=(3, 2), background=-5), (0, 1), **_TERRAIN),
    "aspect reflect": Case(_with(gridmill.aspect, cellsize=(3, 2), edge="reflect"), (0, 1), **_TERRAIN),
    "aspect number": Case(_with(gridmill.aspect, cellsize=9, edge=0, flat=1), (0, 1), **_TERRAIN),
    "average_channels": Case(_with(gridmill.average_channels, nodata=3), (0, 1, 5)),
    "threshold": Case(_with(gridmill.threshold, 10, 60), (0, 1)),
    "range_classes": Case(_with(gridmill.range_classes, [(0, 20), (10, 70)], nodata=3), (0, 1)),
    "normalize": Case(_with(gridmill.normalize), (0, 3)),
    "normalize bounds": Case(_with(gridmill.normalize, 5, 90, nodata=-1), (0, 3)),
    "normalize one bound": Case(_with(gridmill.normalize, maximum=50), (0, 2)),
    "percentile_stretch": Case(_with(gridmill.percentile_stretch, nodata=-1), (0, 2)),
    "percentile_stretch given": Case(
        _with(
            gridmill.percentile_stretch,
            gridmill.Histogram(np.array([[5, 1, 9, 3]]), np.array([5]), np.array([90])),
        ),
        (0, 1),
    ),
    "intensity_percentile": Case(_with(gridmill.intensity_percentile, sign="forward"), (3,)),
    "mirror": Case(_with(gridmill.mirror, "VERT"), (0, 2), masks=()),
    "mirror rows": Case(_with(gridmill.mirror, "hori", dtype="float32"), (0, 1), masks=()),
    "mirror window": Case(_with(gridmill.mirror, "vert", window=(0, 0, 1, 1)), (0, 2), masks=()),
    "mirror crop": Case(_with(gridmill.mirror, "hori", window=(0, 0, 1, 1), crop=True), (0, 2), masks=()),
    "vegetation_indices": Case(_indices, (2, 4)),
    "vegetation_indices of bands": Case(_indices_of_bands, (0,)),
    "squared_gradient": Case(_with(gridmill.squared_gradient), (0, 2)),
    "vollath": Case(_with(gridmill.vollath), (0, 2)),
    "difference": Case(_two(gridmill.difference), (0, 2), 1),
    "channel_difference": Case(_two(gridmill.channel_difference, nodata=3, form="forward"), (0, 2), 1),
    "channel_difference_two_masks": Case(
        _two(gridmill.channel_difference_two_masks, nodata=3), (0, 2), 1, _BOTH, SHORT_TYPES
    ),
    "channel_ratio": Case(_two(gridmill.channel_ratio, nodata=3), (0, 2), 1, types=SHORT_TYPES),
    "channel_ratio_two_masks": Case(
        _two(gridmill.channel_ratio_two_masks, reference_nodata=3), (0, 2), 1, _BOTH, SHORT_TYPES
    ),
    "combine": Case(_two(gridmill.combine, fill=7), (0, 2), 1),
    "intensity_ratio": Case(_two(gridmill.intensity_ratio, nodata=3), (0, 2), 1),
    "magnitude_change": Case(_two(gridmill.magnitude_change, form="backward"), (0, 2), 1),
    "tasseled_cap_change": Case(
        _two(gridmill.tasseled_cap_change, sensor="QuickBird", component="brightness"), (4,), 0
    ),
    "statistics": Case(_with(gridmill.statistics), (0, 2)),
    "statistics blue": Case(_with(gridmill.statistics, synthetic_blue=True), (3,)),
    "histogram": Case(_with(gridmill.histogram), (0, 2)),
    "histogram bins": Case(_with(gridmill.histogram, bins=7, minimum=-200), (0, 2)),
    "histogram range": Case(_with(gridmill.histogram, minimum=5, maximum=[60]), (0, 1)),
    "transfer": Case(_with(gridmill.transfer, (1, 0, 5, 7), (0, 2, 9, 4), shape=(17, 15)), (0, 2)),
    "transfer pieces": Case(
        _with(
            gridmill.transfer,
            (20, 10, 6, 7),
            (3, 3, 30, 4),
            in_origin=(21, 9),
            out_origin=(4, 2),
            fill=9,
            dtype="float64",
        ),
        (0, 2),
    ),
    "synthetic_blue": Case(_with(gridmill.synthetic_blue, **_COLOURS), (3, 4)),
    "natural_color": Case(_with(gridmill.natural_color, **_COLOURS, scale=[1, 2, 3]), (3,)),
}


def samples_of(generator: np.random.Generator, shape: tuple[int, ...], dtype: str, kind: str) -> np.ndarray:
    """Samples with many equal ones ("few"), over the range of the type ("wide"), or with NaN ("special")."""
    kind_of_type = np.dtype(dtype).kind
    if kind == "wide":
        if kind_of_type == "f":
            return (generator.standard_normal(shape) * 10.0 ** generator.integers(-3, 9)).astype(dtype)
        limits = np.iinfo(dtype)
        return generator.integers(limits.min, limits.max, shape, dtype=dtype, endpoint=True)
    samples = generator.integers(0 if kind_of_type == "u" else -30, 100, shape).astype(dtype)
    if kind == "special" and kind_of_type == "f":
        samples = samples / np.dtype(dtype).type(3)
        samples[generator.random(shape) < 0.1] = np.nan
    return samples


def operands_of(
    case: Case,
    generator: np.random.Generator,
    size: tuple[int, int],
    bands: int,
    dtype: str,
    kind: str,
    masks: bool,
) -> dict[str, np.ndarray]:
    """Rasters and masks for a call."""
    last = (bands,) if bands else ()
    operands = {case.raster: samples_of(generator, size + last, dtype, kind)}
    if case.reference >= 0:
        more = (max(bands, 1) + case.reference,) if bands or case.reference else ()
        operands["reference"] = samples_of(generator, size + more, dtype, kind)
    if masks:
        operands.update((name, generator.random(size) < 0.8) for name in case.masks)
    return operands


def lazy(array: np.ndarray, chunks: tuple[Any, Any]) -> da.Array:
    """A dask array in these chunks, with the bands one by one."""
    return da.from_array(array, chunks=chunks + (1,) * (array.ndim - 2))


def parts_of(result: Any) -> tuple[Any, ...]:
    return result if isinstance(result, tuple) else (result,)


def assert_same(result: Any, expected: Any) -> None:
    """Equal to the bit, type and shape included."""
    assert type(result) is type(expected)
    for part, wanted in zip(parts_of(result), parts_of(expected)):
        assert part.dtype == wanted.dtype
        assert part.shape == wanted.shape
        if part.tobytes() != wanted.tobytes():
            np.testing.assert_array_equal(part, wanted)
            raise AssertionError("equal values of other bits")
