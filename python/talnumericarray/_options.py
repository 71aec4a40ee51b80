"""The keyword arguments of calls, for type checkers and for help()."""

from __future__ import annotations

import inspect
from typing import TYPE_CHECKING, Any, Callable, Optional, SupportsFloat, Tuple, TypeVar, Union
from typing import TypedDict

if TYPE_CHECKING:
    from types import EllipsisType

    from numpy.typing import ArrayLike

    Index = Union[int, slice, EllipsisType]


class SameOptions(TypedDict, total=False):
    """Those of `same`."""

    tol: Optional[SupportsFloat]
    relative: Optional[SupportsFloat]
    absolute: Optional[SupportsFloat]
    equal_nan: Optional[bool]
    strict_type: Optional[bool]
    squeeze: Optional[bool]
    slices: Union[str, Index, Tuple[Index, ...], None]
    ignore: Optional[ArrayLike]
    threads: Optional[int]
    progress: Optional[Callable[[int, int], object]]


class CompareOptions(SameOptions, total=False):
    """Those of `compare` and `assert_same`."""

    max_places: Optional[int]
    names: Optional[Tuple[str, str]]


Function = TypeVar("Function", bound=Callable[..., Any])


def shows(options: Any) -> Callable[[Function], Function]:
    """Makes help() show the keyword arguments that `**options` stands for, each None by default."""

    def show(function: Function) -> Function:
        signature = inspect.signature(function)
        arrays = [p for p in signature.parameters.values() if p.kind is not p.VAR_KEYWORD]
        keywords = [
            inspect.Parameter(name, inspect.Parameter.KEYWORD_ONLY, default=None, annotation=kind.__forward_arg__)
            for name, kind in options.__annotations__.items()
        ]
        function.__signature__ = signature.replace(  # type: ignore[attr-defined]
            parameters=arrays + keywords
        )
        return function

    return show
