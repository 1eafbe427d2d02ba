"""Documents from everything that holds one."""

from __future__ import annotations

import bz2
import gzip
import http.server
import io
import os
import threading
from pathlib import Path
from typing import Iterator, List, Optional

import pytest

import xquery

TEXT = "<a>\u00e4</a>"


@pytest.fixture
def file(tmp_path: Path) -> Path:
    path = tmp_path / "a b\u00e4.xml"
    path.write_text(TEXT, encoding="utf-8")
    return path


@pytest.fixture
def server(tmp_path: Path) -> Iterator[str]:
    (tmp_path / "a.xml").write_text(TEXT, encoding="utf-8")
    (tmp_path / "a.html").write_text("<p>one<p>two")

    class Handler(http.server.SimpleHTTPRequestHandler):
        def __init__(self, *args: object) -> None:
            super().__init__(*args, directory=str(tmp_path))  # type: ignore[arg-type]

        def log_message(self, format: str, *args: object) -> None:
            pass

    with http.server.ThreadingHTTPServer(("127.0.0.1", 0), Handler) as server:
        threading.Thread(target=server.serve_forever, daemon=True).start()
        yield f"http://127.0.0.1:{server.server_address[1]}/"
        server.shutdown()


def test_a_path(file: Path) -> None:
    paths: List[xquery.Source] = [file, str(file)]
    for path in paths:
        document = xquery.parse(path)
        assert document.text == "\u00e4"
        assert document.uri == file.as_uri()


def test_a_file_by_the_name_of_standard_input(
    tmp_path: Path, monkeypatch: pytest.MonkeyPatch
) -> None:
    monkeypatch.chdir(tmp_path)
    Path("-").write_text("<a>file</a>")
    assert xquery.parse("-").text == "file"


def test_xml_as_text() -> None:
    assert xquery.parse(TEXT).text == "\u00e4"
    assert xquery.parse("\n <a/>")[0].name == "a"
    assert xquery.parse("\ufeff" + TEXT).text == "\u00e4"


@pytest.mark.parametrize("quote", ["'", '"'])
def test_text_has_no_encoding_whatever_it_says(quote: str) -> None:
    declared = f"<?xml version='1.0' encoding={quote}ISO-8859-1{quote}?>"
    assert xquery.parse(declared + TEXT).text == "\u00e4"
    assert xquery.parse(io.StringIO(declared + TEXT)).text == "\u00e4"
    assert xquery.parse((declared + TEXT).encode("latin-1")).text == "\u00e4"


def test_bytes() -> None:
    data = TEXT.encode()
    for source in (data, bytearray(data), memoryview(data)):
        assert xquery.parse(source).text == "\u00e4"
    assert xquery.parse(TEXT.encode("utf-16")).text == "\u00e4"
    assert xquery.parse(gzip.compress(data)).text == "\u00e4"
    assert xquery.parse(bz2.compress(data)).text == "\u00e4"


def test_file_objects(file: Path) -> None:
    assert xquery.parse(io.BytesIO(TEXT.encode())).text == "\u00e4"
    with open(file, "rb") as binary:
        assert xquery.parse(binary).text == "\u00e4"
    with open(file, encoding="utf-8") as text:
        assert xquery.parse(text).text == "\u00e4"


def test_html() -> None:
    document = xquery.parse(b"<p>one<p>two", html=True)
    assert document.find("count(//*[local-name() = 'p'])") == 2
    assert document[-1].namespace == "http://www.w3.org/1999/xhtml"


def test_white_space() -> None:
    assert len(xquery.parse("<a> <b/> </a>")[0]) == 3
    assert len(xquery.parse("<a> <b/> </a>", strip_space=True)[0]) == 1


def test_a_file_that_cannot_be_read(tmp_path: Path) -> None:
    with pytest.raises(FileNotFoundError):
        xquery.parse(tmp_path / "none.xml")
    with pytest.raises(IsADirectoryError):
        xquery.parse(tmp_path)
    with pytest.raises(FileNotFoundError):
        xquery.query("1", tmp_path / "none.xml")


def test_a_file_that_is_not_well_formed(tmp_path: Path) -> None:
    path = tmp_path / "broken.xml"
    path.write_text("<a>\n<b></a>")
    with pytest.raises(xquery.DocumentError) as caught:
        xquery.parse(path)
    assert caught.value.place is not None
    assert caught.value.place[:2] == (str(path), 2)
    assert str(caught.value).startswith(f"{path}:2:")


