"""The Variant values that have no Python counterpart of their own."""

from __future__ import annotations

from typing import Any, Iterable, List, Optional, Sequence, Tuple


class _Singleton:
    def __init__(self, name: str) -> None:
        self._name = name

    def __repr__(self) -> str:
        return self._name

    def __bool__(self) -> bool:
        return False


EMPTY = _Singleton("EMPTY")
"""The Empty value (an uninitialised Variant)."""
NOTHING = _Singleton("NOTHING")
"""An object reference to no object."""
MISSING = _Singleton("MISSING")
"""An omitted optional argument; the member takes its declared default."""


class ErrorValue:
    """A Variant holding an error code (other than a missing argument)."""

    def __init__(self, code: int) -> None:
        self.code = code

    def __eq__(self, other: object) -> bool:
        return isinstance(other, ErrorValue) and other.code == self.code

    def __hash__(self) -> int:
        return hash(("ErrorValue", self.code))

    def __repr__(self) -> str:
        return f"ErrorValue({self.code})"


class Array(List[Any]):
    """A one-dimensional array with a lower bound other than zero."""

    def __init__(self, values: Iterable[Any] = (), lbound: int = 0) -> None:
        super().__init__(values)
        self.lbound = lbound

    def __eq__(self, other: object) -> bool:
        return (isinstance(other, list) and list.__eq__(self, other)
                and getattr(other, "lbound", 0) == self.lbound)

    __hash__ = None

    def __repr__(self) -> str:
        return f"Array({list.__repr__(self)}, lbound={self.lbound})"


class Array2D(List[List[Any]]):
    """A two-dimensional array: a list of rows over the first dimension, with its bounds
    ``((lower1, upper1), (lower2, upper2))``; element (i, j) is ``self[i - lower1][j - lower2]``."""

    def __init__(self, rows: Iterable[Iterable[Any]] = (),
                 bounds: Optional[Sequence[Sequence[int]]] = None) -> None:
        super().__init__([list(row) for row in rows])
        if bounds is None:
            columns = len(self[0]) if self else 0
            bounds = ((0, len(self) - 1), (0, columns - 1))
        self.bounds: Tuple[Tuple[int, ...], ...] = tuple(tuple(pair) for pair in bounds)

    def __eq__(self, other: object) -> bool:
        return (isinstance(other, list) and list.__eq__(self, other)
                and getattr(other, "bounds", None) == self.bounds)

    __hash__ = None

    def __repr__(self) -> str:
        return f"Array2D({list.__repr__(self)}, bounds={self.bounds})"
