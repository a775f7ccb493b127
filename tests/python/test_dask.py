"""Dask arrays: the bits of one call on the whole array for any chunking, and nothing computed too early."""

from __future__ import annotations

import pickle
import tracemalloc
from typing import Any

import dask
import dask.array as da
import numpy as np
import pytest
from hypothesis import HealthCheck, given, settings, strategies as st

import gridmill
from lazy_support import CASES, TEN_TYPES, Case, assert_same, lazy, operands_of, parts_of, samples_of

FEW = settings(
    max_examples=12, derandomize=True, deadline=None, database=None, suppress_health_check=list(HealthCheck)
)


def chunks_of(extent: int) -> st.SearchStrategy[tuple[int, ...]]:
    """Any way to cut an extent, chunks of width 1 included."""

    def cut(ends: list[bool]) -> tuple[int, ...]:
        marks = [0, *(place + 1 for place, end in enumerate(ends) if end), extent]
        return tuple(int(size) for size in np.diff(marks))

    return st.lists(st.booleans(), min_size=extent - 1, max_size=extent - 1).map(cut)


@st.composite
def calls(draw: Any, case: Case) -> tuple[dict[str, np.ndarray], dict[str, Any]]:
    """Plain operands and lazy ones. Some of the latter stay numpy arrays, others have chunks of their own."""
    height, width = draw(st.integers(1, 9)), draw(st.integers(1, 9))
    dtype = draw(st.sampled_from(case.types))
    kind = draw(st.sampled_from(("few", "wide", "special")))
    generator = np.random.default_rng(draw(st.integers(0, 1000)))
    bands, masks = draw(st.sampled_from(case.bands)), draw(st.booleans())
    plain = operands_of(case, generator, (height, width), bands, dtype, kind, masks)
    chunks = draw(chunks_of(height)), draw(chunks_of(width))
    given_as = {name: draw(st.sampled_from(("same chunks", "own chunks", "numpy"))) for name in plain}
    given_as[case.raster] = "same chunks"
    made = {}
    for name, array in plain.items():
        own = chunks if given_as[name] == "same chunks" else (draw(chunks_of(height)), draw(chunks_of(width)))
        made[name] = array if given_as[name] == "numpy" else lazy(array, own)
    return plain, made


def is_lazy(result: Any) -> bool:
    return all(isinstance(part, da.Array) for part in parts_of(result))


@pytest.mark.parametrize("name", CASES)
def test_any_chunking_gives_the_bits_of_one_call(name: str) -> None:
    case = CASES[name]

    @FEW
    @given(calls(case))
    def check(call: tuple[dict[str, np.ndarray], dict[str, Any]]) -> None:
        plain, made = call
        result = case.call(**made)
        assert is_lazy(result)
        (computed,) = dask.compute(result, scheduler="sync")
        assert_same(computed, case.call(**plain))
        for announced, part in zip(parts_of(result), parts_of(computed)):
            assert announced.dtype == part.dtype
            assert len(announced.shape) == part.ndim
            assert all(size == found or np.isnan(size) for size, found in zip(announced.shape, part.shape))

    check()


@pytest.mark.parametrize("name", ["slope", "percentile_stretch", "statistics", "combine", "transfer"])
@pytest.mark.parametrize("dtype", TEN_TYPES)
def test_all_types(name: str, dtype: str) -> None:
    case = CASES[name]
    plain = operands_of(case, np.random.default_rng(7), (11, 8), 2, dtype, "wide", True)
    made = {key: lazy(array, (4, 3)) for key, array in plain.items()}
    assert_same(dask.compute(case.call(**made), scheduler="threads")[0], case.call(**plain))


def test_in_processes() -> None:
    expected, results = [], []
    for name in ("slope reflect", "histogram", "normalize", "vollath", "transfer", "mirror"):
        case = CASES[name]
        generator = np.random.default_rng(3)
        plain = operands_of(case, generator, (9, 8), case.bands[-1], "int16", "few", bool(case.masks))
        expected.append(case.call(**plain))
        results.append(case.call(**{key: lazy(array, (4, 5)) for key, array in plain.items()}))
    for computed, wanted in zip(dask.compute(results, scheduler="processes", num_workers=2)[0], expected):
        assert_same(computed, wanted)


