"""The public functions on DataArrays: dimensions, coordinates and attributes around the plain functions."""

from __future__ import annotations

import re
from dataclasses import dataclass
from typing import Any, Sequence

import numpy as np
import xarray as xr

from ._arrays import RasterFunction, is_labelled, is_lazy
from .bands import _INDICES, _code_of

_BAND_NAMES = ("band", "bands", "channel", "wavelength", "variable")
_COLUMN_NAMES = ("x", "lon", "longitude", "easting")
_ROW_NAMES = ("y", "lat", "latitude", "northing")
_DEGREE_NAMES = ("lon", "lat", "longitude", "latitude")
_DEGREE_UNITS = re.compile(r"(arc_?)?deg(ree)?s?(_?(north|east|south|west|n|e|s|w))?|°", re.IGNORECASE)
#: Functions whose result has the input's bands, in their order and of their meaning.
_SAME_BANDS = (
    "slope",
    "normalize",
    "percentile_stretch",
    "mirror",
    "transfer",
    "channel_difference",
    "channel_difference_two_masks",
    "channel_ratio",
    "channel_ratio_two_masks",
)
#: Codes known without a library that reads the registry.
_GEOGRAPHIC_CODES = (4148, 4167, 4258, 4267, 4269, 4283, 4326, 4490, 4617, 4674, 4979, 7844)


@dataclass(frozen=True)
class Layout:
    """Which dimension of a DataArray is what."""

    row: str
    column: str
    band: str | None

    def order(self) -> tuple[str, ...]:
        """The plain functions' order of the dimensions."""
        return (self.row, self.column) if self.band is None else (self.row, self.column, self.band)


def call(described: RasterFunction, arguments: dict[str, Any]) -> Any:
    """Call a public function whose arguments hold a DataArray."""
    if arguments.get("out") is not None:
        raise TypeError("out: an array; expected None with DataArrays, whose results are new")
    frame_name, frame = _frame(described, arguments)
    if frame is None:
        return described.call(**_without_labels(described, arguments))
    layout = _layout(frame_name, frame)
    plain = {frame_name: _data(frame, layout)}
    for name, value in described.operands(arguments):
        if name != frame_name:
            plain[name] = _operand(described, name, value, frame_name, frame, layout)
    called = described.replaced(arguments, plain)
    if described.takes("cellsize") and called.get("cellsize") is None:
        called["cellsize"] = _cellsize(frame_name, frame, layout, called.get("z_factor") is not None)
    result = described.call(**called)
    if described.blocks in ("statistics", "histogram", "whole"):
        return result
    return _labelled(described, arguments, result, frame, layout)


def _frame(described: RasterFunction, arguments: dict[str, Any]) -> tuple[str, xr.DataArray | None]:
    """The raster that gives the result its coordinates: the first one."""
    rasters = [item for item in described.operands(arguments) if not described.is_mask(item[0])]
    labelled = [is_labelled(value) for _, value in rasters]
    if not any(labelled):
        return "", None
    if not labelled[0]:
        raise TypeError(f"{rasters[0][0]}: a plain array beside a DataArray; expected a DataArray too")
    return rasters[0]


def _without_labels(described: RasterFunction, arguments: dict[str, Any]) -> dict[str, Any]:
    """Masks without their coordinates, for rasters that have none."""
    operands = described.operands(arguments)
    return described.replaced(arguments, {n: v.data if is_labelled(v) else v for n, v in operands})


# ---- dimensions


def _layout(name: str, array: xr.DataArray) -> Layout:
    dims = [str(dim) for dim in array.dims]
    if len(dims) not in (2, 3):
        raise ValueError(
            f"{name}: dimensions ({', '.join(dims)}); expected (y, x), (y, x, band) or (band, y, x)"
        )
    band = None
    if len(dims) == 3:
        named = [dim for dim in dims if dim.lower() in _BAND_NAMES]
        band = named[0] if named else dims[2]
    row, column = (dim for dim in dims if dim != band)
    if row.lower() in _COLUMN_NAMES or column.lower() in _ROW_NAMES:
        raise ValueError(
            f"{name}: dimensions ({', '.join(dims)}); expected rows before columns, as after "
            f".transpose({column!r}, {row!r}, ...)"
        )
    return Layout(row, column, band)


