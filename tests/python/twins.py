"""The operators once more, slowly: what the tests compare the package with, to the bit.

Every twin takes images as (height, width, bands) arrays and masks as (height, width) arrays of bool, True for
a valid pixel, or None. Arithmetic is written in the order that the headers of the operators give.
"""

from __future__ import annotations

import math

import numpy as np

F32 = np.float32
F64 = np.float64


# Conversions


def plain_cast(values, out) -> np.ndarray:
    """Converts without rounding and without saturation; NaN and what does not fit give the lowest value."""
    values, out = np.asarray(values), np.dtype(out)
    if values.dtype.kind != "f" or out.kind == "f":
        with np.errstate(over="ignore"):
            return values.astype(out)
    if out == np.uint64:
        top = values.dtype.type(2.0**63)
        above = values >= top
        shifted = np.where(above, values - top, values)
        signed = truncated(shifted, np.int64).astype(np.uint64)
        return np.where(above, signed ^ np.uint64(2**63), signed)
    wide = np.int64 if out.itemsize == 8 or out == np.uint32 else np.int32
    return truncated(values, wide).astype(out)


def truncated(values, signed) -> np.ndarray:
    """Truncates towards zero to a signed type; its lowest value for NaN and for what it cannot hold."""
    lowest = np.iinfo(signed).min
    limit = values.dtype.type(-float(lowest))
    with np.errstate(invalid="ignore"):
        fits = (values >= -limit) & (values < limit)
    return np.where(fits, np.where(fits, values, 0).astype(signed), signed(lowest))


def clip_to(values, out) -> np.ndarray:
    """Converts a computed value to the type of an output, with the rounding and the limits of that type."""
    values, out = np.asarray(values), np.dtype(out)
    if out.kind == "f" or values.dtype == out:
        with np.errstate(over="ignore"):
            return values.astype(out)
    return clip_floating(values, out) if values.dtype.kind == "f" else clip_integer(values, out)


def clip_floating(values, out) -> np.ndarray:
    one = values.dtype.type
    zero_below = out.kind == "u" or out.itemsize == 8
    highest = np.iinfo(out).max
    lowest = 0 if zero_below else np.iinfo(out).min
    with np.errstate(invalid="ignore"):
        if out.itemsize < 8:
            up = np.ones(values.shape, bool) if out.kind == "u" else values >= 0
            values = values + np.where(up, one(0.5), one(-0.5))
        above = values >= one(highest)
        below = values <= one(lowest) if zero_below else values < one(lowest)
    result = plain_cast(values, out)
    result = np.where(below, out.type(lowest), result)
    return np.where(above, out.type(highest), result)


def clip_integer(values, out) -> np.ndarray:
    given, limits = values.dtype, np.iinfo(out)
    bounds = np.iinfo(given)
    narrows = out.itemsize < given.itemsize
    keeps_low_bits = given == np.int64 and narrows
    result = values.astype(out)
    if bounds.max > limits.max:
        result[values >= given.type(limits.max)] = limits.max
    if given.kind == "i" and not keeps_low_bits:
        if out.kind == "u" or out.itemsize == 8:
            result[values < 1] = 0
        elif narrows:
            result[values < given.type(limits.min)] = limits.min
    return result


# Helpers


def float_bands(image) -> np.ndarray:
    return image.astype(F32)


def near(values, number, threshold=1e-9) -> np.ndarray:
    """True where single values are no-data: nearer to `number` than 1e-9, NaN never."""
    with np.errstate(invalid="ignore", over="ignore"):
        difference = values - values.dtype.type(number)
        return (difference < threshold) & (difference > -threshold)


def everywhere(mask, image) -> np.ndarray:
    return np.ones(image.shape[:2], bool) if mask is None else mask


def ignoring_errors(function):
    """Infinities and NaN belong to the results, so that numpy need not tell of them."""

    def wrapped(*arguments, **named):
        with np.errstate(all="ignore"):
            return function(*arguments, **named)

    return wrapped


# Filters


@ignoring_errors
def average_channels(image, mask, out, nodata=0.0):
    bands = float_bands(image)
    total = np.zeros(image.shape[:2], F32)
    for c in range(image.shape[2]):
        total = total + bands[..., c]
    result = clip_to(total / F32(image.shape[2]), out)
    result[near(bands, nodata).any(axis=2)] = clip_to(F32(nodata), out)
    result[~everywhere(mask, image)] = plain_cast(plain_cast(F32(nodata), image.dtype), out)
    return result[..., None]


