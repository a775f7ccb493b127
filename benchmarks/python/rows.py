"""Measures the Python package beside numpy, numexpr and numba, and beside C++ calls on the same memory.

Usage: rows.py DIRECT_LIBRARY [--quick] [--json FILE]

Every contestant of a row writes into an array that stands already, on one thread. The rounds of a row go
round the contestants, so that a slow moment of the machine meets all of them; a figure is the median of its
rounds, and a ratio is that of medians. What a peer computes is compared with gridmill's result before the
clock runs.
"""

from __future__ import annotations

import argparse
import ctypes
import json
import os
import statistics
import sys
import time

# Before the imports that read them.
threads = ("NUMBA_NUM_THREADS", "OMP_NUM_THREADS", "NUMEXPR_NUM_THREADS", "NUMEXPR_MAX_THREADS")
os.environ.update(dict.fromkeys(threads, "1"))

import numpy as np

import gridmill
import gridmill.core

try:
    import numexpr
except ImportError:
    numexpr = None
try:
    import numba
except ImportError:
    numba = None

CELL = np.float32(30)
SIZES = (512, 4096)


def compiled(function):
    """numba's version of a loop, without the test for a division by 0; None where numba is not installed."""
    return None if numba is None else numba.njit(error_model="numpy")(function)


# Slope


def slope_row(edge):
    rng = np.random.default_rng(1)
    elevation = rng.normal(0, 20, (edge + 2, edge + 2)).astype(np.float32)
    out = np.empty((edge, edge), np.float32)
    corners = [elevation[y : y + edge, x : x + edge] for y, x in ((1, 1), (1, 2), (2, 1), (2, 2))]
    loop = compiled(slope_loop)
    yield "gridmill", lambda: gridmill.slope(elevation, cellsize=(30, 30), margin=1, out=out), out, elevation
    yield "numpy", *numpy_slope(corners)
    if numexpr:
        yield "numexpr", *numexpr_slope(corners)
    if loop:
        mine = np.empty_like(out)
        yield "numba", lambda: loop(elevation, mine), mine


def numpy_slope(corners):
    z00, z10, z01, z11 = corners
    out = np.empty_like(z00)
    half, area = CELL / np.float32(2), CELL * CELL

    def run():
        nx = ((z01 - z11) - (z10 - z00)) * half
        ny = ((z10 - z11) - (z01 - z00)) * half
        length = np.sqrt(nx * nx + ny * ny + area * area)
        np.arccos(area / length, out=out)
        np.multiply(out, np.float32(180 / np.pi), out=out)

    return run, out


def numexpr_slope(corners):
    z00, z10, z01, z11 = corners
    names = {
        **dict(z00=z00, z10=z10, z01=z01, z11=z11, half=CELL / np.float32(2), area=CELL * CELL),
        "degrees": np.float32(180 / np.pi),
    }
    out = np.empty(z00.shape, np.float32)
    nx, ny = "(((z01 - z11) - (z10 - z00)) * half)", "(((z10 - z11) - (z01 - z00)) * half)"
    text = f"arccos(area / sqrt({nx} * {nx} + {ny} * {ny} + area * area)) * degrees"
    return lambda: numexpr.evaluate(text, names, out=out), out


def slope_loop(elevation, out):
    half, area = np.float32(15), np.float32(900)
    for y in range(out.shape[0]):
        for x in range(out.shape[1]):
            z00, z10 = elevation[y + 1, x + 1], elevation[y + 1, x + 2]
            z01, z11 = elevation[y + 2, x + 1], elevation[y + 2, x + 2]
            nx = ((z01 - z11) - (z10 - z00)) * half
            ny = ((z10 - z11) - (z01 - z00)) * half
            length = np.sqrt(nx * nx + ny * ny + area * area)
            out[y, x] = np.arccos(area / length) * np.float32(180 / np.pi)


# NDVI of four 16-bit bands