def _data(array: xr.DataArray, layout: Layout) -> Any:
    """The samples in the plain functions' order."""
    data = array.transpose(*layout.order()).data
    return data if is_lazy(data) else np.asarray(data)


def _operand(
    described: RasterFunction, name: str, value: Any, frame_name: str, frame: xr.DataArray, layout: Layout
) -> Any:
    """Another raster or a mask, on the coordinates of the first raster."""
    if not is_labelled(value):
        return value
    if described.is_mask(name):
        own = Layout(layout.row, layout.column, None)
        if set(value.dims) != {own.row, own.column}:
            raise ValueError(f"{name}: dimensions {value.dims}; expected {(own.row, own.column)}")
    else:
        own = _layout(name, value)
        if (own.row, own.column) != (layout.row, layout.column):
            raise ValueError(
                f"{name}: dimensions {value.dims}; expected {layout.row!r} and {layout.column!r} "
                f"as {frame_name} has"
            )
    for dim in (layout.row, layout.column):
        _check_same_coordinates(name, value, frame_name, frame, dim)
    return _data(value, own)


def _check_same_coordinates(
    name: str, value: xr.DataArray, frame_name: str, frame: xr.DataArray, dim: str
) -> None:
    if value.sizes[dim] != frame.sizes[dim]:
        raise ValueError(
            f"{name}: {value.sizes[dim]} entries along {dim!r}; expected {frame.sizes[dim]} as "
            f"{frame_name} has"
        )
    if dim in value.coords and dim in frame.coords:
        if not np.array_equal(value.coords[dim].values, frame.coords[dim].values):
            raise ValueError(
                f"{name}: other coordinates along {dim!r} than {frame_name}; expected the same "
                "(nothing is aligned here: reindex or interpolate first)"
            )


# ---- cell size


def _cellsize(name: str, frame: xr.DataArray, layout: Layout, scaled: bool) -> tuple[float, float]:
    """The distances of columns and rows, always above 0: either axis may fall."""
    evidence = None if scaled else _degrees(frame, layout)
    if evidence is not None:
        raise ValueError(
            f"{name}: coordinates in degrees ({evidence}); expected those in the unit of the elevations: "
            "reproject, or give cellsize=(dx, dy) in metres, or a z_factor that turns elevations into "
            "degrees, for metres near a latitude 1 / (111320 * cos(latitude))"
        )
    return _step(name, frame, layout.column), _step(name, frame, layout.row)


def _step(name: str, frame: xr.DataArray, dim: str) -> float:
    remedy = "expected evenly spaced numbers to read the cell size from, or cellsize=(dx, dy)"
    if dim not in frame.coords:
        raise ValueError(f"{name}: no coordinate {dim!r}; {remedy}")
    values = frame.coords[dim].values
    if values.dtype.kind not in "iuf" or len(values) < 2 or not np.isfinite(values).all():
        raise ValueError(f"{name}: coordinate {dim!r} of {len(values)} {values.dtype} entries; {remedy}")
    numbers = values.astype(np.float64)
    step = (numbers[-1] - numbers[0]) / (len(numbers) - 1)
    off = np.abs(numbers - (numbers[0] + step * np.arange(len(numbers)))).max()
    if step == 0 or off > 1e-3 * abs(step) + _resolution(values):
        raise ValueError(f"{name}: coordinate {dim!r} is not evenly spaced; {remedy}")
    return abs(float(step))


def _resolution(values: np.ndarray) -> float:
    """How far rounding alone takes floating coordinates from even steps."""
    if values.dtype.kind != "f":
        return 0.0
    return 2.0 * float(np.finfo(values.dtype).eps) * float(np.abs(values).max())