def normals(image, mask, dx, dy, scale):
    """nx, ny of the cell of each pixel, in single precision; the image has a margin of 1 on each side."""
    z = float_bands(image)
    valid = everywhere(mask, image)
    z00 = z[1:-1, 1:-1]
    corners = []
    for y, x in ((0, 1), (1, 0), (1, 1)):
        rows, columns = slice(1 + y, z.shape[0] - 1 + y), slice(1 + x, z.shape[1] - 1 + x)
        corners.append(np.where(valid[rows, columns][..., None], z[rows, columns], z00))
    z10, z01, z11 = corners
    scale, dx, dy = F32(scale), F32(dx), F32(dy)
    top, left = (z10 - z00) * scale, (z01 - z00) * scale
    bottom, right = (z01 - z11) * scale, (z10 - z11) * scale
    nx = ((bottom - top) * dy) * F32(0.5)
    ny = ((right - left) * dx) * F32(0.5)
    return nx, ny


def neighbours(values):
    """Angles rounded to single precision, with the numbers below and above: one of them is the core's."""
    single = values.astype(F32)
    return [np.nextafter(single, F32(-np.inf)), single, np.nextafter(single, F32(np.inf))]


@ignoring_errors
def slope_degrees(image, mask, dx, dy, scale=1.0):
    """Degrees in single precision, for each of the neighbours of the angle, and where the cell is level."""
    nx, ny = normals(image, mask, dx, dy, scale)
    nz = F32(dx) * F32(dy)
    cosine = nz / np.sqrt((ny * ny + nx * nx) + nz * nz)
    angles = neighbours(np.arccos(np.minimum(cosine, F32(1)).astype(F64)))
    level = (nx == 0) & (ny == 0)
    return [np.where(level, F32(0), angle * F32(57.29578)) for angle in angles], level


@ignoring_errors
def aspect_degrees(image, mask, dx, dy, scale=1.0, flat=510.0):
    """The same of the aspect of channel 0; what has no direction counts as level."""
    nx, ny = normals(image[..., :1], mask, dx, dy, scale)
    valid = everywhere(mask, image)
    h, w = valid.shape[0] - 2, valid.shape[1] - 2
    around = [valid[1 + y : 1 + y + h, 1 + x : 1 + x + w] for y, x in ((0, 1), (1, 0), (1, 1))]
    level = (nx == 0) & (ny == 0) | ~np.logical_and.reduce(around)[..., None]
    results = []
    for angle in neighbours(np.arctan2(ny.astype(F64), nx.astype(F64))):
        degrees = (angle + F32(1.5707964)) * F32(57.29578)
        degrees = np.where(degrees < 0, degrees + F32(360), degrees)
        results.append(np.where(level, F32(flat), degrees))
    return results, level


@ignoring_errors
def threshold(image, mask, out, minimum, maximum):
    s, low, high = float_bands(image), F32(minimum), F32(maximum)
    inside = (s >= low) & (s <= high) if low <= high else (s >= low) | (s <= high)
    return (inside & everywhere(mask, image)[..., None]).astype(out)


@ignoring_errors
def mirror(image, mask, out, axis, window=(), crop=False, target=None):
    """`mask` marks the window; `target` is what the output held, for the pixels that are not written."""
    h, w, _ = image.shape
    marked = everywhere(mask, image)
    values = clip_to(float_bands(image), out)
    width, height = (window[2], window[3]) if len(window) else (w, h)
    result = values.copy() if not crop else target.copy()
    vertical = axis.upper() == "VERT"
    for line in range(h if vertical else w):
        places = np.flatnonzero(marked[line] if vertical else marked[:, line])
        for k in range(len(places)):
            source, goal = places[0] + (width if vertical else height) - 1 - k, k if crop else places[0] + k
            if vertical:
                result[line, goal] = values[line, source]
            else:
                result[goal, line] = values[source, line]
    return result


