"""What goes wrong, as exceptions."""

from __future__ import annotations

import sys
import warnings
from typing import Any, Dict, List, NamedTuple, Optional, Tuple, Type


class Place(NamedTuple):
    """A piece of the text of a query, of a library module or of a document.

    Lines and columns count from 1, columns and the length in characters.
    """

    #: URL of the library module, name of the document; None for the query itself.
    module: Optional[str]
    line: int
    #: 0 where no more than the line is known.
    column: int
    #: 0 where it is not known.
    length: int
    #: The text of the line.
    source_line: str = ""


class Call(NamedTuple):
    """A call of a declared function on the way to an error."""

    function: Optional[str]
    place: Optional[Place]


class Error(Exception):
    """A query that fails.

    >>> import xquery
    >>> try:
    ...     xquery.query("1 +\\n1 idiv 0")
    ... except xquery.Error as error:
    ...     print(error.number, error.message, error.category)
    ...     print(error.place.line, error.place.column, error.place.length)
    ...     print(error)
    6 divide by zero values
    2 1 8
    XQueryError:6 - "divide by zero" at line:2
      at line 2, column 1
        1 idiv 0
        ^^^^^^^^
    """

    #: The number of the language's error code; 0 for a limit and for what a query raises itself.
    number: int
    message: str
    #: One of "syntax", "names", "types", "values", "loading", "limit", "raised by the query",
    #: "internal", and "document" for a document that cannot be read.
    category: str
    #: ``XQueryError:6 - "divide by zero" at line:2``
    description: str
    #: Of the innermost expression that was being evaluated; None where nothing is known.
    place: Optional[Place]
    #: The calls of declared functions that led there, innermost first.
    calls: Tuple[Call, ...]
    #: How many calls are missing in the middle of very many.
    calls_left_out: int

    def __init__(
        self,
        message: str = "",
        *,
        number: int = 0,
        category: str = "internal",
        description: Optional[str] = None,
        place: Optional[Place] = None,
        calls: Tuple[Call, ...] = (),
        calls_left_out: int = 0,
    ) -> None:
        super().__init__(message)
        self.message = message
        self.number = number
        self.category = category
        self.description = message if description is None else description
        self.place = place
        self.calls = tuple(calls)
        self.calls_left_out = calls_left_out

    def _fields(self) -> Dict[str, Any]:
        return {
            "message": self.message,
            "number": self.number,
            "category": self.category,
            "description": self.description,
            "place": self.place,
            "calls": self.calls,
            "calls_left_out": self.calls_left_out,
        }

    def __reduce__(self) -> Tuple[Any, ...]:
        return _restored, (type(self), self._fields())

    def __str__(self) -> str:
        return self.description + _shown(self.place, self.calls)

    def __repr__(self) -> str:
        return f"<xquery.{type(self).__name__} {self.number} {self.message!r}>"


class LimitError(Error):
    """A limit of the host or of the engine was reached: time, memory, nesting, cancellation."""


class CompileError(Error):
    """A query that does not compile. It tells of its first error; ``errors`` has all of them."""

    errors: List[Error]

    def __init__(self, message: str = "", *, errors: List[Error], **fields: Any) -> None:
        super().__init__(message, **fields)
        self.errors = list(errors)

    def _fields(self) -> Dict[str, Any]:
        return {**super()._fields(), "errors": self.errors}


class DocumentError(Error):
    """A document that cannot be read, or is not well formed.

    >>> import xquery
    >>> try:
    ...     xquery.parse("<a><b></a>")
    ... except xquery.DocumentError as error:
    ...     print(error.place.line, error.message)
    1 Opening and ending tag mismatch: b line 1 and a
    """

    def __init__(self, message: str, name: str, line: int = 0, column: int = 0) -> None:
        shown = f"{name}:{line}:{column}: {message}" if line else f"{name}: {message}"
        place = Place(name, line, column, 0) if line else None
        super().__init__(message, category="document", description=shown, place=place)
        self.name = name

    def _fields(self) -> Dict[str, Any]:
        line, column = (self.place.line, self.place.column) if self.place else (0, 0)
        return {"message": self.message, "name": self.name, "line": line, "column": column}

    def __str__(self) -> str:
        return self.description


class MissingDocumentWarning(UserWarning):
    """A document that a query named is missing, malformed or forbidden; the query goes on."""


def _warn_of_missing(url: str, reason: str) -> None:
    """Warns where the package was called, however many of its own calls lie between."""
    level = 2
    frame = sys._getframe().f_back
    while frame is not None and frame.f_globals.get("__package__") == __package__:
        frame = frame.f_back
        level += 1
    warnings.warn(f"{url}: {reason}", MissingDocumentWarning, stacklevel=level)


def _restored(error: Type[Error], fields: Dict[str, Any]) -> Error:
    return error(**fields)


# As many calls are shown at each end of a long row of them.
_MOST_CALLS = 5
_MOST_COLUMNS = 100


def _where(place: Place, inside: Optional[str]) -> str:
    column = f", column {place.column}" if place.column else ""
    module = "" if place.module is None else f" of {place.module}"
    function = f", in {inside}" if inside else ""
    return f"line {place.line}{column}{module}{function}"


def _marked(place: Place) -> str:
    """The line and marks below the place; nothing for a line too long to be read."""
    if not place.column or not place.length or not place.source_line:
        return ""
    line = "".join(c if c.isprintable() else " " for c in place.source_line)
    if len(line) > _MOST_COLUMNS:
        return ""
    before = place.column - 1
    marks = "^" * max(1, min(place.length, len(line) - before))
    return f"\n    {line}\n    {' ' * before}{marks}"


def _shown(place: Optional[Place], calls: Tuple[Call, ...]) -> str:
    if place is None:
        return ""
    names = [call.function for call in calls]
    text = f"\n  at {_where(place, names[0] if names else None)}{_marked(place)}"
    shown = list(range(len(calls)))
    if len(shown) > 2 * _MOST_CALLS:
        shown = shown[:_MOST_CALLS] + shown[-_MOST_CALLS:]
    for index in shown:
        called = calls[index].place
        if called is not None:
            outer = names[index + 1] if index + 1 < len(names) else None
            text += f"\n  called at {_where(called, outer)}"
    return text
