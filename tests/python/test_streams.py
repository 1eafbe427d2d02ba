"""Streams: results of documents that are read record by record."""

from __future__ import annotations

import gc
import io
import os
import sys
import threading
import time
from pathlib import Path
from typing import Any, Callable, List, Optional

import pytest

import xquery

PRICES = ["24.50", "7.95", "18", "9.90"]
COUNT = 100_000


@pytest.fixture(scope="module")
def long_file(tmp_path_factory: pytest.TempPathFactory) -> Path:
    path = tmp_path_factory.mktemp("streams") / "long.xml"
    with open(path, "w") as file:
        file.write("<a>")
        file.writelines(f"<r n='{number}'>text {number}</r>" for number in range(COUNT))
        file.write("</a>")
    return path


def test_items_of_every_source() -> None:
    query = xquery.compile("for $p in //price return string($p)")
    path = Path("examples/books.xml")
    data = path.read_bytes()
    text = data.decode()
    sources: List[xquery.Source] = [path, str(path), data, text]
    for source in [*sources, io.BytesIO(data), io.StringIO(text)]:
        assert list(query.stream(source)) == PRICES
    with open(path, "rb") as file:
        assert list(query.stream(file)) == PRICES


class OneByOne(io.StringIO):
    def read(self, size: Optional[int] = -1, /) -> str:
        return super().read(min(size or 0, 1))


def test_text_has_no_encoding_whatever_it_says() -> None:
    query = xquery.compile("for $r in /a/r return string($r)")
    text = "<?xml version='1.0' encoding='ISO-8859-1'?><a><r>\u00e4</r></a>"
    sources: List[xquery.Source] = [text, io.StringIO(text), OneByOne(text), text.encode("latin-1")]
    for source in sources:
        assert list(query.stream(source)) == ["\u00e4"]


def test_values_and_variables() -> None:
    query = xquery.compile("declare variable $v external; for $r in /a/r return $r/@n + $v")
    assert list(query.stream(b"<a><r n='1'/><r n='2'/></a>", v=10)) == [11.0, 12.0]
    assert list(xquery.compile("count(/a/r)").stream(b"<a><r/><r/></a>")) == [2]


def test_nodes_are_copies() -> None:
    nodes = list(xquery.compile("/a/r").stream(b"<a xmlns:p='u'><r><p:b/></r><r/></a>"))
    assert [node.name for node in nodes] == ["r", "r"]
    assert nodes[0].parent is None
    assert nodes[0].xml() == '<r><p:b xmlns:p="u"/></r>'
    attribute = next(xquery.compile("/a/r/@n").stream(b"<a><r n='7'/></a>"))
    assert (attribute.kind, attribute.text) == ("attribute", "7")


def test_long_documents(long_file: Path) -> None:
    assert sum(1 for _ in xquery.compile("/a/r").stream(long_file)) == COUNT
    texts = xquery.compile("for $r in /a/r return string($r/@n)").stream(long_file)
    assert [int(text) for text in texts] == list(range(COUNT))


def test_closing_early(long_file: Path) -> None:
    before = threading.active_count()
    with xquery.compile("for $r in /a/r return string($r)").stream(long_file) as stream:
        assert next(stream) == "text 0"
    with pytest.raises(StopIteration):
        next(stream)
    stream.close()
    assert threading.active_count() == before


def test_one_thread_asks_at_a_time_and_any_may_close() -> None:
    asked = threading.Event()

    class Slow:
        first = True

        def read(self, size: int = -1, /) -> bytes:
            data, self.first = (b"<a>" if self.first else b"<r>1</r>"), False
            asked.set()
            time.sleep(0.001)
            return data

    stream = xquery.compile("for $r in /a/r[. = 2] return string($r)").stream(Slow())
    ended: List[BaseException] = []

    def ask() -> None:
        try:
            next(stream)
        except (StopIteration, xquery.LimitError) as end:
            ended.append(end)

    thread = threading.Thread(target=ask)
    thread.start()
    assert asked.wait(60)
    time.sleep(0.1)
    with pytest.raises(ValueError, match="already"):
        next(stream)
    stream.close()
    thread.join(60)
    assert len(ended) == 1


def test_letting_go_early(long_file: Path) -> None:
    threads = len(list(Path("/proc/self/task").iterdir()))
    for _ in range(20):
        stream = xquery.compile("for $r in /a/r return string($r)").stream(long_file)
        next(stream)
        del stream
        gc.collect()
    assert len(list(Path("/proc/self/task").iterdir())) <= threads + 2