@ignoring_errors
def normalize(image, out, minimum, maximum, nodata=0.0):
    v, low, high = float_bands(image), np.asarray(minimum, F32), np.asarray(maximum, F32)
    share = ((v - low).astype(F64) * 100.0) / (high - low).astype(F64)
    p = np.clip(share.astype(F32), F32(0), F32(100))
    p = np.where(v >= high, F32(100), p)
    p = np.where(v <= low, F32(0), p)
    result = clip_to(p.astype(F32), out)
    result[near(v, nodata)] = clip_to(F32(nodata), out)
    return result


class Spline:
    """The cubic spline through the cumulative percentages of one histogram, `scale` bins per unit."""

    def __init__(self, counts, scale: float) -> None:
        counts = [int(count) for count in counts]
        n = len(counts)
        total = sum(counts)
        self.bins = n
        self.cumulative = [0.0] * (n + 1) + [100.0]
        for i in range(1, n + 1):
            share = 100 * counts[i - 1] / total if total else 0.0
            self.cumulative[i] = share + self.cumulative[i - 1] if total else 0.0
        self._solve(n, float(scale))

    def _solve(self, n: int, s: float) -> None:
        knots = self.cumulative
        mu, z = [0.0] * (n + 2), [0.0] * (n + 2)
        for i in range(1, n + 1):
            alpha = ((knots[i + 1] - knots[i] * 2.0) + knots[i - 1]) * (s * 3.0)
            diagonal = ((2.0 - mu[i - 1]) * 2.0) / s
            mu[i] = 1.0 / (diagonal * s)
            z[i] = (alpha - z[i - 1] / s) / diagonal
        self.quadratic, self.linear, self.cubic = [0.0] * (n + 2), [0.0] * (n + 2), [0.0] * (n + 2)
        for j in range(n, -1, -1):
            self.quadratic[j] = z[j] - mu[j] * self.quadratic[j + 1]
            step = (self.quadratic[j] * 2.0 + self.quadratic[j + 1]) / (s * 3.0)
            self.linear[j] = (knots[j + 1] - knots[j]) * s - step
            self.cubic[j] = ((self.quadratic[j + 1] - self.quadratic[j]) * s) / 3.0

    def at(self, b: int, dx: float) -> float:
        line = dx * self.linear[b] + self.cumulative[b]
        parabola = line + (dx * self.quadratic[b]) * dx
        return parabola + ((dx * self.cubic[b]) * dx) * dx


def percentile_of(v, low, high, s, spline) -> tuple[float, bool]:
    """The percentile of a single value, and whether it comes from the spline."""
    if v <= low or low == high:
        return 0.0, False
    if v >= high:
        return 100.0, False
    position = F32(F32(v - low) * F32(s))
    if not np.isfinite(position):
        return (100.0 if position > 0 else 0.0), False
    b = math.floor(position)
    if b < 0:
        return 0.0, False
    if b >= spline.bins:
        return 100.0, False
    return spline.at(b, float(v) - (float(b) / float(s) + float(low))), True


@ignoring_errors
def percentile_stretch(image, out, counts, minimum, maximum, nodata=0.0):
    """`counts` is (bands, bins)."""
    v = float_bands(image)
    p = np.zeros(image.shape, F32)
    for c in range(image.shape[2]):
        low, high = F32(minimum[c]), F32(maximum[c])
        s = F32(len(counts[c])) / F32(high - low)
        spline = Spline(counts[c], s)
        for y, x in np.ndindex(image.shape[:2]):
            value, from_spline = percentile_of(v[y, x, c], low, high, s, spline)
            p[y, x, c] = F32(plain_cast(F64(value), image.dtype)) if from_spline else F32(value)
    result = clip_to(p, out)
    result[near(v, nodata)] = clip_to(F32(nodata), out)
    return result


def intensity_percentile_of(v, low, high, s, spline) -> tuple[float, bool]:
    if not v > low:
        return 0.0, False
    if v >= high:
        return 100.0, False
    b = math.floor((v - low) * s)
    if b < 0:
        return 0.0, False
    if b >= spline.bins:
        return 100.0, False
    return spline.at(b, v - (float(b) / s + low)), True


