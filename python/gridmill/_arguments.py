"""The checks of the arguments. Each failure says "<argument>: <what came>; expected <what>"."""

from __future__ import annotations

import difflib
import math
import operator
from numbers import Real
from typing import AbstractSet, Any, Iterable, Iterator, List, Mapping, Optional, Sequence, Tuple, TypeVar

import numpy as np

from . import _core
from ._types import PIXEL_TYPES, UINT8, DefaultType, names

Value = TypeVar("Value")
Shape = Tuple[int, ...]

_BOOL = np.dtype(bool)
_LEAST_SINGLE, _GREATEST_SINGLE = 1e-45, 3.4028234e38
_GREATEST_UNSIGNED = 2**32 - 1
_MOST_THREADS = 256
_BLOCK_BYTES = 1 << 20


def value_error(argument: str, came: str, expected: str) -> ValueError:
    return ValueError(f"{argument}: {came}; expected {expected}")


def type_error(argument: str, came: str, expected: str) -> TypeError:
    return TypeError(f"{argument}: {came}; expected {expected}")


def _kind(value: Any) -> str:
    return f"an array of {value.dtype}" if isinstance(value, np.ndarray) else type(value).__name__


def shown(value: Any) -> str:
    """A value as a message shows it: in a line."""
    text = repr(value)
    return _kind(value) if isinstance(value, np.ndarray) or len(text) > 80 else text


def counted(bands: int) -> str:
    return "1 band" if bands == 1 else f"{bands} bands"


# Images and masks


def image_of(argument: str, value: Any, types: AbstractSet[np.dtype] = PIXEL_TYPES) -> np.ndarray:
    """The image as the core reads it: the array itself if it is in order, else a copy."""
    if type(value) is np.ndarray and value.dtype in types:
        flags = value.flags
        image = value if flags.c_contiguous and flags.aligned else np.require(value, None, "CA")
    else:
        image = np.require(pixels_of(argument, value, types), None, "CA")
    if image.ndim == 2 or image.ndim == 3 and image.shape[2] > 0:
        return image
    _refuse_shape(argument, image)
    raise AssertionError("unreachable")


def pixels_of(argument: str, value: Any, types: AbstractSet[np.dtype] = PIXEL_TYPES) -> np.ndarray:
    """An array of one of the types in the machine's byte order, with its own strides."""
    if isinstance(value, np.ma.MaskedArray):
        raise type_error(argument, "a masked array", "its data, with mask=~numpy.ma.getmaskarray(...)")
    if value is None or isinstance(value, (str, bytes)):
        raise type_error(argument, shown(value), "an array")
    try:
        array = np.asarray(value)
    except ValueError:
        raise type_error(argument, "rows of unequal length", "an array") from None
    native = array.dtype.newbyteorder("=")
    if native not in types:
        raise type_error(argument, f"an array of {array.dtype}", names(types))
    return array.astype(native, copy=False)


def _refuse_shape(argument: str, image: np.ndarray) -> None:
    if image.ndim == 3:
        raise value_error(argument, "no band", "at least one band")
    came = f"{image.ndim} dimensions"
    raise value_error(argument, came, "two or three, (height, width) or (height, width, bands)")


def bands_of(image: np.ndarray) -> int:
    return 1 if image.ndim == 2 else image.shape[2]


def single_band(argument: str, image: np.ndarray) -> np.ndarray:
    """The image as (height, width), without a copy."""
    if image.ndim == 2:
        return image
    if image.shape[2] != 1:
        raise value_error(argument, counted(image.shape[2]), "one band")
    return image.reshape(image.shape[:2])


def mask_of(argument: str, value: Any, image: np.ndarray) -> Optional[np.ndarray]:
    """The mask of an image, C-contiguous, or None."""
    if value is None:
        return None
    if not isinstance(value, np.ndarray) or value.dtype != _BOOL:
        raise type_error(argument, _kind(value), "a bool array, True for a valid pixel")
    if isinstance(value, np.ma.MaskedArray):
        raise type_error(argument, "a masked array", "a bool array, True for a valid pixel")
    if value.shape != image.shape[:2]:
        expected = f"{image.shape[:2]}, the image's height and width"
        raise value_error(argument, f"shape {value.shape}", expected)
    return np.ascontiguousarray(value)