@FEW
@given(st.data())
def test_margin_of_the_image_itself(data: Any) -> None:
    height, width = data.draw(st.integers(2, 9)), data.draw(st.integers(2, 9))
    image = samples_of(
        np.random.default_rng(data.draw(st.integers(0, 99))), (height, width, 2), "int16", "few"
    )
    mask = image[..., 0] > -20
    chunks = data.draw(chunks_of(height)), data.draw(chunks_of(width))
    expected = gridmill.slope(image, cellsize=4, margin=1, mask=mask)
    result = gridmill.slope(lazy(image, chunks), cellsize=4, margin=1, mask=lazy(mask, chunks))
    assert result.shape == expected.shape == (height - 2, width - 2, 2)
    assert_same(result.compute(scheduler="sync"), expected)


def test_blocks_of_no_extent_are_left_out() -> None:
    image = np.arange(30.0).reshape(5, 6) ** 2
    cut = da.from_array(image, chunks=((2, 0, 3), (3, 3)))
    assert 0 in cut.chunks[0]
    assert_same(gridmill.slope(cut, cellsize=1).compute(), gridmill.slope(image, cellsize=1))


@pytest.mark.parametrize("name", ["slope", "threshold", "combine", "mirror", "average_channels"])
def test_images_without_pixels(name: str) -> None:
    case = CASES[name]
    plain = operands_of(case, np.random.default_rng(0), (0, 4), case.bands[0], "uint8", "few", False)
    made = {key: lazy(array, (2, 2)) for key, array in plain.items()}
    assert_same(case.call(**made).compute(), case.call(**plain))


# ---- what is computed, and when


def unreadable(shape: tuple[int, ...], chunks: int, dtype: str = "float32") -> da.Array:
    """An array whose blocks cannot be had."""

    def fail(block: np.ndarray) -> np.ndarray:
        raise AssertionError("a block was computed")

    zeros = da.zeros(shape, chunks=(chunks, chunks) + (1,) * (len(shape) - 2), dtype=dtype)
    return zeros.map_blocks(fail, dtype=dtype, meta=np.empty((0,) * len(shape), dtype))


@pytest.mark.parametrize("name", CASES)
def test_building_computes_nothing(name: str) -> None:
    case = CASES[name]
    operands = {}
    plain = operands_of(case, np.random.default_rng(0), (2, 2), max(case.bands), case.types[-1], "few", True)
    for key, array in plain.items():
        operands[key] = unreadable((60, 50) + array.shape[2:], 20, str(array.dtype))
    result = case.call(**operands)
    assert is_lazy(result)
    with pytest.raises(AssertionError, match="a block was computed"):
        dask.compute(result, scheduler="sync")


def test_graph_of_a_vast_image_is_small() -> None:
    image = unreadable((200_000, 200_000), 2000)
    tracemalloc.start()
    try:
        result = gridmill.slope(image, cellsize=30, mask=image != -9999)
        peak = tracemalloc.get_traced_memory()[1]
    finally:
        tracemalloc.stop()
    assert result.shape == image.shape and result.chunks == image.chunks
    assert peak < 50e6


def test_a_block_reads_its_neighbours_alone() -> None:
    read = []

    def note(block: np.ndarray, block_id: Any = None) -> np.ndarray:
        read.append(block_id)
        return block

    image = da.zeros((50, 50), chunks=10, dtype="float32").map_blocks(
        note, dtype="float32", meta=np.empty((0, 0))
    )
    gridmill.slope(image, cellsize=1)[22:24, 22:24].compute(scheduler="sync")
    assert set(read) == {(row, column) for row in (1, 2, 3) for column in (1, 2, 3)}


def test_transfer_reads_the_blocks_that_it_needs() -> None:
    read = []

    def note(block: np.ndarray, block_id: Any = None) -> np.ndarray:
        read.append(block_id)
        return block

    image = da.zeros((50, 50), chunks=10, dtype="uint8").map_blocks(
        note, dtype="uint8", meta=np.empty((0, 0), "uint8")
    )
    moved = gridmill.transfer(image, (0, 0, 50, 50), (0, 0, 100, 100))
    moved[45:55, 5:15].compute(scheduler="sync")
    assert set(read) == {(2, 0)}
    assert max(max(sizes) for sizes in moved.chunks) <= 20