@ignoring_errors
def intensity_percentile(image, mask, out, counts, minimum, maximum, scale, sign=0, nodata=0.0):
    spline = Spline(counts, scale)
    single = float_bands(image)
    result = np.zeros(image.shape[:2] + (4,), out)
    result[..., :3] = clip_to(image[..., :3], out)
    for y, x in np.ndindex(image.shape[:2]):
        s0, s1, v = image[y, x, 0], image[y, x, 1], single[y, x, 2]
        p, from_spline = intensity_percentile_of(
            float(v), float(minimum), float(maximum), float(scale), spline
        )
        p = F32(plain_cast(F64(p), image.dtype)) if from_spline else F32(p)
        if (sign == 2 and s0 > s1) or (sign == 1 and s1 > s0):
            p = -p
        result[y, x, 3] = clip_to(v if v == F32(nodata) else p, out)
    excluded = clip_to(plain_cast(F64(nodata), image.dtype), out)
    result[~everywhere(mask, image)] = excluded
    return result


def ratio(numerator, denominator):
    return np.where(denominator == 0, 0.0, numerator / np.where(denominator == 0, 1.0, denominator))


def limited(values):
    return np.where(values < -1.0, -1.0, np.where(values > 1.0, 1.0, values))


def gemi(R, N):
    divisor = (N + R) + 0.5
    eta = ratio(((N * N - R * R) * 2.0 + 1.5 * N) + 0.5 * R, divisor)
    return np.where(R == 1, 0.0, (1.0 - 0.25 * eta) * eta - (R - 0.125) / np.where(R == 1, 2.0, 1.0 - R))


def index_values(code, B, G, R, E, N, S1, S2):
    """One vegetation index in double precision."""
    formulas = (
        lambda: ratio(G - R, G + R),
        lambda: ((G + 255.0) - (R + B) * 0.5) * 0.5,
        lambda: N - R,
        lambda: ratio(N, R),
        lambda: limited(ratio(N - R, N + R)),
        lambda: np.where(N + R == 0, 0.0, np.sqrt(ratio(N - R, N + R) + 0.5).astype(F32).astype(F64)),
        lambda: limited(ratio(N - R, (N + R) + 0.5) * 1.5),
        lambda: ((N + 1.0) * 2.0 - np.sqrt((2.0 * N + 1.0) ** 2 - (N - R) * 8.0)) * 0.5,
        lambda: gemi(R, N),
        lambda: ((((-0.2848 * B - 0.2435 * G) - 0.5436 * R) + 0.7243 * N) + 0.084 * S1) - 1.18 * S2,
        lambda: np.where(R == 0, 0.0, ((E - R) - (E - G) * 0.2) * ratio(E, R)),
        lambda: ((N - G) * 1.2 - (R - G) * 2.5) * 1.2,
    )
    return formulas[code]()


@ignoring_errors
def vegetation_indices(image, mask, out, codes, roles):
    """`roles` holds the role of each band; the output has the order of `codes`."""
    bands = [np.zeros(image.shape[:2], F64)] * 7
    for channel, role in enumerate(roles):
        if role < 7:
            bands[role] = image[..., channel].astype(F32).astype(F64)
    result = np.zeros(image.shape[:2] + (len(codes),), out)
    for position, code in enumerate(codes):
        result[..., position] = clip_to(index_values(code, *bands), out)
    result[~everywhere(mask, image)] = clip_to(F64(-1e20), out)
    return result


# Focus measures


def counts_for_focus(values, background, failure):
    return ~near(values, failure) & (values > background[0]) & (values < background[1])


def sum_in_order(terms) -> float:
    return float(np.add.accumulate(np.concatenate([[0.0], terms]))[-1])


@ignoring_errors
def squared_gradient(image, mask, background=(-1e7, 1e7), failure=-32767.0):
    valid = everywhere(mask, image)
    sums = []
    for c in range(image.shape[2]):
        v = image[..., c].astype(F64)
        counts = counts_for_focus(v, background, failure)
        terms = []
        for y in range(image.shape[0] - 1):
            n = int((valid[y] & valid[y + 1]).sum())
            both = counts[y, :n] & counts[y + 1, :n]
            terms.append(((v[y + 1, :n] - v[y, :n]) ** 2)[both])
        sums.append(sum_in_order(np.concatenate(terms) if terms else np.zeros(0)))
    return np.array(sums)


