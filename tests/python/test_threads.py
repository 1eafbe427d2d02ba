"""Threads: evaluations side by side, and cancellation."""

from __future__ import annotations

import hashlib
import threading
import time
from concurrent.futures import ThreadPoolExecutor
from typing import List

import pytest

import xquery

WORK = "declare variable $n external; sum(for $i in 1 to $n return ($i mod 7) * ($i mod 11))"


def took_by_hashing(threads: int) -> float:
    """The time of hashing on so many threads: work that lets the lock go and shares nothing."""
    start = time.perf_counter()
    workers = [
        threading.Thread(target=hashlib.pbkdf2_hmac, args=("sha256", b"a", b"b", 100_000))
        for _ in range(threads)
    ]
    for worker in workers:
        worker.start()
    for worker in workers:
        worker.join()
    return time.perf_counter() - start


def machine_has_two_cores_now() -> bool:
    """Whether two threads of anything at all go twice as far as one at this moment.

    The count of cores does not tell: they may be halves of one core, or be lent to others, which
    the system does not always count as time taken away.
    """
    one = min(took_by_hashing(1) for _ in range(3))
    two = min(took_by_hashing(2) for _ in range(3))
    return two <= 1.1 * one


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
    # Others may use the machine meanwhile: measured is until it is right, and what is wrong is
    # believed where the machine had two cores to give before and after, three times.
    wrong: List[float] = []
    for _ in range(10):
        had_two_cores = machine_has_two_cores_now()
        one = min(took(query, 1, size) for _ in range(3))
        two = min(took(query, 2, size) for _ in range(3))
        if two <= 1.2 * one:
            return
        if had_two_cores and machine_has_two_cores_now():
            wrong.append(two / one)
        assert len(wrong) < 3, wrong
    pytest.skip(f"there were not two free cores: {two / one:.2f}")


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