# Results


def type_of(dtype: Any, types: AbstractSet[np.dtype] = PIXEL_TYPES) -> np.dtype:
    """What `dtype` stands for."""
    try:
        asked = np.dtype(dtype)
    except TypeError:
        raise type_error("dtype", shown(dtype), names(types)) from None
    if asked not in types:
        raise type_error("dtype", str(asked), f"{names(types)}, of the machine's byte order")
    return asked


def result_for(
    shape: Shape,
    default: DefaultType,
    of: np.dtype,
    dtype: Any,
    out: Any,
    inputs: Sequence[Any],
    types: AbstractSet[np.dtype] = PIXEL_TYPES,
) -> np.ndarray:
    """The array to write to: `out` if it is in order and shares no memory with the inputs, else a new one."""
    if out is None:
        return np.empty(shape, default(of) if dtype is None else type_of(dtype, types))
    _require_writable(out, types)
    if dtype is not None and type_of(dtype, types) != out.dtype:
        raise type_error("out", f"an array of {out.dtype}", f"{type_of(dtype, types)}, as dtype says")
    if out.shape != shape:
        raise value_error("out", f"shape {out.shape}", str(shape))
    for given in inputs:
        if given is not None and _share_memory(out, given):
            raise value_error("out", "an array that shares memory with an input", "an array of its own")
    return out


def _require_writable(out: Any, types: AbstractSet[np.dtype]) -> None:
    if not isinstance(out, np.ndarray) or isinstance(out, np.ma.MaskedArray):
        raise type_error("out", type(out).__name__, "a numpy array")
    if out.dtype not in types:
        expected = f"{names(types)}, of the machine's byte order"
        raise type_error("out", f"an array of {out.dtype}", expected)
    flags = out.flags
    if not flags.writeable:
        raise value_error("out", "a read-only array", "one to write to")
    if not (flags.c_contiguous and flags.aligned):
        raise value_error("out", "an array with gaps or misaligned", "a C-contiguous array")


def _share_memory(out: np.ndarray, given: Any) -> bool:
    if out is given:
        return True
    if not isinstance(given, np.ndarray) or (out.base is None and given.base is None):
        return False  # two arrays that own their memory: known without a look at their bounds
    return np.may_share_memory(out, given) and np.shares_memory(out, given)