def test_blocks_run_on_one_thread(monkeypatch: pytest.MonkeyPatch) -> None:
    from gridmill import terrain

    asked = []
    monkeypatch.setattr(terrain, "threads_of", lambda threads: asked.append(threads) or threads)
    image = da.zeros((8, 8), chunks=4)
    result = gridmill.slope(image, cellsize=1, num_threads=2)
    asked.clear()
    result.compute(scheduler="sync")
    assert asked == [1] * 4


def test_keys_are_those_of_the_arguments() -> None:
    image = da.zeros((8, 8), chunks=4)
    first, again = (gridmill.slope(image, cellsize=1) for _ in range(2))
    assert first.name == again.name
    assert first.name != gridmill.slope(image, cellsize=2).name
    assert first.name != gridmill.aspect(image, cellsize=1).name


def test_graphs_can_be_pickled() -> None:
    image = np.arange(48.0).reshape(6, 8)
    result = pickle.loads(pickle.dumps(gridmill.percentile_stretch(da.from_array(image, chunks=3))))
    assert_same(result.compute(scheduler="sync"), gridmill.percentile_stretch(image))


# ---- statistics


def test_counts_are_divided_for_the_whole_image_alone(monkeypatch: pytest.MonkeyPatch) -> None:
    from gridmill import summary

    monkeypatch.setattr(summary, "_MOST_IN_BIN", 10)
    image = np.zeros((9, 9), "float32")
    image[0] = 1
    expected = gridmill.histogram(image, bins=2)
    assert expected.counts.tolist() == [[9, 1]]  # 72 and 9, by 8
    assert_same(dask.compute(gridmill.histogram(lazy(image, (2, 5)), bins=2), scheduler="sync")[0], expected)


def test_a_lazy_histogram_goes_on_as_an_argument() -> None:
    image = samples_of(np.random.default_rng(1), (20, 17), "uint8", "wide")
    cut = lazy(image, (6, 7))
    counts = gridmill.histogram(cut)
    assert np.isnan(counts.counts.shape[1])
    assert_same(gridmill.percentile_stretch(cut, counts).compute(), gridmill.percentile_stretch(image))


def test_lazy_statistics_merge() -> None:
    image = samples_of(np.random.default_rng(1), (20, 17), "uint16", "wide")
    halves = gridmill.statistics(lazy(image[:9], (5, 5))).merge(gridmill.statistics(lazy(image[9:], (5, 5))))
    assert_same(dask.compute(halves)[0], gridmill.statistics(image))


# ---- refusals


IMAGE = da.zeros((6, 5), chunks=3)


