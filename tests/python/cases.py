"""Images, masks and comparisons that the tests share."""

from __future__ import annotations

import zlib
from dataclasses import dataclass

import numpy as np

TYPES = ("int8", "uint8", "int16", "uint16", "int32", "uint32", "float32", "float64", "int64", "uint64")
SHORT_LIST = ("uint8", "int16", "uint16", "float32")
MASKS = ("none", "random", "all", "nothing")
SHAPES = ((1, 1), (1, 7), (7, 1), (5, 9), (7, 7), (33, 64))


def seeded(*names) -> np.random.Generator:
    """Random numbers that depend on the names alone."""
    return np.random.default_rng([zlib.crc32(str(name).encode()) for name in names])


def samples(rng, shape, dtype) -> np.ndarray:
    """Small values, and some of the whole range of the type; of floats some that are no numbers too."""
    dtype = np.dtype(dtype)
    small = rng.integers(0, 100, shape)
    if dtype.kind == "f":
        values = (small + rng.random(shape)).astype(dtype) - dtype.type(20)
        rare = np.array([np.nan, np.inf, -np.inf, 0.0, -0.0, 1e12, -3e9, 255.5, 65535.5, 0.5, -0.5], dtype)
        return np.where(rng.random(shape) < 0.1, rng.choice(rare, shape), values)
    limits = np.iinfo(dtype)
    wide = rng.integers(limits.min, limits.max, shape, dtype=dtype, endpoint=True)
    return np.where(rng.random(shape) < 0.25, wide, small.astype(dtype))


def finite_samples(rng, shape, dtype) -> np.ndarray:
    values = samples(rng, shape, dtype)
    return np.where(np.isfinite(values), values, values.dtype.type(3)) if values.dtype.kind == "f" else values


def mask_of(rng, shape, kind: str):
    if kind == "none":
        return None
    if kind == "random":
        return rng.random(shape) < 0.7
    return np.full(shape, kind == "all")


@dataclass
class Case:
    """One combination of a size, types and a mask, with random contents of its own."""

    rng: np.random.Generator
    shape: tuple[int, int]
    dtype: str
    out: str
    masking: str

    def image(self, bands: int = 1, margin: int = 0, finite: bool = False, dtype=None) -> np.ndarray:
        make = finite_samples if finite else samples
        shape = (self.shape[0] + 2 * margin, self.shape[1] + 2 * margin, bands)
        return make(self.rng, shape, dtype or self.dtype)

    def mask(self, margin: int = 0):
        return mask_of(self.rng, (self.shape[0] + 2 * margin, self.shape[1] + 2 * margin), self.masking)

    def target(self, bands: int, shape=None, out=None) -> np.ndarray:
        """An output with something in it, so that a sample that is not written shows."""
        return finite_samples(self.rng, (*(shape or self.shape), bands), out or self.out)

    def flat(self, image: np.ndarray) -> np.ndarray:
        """The image as a caller may give it: one band in two dimensions every other time."""
        return image[..., 0] if image.shape[2] == 1 and self.rng.random() < 0.5 else image


def bits(array: np.ndarray) -> np.ndarray:
    """The bits of the samples, with one pattern for all NaN."""
    array = np.ascontiguousarray(array)
    if array.dtype.kind != "f":
        return array
    calm = np.where(np.isnan(array), array.dtype.type(np.nan), array)
    return calm.view(f"u{array.dtype.itemsize}")


def assert_same(got, want, what: str = "") -> None:
    """The same type, the same shape, the same bits."""
    assert isinstance(got, np.ndarray), what
    assert got.dtype == want.dtype, f"{what}: {got.dtype}, not {want.dtype}"
    assert got.shape == want.shape, f"{what}: {got.shape}, not {want.shape}"
    wrong = np.argwhere(bits(got) != bits(want))
    if len(wrong):
        at = tuple(wrong[0])
        raise AssertionError(
            f"{what}: {len(wrong)} of {got.size} differ; at {at} {got[at]!r}, not {want[at]!r}"
        )


def one_band(result: np.ndarray) -> np.ndarray:
    """What a function with a single output band gives."""
    return result[..., 0]


def like(result: np.ndarray, image: np.ndarray) -> np.ndarray:
    """What a function gives that keeps the bands: two dimensions for an image of two."""
    return result[..., 0] if image.ndim == 2 and result.shape[2] == 1 else result
