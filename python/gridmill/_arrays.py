"""The decorator of the public functions: numpy arrays go straight in, dask arrays and DataArrays take the
long way through `_dask` and `_xarray`, which are imported only then."""

from __future__ import annotations

import functools
import inspect
import sys
from dataclasses import dataclass
from typing import Any, Callable, Collection, Iterator, TypeVar

import numpy as np

Function = TypeVar("Function", bound=Callable[..., Any])

#: Types of arguments that need no second look. The test of a call is one set operation, well below a
#: microsecond; whatever else comes (an enum, a mapping, a subclass) is looked at one by one.
_PLAIN = frozenset({np.ndarray, int, float, bool, str, tuple, list, type(None), type, np.dtype})


@dataclass(frozen=True)
class RasterFunction:
    """What the decorator knows of a public function."""

    function: Callable[..., Any]  #: as it is written, for numpy arrays
    call: Callable[..., Any]  #: the public one, which pickles by its name
    signature: inspect.Signature
    rasters: tuple[str, ...]
    masks: tuple[str, ...]
    blocks: str

    @property
    def name(self) -> str:
        return self.function.__name__

    def takes(self, argument: str) -> bool:
        return argument in self.signature.parameters

    def bind(self, args: tuple[Any, ...], kwargs: dict[str, Any]) -> dict[str, Any]:
        """All arguments by name."""
        try:
            bound = self.signature.bind(*args, **kwargs)
        except TypeError as error:
            raise TypeError(f"{self.name}() {error}") from None
        bound.apply_defaults()
        return dict(bound.arguments)

    def operands(self, arguments: dict[str, Any]) -> Iterator[tuple[str, Any]]:
        """Rasters and masks that were given: name and value, the entries of a mapping one by one."""
        for name in (*self.rasters, *self.masks):
            value = arguments.get(name)
            if isinstance(value, dict):
                yield from ((f"{name}[{key!r}]", entry) for key, entry in value.items() if _has_axes(entry))
            elif value is not None:
                yield name, value

    def replaced(self, arguments: dict[str, Any], operands: dict[str, Any]) -> dict[str, Any]:
        """The arguments with other operands, which are named as `operands()` names them."""
        result = dict(arguments)
        for name in (*self.rasters, *self.masks):
            value = arguments.get(name)
            if isinstance(value, dict):
                result[name] = {key: operands.get(f"{name}[{key!r}]", entry) for key, entry in value.items()}
            elif name in operands:
                result[name] = operands[name]
        return result

    def is_mask(self, operand: str) -> bool:
        return operand in self.masks


def raster_function(
    *, rasters: tuple[str, ...], masks: tuple[str, ...] = ("mask",), blocks: str = "map"
) -> Callable[[Function], Function]:
    """Make a function of numpy arrays one of dask arrays and DataArrays too.

    Parameters
    ----------
    rasters, masks
        The names of the arguments that hold them; an argument may be a mapping whose values are rasters.
    blocks
        How the work is cut for dask: "map", "overlap", "statistics", "histogram", "stretch", "mirror",
        "transfer" or "whole".
    """

    def decorate(function: Function) -> Function:
        @functools.wraps(function)
        def call(*args: Any, **kwargs: Any) -> Any:
            if _PLAIN.issuperset(map(type, args)) and _are_plain(kwargs.values()):
                return function(*args, **kwargs)
            return _call(described, args, kwargs)

        described = RasterFunction(function, call, inspect.signature(function), rasters, masks, blocks)
        call.raster_function = described  # type: ignore[attr-defined]
        return call  # type: ignore[return-value]

    return decorate


def _are_plain(values: Collection[Any]) -> bool:
    """Whether nothing among the values, and in the mappings among them, needs a second look."""
    if _PLAIN.issuperset(map(type, values)):
        return True
    for value in values:
        kind = type(value)
        if kind not in _PLAIN and not (kind is dict and _PLAIN.issuperset(map(type, value.values()))):
            return False
    return True


def _call(described: RasterFunction, args: tuple[Any, ...], kwargs: dict[str, Any]) -> Any:
    arguments = described.bind(args, kwargs)
    values = [value for _, value in described.operands(arguments)]
    if any(is_labelled(value) for value in values):
        from . import _xarray

        return _xarray.call(described, arguments)
    if any(is_lazy(value) for value in values):
        from . import _dask

        return _dask.call(described, arguments)
    return described.function(*args, **kwargs)


def is_lazy(value: Any) -> bool:
    """Whether this is a dask array, found out without importing dask."""
    return _is_of("dask.array", "Array", value)


def is_labelled(value: Any) -> bool:
    """Whether this is a DataArray, found out without importing xarray."""
    return _is_of("xarray", "DataArray", value)


def _is_of(module: str, name: str, value: Any) -> bool:
    kind = getattr(sys.modules.get(module), name, None)
    return kind is not None and isinstance(value, kind)


def _has_axes(value: Any) -> bool:
    return getattr(value, "ndim", 0) > 0
