"""Documents from wherever they are."""

from __future__ import annotations

import os
import re
import stat
from typing import TYPE_CHECKING, List, Optional, Protocol, Union

from . import _xquery
from ._errors import DocumentError
from ._settings import Loader, Policy, Resource, Settings
from ._xquery import Node

if TYPE_CHECKING:
    from ._queries import Query


class Readable(Protocol):
    """A file object, of bytes or of text."""

    def read(self, size: int = ..., /) -> Union[bytes, str]:
        ...


Source = Union[str, bytes, bytearray, memoryview, "os.PathLike[str]", Readable]

_URL = re.compile(r"[A-Za-z][A-Za-z0-9+.-]*://|file:")
_ENCODING = re.compile(r"""(\A\ufeff?<\?xml\s[^>]*?)(\bencoding\s*=\s*(?:"[^"]*"|'[^']*'))""")


def _utf8(text: str) -> bytes:
    """A text is what it is, whatever encoding it says that it had as bytes."""
    declared = _ENCODING.match(text)
    if declared:
        start, end = declared.span(2)
        text = text[:start] + " " * (end - start) + text[end:]
    return text.encode()


def _path(path: Union[str, os.PathLike[str]]) -> bytes:
    # "-" is a file like any other.
    name = os.fsencode(path)
    return b"./-" if name == b"-" else name


def _try_to_open(path: Union[str, os.PathLike[str]]) -> None:
    # Not a named pipe: who writes to it would find it closed.
    if not stat.S_ISFIFO(os.stat(path).st_mode):
        with open(path, "rb"):
            pass


def _is_text(source: str) -> bool:
    return source.lstrip("\ufeff \t\r\n").startswith("<")


def _from_bytes(
    data: Union[bytes, bytearray, memoryview],
    name: str,
    html: bool,
    strip_space: bool,
    query: Optional[_xquery.Compiled],
) -> Node:
    return _xquery.parse_bytes(bytes(data), name, html, strip_space, query)


def _from_file(
    path: Union[str, os.PathLike[str]],
    html: bool,
    strip_space: bool,
    query: Optional[_xquery.Compiled],
) -> Node:
    try:
        document = _xquery.parse_file(_path(path), html, strip_space, query)
    except DocumentError as error:
        if error.place is None:
            # Python knows better what is wrong with a file that cannot be opened.
            _try_to_open(path)
        raise
    url = _xquery.file_url(_path(path))
    if url is not None:
        _xquery.set_uri(document, url)
    return document


def _is_html(url: str, mime_type: Optional[str]) -> bool:
    if mime_type is not None:
        return mime_type.lower() == "text/html"
    return url.lower().split("?")[0].endswith((".html", ".htm"))


def _from_url(
    url: str,
    policy: Policy,
    loader: Optional[Loader],
    html: bool,
    strip_space: bool,
    query: Optional[_xquery.Compiled],
) -> Node:
    from ._queries import _fetched

    told: List[Optional[str]] = []

    def noting(url: str, purpose: str) -> Union[None, bytes, str, Resource]:
        assert loader is not None
        answer = loader(url, purpose)
        told.append(getattr(answer, "mime_type", None))
        return answer

    asked = None if loader is None else noting
    data = _fetched(url, Settings(policy=policy, loader=asked))
    is_html = html or _is_html(url, told[-1] if told else None)
    document = _from_bytes(data, url, is_html, strip_space, query)
    _xquery.set_uri(document, url)
    return document


def parse(
    source: Source,
    *,
    html: bool = False,
    strip_space: bool = False,
    policy: Policy = Policy(),
    loader: Optional[Loader] = None,
    query: Optional[Query] = None,
) -> Node:
    """Reads a document, and answers its document node.

    ``source`` is a path (of pathlib or as a str), a URL, XML as bytes or as a str that begins
    with ``<``, or a file object. What gzip, xz, zstd or bzip2 has packed is read as it is.

    >>> import xquery
    >>> xquery.parse("<a><b/></a>").find("name(/a/*)")
    'b'
    >>> xquery.parse(b"<a>text</a>").text
    'text'

    - html: the document is HTML of any quality; elements are in the XHTML namespace. What is
      fetched from a URL is, where a loader says so by ``Resource.mime_type`` or, where none says
      anything, the path of the URL ends in ``.html`` or ``.htm``
    - strip_space: texts of nothing but white space are left out, unless xml:space says preserve
    - policy, loader: for a URL alone, what may be fetched and by whom
    - query: the document is for that query alone, so that no more than it needs is made

    DocumentError says what is wrong with a document, and OSError why a file cannot be read.
    """
    compiled = None if query is None else query._compiled
    if isinstance(source, str):
        if _is_text(source):
            return _from_bytes(_utf8(source), "document", html, strip_space, compiled)
        if _URL.match(source):
            return _from_url(source, policy, loader, html, strip_space, compiled)
        return _from_file(source, html, strip_space, compiled)
    if isinstance(source, (bytes, bytearray, memoryview)):
        return _from_bytes(source, "document", html, strip_space, compiled)
    if isinstance(source, os.PathLike):
        return _from_file(source, html, strip_space, compiled)
    if hasattr(source, "read"):
        data = source.read()
        name = getattr(source, "name", "document")
        if isinstance(data, str):
            data = _utf8(data)
        elif not isinstance(data, (bytes, bytearray, memoryview)):
            raise TypeError(f"read() answers bytes or a str, not {type(data).__name__}")
        return _from_bytes(data, str(name), html, strip_space, compiled)
    raise TypeError(f"a document cannot be read from {type(source).__name__}")
