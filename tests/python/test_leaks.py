"""What is left behind: by documents, by cycles, by the end of the interpreter."""

from __future__ import annotations

import gc
import os
import subprocess
import weakref
from pathlib import Path
from typing import Any, Callable, List

import pytest

import xquery

Run = Callable[[str], "subprocess.CompletedProcess[str]"]


def resident_now() -> int:
    """Bytes of memory that the process has."""
    with open("/proc/self/statm") as file:
        return int(file.readline().split()[1]) * os.sysconf("SC_PAGE_SIZE")


def resident() -> int:
    """The same once nothing is idle."""
    gc.collect()
    xquery.release_memory()
    return resident_now()


def test_idle_memory_is_given_back_when_it_is_asked_for() -> None:
    before = resident()
    xquery.query("count(for $i in 1 to 300000 order by -$i return <a>{$i}</a>)")
    idle = resident_now()
    assert idle - before > 4 << 20
    xquery.release_memory()
    assert resident_now() - before < (idle - before) / 2


def test_ten_thousand_documents_leave_nothing() -> None:
    data = Path("examples/books.xml").read_bytes()
    query = xquery.compile("declare variable $n external; //title, <a n='{$n}'/>, //price/text()")

    def use(count: int) -> None:
        for number in range(count):
            document = xquery.parse(data)
            items = query.evaluate(document, n=number)
            assert len(items) == 9 and items[4].get("n") == str(number)
            [node.parent for node in document.walk()]

    use(1000)
    before = resident()
    use(10_000)
    # A document takes some kilobytes: a leak of each would be many times as much.
    assert resident() - before < 4 << 20


def test_failures_leave_nothing() -> None:
    query = xquery.compile("declare variable $v external; $v idiv 0")

    def use(count: int) -> None:
        for number in range(count):
            with pytest.raises(xquery.Error):
                query.evaluate(v=number)
            with pytest.raises(TypeError):
                query.evaluate(v=object())
            with pytest.raises(xquery.DocumentError):
                xquery.parse("<a>" + "<b>" * 50)
            with pytest.raises(xquery.CompileError):
                xquery.compile("1 +")
            with pytest.warns(xquery.MissingDocumentWarning):
                xquery.query("doc('own:a')")

    use(300)
    before = resident()
    use(3000)
    assert resident() - before < 4 << 20


def test_cycles_are_collected() -> None:
    class Loader:
        query: Any = None

        def __call__(self, url: str, purpose: str) -> bytes:
            return b"<a/>"

    gone: List[Any] = []
    for keyword in ("loader", "trace", "missing", "modules"):
        loader = Loader()
        loader.query = xquery.compile("1", **{keyword: loader})  # type: ignore[arg-type]
        loader.query.evaluate()
        gone.append(weakref.ref(loader))
        context = xquery.Context(**{keyword: loader})  # type: ignore[arg-type]
        context.evaluate("doc('http://example.org/')" if keyword == "loader" else "1")
        loader.context = context  # type: ignore[attr-defined]
        del loader, context
    gc.collect()
    assert [reference() for reference in gone] == [None] * 4