def ndvi_row(edge):
    image = np.random.default_rng(2).integers(1, 10000, (edge, edge, 4)).astype(np.uint16)
    bands = {"blue": 0, "green": 1, "red": 2, "nir": 3}
    out = np.empty((edge, edge, 1), np.float32)
    red, nir = image[..., 2], image[..., 3]
    loop = compiled(ndvi_loop)
    yield "gridmill", lambda: gridmill.vegetation_indices(["NDVI"], image, bands=bands, out=out), out, image
    theirs = np.empty((edge, edge), np.float32)

    def by_numpy():
        n, r = nir.astype(np.float32), red.astype(np.float32)
        np.divide(n - r, n + r, out=theirs)

    yield "numpy", by_numpy, theirs
    if numexpr:
        other = np.empty((edge, edge), np.float32)
        text, names = "(n * one - r * one) / (n * one + r * one)", {"n": nir, "r": red, "one": np.float32(1)}
        yield "numexpr", lambda: numexpr.evaluate(text, names, out=other, casting="same_kind"), other
    if loop:
        mine = np.empty((edge, edge), np.float32)
        yield "numba", lambda: loop(image, mine), mine


def ndvi_loop(image, out):
    for y in range(out.shape[0]):
        for x in range(out.shape[1]):
            n, r = np.float32(image[y, x, 3]), np.float32(image[y, x, 2])
            out[y, x] = (n - r) / (n + r)


# The absolute difference of two dates, 16 bits


def difference_row(edge):
    rng = np.random.default_rng(3)
    a, b = (rng.integers(0, 30000, (edge, edge)).astype(np.uint16) for _ in range(2))
    out = np.empty((edge, edge), np.int32)
    loop = compiled(difference_loop)
    yield "gridmill", lambda: gridmill.channel_difference(a, b, out=out), out
    theirs = np.empty_like(out)

    def by_numpy():
        np.subtract(a, b, out=theirs, dtype=np.int32)
        np.abs(theirs, out=theirs)

    yield "numpy", by_numpy, theirs
    if numexpr:
        other = np.empty_like(out)
        names = {"a": a, "b": b}
        # It has no absolute value of integers.
        text = "where(a >= b, a - b, b - a)"
        yield "numexpr", lambda: numexpr.evaluate(text, names, out=other), other
    if loop:
        mine = np.empty_like(out)
        yield "numba", lambda: loop(a, b, mine), mine


def difference_loop(a, b, out):
    for y in range(out.shape[0]):
        for x in range(out.shape[1]):
            out[y, x] = abs(np.int32(a[y, x]) - np.int32(b[y, x]))


# The histogram of 16-bit samples


def histogram_row(edge):
    image = np.random.default_rng(4).normal(12000, 3000, (edge, edge)).clip(0, 65535).astype(np.uint16)
    counts = np.zeros(65536, np.int64)
    loop = compiled(histogram_loop)

    def by_gridmill():
        counts[:] = gridmill.statistics(image).histogram[0]

    yield "gridmill", by_gridmill, counts
    theirs = np.zeros(65536, np.int64)

    def by_numpy():
        theirs[:] = np.bincount(image.ravel(), minlength=65536)

    yield "numpy", by_numpy, theirs
    if loop:
        mine = np.zeros(65536, np.int64)
        yield "numba", lambda: loop(image, mine), mine


def histogram_loop(image, counts):
    counts[:] = 0
    for y in range(image.shape[0]):
        for x in range(image.shape[1]):
            counts[image[y, x]] += 1


ROWS = (
    ("slope, f32 -> f32", slope_row, 1e-3),
    ("NDVI, u16 x 4 -> f32", ndvi_row, 1e-6),
    ("absolute difference, u16 -> i32", difference_row, 0),
    ("histogram, u16", histogram_row, 0),
)


# The clock


def rounds(contestants, budget):
    """Medians of seconds for one call of each, of rounds that take turns."""
    calls = {}
    for name, run in contestants.items():
        run()
        start = time.perf_counter()
        run()
        calls[name] = max(1, int(0.004 / max(time.perf_counter() - start, 1e-7)))
    times = {name: [] for name in contestants}
    end = time.perf_counter() + budget
    while time.perf_counter() < end or len(next(iter(times.values()))) < 7:
        for name, run in contestants.items():
            start = time.perf_counter()
            for _ in range(calls[name]):
                run()
            times[name].append((time.perf_counter() - start) / calls[name])
    return {name: statistics.median(values) for name, values in times.items()}


