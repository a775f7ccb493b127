"""Element types: the ten pixel types, and the default type of each function's result."""

from __future__ import annotations

from typing import AbstractSet, Callable

import numpy as np

INT8, INT16, INT32, INT64 = (np.dtype(t) for t in (np.int8, np.int16, np.int32, np.int64))
UINT8, UINT16, UINT32, UINT64 = (np.dtype(t) for t in (np.uint8, np.uint16, np.uint32, np.uint64))
FLOAT32, FLOAT64 = np.dtype(np.float32), np.dtype(np.float64)

#: The types that an image or a result can have.
PIXEL_TYPES = frozenset((INT8, UINT8, INT16, UINT16, INT32, UINT32, INT64, UINT64, FLOAT32, FLOAT64))

#: Those of the functions that take two dates of unlike types.
SHORT_TYPES = frozenset((UINT8, INT16, UINT16, FLOAT32))

#: One bin for each value.
COUNTED_TYPES = frozenset((UINT8, UINT16))

#: Given an input's type, the type of the result.
DefaultType = Callable[[np.dtype], np.dtype]

_DIFFERENCES = {
    INT8: INT16,
    UINT8: INT16,
    INT16: INT32,
    UINT16: INT32,
    INT32: INT64,
    UINT32: INT64,
    INT64: INT64,
    UINT64: INT64,
    FLOAT32: FLOAT32,
    FLOAT64: FLOAT64,
}

_SINGLE_IS_ENOUGH = frozenset((INT8, UINT8, INT16, UINT16, FLOAT32))


def single(_: np.dtype) -> np.dtype:
    """float32 for every input."""
    return FLOAT32


def byte(_: np.dtype) -> np.dtype:
    """uint8 for every input."""
    return UINT8


def same(of: np.dtype) -> np.dtype:
    """The input's own type."""
    return of


def difference_type(of: np.dtype) -> np.dtype:
    """A type that holds the differences of two samples: of 8 and 16 bits, and of most wider ones."""
    return _DIFFERENCES[of]


def precise(of: np.dtype) -> np.dtype:
    """float32 if it holds each sample, else float64."""
    return FLOAT32 if of in _SINGLE_IS_ENOUGH else FLOAT64


def names(types: AbstractSet[np.dtype]) -> str:
    """What a message calls these types."""
    if types == PIXEL_TYPES:
        return "int8 to int64, uint8 to uint64, float32 or float64"
    listed = [str(t) for t in sorted(types, key=lambda t: (t.kind == "f", t.itemsize, t.kind))]
    return ", ".join(listed[:-1]) + " or " + listed[-1]