def _degrees(frame: xr.DataArray, layout: Layout) -> str | None:
    """What says that the coordinates are degrees, or None."""
    for dim in (layout.column, layout.row):
        units = str(frame.coords[dim].attrs.get("units", "")) if dim in frame.coords else ""
        if _DEGREE_UNITS.fullmatch(units.strip()):
            return f"{dim!r} has the units {units!r}"
        if dim.lower() in _DEGREE_NAMES:
            return f"a dimension is named {dim!r}"
    for place, value in _reference_systems(frame):
        if _is_geographic(value):
            return f"{place} is a geographic reference system"
    return None


def _reference_systems(frame: xr.DataArray) -> list[tuple[str, Any]]:
    found = [
        (f"attribute {key!r}", frame.attrs[key])
        for key in ("crs", "spatial_ref", "crs_wkt")
        if key in frame.attrs
    ]
    names = ["spatial_ref", "crs", frame.attrs.get("grid_mapping"), frame.encoding.get("grid_mapping")]
    for name in dict.fromkeys(name for name in names if name in frame.coords):
        attrs = frame.coords[name].attrs
        keys = ("crs_wkt", "spatial_ref", "grid_mapping_name")
        found += [(f"coordinate {name!r}", attrs[key]) for key in keys if key in attrs]
    return found


def _is_geographic(system: Any) -> bool:
    known = getattr(system, "is_geographic", None)
    if isinstance(known, bool):
        return known
    text = str(system).upper()
    code = re.fullmatch(r"\s*(?:\+INIT=|URN:OGC:DEF:CRS:)?EPSG:(?:[0-9.]*:)?(\d+)\s*|\s*(\d+)\s*", text)
    if code:
        return int(code.group(1) or code.group(2)) in _GEOGRAPHIC_CODES
    if "PROJCS[" in text or "PROJCRS[" in text:
        return False
    marks = (
        "GEOGCS[",
        "GEOGCRS[",
        "GEODCRS[",
        "GEOGRAPHICCRS[",
        "+PROJ=LONGLAT",
        "+PROJ=LATLONG",
        "LATITUDE_LONGITUDE",
        "OGC:CRS84",
    )
    return any(mark in text for mark in marks)


# ---- results


def _labelled(
    described: RasterFunction, arguments: dict[str, Any], result: Any, frame: xr.DataArray, layout: Layout
) -> xr.DataArray:
    """The result with what is known of the first raster."""
    coordinates = _spatial_coordinates(described, arguments, result, frame, layout)
    dims = [layout.row, layout.column]
    if result.ndim == 3:
        band = layout.band or "band"
        dims.append(band)
        coordinates = _band_coordinates(described, arguments, result.shape[2], coordinates, frame, band)
    elif layout.band is not None:
        coordinates = _without_dimension(coordinates, layout.band)
    array = xr.DataArray(result, dims=dims, coords=dict(coordinates.variables), attrs=frame.attrs)
    array.name = frame.name if arguments.get(described.rasters[0]) is frame else None
    if layout.band is not None and result.ndim == 3:
        array = array.transpose(*frame.dims)
    return array


def _spatial_coordinates(
    described: RasterFunction, arguments: dict[str, Any], result: Any, frame: xr.DataArray, layout: Layout
) -> xr.Dataset:
    """The coordinates of the result's rows and columns, with all others of the first raster."""
    coordinates = frame.coords.to_dataset()
    if described.takes("margin") and arguments["margin"]:
        return _part(coordinates, layout, slice(1, -1), slice(1, -1))
    if described.blocks == "mirror" and arguments["crop"] and arguments["window"] is not None:
        x, y, width, height = (int(number) for number in arguments["window"])
        return _part(coordinates, layout, slice(y, y + height), slice(x, x + width))
    if described.blocks == "transfer":
        return _transferred(arguments, result, coordinates, layout)
    return coordinates


def _part(coordinates: xr.Dataset, layout: Layout, rows: slice, columns: slice) -> xr.Dataset:
    return coordinates.isel({layout.row: rows, layout.column: columns}, missing_dims="ignore")