def measured_row(job, make, tolerance, edge, budget):
    contestants = {}
    expected = None
    for name, run, out, *_ in make(edge):
        run()
        result = np.asarray(out, np.float64).ravel()
        if expected is None:
            expected = result
        elif np.abs(result - expected).max() > tolerance:
            sys.exit(f"rows.py: {name} computes another {job}; expected gridmill's result within {tolerance}")
        contestants[name] = run
    medians = rounds(contestants, budget)
    return {"job": job, "size": edge, "seconds": medians}


def overhead_rows(library, budget):
    """Functions and classes against C++ calls on the same memory, 512 x 512, an operator for each call."""
    direct = ctypes.CDLL(library)
    jobs = (
        ("slope", slope_row, slope_by_class, direct.SlopeSeconds),
        ("NDVI", ndvi_row, ndvi_by_class, direct.NdviSeconds),
    )
    for job, make, by_class, seconds in jobs:
        seconds.restype = ctypes.c_double
        _, by_function, out, image = next(make(512))
        pointers = (ctypes.c_void_p(image.ctypes.data), ctypes.c_void_p(out.ctypes.data))
        runs = {"function": by_function, "class": lambda: by_class(image, out)}
        calls = 50
        times = {"C++": [], "function": [], "class": []}
        end = time.perf_counter() + 4 * budget
        while time.perf_counter() < end:
            for name, run in runs.items():
                start = time.perf_counter()
                for _ in range(calls):
                    run()
                times[name].append((time.perf_counter() - start) / calls)
            times["C++"].append(seconds(*pointers, ctypes.c_uint32(512), calls) / calls)
        yield {"job": job, "size": 512, "seconds": {k: statistics.median(v) for k, v in times.items()}}


def slope_by_class(image, out):
    gridmill.core.FilterSlp(30, 30).Process(image, None, out, margin=1)


def ndvi_by_class(image, out):
    indices = gridmill.core.VegIndex()
    indices.SetRequestedIndex([0, 0, 0, 0, 1, 0, 0, 0, 0, 0, 0, 0])
    indices.SetBandIndex([0, 1, 2, 4])
    indices.Process(image, None, out)


# The tables


def print_rows(rows):
    names = ("numpy", "numexpr", "numba")
    print("Mpixel/s of gridmill from Python; how many times faster it is than each peer, on one thread.\n")
    print(f"{'job':34}{'size':>12}{'gridmill':>10}" + "".join(f"{name:>10}" for name in names))
    for row in rows:
        seconds, size = row["seconds"], row["size"]
        ratios = (f"{seconds[n] / seconds['gridmill']:9.2f}x" if n in seconds else f"{'':10}" for n in names)
        speed = size * size / seconds["gridmill"] / 1e6
        print(f"{row['job']:34}{f'{size}x{size}':>12}{speed:10.0f}" + "".join(ratios))


def print_overhead(rows):
    print("\nA call from Python beside one from C++ on the same memory, each with an operator of its own:\n")
    for row in rows:
        direct = row["seconds"]["C++"]
        texts = []
        for way in ("class", "function"):
            more = row["seconds"][way] - direct
            texts.append(f"by the {way} {1e6 * more:5.1f} us more, {100 * more / direct:5.1f} %")
        print(f"{row['job']:10}{'512x512':>10}{1e6 * direct:8.1f} us in C++; " + "; ".join(texts))


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("library", help="libgridmill_direct.so of a build with benchmarks")
    parser.add_argument("--quick", action="store_true", help="fewer rounds")
    parser.add_argument("--json", metavar="FILE", help="also write the rows to FILE")
    arguments = parser.parse_args()
    if numexpr:
        numexpr.set_num_threads(1)
    budget = 0.5 if arguments.quick else 3.0
    rows = [measured_row(job, make, within, size, budget) for job, make, within in ROWS for size in SIZES]
    overhead = list(overhead_rows(arguments.library, budget))
    print_rows(rows)
    print_overhead(overhead)
    if arguments.json:
        with open(arguments.json, "w", encoding="utf-8") as file:
            json.dump({"rows": rows, "overhead": overhead}, file, indent=2)


if __name__ == "__main__":
    main()
