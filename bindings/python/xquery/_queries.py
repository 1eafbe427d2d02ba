"""Compiled queries, and what is asked of them."""

from __future__ import annotations

import atexit
import os
import weakref
from dataclasses import replace
from types import TracebackType
from typing import (
    Any,
    Dict,
    Iterator,
    List,
    Mapping,
    NamedTuple,
    Optional,
    Tuple,
    Type,
    Union,
)

from . import _xquery
from ._documents import Source, _is_text, _path, _try_to_open, _URL, _utf8, parse
from ._errors import DocumentError, Error
from ._settings import Loader, Missing, Modules, Policy, Settings, Trace
from ._xquery import Cancellation, Node, Result

#: What can be given for a variable: see docs/python.md.
Variables = Mapping[str, Any]


def _together(variables: Optional[Variables], named: Dict[str, Any]) -> Dict[str, Any]:
    """The variables of a call; names that are no names of Python come in a mapping."""
    if not variables:
        return named
    twice = [name for name in named if name in variables]
    if twice:
        raise TypeError(f"a value is given twice for the variable {twice[0]}")
    return {**variables, **named}


def _item(doc: object) -> object:
    """A context item: a node or a value as it is, and what documents are read from."""
    if doc is None or isinstance(doc, Node):
        return doc
    if isinstance(doc, (str, bytes, bytearray, memoryview, os.PathLike)) or hasattr(doc, "read"):
        return parse(doc)
    return doc


class CheckWarning(NamedTuple):
    """What a query may do that its author hardly wants."""

    #: ``unknown-function`` and so on; docs/warnings.md has all of them.
    identifier: str
    text: str
    #: Of the function, variable or prefix that it is about.
    name: Optional[str]
    #: URL of the library module that it is in; None for the query itself.
    module: Optional[str]
    line: int
    column: int


class Function(NamedTuple):
    """A function that every query may call."""

    namespace: str
    name: str
    least_arguments: int
    #: None for any number.
    most_arguments: Optional[int]


class Query:
    """A compiled query. Immutable: any number of threads may evaluate it at once.

    >>> import xquery
    >>> query = xquery.compile("declare variable $limit external; //book[price > $limit]/title")
    >>> books = xquery.parse("examples/books.xml")
    >>> for title in query.evaluate(books, limit=20):
    ...     print(title.text)
    A Field Guide to Lichens

    A query can be pickled: its text and its settings are, and it is compiled anew.
    """

    __slots__ = ("text", "_settings", "_made", "_compiled", "_others", "__weakref__")

    def __init__(self, text: str, settings: Settings = Settings()) -> None:
        #: The text that was compiled.
        self.text = text
        self._settings = settings
        self._made = settings.made()
        self._compiled = _xquery.compile(text, self._made, "planned")
        self._others: Dict[str, _xquery.Compiled] = {}

    def evaluate(
        self, doc: object = None, variables: Optional[Variables] = None, /, **named: Any
    ) -> Result:
        """The items of the result.

        ``doc`` becomes the context item: a node, what ``parse`` takes, or another item. The
        variables that the query declares as external are given by name; names that are none of
        Python's, such as "max-price", in the mapping ``variables``.
        """
        return _xquery.evaluate(
            self._compiled, self._made, _item(doc), _together(variables, named)
        )

    __call__ = evaluate

    def stream(
        self, source: Source, variables: Optional[Variables] = None, /, **named: Any
    ) -> Stream:
        """The items one after another, while the document is read, in the memory of one record.

        Nodes are copies of their own. A query that needs more than a record at a time is refused
        with a CompileError that says why.

        >>> import xquery
        >>> query = xquery.compile("//price/text()")
        >>> with query.stream("examples/books.xml") as prices:
        ...     print([price.text for price in prices])
        ['24.50', '7.95', '18', '9.90']
        """
        return Stream(self, source, _together(variables, named))

    def profile(
        self, doc: object = None, variables: Optional[Variables] = None, /, **named: Any
    ) -> Profile:
        """Evaluates, and tells where the time went."""
        profile = Profile(self)
        profile.evaluate(doc, variables, **named)
        return profile

    def plan(self, format: str = "text") -> str:
        """How the query is evaluated: as "text", "json", or "dot" for tools that draw."""
        return self._compiled_to_be("explained").plan(format)

    @property
    def warnings(self) -> List[CheckWarning]:
        """What the query may do that its author hardly wants."""
        found = self._compiled_to_be("explained").warnings()
        return [CheckWarning(*warning) for warning in found]

    @property
    def projection(self) -> Optional[str]:
        """What the query needs of a document, for people to read; None where it needs all."""
        is_whole, _, description = self._compiled.projection()
        return None if is_whole else description

    @property
    def stream_plan(self) -> str:
        """How the query is evaluated as a stream; CompileError where it cannot be."""
        return self._compiled_to_be("streamed").stream_description()

    def _compiled_to_be(self, way: str) -> _xquery.Compiled:
        compiled = self._others.get(way)
        if compiled is None:
            compiled = self._others[way] = _xquery.compile(self.text, self._made, way)
        return compiled

    def __reduce__(self) -> Tuple[Any, ...]:
        return _compiled_again, (self.text, self._settings.given())

    def __repr__(self) -> str:
        text = " ".join(self.text.split())
        return f"<xquery.Query {text if len(text) <= 60 else text[:59] + chr(0x2026)!r}>"


