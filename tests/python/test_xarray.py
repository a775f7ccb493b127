"""DataArrays: coordinates and attributes stay, cell sizes are read, nothing is aligned silently."""

from __future__ import annotations

from typing import Any

import dask.array as da
import numpy as np
import pytest
import xarray as xr

import gridmill
from lazy_support import assert_same

GENERATOR = np.random.default_rng(11)
HEIGHTS = GENERATOR.integers(0, 500, (5, 4)).astype("float32")
BANDS = GENERATOR.integers(0, 200, (5, 4, 3)).astype("uint8")
X, Y = 600_015.0 + 30 * np.arange(4), 5_000_010.0 - 20 * np.arange(5)


def terrain(**coords: Any) -> xr.DataArray:
    return xr.DataArray(
        HEIGHTS,
        dims=("y", "x"),
        coords={"y": Y, "x": X, "spatial_ref": 0, **coords},
        attrs={"source": "survey", "nodata": -1},
        name="elevation",
    )


def scene(order: tuple[str, ...] = ("y", "x", "band"), band: str = "band", **coords: Any) -> xr.DataArray:
    array = xr.DataArray(
        BANDS,
        dims=("y", "x", band),
        attrs={"source": "camera"},
        coords={"y": Y, "x": X, band: ["nir", "red", "green"], "time": 7, **coords},
    )
    return array.transpose(*order)


# ---- coordinates and attributes


def test_slope_keeps_what_is_known_and_reads_the_cell_size() -> None:
    result = gridmill.slope(terrain())
    assert_same(result.values, gridmill.slope(HEIGHTS, cellsize=(30, 20)))
    assert result.attrs == {"source": "survey", "nodata": -1} and result.name == "elevation"
    xr.testing.assert_identical(result.coords.to_dataset(), terrain().coords.to_dataset())


@pytest.mark.parametrize("y", [Y, Y[::-1], Y.astype("int64")], ids=["falling", "rising", "whole"])
def test_either_direction_of_an_axis_gives_one_cell_size(y: np.ndarray) -> None:
    array = terrain().assign_coords(y=y, x=X[::-1])
    assert_same(gridmill.aspect(array).values, gridmill.aspect(HEIGHTS, cellsize=(30, 20)))


def test_coordinates_in_single_precision_are_even() -> None:
    x = (600_000 + 0.1 * np.arange(4)).astype("float32")
    assert len(set(np.diff(x))) > 1
    array = terrain().assign_coords(x=x)
    step = float(x[-1] - x[0]) / 3
    assert_same(gridmill.slope(array).values, gridmill.slope(HEIGHTS, cellsize=(step, 20)))


def test_a_given_cell_size_prevails() -> None:
    array = terrain().drop_vars(["x", "y"])
    assert_same(gridmill.slope(array, cellsize=7).values, gridmill.slope(HEIGHTS, cellsize=7))
    assert_same(gridmill.slope(terrain(), cellsize=7).values, gridmill.slope(HEIGHTS, cellsize=7))


@pytest.mark.parametrize(
    "change",
    [
        lambda array: array.drop_vars("x"),
        lambda array: array.assign_coords(x=[0, 1, 2, 4]),
        lambda array: array.assign_coords(x=[0.0, 1.0, np.nan, 3.0]),
        lambda array: array.assign_coords(x=[5, 5, 5, 5]),
        lambda array: array.assign_coords(x=list("abcd")),
        lambda array: array[:, :1],
    ],
    ids=["none", "uneven", "nan", "equal", "text", "single"],
)
@pytest.mark.parametrize("function", [gridmill.slope, gridmill.aspect])
def test_uneven_coordinates_are_refused(change: Any, function: Any) -> None:
    with pytest.raises(ValueError, match=r"^elevation: .*'x'.*; expected evenly spaced.*cellsize="):
        function(change(terrain()))


def test_the_margin_loses_its_coordinates() -> None:
    result = gridmill.slope(terrain(), margin=1)
    assert_same(result.values, gridmill.slope(HEIGHTS, cellsize=(30, 20), margin=1))
    assert result.x.values.tolist() == X[1:-1].tolist() and result.y.values.tolist() == Y[1:-1].tolist()


