#!/usr/bin/env python3
"""Terrain slope of a raster of any size, on all cores, in bounded memory.

The workers of a local cluster read windows with a margin of one pixel and compute; this process alone writes
the result, a tiled GeoTIFF. A few windows for each worker are under way at a time, so that memory depends on
--tile and --workers, not on the raster.
"""

from __future__ import annotations

import argparse
import contextlib
import math
import os
import signal
import sys
import tempfile
import time
from dataclasses import dataclass
from pathlib import Path
from typing import Iterator, Optional

import numpy as np
import rasterio
from distributed import Client, Future, LocalCluster, as_completed
from rasterio.errors import RasterioError, RasterioIOError
from rasterio.transform import from_origin
from rasterio.windows import Window

import gridmill

BLOCK = 256  # the side of a block of the GeoTIFFs; --tile is a multiple, so that no block is written twice
CACHE_MB = 64  # of blocks of rasters, in each process
EXCLUDED = -9999.0
UNREADABLE = (RasterioError, RasterioIOError)


class Refusal(Exception):
    """An argument that cannot be used."""

    def __init__(self, argument: str, came: str, expected: str) -> None:
        super().__init__(f"{argument}: {came}; expected {expected}")


class Parser(argparse.ArgumentParser):
    def error(self, message: str) -> None:
        raise Refusal("arguments", message, "those that --help lists")


@dataclass(frozen=True)
class Job:
    """What a worker has to know."""

    path: str
    cellsize: tuple[float, float]
    z_factor: Optional[float]
    masked: bool  #: whether the raster has pixels without a value


# ---- arguments


def arguments_of(words: list[str]) -> argparse.Namespace:
    parser = Parser(prog="slope_cluster", description=__doc__, formatter_class=argparse.RawTextHelpFormatter)
    parser.add_argument("input", help="a raster of elevations; its first band is taken")
    parser.add_argument("output", help="a GeoTIFF to write: slope in degrees, float32")
    parser.add_argument(
        "--make", metavar="SIZE", help="first write a synthetic terrain of SIZE x SIZE to input"
    )
    parser.add_argument("--workers", default="2", help="processes that compute (default 2)")
    parser.add_argument(
        "--tile", default="2048", help="side of the windows, a multiple of 256 (default 2048)"
    )
    parser.add_argument("--z-factor", help="factor on the elevations; needed if coordinates are degrees")
    given = parser.parse_args(words)
    given.make = None if given.make is None else whole("--make", given.make, 2, 1_000_000)
    given.workers = whole("--workers", given.workers, 1, 256)
    given.tile = whole("--tile", given.tile, BLOCK, 65536)
    if given.tile % BLOCK:
        raise Refusal("--tile", str(given.tile), f"a multiple of {BLOCK}")
    given.z_factor = None if given.z_factor is None else factor("--z-factor", given.z_factor)
    check_paths(given)
    return given


def whole(argument: str, text: str, least: int, greatest: int) -> int:
    if text.isascii() and text.isdigit() and least <= int(text) <= greatest:
        return int(text)
    raise Refusal(argument, repr(text), f"a whole number from {least} to {greatest}")


def factor(argument: str, text: str) -> float:
    with contextlib.suppress(ValueError):
        if math.isfinite(float(text)) and float(text) != 0:
            return float(text)
    raise Refusal(argument, repr(text), "a finite number other than 0")


def check_paths(given: argparse.Namespace) -> None:
    source, target = Path(given.input), Path(given.output)
    if source.resolve() == target.resolve():
        raise Refusal("output", f"the input {given.output!r}", "another file")
    if not target.absolute().parent.is_dir():
        raise Refusal("output", f"no folder {str(target.parent)!r}", "a file in a folder that exists")
    if target.is_dir():
        raise Refusal("output", f"the folder {given.output!r}", "a file")
    if given.make is None and not source.is_file():
        raise Refusal("input", f"no file {given.input!r}", "a raster, or --make SIZE to write one")
    if given.make is not None and source.exists():
        raise Refusal("input", f"{given.input!r}, which exists", "a new name with --make")