@ignoring_errors
def vollath(image, mask, background=(-1e7, 1e7), failure=-32767.0):
    valid = everywhere(mask, image)
    left, right = [], []
    for c in range(image.shape[2]):
        v = image[..., c].astype(F64)
        counts = counts_for_focus(v, background, failure)
        first, second = [np.zeros(0)], [np.zeros(0)]
        for y in range(image.shape[0]):
            n = int((valid[y, :-2] & valid[y, 1:-1]).sum())
            p0, p1, p2 = v[y, :n], v[y, 1 : n + 1], v[y, 2 : n + 2]
            all_three = counts[y, :n] & counts[y, 1 : n + 1] & counts[y, 2 : n + 2]
            first.append((p1 * p0)[all_three])
            second.append((p2 * p0)[all_three])
        left.append(sum_in_order(np.concatenate(first)))
        right.append(sum_in_order(np.concatenate(second)))
    return np.array(left), np.array(right)


# Two dates


def excluded_samples(image, reference, image_nodata, reference_nodata):
    """The samples that are no-data in either date; the arguments have an entry for each band, or are None."""
    bands = image.shape[2]
    if image_nodata is None:
        return np.zeros(image.shape, bool)
    of_image = float_bands(image) == np.asarray(image_nodata, F32)
    return of_image | (float_bands(reference[..., :bands]) == np.asarray(reference_nodata, F32)[:bands])


def excluded_pixels(image, reference, image_nodata, reference_nodata):
    """The pixels with a no-data sample in any band of either date."""
    if image_nodata is None:
        return np.zeros(image.shape[:2], bool)
    of_image = (float_bands(image) == np.asarray(image_nodata, F32)).any(axis=2)
    return of_image | (float_bands(reference) == np.asarray(reference_nodata, F32)).any(axis=2)


def finish(result, excluded, mask, fill):
    result[excluded] = clip_to(F32(fill), result.dtype)
    result[~everywhere(mask, result)] = clip_to(F32(fill), result.dtype)
    return result


@ignoring_errors
def difference(image, reference, mask, out, form):
    i, r = float_bands(image[..., :1]), float_bands(reference[..., :1])
    d = {0: np.abs(r - i), 1: r - i}.get(form, i - r)
    return finish(clip_to(d, out), np.zeros(d.shape, bool), mask, 0.0)


@ignoring_errors
def channel_difference(image, reference, mask, out, form, nodata=None, reference_nodata=None, fill=0.0):
    a, b = plain_cast(image, out), plain_cast(reference[..., : image.shape[2]], out)
    if form == 0:
        d = np.where(a >= b, a - b, b - a)
    elif form == 1:
        d = a - b
    else:
        d = 0 - (a - b) if np.dtype(out).kind == "f" else b - a
    return finish(d, excluded_samples(image, reference, nodata, reference_nodata), mask, fill)


def both_masks(mask, reference_mask, image):
    return everywhere(mask, image) & everywhere(reference_mask, image)


@ignoring_errors
def channel_difference_two_masks(
    image, reference, mask, reference_mask, out, form, nodata=None, reference_nodata=None, fill=0.0
):
    r = reference[..., : image.shape[2]]
    a, b = plain_cast(image, out), plain_cast(r, out)
    if form == 0:
        k = clip_to(r, out)
        kind = F32 if F32 in (image.dtype.type, np.dtype(out).type) else np.int32
        i, k = image.astype(kind), k.astype(kind)
        d = plain_cast(np.where(a >= b, i - k, k - i), out)
    else:
        d = a - b
    valid = both_masks(mask, reference_mask, image)
    return finish(d, excluded_samples(image, reference, nodata, reference_nodata), valid, fill)


@ignoring_errors
def channel_ratio(
    image, reference, mask, reference_mask, out, form, nodata=None, reference_nodata=None, fill=3.4e38
):
    q = float_bands(image) / float_bands(reference[..., : image.shape[2]])
    q = np.abs(q) if form == 0 else q
    valid = both_masks(mask, reference_mask, image)
    return finish(clip_to(q, out), excluded_samples(image, reference, nodata, reference_nodata), valid, fill)


@ignoring_errors
def combine(image, reference, mask, out, fill=0.0):
    result = np.concatenate([clip_to(image, out), clip_to(reference, out)], axis=2)
    return finish(result, np.zeros(result.shape, bool), mask, fill)


def mean_in_double(image):
    total = np.zeros(image.shape[:2], F64)
    for c in range(image.shape[2]):
        total = total + image[..., c].astype(F64)
    return total / image.shape[2]