class Reading:
    """A file without an end."""

    stream: Any = None
    start = b"<a>"

    def read(self, size: int = -1, /) -> bytes:
        start, self.start = self.start, b""
        return start + b"<b/>" * ((size - len(start)) // 4)


def test_cycles_through_streams_are_collected() -> None:
    gone: List[Any] = []
    file = Reading()
    file.stream = xquery.compile("/a/b").stream(file)
    next(file.stream)
    gone.append(weakref.ref(file))
    del file
    for keyword in ("loader", "trace", "missing", "modules"):

        class Hearing:
            stream: Any = None

            def __call__(self, *event: object) -> None:
                return None

        heard = Hearing()
        query = xquery.compile("/a/b", **{keyword: heard})  # type: ignore[arg-type]
        heard.stream = query.stream("<a>" + "<b/>" * 1000 + "</a>")
        next(heard.stream)
        gone.append(weakref.ref(heard))
        del heard, query
    gc.collect()
    assert [reference() for reference in gone] == [None] * 5


def test_a_stream_may_be_let_go_of_by_what_it_reads_from(run_python: Run) -> None:
    done = run_python(
        "import gc, threading, xquery\n"
        "class File:\n"
        "    let_go, done, count = threading.Event(), threading.Event(), 0\n"
        "    def read(self, size):\n"
        "        self.count += 1\n"
        "        if self.count == 1: return b'<a><b/>' + b' ' * 70000\n"
        "        self.let_go.wait()\n"
        "        gc.collect()\n"
        "        self.done.set()\n"
        "        return b''\n"
        "file = File()\n"
        "cycle = [xquery.compile('/a/b').stream(file)]\n"
        "next(cycle[0])\n"
        "cycle.append(cycle)\n"
        "gc.disable()\n"
        "del cycle\n"
        "file.let_go.set()\n"
        "file.done.wait()\n"
        "print('done')\n"
    )
    assert (done.returncode, done.stdout, done.stderr) == (0, "done\n", "")


def test_a_query_is_gone_with_its_last_reference() -> None:
    query = xquery.compile("1")
    gone = weakref.ref(query)
    query.plan()
    del query
    assert gone() is None


def test_the_interpreter_ends_with_everything_alive(run_python: Run) -> None:
    done = run_python(
        "import xquery, threading\n"
        "document = xquery.parse('<a><b/></a>')\n"
        "kept = [document, document.find('/a'), xquery.query('1 to 10'), iter(document)]\n"
        "context = xquery.Context(loader=lambda url, purpose: b'<a/>')\n"
        "context.evaluate(\"doc('http://example.org/')\")\n"
        "class Cycle: pass\n"
        "cycle = Cycle(); cycle.cycle = cycle; cycle.kept = kept\n"
        "cycle.query = xquery.compile('1', trace=lambda *a: cycle)\n"
        "print('done')\n"
    )
    assert (done.returncode, done.stdout, done.stderr) == (0, "done\n", "")


def test_the_interpreter_ends_while_a_thread_evaluates(run_python: Run) -> None:
    done = run_python(
        "import xquery, threading, time\n"
        "query = xquery.compile('count(for $i in 1 to 1000000, $j in 1 to 1000000 return $i)')\n"
        "threading.Thread(target=query.evaluate, daemon=True).start()\n"
        "time.sleep(0.2)\n"
        "print('done')\n"
    )
    assert (done.returncode, done.stdout) == (0, "done\n"), done.stderr


def test_the_interpreter_ends_while_a_loader_is_asked(run_python: Run) -> None:
    done = run_python(
        "import xquery, threading, time\n"
        "def load(url, purpose):\n"
        "    time.sleep(1)\n"
        "query = xquery.compile(\"doc('http://example.org/')\", loader=load, seconds=0.1)\n"
        "try:\n"
        "    query.evaluate()\n"
        "except xquery.LimitError:\n"
        "    print('done')\n"
    )
    assert (done.returncode, done.stdout) == (0, "done\n"), done.stderr


@pytest.mark.parametrize(
    "call",
    [
        "query.evaluate()",
        "traced.evaluate()",
        "xquery.parse(text)",
        "document.find('count(a)')",
        "document.xml()",
    ],
)
def test_the_interpreter_ends_while_threads_come_back_to_it(run_python: Run, call: str) -> None:
    done = run_python(
        "import xquery, threading, time\n"
        "text = '<a>' + '<b/>' * 2000 + '</a>'\n"
        "document = xquery.parse(text)\n"
        "query = xquery.compile('count(for $i in 1 to 300 return $i * 2)')\n"
        "traced = xquery.compile('trace(1, \"a\")', trace=lambda label, items: None)\n"
        "def work():\n"
        f"    while True: {call}\n"
        "for _ in range(6): threading.Thread(target=work, daemon=True).start()\n"
        "time.sleep(0.1)\n"
        "print('done')\n"
    )
    assert (done.returncode, done.stdout) == (0, "done\n"), done.stderr
