"""The compiled part of talnumericarray."""

from typing import Any, Callable, Dict, List, Optional, Sequence, SupportsFloat, Tuple, Union, final

from numpy import dtype
from numpy.typing import ArrayLike

from talnumericarray._options import Index

__version__: str

def same(
    first: Any,
    second: Any,
    /,
    *,
    tol: Optional[SupportsFloat] = 0,
    relative: Optional[SupportsFloat] = None,
    absolute: Optional[SupportsFloat] = None,
    equal_nan: Optional[bool] = False,
    strict_type: Optional[bool] = False,
    squeeze: Optional[bool] = False,
    slices: Union[str, Index, Tuple[Index, ...], None] = None,
    ignore: Optional[ArrayLike] = None,
    threads: Optional[int] = None,
    progress: Optional[Callable[[int, int], object]] = None,
) -> bool: ...
def equivalent(first: Any, second: Any, /) -> bool: ...
def compare(first: Any, second: Any, /, **kwargs: Any) -> Dict[str, Any]: ...
@final
class Findings: ...

def find(
    first: Any, second: Any, number: int, strides: Sequence[int], /, **kwargs: Any
) -> Findings: ...
def merge(parts: List[Findings], /) -> Findings: ...
def conclude(
    findings: Optional[Findings],
    first: Tuple[dtype[Any], Tuple[int, ...], Tuple[int, ...]],
    second: Tuple[dtype[Any], Tuple[int, ...], Tuple[int, ...]],
    /,
    **kwargs: Any,
) -> Dict[str, Any]: ...