def decibels(s: float, t: float) -> float:
    if t == 0:
        return 0.0
    q = abs(np.float64(s) / np.float64(t))
    return float("-inf") if q == 0 else 10.0 * (math.log10(q) if q == q else float("nan"))


@ignoring_errors
def intensity_ratio(image, reference, mask, out, nodata=None, reference_nodata=None, fill=0.0):
    s, t = mean_in_double(image), mean_in_double(reference)
    d = np.array([decibels(*pair) for pair in zip(s.flat, t.flat)]).reshape(s.shape)
    result = clip_to(np.stack([s, t, d, np.zeros(s.shape)], axis=2), out)
    pixels = excluded_pixels(image, reference, nodata, reference_nodata)
    return finish(result, pixels, mask, fill)


def magnitude(image):
    total = np.zeros(image.shape[:2], F64)
    promoted = image.astype(np.int32) if image.dtype.itemsize < 4 else image
    for c in range(image.shape[2]):
        total = total + (promoted[..., c] * promoted[..., c]).astype(F64)
    return np.sqrt(total)


@ignoring_errors
def magnitude_change(image, reference, mask, out, form, nodata=None, reference_nodata=None, fill=0.0):
    a, b = magnitude(image), magnitude(reference)
    c = np.abs(a - b) if form == 0 else (a - b if form == 1 else b - a)
    pixels = excluded_pixels(image, reference, nodata, reference_nodata)
    return finish(clip_to(np.stack([a, b, c], axis=2), out), pixels, mask, fill)


MSS = ("Landsat-4 MSS", "Landsat-5 MSS")
TM = ("Landsat-4 TM", "Landsat-5 TM")
ETM = "Landsat-7 ETM+"
SENSORS = MSS + TM + (ETM, "Ikonos", "QuickBird")
GREENNESS = {
    MSS[0]: (-0.29, -0.562, 0.6, 0.49),
    TM[0]: (-0.2848, -0.2435, -0.5436, 0.7243, 0.084, -0.18),
    ETM: (-0.3344, -0.3544, -0.4556, 0.6966, -0.0242, -0.263),
    "Ikonos": (-0.311, -0.356, -0.324, 0.819),
    "QuickBird": (-0.121, -0.331, -0.517, 0.78),
}
BRIGHTNESS = {
    MSS[0]: (0.433, 0.632, 0.586, 0.264),
    TM[0]: (0.3037, 0.2793, 0.4343, 0.5585, 0.5082, 0.1863),
    ETM: (0.3561, 0.3872, 0.3904, 0.6966, 0.2286, 0.1596),
    "Ikonos": (0.326, 0.509, 0.56, 0.567),
    "QuickBird": (0.319, 0.542, 0.49, 0.604),
}
for weights in (GREENNESS, BRIGHTNESS):
    weights[MSS[1]], weights[TM[1]] = weights[MSS[0]], weights[TM[0]]


def bands_of(sensor: str) -> int:
    return len(GREENNESS[sensor])


def tasseled_cap(image, sensor, greenness):
    w = [abs(weight) for weight in (GREENNESS if greenness else BRIGHTNESS)[sensor]]
    terms = [w[c] * image[..., c].astype(F64) for c in range(len(w))]
    first = terms[1] + terms[0]
    if not greenness:
        result = (first + terms[2]) + terms[3]
        return (result + terms[4]) + terms[5] if len(w) == 6 else result
    if sensor in MSS:
        return (terms[2] - first) + terms[3]
    result = terms[3] - (first + terms[2])
    if sensor in TM:
        return (result + terms[4]) - terms[5]
    return (result - terms[4]) - terms[5] if sensor == ETM else result


@ignoring_errors
def tasseled_cap_change(
    image, reference, mask, out, sensors, form, greenness=True, nodata=None, reference_nodata=None, fill=0.0
):
    a = tasseled_cap(image, sensors[0], greenness)
    b = tasseled_cap(reference, sensors[1], greenness)
    d = {0: np.abs(a - b), 2: -(a - b)}.get(form, a - b)
    pixels = excluded_samples(image, reference, nodata, reference_nodata).any(axis=2)
    return finish(clip_to(np.stack([a, b, d], axis=2), out), pixels, mask, fill)


# Services


