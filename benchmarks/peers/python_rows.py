"""Measures numba and numpy on rows that gridmill_benchmarks has measured, and adds them to its results.

Each row's data are the sample that the program wrote, an image of 512 x 512 pixels, laid out like tiles to
the row's size: sizes and types are those of the other contestants, and so is the distribution. What a peer
computes from the sample is compared with gridmill's output before anything is timed. Rounds, clock and median
are those of the program; the ratio is that of the medians. Tables and constants are prepared, and functions
compiled, before the clock runs.
"""

import argparse
import json
import math
import os
import statistics
import sys
import time

# Before the imports that read them.
os.environ.update(NUMBA_NUM_THREADS="1", OMP_NUM_THREADS="1")

import numba
import numpy as np

SAMPLE_EDGE = 512
TYPES = {"u8": np.uint8, "u16": np.uint16, "f32": np.float32}
BINS = 256

# The parameters of the rows, as in workloads.h.
STRETCH_FROM = (13000, 12500, 12000)
STRETCH_TO = (21000, 21500, 22000)
RANGE_FROM = 13500
RANGE_TO = 20500
CLASS_FROM = np.array((5000, 9000, 12000, 14000, 16500, 18500, 21000, 24000), np.float32)
CLASS_TO = np.array((9000, 12000, 14500, 17000, 18500, 21500, 24000, 32000), np.float32)
CLASS_NO_DATA = np.float32(17000)
BLUE_MIN = np.array((60, 72, 48), np.float32)
BLUE_MAX = np.array((204, 193, 148), np.float32)
BLUE_SCALE = np.array((255 / 144, 255 / 121, 255 / 100), np.float32)

# Pixels that go through the steps of numpy together, so that what lies between them stays in the cache.
NUMPY_STRIP = 65536

# Without the test for a division by 0, which keeps loops from being vectorised.
compiled = numba.njit(error_model="numpy")


class Job:
    """The data of a row: `source` and `target` as flat samples, `mask` as packed bits or None.

    Rows without an output have integers as results, as many as gridmill has.
    """

    def __init__(self, folder, name, types, size):
        given, *wanted = (parse_type(text) for text in types.split(" -> "))
        path = os.path.join(folder, name)
        self.tiles = size // SAMPLE_EDGE
        self.pixels = size * size
        self.channels = given[1]
        self.source = self.lay(np.fromfile(path + ".in", given[0]).reshape(SAMPLE_EDGE, -1))
        if wanted:
            ((sample_type, channels),) = wanted
            self.expected = np.fromfile(path + ".out", sample_type)
            self.target = np.zeros(self.pixels * channels, sample_type)
        else:
            self.expected = np.fromfile(path + ".out", np.int32)
            self.target = np.zeros_like(self.expected)
        self.mask = None
        if os.path.exists(path + ".mask"):
            self.mask = self.lay(np.fromfile(path + ".mask", np.uint8).reshape(SAMPLE_EDGE, -1))
        self.histogram = path + ".histogram"

    def lay(self, sample):
        return np.tile(sample, (self.tiles, self.tiles)).ravel()

    def splines(self):
        with open(self.histogram, "rb") as file:
            minima = np.fromfile(file, np.float32, self.channels)
            maxima = np.fromfile(file, np.float32, self.channels)
            counts = np.fromfile(file, np.int32).reshape(self.channels, BINS)
        return [Spline(*channel) for channel in zip(minima, maxima, counts)]


def parse_type(text):
    name, _, channels = text.partition(" x ")
    return TYPES[name], int(channels or 1)


class Spline:
    """The spline through the cumulative percentages of a channel's histogram."""

    def __init__(self, minimum, maximum, counts):
        self.minimum, self.maximum = minimum, maximum
        self.scale = scale = float(np.float32(BINS) / (maximum - minimum))
        c = self.cumulative = np.zeros(BINS + 2)
        c[1 : BINS + 1] = np.cumsum(counts * 100 / counts.sum())
        c[BINS + 1] = 100.0
        mu, z = np.zeros(BINS + 2), np.zeros(BINS + 2)
        for i in range(1, BINS + 1):
            alpha = (c[i + 1] - c[i] * 2.0 + c[i - 1]) * (scale * 3.0)
            diagonal = (2.0 - mu[i - 1]) * 2.0 / scale
            mu[i] = 1.0 / (diagonal * scale)
            z[i] = (alpha - z[i - 1] / scale) / diagonal
        self.linear, self.quadratic, self.cubic = (np.zeros(BINS + 2) for _ in range(3))
        for j in range(BINS, -1, -1):
            after = self.quadratic[j + 1]
            self.quadratic[j] = z[j] - mu[j] * after
            self.linear[j] = (c[j + 1] - c[j]) * scale - (self.quadratic[j] * 2.0 + after) / (scale * 3.0)
            self.cubic[j] = (after - self.quadratic[j]) * scale / 3.0

    def parameters(self):
        return (
            *(self.minimum, self.maximum, self.scale),
            *(self.cumulative, self.linear, self.quadratic, self.cubic),
        )

    def byte_of_each_sample(self):
        """The table for samples of 16 bits and percentiles of 8, with the fraction cut off in between."""
        samples = np.arange(65536, dtype=np.float32)
        ranks = np.empty_like(samples)
        rank_floats(samples, ranks, *self.parameters())
        inside = (samples > self.minimum) & (samples < self.maximum)
        ranks[inside] = ranks[inside].astype(np.int32).astype(np.uint16)
        return np.minimum(ranks, 255).astype(np.uint8)


