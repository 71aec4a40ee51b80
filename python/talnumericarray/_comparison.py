"""What a comparison finds: `compare`, and the immutable objects that it returns, also in an error."""

from __future__ import annotations

from dataclasses import dataclass, field
from typing import TYPE_CHECKING, Any, NamedTuple, Optional, Tuple, Union

from talnumericarray import _core
from talnumericarray._options import CompareOptions, shows

if TYPE_CHECKING:
    from typing_extensions import Unpack

Number = Union[int, float, complex]


@dataclass(frozen=True)
class Place:
    """A place where two arrays differ.

    Places are equal if their indices, the texts of their values, and what is said of them are: so
    that a NaN is equal to a NaN of the same bits.
    """

    index: Tuple[int, ...]
    """In the first array; whole, if only a part of the array was compared."""
    first: Number = field(compare=False)
    """The value there: an int, a float or a complex."""
    second: Number = field(compare=False)
    first_text: str = field(repr=False)
    """The value in the fewest digits that read back as the same value; a NaN with its bits."""
    second_text: str = field(repr=False)
    digits: Optional[int]
    """Binary digits in which the values differ; None if they are the same under no tolerance."""
    reason: str
    """Why the two are not the same: "the same from tol=15 on", "opposite signs"."""


class ArrayFacts(NamedTuple):
    """What is reported about an array."""

    name: str
    type: str
    """As which elements are compared: booleans as uint8, half precision as float32."""
    stored_type: str
    shape: Tuple[int, ...]
    selected_shape: Tuple[int, ...]
    """Of what was compared."""
    fortran_order: bool


class ValueCounts(NamedTuple):
    """How many values of an array are special; a complex one counts if either part is."""

    nans: int
    infinities: int
    negative_zeros: int


class Bar(NamedTuple):
    """How many pairs differ in a number of binary digits; None stands for more than all."""

    digits: Optional[int]
    pairs: int


@dataclass(frozen=True)
class Comparison:
    """What was found in two arrays; printed, the report.

    Comparisons are equal if all that is reported is. They can be pickled and hashed. Where the
    shapes differ nothing is counted.

    >>> import talnumericarray as tna
    >>> c = tna.compare([1.0, 2.0, 3.0], [1.0, 2.5, -3.0], max_places=2)
    >>> c.same, c.difference, c.differing
    (False, 'elements', 2)
    >>> [(place.index, place.reason) for place in c.places]
    [((1,), 'the same from tol=51 on'), ((2,), 'opposite signs')]
    """

    difference: Optional[str]
    """How the arrays differ: "shape", "type" or "elements"; None if they are the same."""
    first: ArrayFacts
    second: ArrayFacts
    tolerance: float
    """In binary digits, also if it was given as a relative error."""
    places: Tuple[Place, ...]
    """The first `max_places` that differ, in row-major order."""
    pairs: int
    """Pairs of elements that were compared."""
    ignored: int
    """Pairs that `ignore` left out; they are counted nowhere else."""
    differing: int
    worst: Optional[Place]
    """The first place that differs in the most digits."""
    largest_absolute_difference: float
    """The largest |x - y|; for complex numbers, of parts. Infinite if one of the two is."""
    largest_relative_difference: float
    """The largest |x - y| / max(|x|, |y|)."""
    smallest_tolerance: Optional[int]
    """The smallest whole `tol` under which the arrays are the same; None if there is none below
    all digits of the type."""
    why_no_tolerance: Optional[str]
    first_values: ValueCounts
    second_values: ValueCounts
    histogram: Tuple[Bar, ...]
    """How many pairs differ in each number of digits; numbers without pairs are left out."""
    text: str = field(repr=False)
    """The report."""

    @property
    def same(self) -> bool:
        """Whether the arrays are the same; what `talnumericarray.same` says of them."""
        return self.difference is None

    def __str__(self) -> str:
        return self.text

    def __bool__(self) -> bool:
        raise TypeError("a comparison is neither true nor false; ask for its .same")


class NotSameError(AssertionError):
    """Two arrays are not the same; its text is the report."""

    def __init__(self, comparison: Comparison) -> None:
        super().__init__(comparison)
        self.comparison = comparison

    def __str__(self) -> str:
        return str(self.comparison)


def comparison_of(fields: "dict[str, Any]") -> Comparison:
    """A comparison from what the compiled part has found."""
    worst = fields["worst"]
    objects: "dict[str, Any]" = {
        "first": ArrayFacts(*fields["first"]),
        "second": ArrayFacts(*fields["second"]),
        "places": tuple(Place(*place) for place in fields["places"]),
        "worst": None if worst is None else Place(*worst),
        "first_values": ValueCounts(*fields["first_values"]),
        "second_values": ValueCounts(*fields["second_values"]),
        "histogram": tuple(Bar(*bar) for bar in fields["histogram"]),
    }
    return Comparison(**{**fields, **objects})


@shows(CompareOptions)
def compare(first: Any, second: Any, /, **options: "Unpack[CompareOptions]") -> Comparison:
    """Counts and measures all differences of two arrays.

    Takes what `same` takes, and:

    max_places: the most places that are listed, from 1 to 1,000,000; by default 1.
    names: what the report calls the two arrays; by default ("first", "second").

    Raises what `same` raises.

    >>> import talnumericarray as tna
    >>> print(tna.compare([0.5, 1.0], [0.5, 1.0 + 2**-50]))
    first and second differ: [1]: 1 and 1.0000000000000009 (the same from tol=3 on)
      first array           float64 (2,)
      second array          float64 (2,)
      tolerance             0 binary digits
      pairs                 2
      differing             1 (50 %)
      first place           [1]: 1 and 1.0000000000000009 (the same from tol=3 on)
      worst place           [1]: 1 and 1.0000000000000009 (the same from tol=3 on)
      largest difference    3 binary digits
      absolute difference   at most 8.881784197001252e-16
      relative difference   at most 8.881784197001244e-16
      smallest tolerance    tol=3
      NaNs                  0 and 0
      infinities            0 and 0
      negative zeros        0 and 0
      digits that differ, number of pairs
                  0 1 #############################################################
                  3 1 #############################################################
    """
    return comparison_of(_core.compare(first, second, **options))