def _compiled_again(text: str, given: Dict[str, Any]) -> Query:
    return Query(text, Settings(**given))


class Profile:
    """A sum of evaluations of one query, with how often each expression ran and how long it took.

    >>> import xquery
    >>> profile = xquery.compile("count(//book)").profile("examples/books.xml")
    >>> profile.result.one(), profile.evaluations
    (4, 1)
    >>> profile.html().lower().startswith("<!doctype html>")
    True
    """

    #: Of the last evaluation.
    result: Result

    def __init__(self, query: Query) -> None:
        self._query = query
        self._compiled = query._compiled_to_be("profiled")
        self._profile = _xquery.Profile(self._compiled)

    def evaluate(
        self, doc: object = None, variables: Optional[Variables] = None, /, **named: Any
    ) -> Result:
        """One more evaluation. It counts although it fails."""
        self.result = _xquery.evaluate_profiled(
            self._compiled,
            self._profile,
            self._query._made,
            _item(doc),
            _together(variables, named),
        )
        return self.result

    @property
    def evaluations(self) -> int:
        return self._profile.evaluations

    def text(self) -> str:
        """The expressions as a tree, with counts and times in columns."""
        return self._profile.describe("text")

    def json(self) -> str:
        """As docs/profile.md describes it."""
        return self._profile.describe("json")

    def html(self) -> str:
        """A page that needs no network."""
        return self._profile.describe("html")


class Stream(Iterator[Any]):
    """The items of a streamed query. Closed at its end, by ``close``, and by ``with``."""

    def __init__(self, query: Query, source: Source, variables: Dict[str, Any]) -> None:
        path, read, name = b"", None, "document"
        if isinstance(source, (bytes, bytearray, memoryview)) or (
            isinstance(source, str) and _is_text(source)
        ):
            read = _Reading(_utf8(source) if isinstance(source, str) else bytes(source)).read
        elif isinstance(source, str) and _URL.match(source):
            raise ValueError("a stream is read from a file: a URL has to be opened before")
        elif isinstance(source, (str, os.PathLike)):
            # So that what is wrong with it is known before the first item is asked for.
            _try_to_open(source)
            path, name = _path(source), os.fspath(source)
        elif hasattr(source, "read"):
            read, name = _reader(source), str(getattr(source, "name", "document"))
        else:
            raise TypeError(f"a document cannot be read from {type(source).__name__}")
        compiled = query._compiled_to_be("streamed")
        self._stream: Optional[_xquery.Stream] = None
        self._stream = _xquery.Stream(compiled, query._made, path, read, name, variables)
        _open_streams.add(self)

    def __iter__(self) -> Stream:
        return self

    def __next__(self) -> Any:
        if self._stream is None:
            raise StopIteration
        return self._stream.__next__()

    def close(self) -> None:
        """Ends reading. What was not asked for yet is lost."""
        if self._stream is not None:
            self._stream.close()
            self._stream = None

    def __enter__(self) -> Stream:
        return self

    def __exit__(
        self,
        type: Optional[Type[BaseException]],
        value: Optional[BaseException],
        traceback: Optional[TracebackType],
    ) -> None:
        self.close()


