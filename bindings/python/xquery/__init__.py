"""XQuery for Python.

>>> import xquery
>>> xquery.query("//book[price > 10]/title/string()", "examples/books.xml")
<xquery.Result ['A Field Guide to Lichens', 'Brücken & Wege']>

``parse`` reads a document, ``compile`` a query, ``query`` does all at once. docs/python.md has the
rest.
"""

from ._xquery import Cancellation, Node, Result
from ._documents import Readable, Source, parse
from ._errors import (
    Call,
    CompileError,
    DocumentError,
    Error,
    LimitError,
    MissingDocumentWarning,
    Place,
)
from ._lxml import from_lxml, to_lxml
from ._queries import (
    CheckWarning,
    Context,
    Function,
    Profile,
    Query,
    Stream,
    check,
    compile,
    functions,
    query,
    release_memory,
)
from ._settings import Loader, Policy, Resource
from ._values import (
    Date,
    DateTime,
    Duration,
    GDay,
    GMonth,
    GMonthDay,
    GYear,
    GYearMonth,
    HexBinary,
    MonthDuration,
    Notation,
    QName,
    Time,
    Untyped,
    URI,
)

from collections.abc import Sequence as _Sequence

from . import _xquery

_xquery._prepare()
_Sequence.register(Result)

__all__ = [
    "Call",
    "Cancellation",
    "CheckWarning",
    "CompileError",
    "Context",
    "Date",
    "DateTime",
    "DocumentError",
    "Duration",
    "Error",
    "Function",
    "GDay",
    "GMonth",
    "GMonthDay",
    "GYear",
    "GYearMonth",
    "HexBinary",
    "LimitError",
    "Loader",
    "MissingDocumentWarning",
    "MonthDuration",
    "Node",
    "Notation",
    "Place",
    "Policy",
    "Profile",
    "QName",
    "Query",
    "Readable",
    "Resource",
    "Result",
    "Source",
    "Stream",
    "Time",
    "URI",
    "Untyped",
    "check",
    "compile",
    "from_lxml",
    "functions",
    "parse",
    "query",
    "release_memory",
    "to_lxml",
]