@pytest.mark.parametrize("source", [b"", b"\0", b"<a", b"\xff\xfe", gzip.compress(b"<a/>")[:-4]])
def test_bytes_that_are_no_document(source: bytes) -> None:
    with pytest.raises(xquery.DocumentError):
        xquery.parse(source)


def test_no_source() -> None:
    for source in (None, 1, ["<a/>"]):
        with pytest.raises(TypeError, match="a document cannot be read from"):
            xquery.parse(source)  # type: ignore[arg-type]


@pytest.mark.parametrize("answer", [5, None, ["<a/>"]])
def test_a_file_object_answers_bytes_or_a_str(answer: object) -> None:
    class Other:
        def read(self, size: int = -1) -> bytes:
            return answer  # type: ignore[return-value]

    with pytest.raises(TypeError, match="read\\(\\) answers bytes or a str, not "):
        xquery.parse(Other())


def test_what_reading_raises_is_raised() -> None:
    class Broken(io.RawIOBase):
        def readinto(self, buffer: object) -> int:
            raise KeyError("broken")

        def readable(self) -> bool:
            return True

    with pytest.raises(KeyError):
        xquery.parse(Broken())  # type: ignore[arg-type]


def test_urls(server: str, file: Path) -> None:
    document = xquery.parse(server + "a.xml")
    assert (document.text, document.uri) == ("\u00e4", server + "a.xml")
    assert xquery.parse(server + "a.html").find("count(//*[local-name() = 'p'])") == 2
    assert xquery.parse(file.as_uri()).text == "\u00e4"
    with pytest.raises(xquery.DocumentError, match="404"):
        xquery.parse(server + "none.xml")


def test_urls_under_a_policy(server: str, file: Path) -> None:
    deny = xquery.Policy.deny()
    for url in (server + "a.xml", file.as_uri()):
        with pytest.raises(xquery.DocumentError, match="not allowed"):
            xquery.parse(url, policy=deny)
    assert xquery.parse(server + "a.xml", policy=deny.allow_urls(server + "a.xml")).text
    assert xquery.parse(file.as_uri(), policy=deny.allow_files(file.parent)).text
    with pytest.raises(xquery.DocumentError):
        xquery.parse(server + "a.xml", policy=xquery.Policy().forbid_local_addresses())


def test_a_loader_of_ones_own() -> None:
    def load(url: str, purpose: str) -> bytes:
        assert (url, purpose) == ("http://example.org/x", "body")
        return TEXT.encode()

    assert xquery.parse("http://example.org/x", loader=load).text == "\u00e4"


@pytest.mark.parametrize(
    "url, mime_type, is_html",
    [
        ("http://example.org/x", "text/html", True),
        ("http://example.org/x", "TEXT/HTML", True),
        ("http://example.org/x", None, False),
        ("http://example.org/x.html?a", None, True),
        ("http://example.org/x.html", "application/xml", False),
    ],
)
def test_a_loader_says_what_is_html(url: str, mime_type: Optional[str], is_html: bool) -> None:
    def load(url: str, purpose: str) -> xquery.Resource:
        return xquery.Resource(b"<p>a</p>", mime_type)

    root = xquery.parse(url, loader=load)[0]
    assert root.name == ("html" if is_html else "p")


def test_a_projected_document(books: xquery.Node) -> None:
    query = xquery.compile("count(//price)")
    part = xquery.parse("examples/books.xml", query=query)
    assert query.evaluate(part).one() == 4
    assert len(part.xml()) < len(books.xml())
    assert query.projection == "//price"
    assert xquery.compile("//price/..").projection is None


def test_one_shot_reads_what_is_needed_and_answers_whole_nodes(books: xquery.Node) -> None:
    assert xquery.query("sum(//price)", "examples/books.xml").one() == pytest.approx(60.35)
    price = xquery.query("//price", "examples/books.xml")[0]
    assert price.root.xml() == books.xml()


def test_many_threads_read_one_document(books: xquery.Node) -> None:
    texts = []

    def read() -> None:
        for _ in range(50):
            texts.append(books.xml())

    threads = [threading.Thread(target=read) for _ in range(4)]
    for thread in threads:
        thread.start()
    for thread in threads:
        thread.join()
    assert len(texts) == 200
    assert set(texts) == {books.xml()}


def test_file_descriptors_are_closed(file: Path) -> None:
    before = len(os.listdir("/proc/self/fd"))
    for _ in range(10):
        xquery.parse(file)
        with pytest.raises(xquery.DocumentError):
            xquery.parse("<a>")
    assert len(os.listdir("/proc/self/fd")) == before