class _Reading:
    """Bytes, piece by piece."""

    def __init__(self, data: bytes) -> None:
        self._left = memoryview(data)

    def read(self, size: int) -> bytes:
        piece, self._left = bytes(self._left[:size]), self._left[size:]
        return piece


#: Characters of a declaration of XML, which are a few.
_MOST_DECLARED = 1000


def _reader(file: Any) -> Any:
    """What reads at most so many bytes of a file, of bytes or of text."""
    rest = b""
    is_first = True

    def read(size: int) -> bytes:
        nonlocal rest, is_first
        # A character takes up to four bytes.
        data = rest or file.read(size // 4 if size >= 4 else 1)
        if isinstance(data, str):
            # What declares an encoding comes at once, however little is read at a time.
            while is_first and ">" not in data and len(data) < _MOST_DECLARED:
                more = file.read(1)
                if not more:
                    break
                data += more
            data = _utf8(data) if is_first else data.encode()
        is_first = False
        rest = data[size:]
        return bytes(data[:size])

    return read


_open_streams: weakref.WeakSet[Stream] = weakref.WeakSet()


def _end() -> None:
    for stream in list(_open_streams):
        stream.close()
    _xquery._end()


atexit.register(_end)


class Context:
    """Settings, and what evaluations have in common.

    One for a task over documents that do not change: documents that queries name are loaded once,
    ``current-dateTime()`` stays what it was at first, and the context item stays in force for
    evaluations that are given none. It is for one evaluation at a time. ``close``, or the end of
    ``with``, lets go of the documents.

    >>> import xquery
    >>> policy = xquery.Policy.deny().allow_files("examples")
    >>> with xquery.Context(seconds=2, policy=policy) as context:
    ...     context.evaluate("count(doc('examples/books.xml')//book)").one()
    4

    It takes what ``compile`` takes.
    """

    def __init__(
        self,
        *,
        seconds: Optional[float] = None,
        memory: Optional[int] = None,
        policy: Policy = Policy(),
        url: Optional[str] = None,
        namespaces: Optional[Mapping[str, str]] = None,
        cancellation: Optional[Cancellation] = None,
        loader: Optional[Loader] = None,
        modules: Optional[Modules] = None,
        trace: Optional[Trace] = None,
        missing: Optional[Missing] = None,
    ) -> None:
        self._settings = Settings(
            seconds, memory, policy, url, namespaces, cancellation, loader, modules, trace, missing
        )
        self._made = self._settings.made()
        self._session = _xquery.Session(self._made)

    def compile(self, query: Union[str, os.PathLike[str]]) -> Query:
        """A query with the settings of this context."""
        return _query_from(query, self._settings)

    def evaluate(
        self,
        query: Union[str, Query],
        doc: object = None,
        variables: Optional[Variables] = None,
        /,
        **named: Any,
    ) -> Result:
        """As Query.evaluate, within this context."""
        compiled = query if isinstance(query, Query) else self.compile(query)
        return self._session.evaluate(
            compiled._compiled, self._made, _item(doc), _together(variables, named)
        )

    def close(self) -> None:
        """Lets go of the documents; nothing can be evaluated any more."""
        self._session.close()

    def __enter__(self) -> Context:
        return self

    def __exit__(
        self,
        type: Optional[Type[BaseException]],
        value: Optional[BaseException],
        traceback: Optional[TracebackType],
    ) -> None:
        self.close()


def _query_from(query: Union[str, os.PathLike[str]], settings: Settings) -> Query:
    if isinstance(query, str):
        return Query(query, settings)
    if not isinstance(query, os.PathLike):
        raise TypeError(f"a query is a str or a path, not {type(query).__name__}")
    with open(query, encoding="utf-8-sig", newline="") as file:
        text = file.read()
    if settings.url is None:
        url = _xquery.file_url(_path(query)) or ""
        settings = replace(settings, url=url)
    return Query(text, settings)


def compile(
    query: Union[str, os.PathLike[str]],
    /,
    *,
    seconds: Optional[float] = None,
    memory: Optional[int] = None,
    policy: Policy = Policy(),
    url: Optional[str] = None,
    namespaces: Optional[Mapping[str, str]] = None,
    cancellation: Optional[Cancellation] = None,
    loader: Optional[Loader] = None,
    modules: Optional[Modules] = None,
    trace: Optional[Trace] = None,
    missing: Optional[Missing] = None,
) -> Query:
    """Compiles a query: a text, or a file by its path of pathlib.

    CompileError has all that is wrong with it. The keywords hold for compiling it and for each of
    its evaluations:

    - seconds, memory: how long it may take, and how many bytes its values may take at a time;
      reaching one is a LimitError
    - cancellation: ends it from another thread
    - policy: what it may load
    - url: what relative references are resolved against; without, the file, or the working folder
    - namespaces: prefixes for names that the query does not resolve itself
    - loader: fetches in place of the library
    - modules: the texts of library modules, by location, or a function of the URL
    - trace: hears of each ``trace``: ``trace(label, items)``
    - missing: hears of each document that is missing: ``missing(url, reason)``; without, that is
      a MissingDocumentWarning
    """
    settings = Settings(
        seconds, memory, policy, url, namespaces, cancellation, loader, modules, trace, missing
    )
    return _query_from(query, settings)


def query(
    text: Union[str, os.PathLike[str]],
    source: object = None,
    variables: Optional[Variables] = None,
    /,
    **named: Any,
) -> Result:
    """Compiles and evaluates in one go.

    >>> import xquery
    >>> xquery.query("//book[price < 10]/title/string()", "examples/books.xml")
    <xquery.Result ['Pocket Knots', 'Petite histoire du sel']>

    Of a document that is not read yet no more is made than the query needs, where it answers no
    nodes of it.
    """
    compiled = _query_from(text, Settings())
    _, answers_nodes, _ = compiled._compiled.projection()
    item = source
    if not answers_nodes and not isinstance(source, Node) and source is not None:
        if isinstance(source, (str, bytes, os.PathLike)) or hasattr(source, "read"):
            item = parse(source, query=compiled)
    return compiled.evaluate(item, variables, **named)


def check(
    query: Union[str, os.PathLike[str]], /, *, policy: Policy = Policy(), url: Optional[str] = None
) -> List[CheckWarning]:
    """The warnings of a query, without evaluating it; CompileError where it does not compile.

    >>> import xquery
    >>> for warning in xquery.check("let $a := 1 return 2"):
    ...     print(warning.identifier, warning.line, warning.column, warning.name)
    unused-variable 1 6 a
    """
    return _query_from(query, Settings(policy=policy, url=url)).warnings


def functions() -> List[Function]:
    """The functions that every query may call without declaring them, in no particular order."""
    return [Function(*function) for function in _xquery.library_functions()]


def release_memory() -> None:
    """Gives the system back what evaluations left behind for the next ones."""
    _xquery.release_memory()


def _fetched(url: str, settings: Settings) -> bytes:
    """The bytes that are found at a URL; DocumentError where there are none."""
    bodies = Query("declare variable $url external; ext:uri-body($url)", settings)
    try:
        return bytes(bodies.evaluate(url=url).one())
    except Error as error:
        # The function says so of a resource that there is not; which reason there is, others say.
        if error.number != 17:
            raise
    reasons: List[str] = []
    again = replace(settings, missing=lambda missing, reason: reasons.append(reason))
    Query("declare variable $url external; doc($url)", again).evaluate(url=url)
    raise DocumentError(reasons[0] if reasons else "it cannot be loaded", url)