def _transferred(
    arguments: dict[str, Any], result: Any, coordinates: xr.Dataset, layout: Layout
) -> xr.Dataset:
    """Even coordinates go on evenly at the new scale; all others along rows and columns are left out."""
    axes = {}
    for axis, dim in enumerate((layout.column, layout.row)):
        if dim in coordinates.variables and coordinates.variables[dim].dtype.kind in "iuf":
            values = coordinates.variables[dim].values.astype(np.float64)
            positions = _source_positions(arguments, axis, result.shape[1 - axis])
            if positions is not None and len(values) > 1 and _is_even(values):
                step = (values[-1] - values[0]) / (len(values) - 1)
                axes[dim] = (dim, values[0] + step * positions, coordinates.variables[dim].attrs)
    for dim in (layout.row, layout.column):
        coordinates = _without_dimension(coordinates, dim)
    return coordinates.assign_coords(axes)


def _is_even(values: np.ndarray) -> bool:
    steps = np.diff(values)
    return bool(np.isfinite(values).all() and np.ptp(steps) <= 1e-3 * abs(steps.mean()))


def _source_positions(arguments: dict[str, Any], axis: int, count: int) -> np.ndarray | None:
    """Where pixels of the result come from, as positions along the input; None without a scale."""
    source, target = arguments["in_region"], arguments["out_region"]
    if not source[axis + 2] or not target[axis + 2]:
        return None
    whole = np.arange(count) + (arguments["out_origin"][axis] - target[axis])
    scale = target[axis + 2] / source[axis + 2]
    return whole / scale + (source[axis] - arguments["in_origin"][axis])


def _without_dimension(coordinates: xr.Dataset, dim: str) -> xr.Dataset:
    return coordinates.drop_vars([name for name, held in coordinates.variables.items() if dim in held.dims])


# ---- bands


def _band_coordinates(
    described: RasterFunction,
    arguments: dict[str, Any],
    bands: int,
    coordinates: xr.Dataset,
    frame: xr.DataArray,
    band: str,
) -> xr.Dataset:
    if described.name in _SAME_BANDS and frame.sizes.get(band) == bands:
        return coordinates
    coordinates = _without_dimension(coordinates, band).drop_vars(band, errors="ignore")
    names = _result_bands(described, arguments, frame, band)
    return coordinates.assign_coords({band: list(names)}) if len(names) == bands else coordinates


def _result_bands(
    described: RasterFunction, arguments: dict[str, Any], frame: xr.DataArray, band: str
) -> Sequence[str]:
    """What the result's bands are called."""
    if described.name == "vegetation_indices":
        return _index_names(arguments["indices"])
    if described.name == "tasseled_cap_change":
        component = arguments["component"]
        return f"image_{component}", f"reference_{component}", "difference"
    if described.name == "intensity_percentile":
        return *_input_bands(frame, band), "percentile"
    if described.name == "combine":
        dates = {"image": _input_bands(frame, band), "reference": _reference_bands(arguments["reference"])}
        return [f"{date}_{name}" for date, names in dates.items() for name in names]
    return {
        "natural_color": ("red", "green", "blue"),
        "intensity_ratio": ("image_mean", "reference_mean", "ratio_db", "zero"),
        "magnitude_change": ("image_magnitude", "reference_magnitude", "difference"),
    }.get(described.name, ())


def _input_bands(frame: xr.DataArray, band: str) -> list[str]:
    if band in frame.coords and frame.coords[band].dims == (band,):
        return [str(name) for name in frame.coords[band].values]
    return [str(number) for number in range(1, frame.sizes.get(band, 1) + 1)]


def _reference_bands(reference: Any) -> list[str]:
    if is_labelled(reference):
        return _input_bands(reference, _layout("reference", reference).band or "band")
    return [str(number) for number in range(1, (*reference.shape, 1)[2] + 1)]


def _index_names(indices: Any) -> list[str]:
    asked = indices if isinstance(indices, (list, tuple)) else [indices]
    return [_INDICES[_code_of(index)] for index in asked]
