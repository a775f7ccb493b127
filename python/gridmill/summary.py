"""Statistics, histograms and focus measures of an image."""

from __future__ import annotations

from typing import Any, Iterator, NamedTuple, Optional, Sequence, Tuple, Union

import numpy as np
from numpy.typing import ArrayLike

from . import _core
from ._arguments import (
    bands_of,
    counted,
    image_of,
    mask_of,
    number,
    numbers,
    per_band,
    row_blocks,
    value_error,
    whole,
)
from ._arrays import raster_function
from ._types import COUNTED_TYPES, FLOAT32

_MOST_COUNTED = 2**31 - 1  # as far as the bins of the core count
_MOST_IN_BIN = 21474836  # times 100 in 32 bits
_BINS = 256
_MOST_BINS = 1 << 20


class Statistics(NamedTuple):
    """What `statistics` returns; that of two pieces of an image can be merged."""

    minimum: np.ndarray  #: float32, (bands,); 100000 where nothing is less
    maximum: np.ndarray  #: float32, (bands,); -100000 where nothing is greater
    histogram: np.ndarray  #: int64, (bands, 256 or 65536); bin v counts the samples of value v

    def merge(self, other: Statistics) -> Statistics:
        """The statistics of both.

        Parameters
        ----------
        other : Statistics
            Of an image with as many bands, and with as many bins.

        Returns
        -------
        Statistics
            As if `statistics` had had the pixels of both.

        Raises
        ------
        ValueError
            If bands or bins are not as many.
        """
        if self.histogram.shape != other.histogram.shape:
            raise value_error("other", f"bands and bins {other.histogram.shape}", f"{self.histogram.shape}")
        return Statistics(
            np.minimum(self.minimum, other.minimum),
            np.maximum(self.maximum, other.maximum),
            self.histogram + other.histogram,
        )


class Histogram(NamedTuple):
    """What `histogram` returns and the percentile functions take: equal bins of each band."""

    counts: np.ndarray  #: int32, (bands, bins)
    minimum: np.ndarray  #: float32, (bands,): lower edge of the first bin
    maximum: np.ndarray  #: float32, (bands,): upper edge of the last bin


class VollathSums(NamedTuple):
    """What `vollath` returns."""

    left: np.ndarray  #: float64, (bands,): sums of the products with the next sample of the row
    right: np.ndarray  #: float64, (bands,): sums of the products with the one after it

    @property
    def measure(self) -> np.ndarray:
        """left - right: the sharper of two images of one scene has the larger one."""
        return self.left - self.right


@raster_function(rasters=("image",), masks=("mask",), blocks="statistics")
def statistics(
    image: ArrayLike,
    *,
    synthetic_blue: bool = False,
    bits: Optional[int] = None,
    mask: Optional[np.ndarray] = None,
) -> Statistics:
    """Minimum, maximum and histogram of each band.

    A sample counts in the bin of its value, truncated to a whole number.

    Parameters
    ----------
    image : array_like
        (height, width) or (height, width, bands).
    synthetic_blue : bool, optional
        Count, in place of the third band, a blue band made of the first three, which are green, red and near
        infrared: that of the function `synthetic_blue`, truncated and limited to 0 to 255.
    bits : {8, 16}, optional
        256 or 65536 bins. None: 8 for types of 8 bits, else 16. Wider types have no 8.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. Masked pixels do not count.

    Returns
    -------
    Statistics
        `minimum` and `maximum`, float32 of (bands,), and `histogram`, int64 of (bands, 256 or 65536).

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    A sample without a bin, one that is negative or beyond the last bin, counts for minimum and maximum alone;
    NaN counts for nothing. Minimum and maximum start from 100000 and -100000: a band whose samples all lie
    above 100000 has that minimum, one whose samples all lie below -100000 that maximum, and one without a
    sample both. No value counts as no-data.

    References
    ----------
    The image histogram, Richards and Jia (2006), "Remote Sensing Digital Image Analysis", chapter 4.

    Examples
    --------
    >>> of = statistics(np.array([[1, 1, 200]], dtype="uint8"))
    >>> of.minimum, of.maximum, of.histogram[0, 1]
    (array([1.], dtype=float32), array([200.], dtype=float32), 2)
    """
    samples = image_of("image", image)
    valid = mask_of("mask", mask, samples)
    bands = bands_of(samples)
    if synthetic_blue and bands < 3:
        raise value_error("image", counted(bands), "three bands or more for a synthetic blue")
    bits = _bits_of(bits, samples.dtype)
    result = _collected(_counter(bands, bits, synthetic_blue), bands, bits)
    for part, part_mask in _countable(samples, valid):
        counter = _counter(bands, bits, synthetic_blue)
        for pixels in (part,) if part_mask is None else _valid_pixels(part, part_mask):
            counter.Process(pixels)
        result = result.merge(_collected(counter, bands, bits))
    return result