def fill_masked(result: np.ndarray, mask: Optional[np.ndarray], value: Any) -> None:
    """Write `value`, which the result's type holds, to each sample of the masked pixels."""
    if mask is None or result.size == 0:
        return
    pixels = result.reshape((-1,) + result.shape[2:])
    width = result.shape[1]
    for rows in row_blocks(result.shape[0], result.nbytes // result.shape[0]):
        pixels[rows.start * width : rows.stop * width][np.flatnonzero(~mask[rows])] = value


def as_stored(value: float, dtype: np.dtype) -> Any:
    """What the core writes for a parameter: rounded to single precision, then to the type's range."""
    nothing_valid = np.zeros((1, 1), bool)
    stored = np.empty((1, 1, 2), dtype)
    combine = _core.CombChange(_core.DiffType.eDIFF_ABSOLUTE)
    combine.SetNoData(value)
    combine.Process(np.zeros((1, 1), UINT8), np.zeros((1, 1), UINT8), nothing_valid, stored)
    return stored[0, 0, 0]


def row_blocks(height: int, row_bytes: int) -> Iterator[slice]:
    """The rows from 0 to `height` in blocks that a cache holds."""
    step = max(_BLOCK_BYTES // max(row_bytes, 1), 1)
    for first in range(0, height, step):
        yield slice(first, min(first + step, height))


# Numbers


def number(argument: str, value: Any, expected: str = "a number") -> float:
    if type(value) is float:
        return value
    if isinstance(value, np.ndarray) and value.ndim == 0:
        value = value.item()
    if not isinstance(value, Real) or isinstance(value, bool):
        raise type_error(argument, shown(value), expected)
    try:
        return float(value)
    except OverflowError:
        raise value_error(argument, "a number of more than 64 bits", expected) from None


def finite(argument: str, value: Any) -> float:
    result = number(argument, value, "a finite number")
    if not abs(result) <= _GREATEST_SINGLE:
        raise value_error(argument, shown(value), "a finite number in single precision")
    return result


def positive(argument: str, value: Any) -> float:
    result = number(argument, value, "a number above 0")
    if not _LEAST_SINGLE <= result <= _GREATEST_SINGLE:
        raise value_error(argument, shown(value), "a finite number above 0 in single precision")
    return result


def whole(argument: str, value: Any, least: int, greatest: int) -> int:
    if type(value) is int and least <= value <= greatest:
        return value
    expected = f"a whole number from {least} to {greatest}"
    if isinstance(value, (bool, np.bool_)):
        raise type_error(argument, shown(value), expected)
    try:
        result = operator.index(value)
    except TypeError:
        raise type_error(argument, shown(value), expected) from None
    if not least <= result <= greatest:
        raise value_error(argument, shown(value), expected)
    return result


def held_by(argument: str, value: Any, dtype: np.dtype) -> Any:
    """A number that the type holds as it is, but for the rounding of a floating type."""
    result = number(argument, value)
    if dtype.kind == "f":
        return dtype.type(result)
    limits = np.iinfo(dtype)
    if not (math.isfinite(result) and int(value) == value and limits.min <= int(value) <= limits.max):
        raise value_error(argument, shown(value), f"a number that {dtype} holds")
    return dtype.type(int(value))


def _listed(value: Any) -> Optional[List[Any]]:
    if isinstance(value, np.ndarray) and value.ndim == 1:
        return value.tolist()
    return list(value) if isinstance(value, (list, tuple)) else None


def is_one(value: Any) -> bool:
    """Whether this is one value for all bands."""
    return _listed(value) is None


def per_band(argument: str, value: Any, bands: int) -> List[float]:
    """A number for each band, from one for all of them or as many as there are."""
    entries = _listed(value)
    if entries is None:
        return [number(argument, value, "a number, or one for each band")] * bands
    if len(entries) != bands:
        raise value_error(argument, f"{len(entries)} numbers", f"one number, or {bands}, one for each band")
    return [number(argument, entry) for entry in entries]


def numbers(argument: str, value: Any, count: int, what: str) -> List[float]:
    entries = _listed(value)
    if entries is None:
        raise type_error(argument, shown(value), what)
    if len(entries) != count:
        raise value_error(argument, f"{len(entries)} numbers", what)
    return [number(argument, entry) for entry in entries]


def wholes(argument: str, value: Any, count: int, what: str) -> Tuple[int, ...]:
    """Pixel counts and coordinates: none is negative."""
    entries = _listed(value)
    if entries is None:
        raise type_error(argument, shown(value), what)
    if len(entries) != count:
        raise value_error(argument, f"{len(entries)} numbers", what)
    return tuple(whole(argument, entry, 0, _GREATEST_UNSIGNED) for entry in entries)


def region_of(argument: str, value: Any) -> Tuple[int, ...]:
    return wholes(argument, value, 4, "(x, y, width, height)")


def threads_of(value: Any) -> Optional[int]:
    return None if value is None else whole("num_threads", value, 1, _MOST_THREADS)


# Names


def unknown_name(argument: str, value: str, known: Iterable[str]) -> ValueError:
    """The error for a name that is none of the known ones: lists them, and says which is the nearest."""
    by_lower = {name.lower(): name for name in known}
    nearest = difflib.get_close_matches(value.lower(), by_lower, 1, 0.0)[0]
    listed = ", ".join(repr(name) for name in by_lower.values())
    return value_error(argument, shown(value), f"one of {listed}; the nearest is {by_lower[nearest]!r}")


def choice(argument: str, value: Any, table: Mapping[str, Value]) -> Value:
    """What a name stands for."""
    if isinstance(value, str) and value in table:
        return table[value]
    if isinstance(value, str):
        raise unknown_name(argument, value, table)
    raise type_error(argument, shown(value), "one of " + ", ".join(repr(name) for name in table))