@compiled
def rank_floats(source, target, minimum, maximum, scale, cumulative, linear, quadratic, cubic):
    narrow_scale = np.float32(scale)
    for i in range(source.size):
        value = source[i]
        if value == np.float32(0.0):
            target[i] = np.float32(0.0)
        elif minimum >= value:
            target[i] = np.float32(0.0)
        elif value >= maximum:
            target[i] = np.float32(100.0)
        else:
            b = int(math.floor((value - minimum) * narrow_scale))
            if b < 0:
                target[i] = np.float32(0.0)
            elif b >= BINS:
                target[i] = np.float32(100.0)
            else:
                dx = np.float64(value) - (b / scale + np.float64(minimum))
                spline = dx * linear[b] + cumulative[b] + dx * quadratic[b] * dx
                target[i] = np.float32(spline + dx * cubic[b] * dx * dx)


@compiled
def look_up_bytes(source, target, tables):
    for x in range(source.shape[0]):
        for c in range(3):
            target[x, c] = tables[c, source[x, c]]


@compiled
def stretch_row(source, target, lower, gain):
    for i in range(source.size):
        percent = (np.float32(source[i]) - lower[i]) * gain[i]
        percent = percent if percent > np.float32(0.0) else np.float32(0.0)
        target[i] = percent if percent < np.float32(100.0) else np.float32(100.0)


@compiled
def stretch(source, target, lower, gain):
    for y in range(source.shape[0]):
        stretch_row(source[y], target[y], lower, gain)


@compiled
def select(source, target):
    for i in range(source.size):
        target[i] = (source[i] >= RANGE_FROM) & (source[i] <= RANGE_TO)


@compiled
def select_valid(source, bits, target):
    for byte in range(bits.size):
        for k in range(8):
            i = 8 * byte + k
            inside = (source[i] >= RANGE_FROM) & (source[i] <= RANGE_TO)
            target[i] = (bits[byte] >> (7 - k)) & inside


@compiled
def limited(value):
    return 1.0 if value > 1.0 else -1.0 if value < -1.0 else value