@raster_function(rasters=("image",), masks=("mask",), blocks="histogram")
def histogram(
    image: ArrayLike,
    *,
    bins: Optional[int] = None,
    minimum: Union[None, float, Sequence[float]] = None,
    maximum: Union[None, float, Sequence[float]] = None,
    mask: Optional[np.ndarray] = None,
) -> Histogram:
    """The histogram of each band, as `percentile_stretch` and `intensity_percentile` take it.

    uint8 and uint16 images get a bin for each whole number, from the least sample of a band on; the number of
    bins is that of the band with the widest range. All others get 256 equal bins from the least to the
    greatest finite sample of each band.

    Parameters
    ----------
    image : array_like
        (height, width) or (height, width, bands).
    bins : int, optional
        Number of bins of each band, from 1 to 1048576, instead of the numbers above. The bins of uint8 and
        uint16 images then run from the least to the greatest sample as well.
    minimum, maximum : float or sequence of float, optional
        Where the first bin begins and the last one ends, one number or one for each band; by default as
        above. Samples outside do not count. Of uint8 and uint16 images with both and without `bins`, there is
        a bin for each whole number between them.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. Masked pixels do not count.

    Returns
    -------
    Histogram
        `counts`, int32 of (bands, bins), `minimum` and `maximum`, float32 of (bands,). A band without a
        sample has counts and range of 0.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described, a minimum above the maximum among them.

    Notes
    -----
    Samples and edges are taken in single precision. NaN and infinite samples do not count.

    The percentile functions multiply counts by 100 in 32 bits, and a count above 21474836, or a total of a
    band above 2147483647, would wrap. So if there are any, all counts of all bands are divided by the least
    whole number with which there are none, and rounded down: the histogram of a very large image is one in
    proportion.

    References
    ----------
    The image histogram, Richards and Jia (2006), "Remote Sensing Digital Image Analysis", chapter 4.

    Examples
    --------
    >>> of = histogram(np.array([[3, 4, 4, 6]], dtype="uint8"))
    >>> of.counts, of.minimum, of.maximum
    (array([[1, 2, 0, 1]], dtype=int32), array([3.], dtype=float32), array([7.], dtype=float32))
    """
    samples = image_of("image", image)
    valid = mask_of("mask", mask, samples)
    bands = bands_of(samples)
    if bins is not None:
        bins = whole("bins", bins, 1, _MOST_BINS)
    low = None if minimum is None else per_band("minimum", minimum, bands)
    high = None if maximum is None else per_band("maximum", maximum, bands)
    if samples.dtype in COUNTED_TYPES:
        return histogram_of_counts(statistics(samples, mask=valid), bins, low, high)
    return _histogram_of_samples(samples, valid, bins or _BINS, low, high)


def histogram_of_counts(
    counted: Statistics,
    bins: Optional[int],
    minimum: Optional[Sequence[float]],
    maximum: Optional[Sequence[float]],
) -> Histogram:
    """The histogram of an image whose samples have a bin for each value."""
    empty = counted.minimum > counted.maximum
    low = _edges(minimum, counted.minimum, empty)
    by_value = bins is None
    high = _edges(maximum, counted.maximum + FLOAT32.type(1) if by_value else counted.maximum, empty)
    _require_order(low, high)
    if by_value:
        bins = min(max(int(np.ceil((high - low).max())), 1), _MOST_BINS)
        if maximum is None:
            high = np.where(empty, high, low + FLOAT32.type(bins))
    values = np.arange(counted.histogram.shape[1], dtype=np.float32)
    counts = [
        binned(values, bins, low[band], high[band], counted.histogram[band]) for band in range(low.size)
    ]
    return Histogram(fitting_counts(np.stack(counts)), low, high)


def _histogram_of_samples(
    image: np.ndarray,
    mask: Optional[np.ndarray],
    bins: int,
    minimum: Optional[Sequence[float]],
    maximum: Optional[Sequence[float]],
) -> Histogram:
    if minimum is None or maximum is None:
        least, greatest = extremes(image, mask)
    else:
        least = greatest = np.zeros(bands_of(image), np.float32)
    empty = least > greatest
    low, high = _edges(minimum, least, empty), _edges(maximum, greatest, empty)
    _require_order(low, high)
    counts = np.zeros((low.size, bins), np.int64)
    for pixels in _valid_pixels(image, mask):
        samples = pixels.reshape(-1, low.size).astype(np.float32, copy=False)
        for band in range(low.size):
            counts[band] += binned(samples[:, band], bins, low[band], high[band])
    return Histogram(fitting_counts(counts), low, high)


