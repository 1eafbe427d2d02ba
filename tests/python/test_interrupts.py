"""Interrupts, as Ctrl-C sends them, and other signals."""

from __future__ import annotations

import os
import signal
import subprocess
import sys
import threading
import time
from typing import Any, Callable, Iterator, List

import pytest

import xquery

ENDLESS = "count(for $i in 1 to 1000000, $j in 1 to 1000000 return $i)"


@pytest.fixture
def interrupt_soon() -> Iterator[None]:
    timer = threading.Timer(0.2, os.kill, (os.getpid(), signal.SIGINT))
    timer.start()
    yield
    timer.join()


def test_an_evaluation(interrupt_soon: None) -> None:
    start = time.monotonic()
    with pytest.raises(KeyboardInterrupt):
        xquery.query(ENDLESS)
    assert time.monotonic() - start < 10
    # The next one knows nothing of it.
    assert xquery.query("count((1 to 100000, 'a'))").one() == 100001


def test_a_path_that_is_found(books: xquery.Node, interrupt_soon: None) -> None:
    with pytest.raises(KeyboardInterrupt):
        books.find(ENDLESS)


def test_a_context(interrupt_soon: None) -> None:
    with xquery.Context() as context:
        with pytest.raises(KeyboardInterrupt):
            context.evaluate(ENDLESS)
        assert context.evaluate("1").one() == 1


def test_a_query_within_a_trace(interrupt_soon: None) -> None:
    def trace(label: str, items: xquery.Result) -> None:
        xquery.query(ENDLESS)

    with pytest.raises(KeyboardInterrupt):
        xquery.compile("trace(1, 'a')", trace=trace).evaluate()


def test_an_evaluation_after_a_nested_one(interrupt_soon: None) -> None:
    heard: List[Any] = []
    text = f"trace(1, 'a'), {ENDLESS}"
    with pytest.raises(KeyboardInterrupt):
        xquery.compile(text, trace=lambda label, items: heard.append(xquery.query("2"))).evaluate()
    assert heard == [[2]]


def test_a_stream(interrupt_soon: None) -> None:
    class Endless:
        first = True

        def read(self, size: int = -1) -> bytes:
            data, self.first = (b"<a>" if self.first else b"<r/>"), False
            return data

    with pytest.raises(KeyboardInterrupt):
        next(xquery.compile("count(/a/r)").stream(Endless()))


def test_a_loader(interrupt_soon: None) -> None:
    released = threading.Event()

    def load(url: str, purpose: str) -> None:
        released.wait(20)

    start = time.monotonic()
    with pytest.raises(KeyboardInterrupt):
        xquery.compile("doc('http://example.org/')", loader=load).evaluate()
    assert time.monotonic() - start < 10
    released.set()


def handled(handler: Any) -> Callable[[], None]:
    before = signal.signal(signal.SIGINT, handler)

    def back() -> None:
        signal.signal(signal.SIGINT, before)

    return back


def test_a_handler_of_ones_own_that_raises(interrupt_soon: None) -> None:
    def handler(number: int, frame: Any) -> None:
        raise TimeoutError

    back = handled(handler)
    try:
        with pytest.raises(TimeoutError):
            xquery.query(ENDLESS)
    finally:
        back()


def test_a_handler_of_ones_own_that_raises_nothing(interrupt_soon: None) -> None:
    heard: List[int] = []
    back = handled(lambda number, frame: heard.append(number))
    try:
        with pytest.raises(xquery.LimitError, match="cancelled"):
            xquery.query(ENDLESS)
    finally:
        back()
    assert heard == [signal.SIGINT]


def test_an_interrupt_that_is_ignored(interrupt_soon: None) -> None:
    back = handled(signal.SIG_IGN)
    try:
        with pytest.raises(xquery.LimitError, match="deadline"):
            xquery.compile(ENDLESS, seconds=0.6).evaluate()
    finally:
        back()


def test_the_handler_is_what_it_was() -> None:
    before = signal.getsignal(signal.SIGINT)
    xquery.query("1")
    assert signal.getsignal(signal.SIGINT) is before
    with pytest.raises(KeyboardInterrupt):
        os.kill(os.getpid(), signal.SIGINT)
        time.sleep(5)


def test_other_threads_go_on() -> None:
    items: List[Any] = []
    text = "sum(for $i in 1 to 2000000 return $i)"
    thread = threading.Thread(target=lambda: items.append(xquery.query(text).one()))
    thread.start()
    with pytest.raises(KeyboardInterrupt):
        os.kill(os.getpid(), signal.SIGINT)
        time.sleep(5)
    thread.join()
    assert items == [2000001000000]


def test_a_whole_program() -> None:
    program = (
        "import xquery\n"
        "print('ready', flush=True)\n"
        "try:\n"
        f"    xquery.query({ENDLESS!r})\n"
        "except KeyboardInterrupt:\n"
        "    print('interrupted')\n"
    )
    process = subprocess.Popen([sys.executable, "-c", program], stdout=subprocess.PIPE, text=True)
    assert process.stdout is not None
    assert process.stdout.readline() == "ready\n"
    time.sleep(0.3)
    process.send_signal(signal.SIGINT)
    output, _ = process.communicate(timeout=60)
    assert (process.returncode, output) == (0, "interrupted\n")