@compiled
def compute_indices(source, target):
    for x in range(source.size // 7):
        b, g, r = float(source[7 * x]), float(source[7 * x + 1]), float(source[7 * x + 2])
        e, n = float(source[7 * x + 3]), float(source[7 * x + 4])
        s1, s2 = float(source[7 * x + 5]), float(source[7 * x + 6])
        ndvi = 0.0 if n + r == 0.0 else (n - r) / (n + r)
        soil = (n + r) + 0.5
        eta = 0.0 if soil == 0.0 else ((n * n - r * r) * 2.0 + n * 1.5 + r * 0.5) / soil
        rest = 1.0 - r
        o = 12 * x
        target[o] = 0.0 if g + r == 0.0 else (g - r) / (g + r)
        target[o + 1] = ((g + 255.0) - (r + b) * 0.5) * 0.5
        target[o + 2] = n - r
        target[o + 3] = 0.0 if r == 0.0 else n / r
        target[o + 4] = limited(ndvi)
        target[o + 5] = 0.0 if n + r == 0.0 else math.sqrt(ndvi + 0.5)
        target[o + 6] = 0.0 if soil == 0.0 else limited((n - r) / soil * 1.5)
        root = math.sqrt((n * 2.0 + 1.0) * (n * 2.0 + 1.0) - (n - r) * 8.0)
        target[o + 7] = ((n + 1.0) * 2.0 - root) * 0.5
        target[o + 8] = 0.0 if rest == 0.0 else (1.0 - eta * 0.25) * eta - (r - 0.125) / rest
        target[o + 9] = (
            b * -0.2848 + g * -0.2435 + r * -0.5436 + n * 0.7243 + s1 * 0.084 + s2 * -1.18
        )
        target[o + 10] = 0.0 if r == 0.0 else ((e - r) - (e - g) * 0.2) * (e / r)
        target[o + 11] = ((n - g) * 1.2 - (r - g) * 2.5) * 1.2


@compiled
def count(source, results):
    """Least, greatest and the counts, over all calls."""
    least, greatest = results[0], results[1]
    counts = results[2:]
    for sample in source:
        counts[sample] += 1
        least = min(least, np.int32(sample))
        greatest = max(greatest, np.int32(sample))
    results[0], results[1] = least, greatest


@compiled
def classify(source, target):
    for i in range(source.size):
        s = source[i]
        number = np.uint8(0)
        for k in range(8):
            number = np.uint8(k + 1) if (s > CLASS_FROM[k]) & (CLASS_TO[k] > s) else number
        target[i] = np.uint8(0) if s == CLASS_NO_DATA else number


@compiled
def look_up_classes(source, target, table):
    for i in range(source.size):
        target[i] = table[source[i]]


@compiled
def blue_of(s0, s1, s2):
    return ((s0 * 0.873393 + 13.9054) - s1 * 0.138254) - s2 * 0.100616


@compiled
def bits_of_valid(s0, s1, s2, blue):
    """All bits or none; the background is 0 in all channels."""
    valid = (s0 >= BLUE_MIN[0]) & (s0 <= BLUE_MAX[0]) & (s1 >= BLUE_MIN[1]) & (s1 <= BLUE_MAX[1])
    valid &= (s0 != 0) & (s1 != 0) & (s2 != 0) & (blue >= BLUE_MIN[2]) & (blue <= BLUE_MAX[2])
    return np.int32(-1) if valid else np.int32(0)


@compiled
def rounded(value):
    return min(max(np.int32(np.float64(value) + 0.5), np.int32(0)), np.int32(255))


@compiled
def mix_colours(source, target):
    """Without a branch: so the compiler vectorises it."""
    for i in range(source.size // 3):
        s0, s1, s2 = np.int32(source[3 * i]), np.int32(source[3 * i + 1]), np.int32(source[3 * i + 2])
        blue = blue_of(s0, s1, s2)
        bits = bits_of_valid(s0, s1, s2, blue)
        target[3 * i] = s1 & bits
        target[3 * i + 1] = s0 & bits
        target[3 * i + 2] = rounded(min(max(blue, 0.0), 255.0)) & bits


@compiled
def stretch_colours(source, target):
    for i in range(source.size // 3):
        s0, s1, s2 = np.int32(source[3 * i]), np.int32(source[3 * i + 1]), np.int32(source[3 * i + 2])
        blue = blue_of(s0, s1, s2)
        bits = bits_of_valid(s0, s1, s2, blue)
        target[3 * i] = rounded((np.float32(s1) - BLUE_MIN[1]) * BLUE_SCALE[1]) & bits
        target[3 * i + 1] = rounded((np.float32(s0) - BLUE_MIN[0]) * BLUE_SCALE[0]) & bits
        blue = (blue - np.float64(BLUE_MIN[2])) * np.float64(BLUE_SCALE[2])
        target[3 * i + 2] = rounded(blue) & bits


def numba_percentile_bytes(job):
    tables = np.array([spline.byte_of_each_sample() for spline in job.splines()])
    source, target = job.source.reshape(-1, 3), job.target.reshape(-1, 3)
    return lambda: look_up_bytes(source, target, tables)


def numba_percentile_floats(job):
    (spline,) = job.splines()
    parameters = spline.parameters()
    return lambda: rank_floats(job.source, job.target, *parameters)


def numba_normalize(job):
    """In `float`, with a row of constants beside each row of samples: so the compiler vectorises it."""
    width = SAMPLE_EDGE * job.tiles
    source, target = job.source.reshape(width, -1), job.target.reshape(width, -1)
    lower = np.tile(np.array(STRETCH_FROM, np.float32), width)
    gain = np.float32(100.0) / (np.tile(np.array(STRETCH_TO, np.float32), width) - lower)
    return lambda: stretch(source, target, lower, gain)


def numba_bitmap(job):
    if job.mask is None:
        return lambda: select(job.source, job.target)
    return lambda: select_valid(job.source, job.mask, job.target)


def numpy_bitmap(job):
    """In strips; the mask's bits are unpacked in each call, and counted."""
    above = np.empty(NUMPY_STRIP, bool)
    below = np.empty(NUMPY_STRIP, bool)

    def run():
        for start in range(0, job.pixels, NUMPY_STRIP):
            samples = job.source[start : start + NUMPY_STRIP]
            np.greater_equal(samples, RANGE_FROM, out=above)
            np.less_equal(samples, RANGE_TO, out=below)
            target = job.target[start : start + NUMPY_STRIP].view(bool)
            np.logical_and(above, below, out=target)
            if job.mask is not None:
                valid = np.unpackbits(job.mask[start // 8 : (start + NUMPY_STRIP) // 8])
                np.logical_and(target, valid.view(bool), out=target)

    return run


def numba_indices(job):
    return lambda: compute_indices(job.source, job.target)


def numba_statistics(job):
    job.target[:2] = 100000, -100000
    return lambda: count(job.source, job.target)


def numba_classes_of_floats(job):
    return lambda: classify(job.source, job.target)


def numba_classes_of_shorts(job):
    table = np.empty(65536, np.uint8)
    classify(np.arange(65536, dtype=np.float32), table)
    return lambda: look_up_classes(job.source, job.target, table)


def numba_natural_colour(job):
    return lambda: mix_colours(job.source, job.target)


def numba_natural_colour_trim(job):
    return lambda: stretch_colours(job.source, job.target)


BITMAP_PEERS = {"numpy": numpy_bitmap, "numba": numba_bitmap}
# The rows by the name that they have in the program: for each peer what makes its call.
PEERS = {
    "twelve_indices": {"numba": numba_indices},
    "normalize": {"numba": numba_normalize},
    "percentile_bytes": {"numba": numba_percentile_bytes},
    "percentile_floats": {"numba": numba_percentile_floats},
    "bitmap": BITMAP_PEERS,
    "bitmap_random_mask": BITMAP_PEERS,
    "bitmap_mask_in_runs": BITMAP_PEERS,
    "statistics": {"numba": numba_statistics},
    "classes_of_floats": {"numba": numba_classes_of_floats},
    "classes_of_shorts": {"numba": numba_classes_of_shorts},
    "natural_colour": {"numba": numba_natural_colour},
    "natural_colour_trim": {"numba": numba_natural_colour_trim},
}


def agrees(expected, target):
    """Whether all values are within 1e-6 of each other, relative to those above 1; integers are equal."""
    if expected.dtype != np.float32:
        return np.array_equal(expected, target)
    difference = np.abs(expected.astype(np.float64) - target)
    return bool(np.all(difference <= 1e-6 * np.maximum(1.0, np.abs(expected))))


def seconds_of(run, calls):
    start = time.thread_time_ns()
    for _ in range(calls):
        run()
    return 1e-9 * (time.thread_time_ns() - start) / calls


def median_speed(run, pixels, rounds, slice_seconds):
    """In Mpixel/s: the median of rounds that last a slice, or a call."""
    run()
    calls = max(1, math.ceil(slice_seconds / seconds_of(run, 1)))
    return 1e-6 * pixels / statistics.median(seconds_of(run, calls) for _ in range(rounds))


def measure(entry, folder, slice_seconds):
    """Adds speed and ratio of each peer to a row's results, or the row's failure."""
    name = entry["label"]
    _, types, size = entry["name"].split("/")[:3]
    edge = int(size.split("x")[0])
    for peer, make in PEERS[name].items():
        sample = Job(folder, name, types, SAMPLE_EDGE)
        make(sample)()
        if not agrees(sample.expected, sample.target):
            entry["error_message"] = f"gridmill and {peer} differ"
            return
        job = Job(folder, name, types, edge)
        speed = median_speed(make(job), job.pixels, entry["iterations"], slice_seconds)
        entry[peer] = speed
        entry["vs " + peer] = entry["gridmill"] / speed
        print(f"{peer}: {entry['name']}", file=sys.stderr)


def main():
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("results", help="the file that --benchmark_out wrote; it is written anew")
    parser.add_argument("samples", help="the folder of the program's samples")
    parser.add_argument("--quick", action="store_true", help="shorter rounds")
    arguments = parser.parse_args()

    with open(arguments.results, encoding="utf-8") as file:
        results = json.load(file)
    for entry in results["benchmarks"]:
        if "label" in entry and "error_message" not in entry:
            measure(entry, arguments.samples, 0.005 if arguments.quick else 0.02)
    with open(arguments.results, "w", encoding="utf-8") as file:
        json.dump(results, file, indent=2)
    return 0


if __name__ == "__main__":
    sys.exit(main())