def extremes(image: np.ndarray, mask: Optional[np.ndarray]) -> Tuple[np.ndarray, np.ndarray]:
    """The least and the greatest finite valid sample of each band in single precision; infinity and minus
    infinity of a band without one."""
    bands = bands_of(image)
    least, greatest = np.full(bands, np.inf, np.float32), np.full(bands, -np.inf, np.float32)
    for pixels in _valid_pixels(image, mask):
        samples = pixels.reshape(-1, bands)
        for band in range(bands):
            low, high = _finite_extremes(samples[:, band])
            least[band], greatest[band] = min(least[band], low), max(greatest[band], high)
    return least, greatest


def _finite_extremes(samples: np.ndarray) -> Tuple[np.float32, np.float32]:
    low, high = samples.min(), samples.max()
    if not (np.isfinite(low) and np.isfinite(high)):  # NaN prevails in both
        with np.errstate(over="ignore"):
            single = samples.astype(np.float32, copy=False)
        single = single[np.isfinite(single)]
        if single.size == 0:
            return FLOAT32.type(np.inf), FLOAT32.type(-np.inf)
        low, high = single.min(), single.max()
    # A zero without its sign, which would depend on the order of the samples.
    return FLOAT32.type(low) + FLOAT32.type(0), FLOAT32.type(high) + FLOAT32.type(0)


def binned(
    samples: np.ndarray, bins: int, low: float, high: float, times: Optional[np.ndarray] = None
) -> np.ndarray:
    """The counts of the samples from `low` to `high`, of a range without extent in the first bin."""
    if low == high:
        counts = np.zeros(bins, np.int64)
        inside = samples == low
        counts[0] = np.count_nonzero(inside) if times is None else times[inside].sum()
        return counts
    return np.histogram(samples, bins, (float(low), float(high)), weights=times)[0]