@pytest.mark.parametrize(
    "call, error, message",
    [
        (
            lambda: gridmill.slope(IMAGE, cellsize=1, out=np.empty((6, 5), "float32")),
            TypeError,
            "^out: an array; ",
        ),
        (lambda: gridmill.slope(IMAGE), TypeError, "^cellsize: None; expected"),
        (lambda: gridmill.slope(IMAGE, cellsize=1, edge="wrap"), ValueError, "^edge: 'wrap'; expected"),
        (
            lambda: gridmill.slope(IMAGE, cellsize=1, dtype="complex64"),
            TypeError,
            "^dtype: complex64; expected",
        ),
        (lambda: gridmill.slope(IMAGE, cellsize=1, num_threads=0), ValueError, "^num_threads: 0; expected"),
        (lambda: gridmill.slope(IMAGE, cellsize=1, wrong=0), TypeError, r"^slope\(\) got an unexpected"),
        (lambda: gridmill.slope(IMAGE[:1], cellsize=1, margin=1), ValueError, "^elevation: shape"),
        (lambda: gridmill.slope(IMAGE[0], cellsize=1), ValueError, r"^elevation: shape \(5,\); expected"),
        (
            lambda: gridmill.slope(IMAGE[IMAGE[:, 0] > 0], cellsize=1),
            ValueError,
            "^elevation: .*unknown shape; exp",
        ),
        (
            lambda: gridmill.aspect(da.zeros((4, 4, 2)), cellsize=1),
            ValueError,
            "^elevation: 2 bands; expected",
        ),
        (lambda: gridmill.threshold(IMAGE, 1, 2, mask=IMAGE), TypeError, "^mask: .*; expected"),
        (
            lambda: gridmill.threshold(IMAGE, 1, 2, mask=IMAGE[1:] > 0),
            ValueError,
            r"^mask: shape \(5, 5\); expected",
        ),
        (lambda: gridmill.threshold(IMAGE, 1, 2, mask=(IMAGE > 0)[..., None]), ValueError, "^mask: shape"),
        (
            lambda: gridmill.difference(IMAGE, IMAGE[:, 1:]),
            ValueError,
            r"^reference: shape \(6, 4\); expected",
        ),
        (
            lambda: gridmill.difference(IMAGE, IMAGE.astype("uint8")),
            TypeError,
            "^reference: .*uint8; expected",
        ),
        (lambda: gridmill.normalize(IMAGE, [1, 2]), ValueError, "^minimum: 2 numbers; expected"),
        (lambda: gridmill.mirror(IMAGE, "up"), ValueError, "^axis: 'up'; expected"),
        (lambda: gridmill.mirror(IMAGE, "vert", window=(0, 0, 9, 1)), ValueError, "^window: .*; expected"),
        (
            lambda: gridmill.mirror(IMAGE, "vert", crop=True, mask=IMAGE > 0),
            ValueError,
            "^mask: .*; expected",
        ),
        (
            lambda: gridmill.transfer(IMAGE, (0, 0, 5, 6), (0, 0, 0, 6)),
            ValueError,
            "^out_region: .*; expected",
        ),
        (
            lambda: gridmill.transfer(IMAGE, (0, 0, 5, 6), (0, 0, 5, 6), shape=3),
            TypeError,
            "^shape: 3; expected",
        ),
        (
            lambda: gridmill.transfer(IMAGE.astype("uint8"), (0, 0, 5, 6), (0, 0, 5, 6), fill=300),
            ValueError,
            "^fill: ",
        ),
        (lambda: gridmill.histogram(IMAGE, bins=0), ValueError, "^bins: 0; expected"),
        (
            lambda: gridmill.difference(IMAGE, np.ma.zeros((6, 5))),
            TypeError,
            "^reference: a masked array; exp",
        ),
        (lambda: gridmill.percentile_stretch(IMAGE, 3), TypeError, "^histogram: int; expected"),
        (
            lambda: gridmill.histogram(IMAGE, minimum=2, maximum=1),
            ValueError,
            "^minimum, maximum: .*; expected",
        ),
        (
            lambda: gridmill.vegetation_indices("NDWI", IMAGE, bands={}),
            ValueError,
            "^indices: 'NDWI'; expected",
        ),
        (lambda: gridmill.vegetation_indices("NDVI", bands={"red": IMAGE}), ValueError, "^bands: no 'nir'"),
        (
            lambda: gridmill.vegetation_indices("NDVI", bands={"red": IMAGE, "nir": IMAGE[1:]}),
            ValueError,
            "nir.*exp",
        ),
    ],
)
def test_arguments_are_refused_at_once(call: Any, error: type[Exception], message: str) -> None:
    with pytest.raises(error, match=message):
        call()


def test_an_exact_bound_of_a_histogram_is_no_error() -> None:
    image = np.full((4, 4), 9.0)
    result = gridmill.histogram(lazy(image, (2, 2)), minimum=5)
    assert_same(dask.compute(result)[0], gridmill.histogram(image, minimum=5))


# ---- plain arrays


def test_plain_arrays_know_nothing_of_dask() -> None:
    import subprocess
    import sys

    script = (
        "import numpy, sys, gridmill\n"
        "gridmill.slope(numpy.zeros((4, 4)), cellsize=1)\n"
        "gridmill.vegetation_indices('NDVI', numpy.zeros((4, 4, 2)), bands={'red': 0, 'nir': 1})\n"
        "assert not {'dask', 'xarray', 'gridmill._dask', 'gridmill._xarray'} & set(sys.modules)\n"
    )
    subprocess.run([sys.executable, "-c", script], check=True)


def test_signatures_and_docstrings_stay() -> None:
    import inspect

    assert list(inspect.signature(gridmill.threshold).parameters)[:3] == ["image", "minimum", "maximum"]
    assert gridmill.threshold.__name__ == "threshold" and gridmill.threshold.__doc__
    assert pickle.loads(pickle.dumps(gridmill.threshold)) is gridmill.threshold