# ---- degrees


WKT = 'GEOGCS["WGS 84",DATUM["WGS_1984",SPHEROID["WGS 84",6378137,298.257223563]]]'
PROJECTED = f'PROJCS["UTM zone 33N",{WKT},PROJECTION["Transverse_Mercator"]]'


class System:
    is_geographic = True


DEGREES = {
    "units": lambda array: array.assign_coords(x=("x", X, {"units": "degrees_east"})),
    "unit of y": lambda array: array.assign_coords(y=("y", Y, {"units": "degree_north"})),
    "degree": lambda array: array.assign_coords(y=("y", Y, {"units": "degree"})),
    "names": lambda array: array.rename(x="lon", y="lat"),
    "long names": lambda array: array.rename(x="Longitude", y="Latitude"),
    "crs code": lambda array: array.assign_attrs(crs="EPSG:4326"),
    "crs init": lambda array: array.assign_attrs(crs="+init=epsg:4326"),
    "crs object": lambda array: array.assign_attrs(crs=System()),
    "spatial_ref": lambda array: array.assign_coords(spatial_ref=((), 0, {"crs_wkt": WKT})),
    "spatial_ref text": lambda array: array.assign_attrs(spatial_ref=WKT),
    "grid mapping": lambda array: array.assign_coords(
        crs=((), 0, {"grid_mapping_name": "latitude_longitude"})
    ),
}
METRES = {
    "units": lambda array: array.assign_coords(x=("x", X, {"units": "metre"})),
    "code": lambda array: array.assign_attrs(crs="EPSG:32633"),
    "text": lambda array: array.assign_coords(spatial_ref=((), 0, {"crs_wkt": PROJECTED})),
    "none": lambda array: array,
}


@pytest.mark.parametrize("change", DEGREES.values(), ids=DEGREES)
@pytest.mark.parametrize("function", [gridmill.slope, gridmill.aspect])
def test_degrees_need_a_factor(change: Any, function: Any) -> None:
    array = change(terrain())
    with pytest.raises(
        ValueError, match=r"^elevation: coordinates in degrees.*; expected.*cellsize.*z_factor"
    ):
        function(array)
    expected = function(HEIGHTS, cellsize=(30, 20), z_factor=2)
    assert_same(function(array, z_factor=2).values, expected)
    assert_same(function(array, cellsize=9).values, function(HEIGHTS, cellsize=9))


@pytest.mark.parametrize("change", METRES.values(), ids=METRES)
def test_metres_need_none(change: Any) -> None:
    assert_same(gridmill.slope(change(terrain())).values, gridmill.slope(HEIGHTS, cellsize=(30, 20)))


# ---- the order of dimensions


ORDERS = [("y", "x", "band"), ("band", "y", "x"), ("y", "band", "x")]


@pytest.mark.parametrize("order", ORDERS)
def test_the_order_of_dimensions_comes_back(order: tuple[str, ...]) -> None:
    result = gridmill.normalize(scene(order))
    assert result.dims == order
    assert_same(np.ascontiguousarray(result.transpose("y", "x", "band").values), gridmill.normalize(BANDS))
    xr.testing.assert_identical(result.coords.to_dataset(), scene(order).coords.to_dataset())
    assert result.attrs == {"source": "camera"}


@pytest.mark.parametrize("name", ["band", "bands", "channel", "wavelength", "variable", "Band"])
def test_names_of_the_band_dimension(name: str) -> None:
    result = gridmill.average_channels(scene((name, "y", "x"), band=name))
    assert result.dims == ("y", "x") and set(result.coords) == {"y", "x", "time"}
    assert_same(result.values, gridmill.average_channels(BANDS))


def test_a_dimension_of_another_name_has_to_be_the_third() -> None:
    result = gridmill.average_channels(scene(("y", "x", "when"), band="when"))
    assert_same(result.values, gridmill.average_channels(BANDS))