def fitting_counts(counts: np.ndarray) -> np.ndarray:
    """Counts that the percentile functions multiply by 100 in 32 bits without wrapping, as int32."""
    if counts.size == 0:
        return counts.astype(np.int32)
    by_bin = -(-int(counts.max()) // _MOST_IN_BIN)
    by_total = int(counts.sum(axis=-1, dtype=np.int64).max()) // _MOST_COUNTED + 1
    divisor = max(by_bin, by_total)
    return (counts // divisor if divisor > 1 else counts).astype(np.int32)


def _edges(given: Optional[Sequence[float]], found: np.ndarray, empty: np.ndarray) -> np.ndarray:
    if given is not None:
        return np.asarray(given, np.float32)
    return np.where(empty, FLOAT32.type(0), found)


def _require_order(low: np.ndarray, high: np.ndarray) -> None:
    for least, greatest in zip(low, high):
        if not (np.isfinite(least) and np.isfinite(greatest) and least <= greatest):
            raise value_error("minimum, maximum", f"{least} and {greatest}", "finite numbers in this order")


def _bits_of(bits: Any, dtype: np.dtype) -> int:
    narrow = dtype.itemsize == 1
    if bits is None:
        return 8 if narrow else 16
    bits = whole("bits", bits, 8, 16)
    if bits not in (8, 16):
        raise value_error("bits", str(bits), "8 or 16")
    if bits == 8 and not narrow:
        raise value_error("bits", f"8 for {dtype}", "16, which has bins for values above 255")
    return bits


def _counter(bands: int, bits: int, synthetic_blue: bool) -> _core.RasterStatistics:
    counter = _core.RasterStatistics()
    counter.SetChans(list(range(bands)))
    counter.SetType(bits)
    methods = _core.StatisticsMethod
    counter.SetMethod(
        methods.eSTATISTICS_SYNTHETIC_BLUE if synthetic_blue else methods.eSTATISTICS_PLAIN
    )
    return counter


def _collected(counter: _core.RasterStatistics, bands: int, bits: int) -> Statistics:
    """The results so far; those of no pixel before the first call of `Process`."""
    least, greatest = counter.GetMinValue(), counter.GetMaxValue()
    if not least:
        return Statistics(
            np.full(bands, 100000, np.float32),
            np.full(bands, -100000, np.float32),
            np.zeros((bands, 1 << bits), np.int64),
        )
    counts = np.stack([counter.GetPixelCounts(band) for band in range(bands)]).astype(np.int64)
    # A zero without its sign, which would depend on the order of the samples.
    return Statistics(np.float32(least) + np.float32(0), np.float32(greatest) + np.float32(0), counts)


def _countable(
    image: np.ndarray, mask: Optional[np.ndarray]
) -> Iterator[Tuple[np.ndarray, Optional[np.ndarray]]]:
    """Pieces of as many rows as one object of the core can count."""
    if image.size == 0:
        return
    rows = max(_MOST_COUNTED // image.shape[1], 1)
    for first in range(0, image.shape[0], rows):
        part = slice(first, first + rows)
        yield image[part], None if mask is None else mask[part]


def _valid_pixels(image: np.ndarray, mask: Optional[np.ndarray]) -> Iterator[np.ndarray]:
    """The valid pixels as images of some rows; with a mask they are packed into one row."""
    if image.size == 0:
        return
    for rows in row_blocks(image.shape[0], image.nbytes // image.shape[0]):
        pixels = image[rows]
        if mask is not None:  # `compress` is many times faster than an index of bools
            pixels = pixels.reshape(-1, bands_of(image)).compress(mask[rows].ravel(), axis=0)[None]
        if pixels.size:
            yield pixels


@raster_function(rasters=("image",), masks=("mask",), blocks="whole")
def squared_gradient(
    image: ArrayLike,
    *,
    background: Tuple[float, float] = (-1e7, 1e7),
    nodata: float = -32767.0,
    mask: Optional[np.ndarray] = None,
) -> np.ndarray:
    """A focus measure: the sum of the squared differences of each sample and the one a row below.

    The sharper of two images of one scene has the larger sum.

    Parameters
    ----------
    image : array_like
        (height, width) or (height, width, bands).
    background : (float, float), optional
        A sample counts if it lies between these two, ends excluded.
    nodata : float, optional
        A sample within 1e-9 of it does not count; NaN equals no sample.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. The core reads it in a way of its own: in each row as many
        pairs from the left end on count as pixels are valid in this row and the next. So masked columns
        shorten the row from its right end, and are not left out themselves.

    Returns
    -------
    ndarray
        float64, (bands,), in squared units of the samples.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    Notes
    -----
    The core prints a line for each band on the standard output of the process, "BEFORE - 101" and the sum,
    past `sys.stdout`. Calls of this function and of `vollath` on several threads compute one after the other.

    References
    ----------
    Santos et al. (1997), "Evaluation of autofocus functions in molecular cytogenetic analysis", Journal of
    Microscopy 188(3).

    Examples
    --------
    >>> squared_gradient([[1, 2], [4, 6]])
    array([25.])
    """
    operator = _core.SqrGradientEvaluation()
    samples = _measured(operator, image, background, nodata)
    valid = mask_of("mask", mask, samples)
    if samples.size == 0:
        return np.zeros(bands_of(samples))
    operator.InitEvaluation(bands_of(samples))
    operator.Process(samples, valid)
    return np.array(operator.GetEvaluation())


@raster_function(rasters=("image",), masks=("mask",), blocks="whole")
def vollath(
    image: ArrayLike,
    *,
    background: Tuple[float, float] = (-1e7, 1e7),
    nodata: float = -32767.0,
    mask: Optional[np.ndarray] = None,
) -> VollathSums:
    """The two sums of Vollath's autocorrelation focus measure.

    The measure is left minus right; the sharper of two images of one scene has the larger one.

    Parameters
    ----------
    image : array_like
        (height, width) or (height, width, bands).
    background : (float, float), optional
        A sample counts if it lies between these two, ends excluded. Three samples in a row count together.
    nodata : float, optional
        A sample within 1e-9 of it does not count; NaN equals no sample.
    mask : ndarray of bool, optional
        (height, width), True for a valid pixel. The core reads it in a way of its own: masked columns shorten
        the row from its right end, and are not left out themselves; the third sample of three is not looked
        up.

    Returns
    -------
    VollathSums
        `left` and `right`, float64 of (bands,), in squared units of the samples, and `measure`.

    Raises
    ------
    TypeError, ValueError
        For an argument that is not as described.

    References
    ----------
    Vollath (1987), "Automatic focusing by correlative methods", Journal of Microscopy 147(3).

    Examples
    --------
    >>> vollath([[1, 2, 3, 4]])
    VollathSums(left=array([8.]), right=array([11.]))
    """
    operator = _core.VollathEvaluation()
    samples = _measured(operator, image, background, nodata)
    valid = mask_of("mask", mask, samples)
    if samples.size == 0:
        return VollathSums(np.zeros(bands_of(samples)), np.zeros(bands_of(samples)))
    operator.InitEvaluation(bands_of(samples))
    operator.Process(samples, valid)
    return VollathSums(np.array(operator.GetLeftEq()), np.array(operator.GetRightEq()))


def _measured(operator: Any, image: Any, background: Any, nodata: Any) -> np.ndarray:
    """The image, after the parameters have gone to the operator."""
    samples = image_of("image", image)
    low, high = numbers("background", background, 2, "two numbers, (low, high)")
    operator.SetBackground(low, high)
    operator.SetFailure(number("nodata", nodata))
    return samples