def blue_of(image):
    s0, s1, s2 = (image[..., c].astype(F64) for c in range(3))
    return ((s0 * 0.873393 + 13.9054) - s1 * 0.138254) - s2 * 0.100616


@ignoring_errors
def statistics(image, mask, bins, synthetic_blue=False):
    """Minima, maxima (float32) and counts (int64) of the valid pixels."""
    bands = image.shape[2]
    minima, maxima = np.full(bands, 100000, F32), np.full(bands, -100000, F32)
    counts = np.zeros((bands, bins), np.int64)
    valid = everywhere(mask, image)
    for c in range(bands):
        values = image[..., c][valid]
        if synthetic_blue and c == 2:
            values = np.clip(plain_cast(blue_of(image)[valid], np.int32), 0, 255)
        for value in values:
            single = F32(value)
            minima[c] = single if single < minima[c] else minima[c]
            maxima[c] = single if single > maxima[c] else maxima[c]
        numbers = plain_cast(values, np.int32) if values.dtype.kind == "f" else values
        inside = (numbers >= 0) & (numbers < bins)
        counts[c] = np.bincount(numbers[inside].astype(np.int64), minlength=bins)
    return minima, maxima, counts


@ignoring_errors
def range_classes(image, out, ranges, nodata=float("nan")):
    s = float_bands(image[..., 0])
    result = np.zeros(s.shape, np.int32)
    for number, (low, high) in enumerate(ranges, 1):
        result[(s > F32(low)) & (s < F32(high))] = number
    result[near(s, nodata)] = 0
    return plain_cast(result, out)[..., None]


def source_coordinate(p, in_region, out_region, in_origin, out_origin, extent, axis):
    """The input coordinate of one output coordinate, on one axis."""
    t = (p - out_region[axis] + out_origin[axis]) % 2**32
    target, given = float(out_region[2 + axis]), float(in_region[2 + axis])
    with np.errstate(all="ignore"):
        u = ((F64(t) / (F64(target) / F64(given)) + in_region[axis]) - in_origin[axis]) + 0.5
    return min(max(int(plain_cast(F64(u), np.int32)), 0), extent - 1)


def transfer(image, out, in_region, out_region, shape, in_origin=(0, 0), out_origin=(0, 0)):
    h, w, _ = image.shape
    given = (in_region, out_region, in_origin, out_origin)
    rows = [source_coordinate(y, *given, h, 1) for y in range(shape[0])]
    columns = [source_coordinate(x, *given, w, 0) for x in range(shape[1])]
    return plain_cast(image[np.ix_(rows, columns)], out), np.ix_(rows, columns)


@ignoring_errors
def blue_background(image, mask, minimum, maximum, background, blue):
    found = ~everywhere(mask, image)
    for c in range(image.shape[2]):
        whole = image[..., c]
        whole = plain_cast(whole, np.int32) if whole.dtype.kind == "f" else whole.astype(np.int32)
        found = found | (whole == plain_cast(F32(background[c]), np.int32))
        if c < 2:
            single = whole.astype(F32)
            found = found | (single < F32(minimum[c])) | (single > F32(maximum[c]))
    if image.shape[2] == 3:
        found = found | (blue < F64(F32(minimum[2]))) | (blue > F64(F32(maximum[2])))
    return found


@ignoring_errors
def spot_blue(image, mask, out, bands, minimum, maximum, background, scale=None):
    """`bands` of the output: 3 for red, green and blue, 1 for blue alone; the image has 3 bands or more."""
    blue = blue_of(image)
    found = blue_background(image, mask, minimum, maximum, background, blue)
    if scale is None:
        red, green = plain_cast(image[..., 1], out), plain_cast(image[..., 0], out)
        values = clip_to(np.where(blue < 0.0, 0.0, np.where(blue > 255.0, 255.0, blue)), out)
    else:
        kind = F64 if image.dtype == F64 else F32
        parts = [
            clip_to((image[..., c].astype(kind) - kind(F32(minimum[c]))) * kind(F32(scale[c])), out)
            for c in (1, 0)
        ]
        red, green = parts
        values = clip_to((blue - F64(F32(minimum[2]))) * F64(F32(scale[2])), out)
    result = np.stack([red, green, values] if bands == 3 else [values], axis=2)
    entries = plain_cast(np.asarray(background[:3], F32), out)
    result[found] = entries if bands == 3 else entries[:1]
    return result