@pytest.mark.parametrize(
    "array",
    [
        terrain().transpose("x", "y"),
        terrain().rename(x="lon", y="row").transpose("lon", "row"),
        terrain()[0],
        terrain().expand_dims(["a", "b"]),
    ],
)
def test_other_dimensions_are_refused(array: xr.DataArray) -> None:
    with pytest.raises(ValueError, match=r"^image: dimensions \(.*\); expected"):
        gridmill.threshold(array, 1, 2)


# ---- bands of the result


@pytest.mark.parametrize("order", ORDERS)
def test_indices_are_named(order: tuple[str, ...]) -> None:
    asked = ["savi", gridmill.core.VegetationIndex(4)]
    result = gridmill.vegetation_indices(asked, scene(order), bands={"nir": 0, "red": 1})
    assert result.dims == order and result.band.values.tolist() == ["SAVI", "NDVI"]
    expected = gridmill.vegetation_indices(["SAVI", "NDVI"], BANDS, bands={"nir": 0, "red": 1})
    assert_same(np.ascontiguousarray(result.transpose("y", "x", "band").values), expected)


def test_indices_of_separate_bands() -> None:
    single = {"nir": scene()[..., 0], "red": scene()[..., 1]}
    result = gridmill.vegetation_indices("NDVI", bands=single)
    assert result.dims == ("y", "x", "band") and result.band.values.tolist() == ["NDVI"]
    assert result.name is None and result.time == 7
    moved = {**single, "red": single["red"].assign_coords(x=X + 1)}
    with pytest.raises(ValueError, match=r"^bands\['red'\]: other coordinates along 'x'"):
        gridmill.vegetation_indices("NDVI", bands=moved)


def four() -> xr.DataArray:
    return xr.concat([scene(), scene()[..., :1]], "band").drop_vars("band")


NAMED = {
    "natural_color": (
        lambda: gridmill.natural_color(scene(), minimum=[0] * 3, maximum=[255] * 3, background=[-1] * 3),
        ["red", "green", "blue"],
    ),
    "intensity_percentile": (
        lambda: gridmill.intensity_percentile(scene()),
        ["nir", "red", "green", "percentile"],
    ),
    "intensity_ratio": (
        lambda: gridmill.intensity_ratio(scene(), scene()),
        ["image_mean", "reference_mean", "ratio_db", "zero"],
    ),
    "magnitude_change": (
        lambda: gridmill.magnitude_change(scene(), scene()),
        ["image_magnitude", "reference_magnitude", "difference"],
    ),
    "tasseled_cap_change": (
        lambda: gridmill.tasseled_cap_change(four(), four(), sensor="Ikonos"),
        ["image_greenness", "reference_greenness", "difference"],
    ),
    "combine": (
        lambda: gridmill.combine(scene(), scene()),
        ["image_nir", "image_red", "image_green", "reference_nir", "reference_red", "reference_green"],
    ),
    "channel_difference": (lambda: gridmill.channel_difference(scene(), scene()), ["nir", "red", "green"]),
}


@pytest.mark.parametrize("call, names", NAMED.values(), ids=NAMED)
def test_bands_of_results_are_named(call: Any, names: list[str]) -> None:
    assert call().band.values.tolist() == names


def test_one_band_results_lose_the_band() -> None:
    result = gridmill.difference(scene(), scene())
    assert result.dims == ("y", "x") and "band" not in result.coords and "time" in result.coords


# ---- other operands


def test_masks_and_references_on_the_same_coordinates() -> None:
    mask = xr.DataArray(HEIGHTS > 200, dims=("y", "x"), coords={"y": Y, "x": X})
    expected = gridmill.slope(HEIGHTS, cellsize=(30, 20), mask=HEIGHTS > 200)
    for given in (mask, mask.transpose("x", "y"), mask.drop_vars(["x", "y"]), mask.values):
        assert_same(gridmill.slope(terrain(), mask=given).values, expected)
    result = gridmill.channel_difference(scene(("band", "y", "x")), scene()[::1], mask=mask)
    wanted = gridmill.channel_difference(BANDS, BANDS, mask=mask.values)
    assert_same(np.ascontiguousarray(result.transpose("y", "x", "band").values), wanted)