def test_what_cannot_be_a_stream() -> None:
    query = xquery.compile("//book[last()]/preceding::title")
    with pytest.raises(xquery.CompileError, match="cannot be evaluated as a stream: "):
        query.stream(b"<a/>")
    assert "record" in xquery.compile("/a/r").stream_plan


def test_errors_come_behind_the_items_before_them() -> None:
    stream = xquery.compile("for $r in /a/r return 1 idiv $r/@n").stream(b"<a><r n='1'/><r n='0'/></a>")
    assert next(stream) == 1
    with pytest.raises(xquery.Error, match="divide by zero"):
        next(stream)
    with pytest.raises(StopIteration):
        next(stream)


def test_documents_that_are_broken_or_missing(tmp_path: Path) -> None:
    query = xquery.compile("for $r in /a/r return string($r)")
    with pytest.raises(xquery.DocumentError):
        list(query.stream(b"<a><r>1</r><r></a>"))
    with pytest.raises(FileNotFoundError):
        query.stream(tmp_path / "none.xml")
    with pytest.raises(ValueError, match="URL"):
        query.stream("http://example.org/")
    with pytest.raises(TypeError):
        query.stream(1)  # type: ignore[arg-type]


# By the library alone: who writes while nobody reads is ended.
def test_a_named_pipe_is_opened_once(tmp_path: Path, monkeypatch: pytest.MonkeyPatch) -> None:
    pipe = tmp_path / "pipe"
    os.mkfifo(pipe)
    plain = open

    def refusing(file: Any, *arguments: Any, **named: Any) -> Any:
        assert file != pipe
        return plain(file, *arguments, **named)

    monkeypatch.setattr("builtins.open", refusing)

    def write() -> None:
        with plain(pipe, "wb") as file:
            file.write(b"<a><r>1</r><r>2</r></a>")

    reads: List[Callable[[], List[str]]] = [
        lambda: list(xquery.compile("for $r in /a/r return string($r)").stream(pipe)),
        lambda: xquery.query("/a/r/string()", pipe).to_list(),
    ]
    for read in reads:
        writer = threading.Thread(target=write, daemon=True)
        writer.start()
        assert read() == ["1", "2"]
        writer.join(10)
        assert not writer.is_alive()


def test_what_reading_raises_is_raised() -> None:
    class Broken:
        def read(self, size: int = -1) -> bytes:
            raise KeyError("broken")

    with pytest.raises(KeyError):
        list(xquery.compile("/a/r").stream(Broken()))


def test_limits() -> None:
    class Endless:
        first = True

        def read(self, size: int = -1) -> bytes:
            data, self.first = (b"<a>" if self.first else b"<r/>"), False
            return data

    with pytest.raises(xquery.LimitError, match="deadline"):
        list(xquery.compile("count(/a/r)", seconds=0.2).stream(Endless()))
    cancellation = xquery.Cancellation()
    stream = xquery.compile("count(/a/r)", cancellation=cancellation).stream(Endless())
    threading.Timer(0.1, cancellation.cancel).start()
    with pytest.raises(xquery.LimitError, match="cancelled"):
        next(stream)


def test_the_interpreter_ends_with_a_stream_under_way(
    long_file: Path, run_python: Callable[[str], object]
) -> None:
    done = run_python(
        "import xquery\n"
        "query = xquery.compile('for $r in /a/r return string($r)')\n"
        f"stream = query.stream({str(long_file)!r})\n"
        "print(next(stream))\n"
        f"other = query.stream(open({str(long_file)!r}, 'rb'))\n"
        "print(next(other))\n"
    )
    assert (done.returncode, done.stdout) == (0, "text 0\ntext 0\n"), done.stderr  # type: ignore[attr-defined]


def test_a_stream_takes_the_memory_of_a_record(long_file: Path, tmp_path: Path) -> None:
    import resource

    longer = tmp_path / "longer.xml"
    records = long_file.read_bytes()[3:-4]
    with open(longer, "wb") as file:
        file.write(b"<a>" + records * 10 + b"</a>")
    query = xquery.compile("for $r in /a/r return string($r)")
    next(query.stream(long_file))
    before = resource.getrusage(resource.RUSAGE_SELF).ru_maxrss
    assert sum(1 for _ in query.stream(longer)) == 10 * COUNT
    grown = resource.getrusage(resource.RUSAGE_SELF).ru_maxrss - before
    assert grown * 1024 < longer.stat().st_size / 2, sys.platform