def job_of(path: str, z_factor: Optional[float]) -> tuple[Job, dict]:
    """What to compute, and the profile of the result."""
    try:
        source = rasterio.open(path)
    except UNREADABLE as error:
        raise Refusal("input", str(error), "a raster") from None
    with source:
        transform = source.transform
        if transform.b or transform.d:
            raise Refusal("input", "a rotated raster", "rows along x and columns along y")
        if source.dtypes[0].startswith("complex"):
            raise Refusal("input", f"samples of {source.dtypes[0]}", "real samples")
        if z_factor is None and source.crs is not None and source.crs.is_geographic:
            raise Refusal(
                "--z-factor",
                "none, with coordinates in degrees",
                "a factor from elevations to degrees, for metres about 0.000009 / cos(latitude)",
            )
        masked = rasterio.enums.MaskFlags.all_valid not in source.mask_flag_enums[0]
        job = Job(path, (abs(transform.a), abs(transform.e)), z_factor, masked)
        profile = geotiff(source.width, source.height, source.crs, transform)
        return job, dict(profile, nodata=EXCLUDED) if masked else profile


def geotiff(width: int, height: int, crs: object, transform: object) -> dict:
    return dict(
        driver="GTiff",
        dtype="float32",
        count=1,
        width=width,
        height=height,
        crs=crs,
        transform=transform,
        tiled=True,
        blockxsize=BLOCK,
        blockysize=BLOCK,
        BIGTIFF="IF_SAFER",
    )


# ---- windows


def windows_of(width: int, height: int, side: int) -> Iterator[Window]:
    for y in range(0, height, side):
        for x in range(0, width, side):
            yield Window(x, y, min(side, width - x), min(side, height - y))


def window_slope(job: Job, window: Window) -> np.ndarray:
    """The slope of a window, with the pixels around it as its margin. Runs in a worker."""
    with rasterio.Env(GDAL_CACHEMAX=CACHE_MB), rasterio.open(job.path) as source:
        left, top = int(window.col_off > 0), int(window.row_off > 0)
        right = int(window.col_off + window.width < source.width)
        bottom = int(window.row_off + window.height < source.height)
        wider = Window(
            window.col_off - left,
            window.row_off - top,
            window.width + left + right,
            window.height + top + bottom,
        )
        elevation = source.read(1, window=wider)
        mask = source.read_masks(1, window=wider) > 0 if job.masked else None
    outside = ((1 - top, 1 - bottom), (1 - left, 1 - right))
    elevation = np.pad(elevation, outside, mode="edge")
    mask = None if mask is None else np.pad(mask, outside, mode="edge")
    return gridmill.slope(
        elevation,
        cellsize=job.cellsize,
        z_factor=job.z_factor,
        margin=1,
        mask=mask,
        background=EXCLUDED,
        dtype="float32",
        num_threads=1,
    )


def terrain(window: Window) -> np.ndarray:
    """Synthetic elevations of a window, the same however an image is cut. Sums of products of a row's and a
    column's values are quick to make."""
    x = np.arange(window.col_off, window.col_off + window.width, dtype=np.float64)
    y = np.arange(window.row_off, window.row_off + window.height, dtype=np.float64)
    heights = np.full((len(y), len(x)), 900, np.float32)
    for length, height in ((2900, 500), (710, 120), (97, 14), (23, 3), (7, 0.7)):
        for phase in (0.3, 1.9):
            across = (height * np.sin(x / length + phase)).astype(np.float32)
            heights += np.cos(y / length - phase * 2).astype(np.float32)[:, None] * across
    return heights


# ---- work


class Progress:
    """A bar on the standard error if that is a terminal, else a line for each tenth."""

    def __init__(self, what: str, total: int) -> None:
        self._what, self._total, self._done, self._shown = what, total, 0, -1

    def step(self) -> None:
        self._done += 1
        terminal = sys.stderr.isatty()
        steps = self._done * (50 if terminal else 10) // self._total
        if steps in (0, self._shown):
            return
        self._shown = steps
        percent = self._done * 100 // self._total
        bar = (
            f"\r{self._what} [{'#' * steps:50}] {percent:3d} %" if terminal else f"{self._what} {percent} %\n"
        )
        end = "\n" if terminal and self._done == self._total else ""
        print(bar, end=end, file=sys.stderr, flush=True)


