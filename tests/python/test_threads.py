"""Threads: evaluations side by side, and cancellation."""

from __future__ import annotations

import os
import threading
import time
from concurrent.futures import ThreadPoolExecutor
from typing import List

import pytest

import xquery

WORK = "declare variable $n external; sum(for $i in 1 to $n return ($i mod 7) * ($i mod 11))"


def free_cores() -> float:
    """The cores of this process that nobody else keeps busy, measured for a moment."""

    def idle() -> float:
        with open("/proc/stat") as file:
            fields = file.readline().split()
        return (int(fields[4]) + int(fields[5])) / os.sysconf("SC_CLK_TCK")

    before, start = idle(), time.monotonic()
    time.sleep(0.3)
    free = (idle() - before) / (time.monotonic() - start)
    return min(free, len(os.sched_getaffinity(0)))


def took(query: xquery.Query, threads: int, size: int) -> float:
    start = time.perf_counter()
    if threads == 1:
        query.evaluate(n=size)
    else:
        workers = [
            threading.Thread(target=query.evaluate, kwargs={"n": size}) for _ in range(threads)
        ]
        for worker in workers:
            worker.start()
        for worker in workers:
            worker.join()
    return time.perf_counter() - start


def test_two_threads_do_twice_the_work_in_the_time_of_one() -> None:
    query = xquery.compile(WORK)
    size = 50_000
    while took(query, 1, size) < 0.1:
        size *= 2
    ratio = 100.0
    # Others may use the machine meanwhile: measured is until it is right, and what is wrong is
    # believed where two cores are free before and after.
    for _ in range(10):
        was_free = free_cores() > 1.8
        one = min(took(query, 1, size) for _ in range(3))
        two = min(took(query, 2, size) for _ in range(3))
        ratio = two / one
        if ratio <= 1.2:
            return
        if was_free and free_cores() > 1.8 and ratio > 1.6:
            break
    if free_cores() < 1.8:
        pytest.skip(f"there are not two free cores: {ratio:.2f}")
    assert ratio <= 1.2


def test_the_lock_is_free_while_evaluating() -> None:
    counted = 0
    done = threading.Event()

    def count() -> None:
        nonlocal counted
        while not done.is_set():
            counted += 1
            time.sleep(0.001)

    thread = threading.Thread(target=count)
    thread.start()
    with pytest.raises(xquery.LimitError):
        endless = "count(for $i in 1 to 100000000, $j in 1 to 1000 return $i)"
        xquery.compile(endless, seconds=0.5).evaluate()
    done.set()
    thread.join()
    # With the lock held it would be none.
    assert counted > 20


def test_the_lock_is_free_while_reading() -> None:
    data = b"<a>" + b"<b>text</b>" * 2_000_000 + b"</a>"
    ticks: List[float] = []
    done = threading.Event()

    def tick() -> None:
        while not done.is_set():
            ticks.append(time.perf_counter())
            time.sleep(0.001)

    thread = threading.Thread(target=tick)
    thread.start()
    start = time.perf_counter()
    xquery.parse(data)
    end = time.perf_counter()
    done.set()
    thread.join()
    assert len([moment for moment in ticks if start < moment < end]) > 3


def test_many_threads_share_a_query_and_a_document(books: xquery.Node) -> None:
    query = xquery.compile(
        "declare variable $limit external;"
        "for $b in //book[price > $limit] return concat($b/title, ' ', count($b/author))"
    )
    expected = {limit: query.evaluate(books, limit=limit).to_list() for limit in range(30)}

    def ask(number: int) -> bool:
        limit = number % 30
        return bool(query.evaluate(books, limit=limit) == expected[limit])

    with ThreadPoolExecutor(8) as pool:
        assert all(pool.map(ask, range(2000)))


def test_many_threads_use_everything(books: xquery.Node) -> None:
    def use(number: int) -> bool:
        query = xquery.compile(f"declare variable $v external; $v + {number}, <a>{{$v}}</a>")
        node = query.evaluate(v=number)[1]
        found = xquery.parse(node.xml()).find(f"number(/a) = {number}")
        titles = xquery.compile("for $t in //title return string($t)").stream("examples/books.xml")
        return bool(found) and len(list(titles)) == 4 and books.find(f"{number}") == number

    with ThreadPoolExecutor(8) as pool:
        assert all(pool.map(use, range(400)))


def test_callbacks_of_many_threads() -> None:
    def load(url: str, purpose: str) -> str:
        return f"<a>{url[-4:]}</a>"

    query = xquery.compile(
        "declare variable $url external; string(doc($url)), trace(1, 'a')",
        loader=load,
        trace=lambda label, items: None,
        seconds=60,
    )

    def ask(number: int) -> bool:
        url = f"http://example.org/{number:04}"
        return bool(query.evaluate(url=url) == [url[-4:], 1])

    with ThreadPoolExecutor(8) as pool:
        assert all(pool.map(ask, range(400)))


def test_cancellation() -> None:
    cancellation = xquery.Cancellation()
    query = xquery.compile(
        "count(for $i in 1 to 1000000, $j in 1 to 1000000 return $i)", cancellation=cancellation
    )
    failures: List[BaseException] = []

    def ask() -> None:
        try:
            query.evaluate()
        except xquery.LimitError as error:
            failures.append(error)

    threads = [threading.Thread(target=ask) for _ in range(3)]
    for thread in threads:
        thread.start()
    time.sleep(0.2)
    assert not failures and not cancellation.is_cancelled
    cancellation.cancel()
    for thread in threads:
        thread.join(20)
    assert len(failures) == 3 and cancellation.is_cancelled
    with pytest.raises(xquery.LimitError):
        query.evaluate()
    # A query without it goes on.
    assert xquery.query("1").one() == 1