@pytest.mark.parametrize(
    "change",
    [
        lambda array: array.assign_coords(x=X + 1),
        lambda array: array.assign_coords(y=Y[::-1]),
        lambda array: array[:, 1:],
        lambda array: array.rename(x="column"),
    ],
    ids=["shifted", "reversed", "smaller", "renamed"],
)
def test_other_coordinates_are_refused(change: Any) -> None:
    mask = change(xr.DataArray(HEIGHTS > 200, dims=("y", "x"), coords={"y": Y, "x": X}))
    with pytest.raises(ValueError, match="^mask: .*; expected"):
        gridmill.slope(terrain(), mask=mask)
    with pytest.raises(ValueError, match="^reference: .*; expected"):
        gridmill.difference(terrain(), change(terrain()))


def test_a_plain_image_with_labels_beside_it() -> None:
    mask = xr.DataArray(HEIGHTS > 200, dims=("y", "x"), coords={"y": Y, "x": X})
    expected = gridmill.threshold(HEIGHTS, 100, 300, mask=mask.values)
    assert_same(gridmill.threshold(HEIGHTS, 100, 300, mask=mask), expected)
    with pytest.raises(TypeError, match="^image: a plain array beside a DataArray; expected"):
        gridmill.difference(HEIGHTS, terrain())


def test_out_is_refused() -> None:
    with pytest.raises(TypeError, match="^out: an array; expected None"):
        gridmill.slope(terrain(), out=np.empty((5, 4), "float32"))


def test_no_data_attributes_have_no_effect() -> None:
    array = terrain().assign_attrs(_FillValue=float(HEIGHTS[0, 0]), nodata=float(HEIGHTS[0, 0]))
    assert_same(gridmill.average_channels(array).values, gridmill.average_channels(HEIGHTS))


# ---- geometry and summaries


def test_a_cropped_window_has_its_coordinates() -> None:
    result = gridmill.mirror(terrain(), "vert", window=(1, 2, 2, 3), crop=True)
    assert_same(result.values, gridmill.mirror(HEIGHTS, "vert", window=(1, 2, 2, 3), crop=True))
    assert result.x.values.tolist() == X[1:3].tolist() and result.y.values.tolist() == Y[2:5].tolist()


def test_a_transferred_image_has_coordinates_of_its_own() -> None:
    result = gridmill.transfer(terrain(), (1, 0, 2, 4), (0, 0, 4, 2))
    assert_same(result.values, gridmill.transfer(HEIGHTS, (1, 0, 2, 4), (0, 0, 4, 2)))
    assert result.x.values.tolist() == [X[1], X[1] + 15, X[1] + 30, X[1] + 45]
    assert result.y.values.tolist() == [Y[0], Y[0] - 40]
    uneven = terrain().assign_coords(x=[1, 2, 4, 8], row=("y", list("abcde")))
    assert set(gridmill.transfer(uneven, (0, 0, 4, 5), (0, 0, 8, 5)).coords) == {"y", "spatial_ref"}


def test_summaries_are_plain() -> None:
    assert_same(gridmill.statistics(scene(("band", "y", "x"))), gridmill.statistics(BANDS))
    assert_same(gridmill.vollath(scene(("band", "y", "x"))), gridmill.vollath(BANDS))


# ---- dask inside


@pytest.mark.parametrize("order", ORDERS)
def test_dask_stays_inside(order: tuple[str, ...]) -> None:
    array = scene(order).chunk({"y": 2, "x": 3, "band": 1})
    result = gridmill.percentile_stretch(array)
    assert isinstance(result.data, da.Array) and result.dims == order
    expected = gridmill.percentile_stretch(scene(order))
    xr.testing.assert_identical(result.compute(), expected)


def test_slope_of_dask_inside() -> None:
    result = gridmill.slope(terrain().chunk({"y": 2, "x": 1}), mask=terrain() > 100)
    assert isinstance(result.data, da.Array)
    xr.testing.assert_identical(result.compute(), gridmill.slope(terrain(), mask=terrain() > 100))