@contextlib.contextmanager
def pending(path: str) -> Iterator[str]:
    """A name beside `path` to write to. It gets the right name at the end, or is removed on a failure."""
    target = Path(path).absolute()
    handle, name = tempfile.mkstemp(prefix=f".{target.stem}-", suffix=".tif", dir=target.parent)
    os.close(handle)
    try:
        yield name
        mode = os.umask(0)
        os.umask(mode)
        os.chmod(name, 0o666 & ~mode)
        os.replace(name, target)
    except BaseException:
        with contextlib.suppress(FileNotFoundError):
            os.unlink(name)
        raise


def make(path: str, size: int, tile: int) -> None:
    profile = geotiff(size, size, None, from_origin(0, size * 10.0, 10, 10))
    progress = Progress("terrain", math.ceil(size / tile) ** 2)
    with pending(path) as name, rasterio.open(name, "w", **profile) as target:
        for window in windows_of(size, size, tile):
            target.write(terrain(window), 1, window=window)
            progress.step()


def compute(client: Client, job: Job, target: rasterio.io.DatasetWriter, tile: int, ahead: int) -> None:
    """Write all windows as they come, `ahead` of them under way."""
    windows = windows_of(target.width, target.height, tile)
    progress = Progress("slope", math.ceil(target.width / tile) * math.ceil(target.height / tile))
    under_way = {}
    results = as_completed()

    def submit_next() -> None:
        window = next(windows, None)
        if window is not None:
            future = client.submit(window_slope, job, window, pure=False)
            under_way[future] = window
            results.add(future)

    for _ in range(ahead):
        submit_next()
    while under_way:
        future = next(results)
        target.write(result_of(future), 1, window=under_way.pop(future))
        future.release()
        submit_next()
        progress.step()


def result_of(future: Future) -> np.ndarray:
    try:
        return future.result()
    except UNREADABLE as error:
        raise Refusal("input", str(error), "a raster that can be read to its end") from None


def peak_memory() -> int:
    """The most memory that this process had so far, in bytes."""
    with open("/proc/self/status", encoding="ascii") as status:
        lines = [line for line in status if line.startswith("VmHWM:")]
    return int(lines[0].split()[1]) * 1024


def run(given: argparse.Namespace) -> None:
    if given.make is not None:
        make(given.input, given.make, given.tile)
    job, profile = job_of(os.path.abspath(given.input), given.z_factor)
    started = time.monotonic()
    with pending(given.output) as name, LocalCluster(
        n_workers=given.workers, threads_per_worker=1, dashboard_address="127.0.0.1:0", silence_logs=50
    ) as cluster, Client(cluster) as client:
        with rasterio.open(name, "w", **profile) as target:
            compute(client, job, target, given.tile, 2 * given.workers)
        workers = sum(client.run(peak_memory).values())
    report(profile, time.monotonic() - started, peak_memory(), workers)


def report(profile: dict, seconds: float, own: int, workers: int) -> None:
    print(
        f"{profile['width']} x {profile['height']} pixels in {seconds:.1f} s, peak memory "
        f"{(own + workers) / 1e6:.0f} MB: {own / 1e6:.0f} here, {workers / 1e6:.0f} in the workers"
    )


def main(words: list[str]) -> int:
    signal.signal(signal.SIGTERM, signal.default_int_handler)
    try:
        with rasterio.Env(GDAL_CACHEMAX=CACHE_MB):
            run(arguments_of(words))
    except Refusal as refusal:
        print(f"slope_cluster: {refusal}", file=sys.stderr)
        return 2
    except (*UNREADABLE, OSError) as error:
        print(f"slope_cluster: output: {error}; expected room and rights to write it", file=sys.stderr)
        return 1
    except KeyboardInterrupt:
        print("slope_cluster: interrupted; nothing was left behind", file=sys.stderr)
        return 130
    return 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
