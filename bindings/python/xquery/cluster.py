"""One query over many documents, on many machines, with Dask.

::

    from distributed import Client
    from xquery import cluster

    outcome = cluster.map(
        Client("tcp://scheduler:8786"),
        "count(//person)",
        paths,
        combine="declare variable $results external; sum($results)",
    )
    print(outcome.combined, len(outcome.failures))

The client sends the names of documents to the workers, which read them from storage that all of them
share, and gets the items of the results back. Each worker compiles a query once and keeps the
documents that it has parsed, up to a bound. A document that fails is reported, and the others go on.
What a lost worker had is evaluated again by another: each document counts once, whatever happens.

A document too large for one worker goes as :class:`Records`, which cuts it into pieces while the
first of them are being worked on.
"""

from __future__ import annotations

import collections
import dataclasses
import itertools
import os
import pathlib
import pickle
import threading
import time
from typing import Any, Callable, Dict, Iterable, Iterator, List, NamedTuple, Optional, Tuple, Union

import distributed

import xquery
from xquery._splitting import Records

# Its functions have no types.
_dask: Any = distributed

__all__ = ["DEFAULT_CACHE", "Failure", "Outcome", "Records", "XML", "map"]

#: How many bytes of files each worker keeps as parsed documents, which take some 2.4 times as much.
DEFAULT_CACHE = 256 << 20

Input = Union[str, "os.PathLike[str]", Records]


class XML(str):
    """A node of a result, as it arrives: the XML of an element, or of a document."""

    def node(self) -> xquery.Node:
        """The element, in a document of its own.

        >>> from xquery.cluster import XML
        >>> XML("<a><b>1</b></a>").node().find("b/text()").text
        '1'
        """
        element = xquery.parse(str(self)).find("/*")
        assert isinstance(element, xquery.Node)
        return element


class Failure(NamedTuple):
    """An input that has no result."""

    #: As it was given; of a piece the path of the piece.
    input: str
    #: ``xquery.Error`` where the document or the query fails, ``OSError`` where it cannot be read,
    #: ``distributed.KilledWorker`` where every worker is lost that tries, and
    #: ``distributed.CancelledError`` where somebody else cancels it, as a restart does.
    error: BaseException

    @property
    def number(self) -> int:
        """The number of the language's error code, 0 where it has none."""
        return int(getattr(self.error, "number", 0))

    @property
    def message(self) -> str:
        return str(getattr(self.error, "message", "") or self.error)

    @property
    def place(self) -> Optional[Any]:
        """An ``xquery.Place`` in the document or in the query, where it is known."""
        return getattr(self.error, "place", None)


@dataclasses.dataclass
class Outcome:
    """What has become of the inputs."""

    #: The inputs in their order, pieces in place of what was cut into them.
    inputs: List[str] = dataclasses.field(default_factory=list)
    #: For each input the items of its result; None where it failed, and where it was folded.
    results: List[Optional[List[Any]]] = dataclasses.field(default_factory=list)
    #: In the order of the inputs.
    failures: List[Failure] = dataclasses.field(default_factory=list)
    #: The result of the second query; None without one.
    combined: Optional[List[Any]] = None

    def items(self) -> Iterator[Any]:
        """The items of all results, in the order of the inputs."""
        return itertools.chain.from_iterable(items for items in self.results if items)


def map(
    client: distributed.Client,
    query: Union[str, xquery.Query],
    inputs: Iterable[Input],
    combine: Union[None, str, xquery.Query] = None,
    *,
    variables: Optional[Dict[str, Any]] = None,
    fold: bool = False,
    batch: Optional[int] = None,
    cache: int = DEFAULT_CACHE,
    progress: Optional[Callable[[int, int], object]] = None,
) -> Outcome:
    """Evaluates a query for each of the inputs on the workers of a cluster.

    ``query`` is a text or a compiled query, whose settings go with it. It does not compile, or
    ``combine`` does not: that is raised here, before anything is sent.

    ``inputs`` are paths, as the workers know them, or :class:`Records`.

    ``combine`` is a query with ``declare variable $results external;``, which are the items of all
    results in the order of the inputs, nodes as elements. It is evaluated once, here. With ``fold``
    the workers evaluate it over the results of each batch as well, so that only what that comes to
    travels; the query must be one that can be asked of its own results, as a sum. What it fails
    with, here or there, is raised.

    ``variables`` are for ``query``; what can be pickled. ``batch`` inputs make a task.

    ``cache`` bounds the parsed documents that a worker process keeps, those of earlier calls
    included, in bytes of their files. What is larger is read each time, and no more of it than the
    query needs; with 0 that is each document, and none is kept.

    ``progress`` is called whenever a task is done, with the numbers of inputs done and failed.
    """
    if getattr(client, "asynchronous", False):
        raise ValueError("the client is asynchronous")
    if fold and combine is None:
        raise ValueError("fold requires combine")
    if batch is not None and batch < 1:
        raise ValueError("batch must be 1 or more")
    work = _Work(
        query=_pickled(query),
        fold=_pickled(combine) if combine is not None and fold else None,
        variables=dict(variables or {}),
        cache=cache,
    )
    last = None if combine is None else _compiled(_pickled(combine))
    run = _Run(client, work, batch, progress)
    try:
        run.run(inputs)
    finally:
        run.end()
    if last is not None:
        run.outcome.combined = _combine(last, run.partial_items())
    return run.outcome


# --- on a worker ----------------------------------------------------------------------------------


@dataclasses.dataclass(frozen=True)
class _Work:
    """What every task of a call has in common."""

    query: bytes
    fold: Optional[bytes]
    variables: Dict[str, Any]
    cache: int


class _Done(NamedTuple):
    """What a task comes to."""

    #: For each input its items, or what it failed with.
    results: List[Union[List[Any], BaseException]]
    #: Of those that did not fail; None without a query for it, and what that failed with.
    folded: Union[None, List[Any], BaseException]


_MOST_QUERIES = 64
_lock = threading.Lock()
_queries: "collections.OrderedDict[bytes, xquery.Query]" = collections.OrderedDict()


def _pickled(query: Union[str, xquery.Query]) -> bytes:
    return pickle.dumps(xquery.compile(query) if isinstance(query, str) else query)


def _compiled(pickled: bytes) -> xquery.Query:
    """Compiled once in a process, as unpickling does."""
    with _lock:
        query = _queries.pop(pickled, None)
        if query is None:
            query = pickle.loads(pickled)
        _queries[pickled] = query
        if len(_queries) > _MOST_QUERIES:
            _queries.popitem(last=False)
    return query


class _Documents:
    """The documents of a worker that were asked for last."""

    def __init__(self) -> None:
        self._lock = threading.Lock()
        self._known: "collections.OrderedDict[Tuple[Any, ...], Any]" = collections.OrderedDict()
        self._size = 0

    def get(self, path: str, query: xquery.Query, most: int) -> Any:
        status = os.stat(path)
        key = (os.fspath(path), status.st_ino, status.st_mtime_ns, status.st_size)
        with self._lock:
            # What an earlier call with a larger bound left behind goes as well.
            self._drop_down_to(most)
            known = self._known.get(key)
            if known is not None:
                self._known.move_to_end(key)
                return known
        if status.st_size > most or most == 0:
            return xquery.parse(pathlib.Path(path), query=query)
        document = xquery.parse(pathlib.Path(path))
        with self._lock:
            if key not in self._known:
                self._known[key] = document
                self._size += status.st_size
            self._drop_down_to(most)
        return document

    def _drop_down_to(self, most: int) -> None:
        while self._size > most:
            dropped, _ = self._known.popitem(last=False)
            self._size -= dropped[-1]


_documents = _Documents()


def _sent(item: Any) -> Any:
    """An item as it can travel. A node that cannot be a document is its text."""
    if not isinstance(item, xquery.Node):
        return item
    is_whole = item.kind == "document" and any(child.kind == "element" for child in item)
    return XML(item.xml()) if item.kind == "element" or is_whole else item.text


def _picklable(error: BaseException) -> BaseException:
    try:
        pickle.loads(pickle.dumps(error))
        return error
    except Exception:
        return RuntimeError(f"{type(error).__name__}: {error}")


def _combine(query: xquery.Query, items: Iterable[Any]) -> List[Any]:
    values = [item.node() if isinstance(item, XML) else item for item in items]
    return list(query.evaluate(None, {"results": values}))


def _evaluate(work: _Work, paths: List[str]) -> _Done:
    """A task: evaluates the query for each of the paths."""
    query = _compiled(work.query)
    results: List[Union[List[Any], BaseException]] = []
    for path in paths:
        try:
            document = _documents.get(path, query, work.cache)
            results.append([_sent(item) for item in query.evaluate(document, work.variables)])
        except Exception as error:
            results.append(_picklable(error))
    if work.fold is None:
        return _Done(results, None)
    items = itertools.chain.from_iterable(each for each in results if isinstance(each, list))
    outcomes: List[Union[List[Any], BaseException]] = [
        [] if isinstance(each, list) else each for each in results
    ]
    try:
        return _Done(outcomes, [_sent(item) for item in _combine(_compiled(work.fold), items)])
    except Exception as error:
        return _Done(outcomes, _picklable(error))


# --- where the client is --------------------------------------------------------------------------


class _Task(NamedTuple):
    start: int
    paths: List[str]
    is_alone: bool = False


class _Workers:
    """The workers that there are, looked at now and then, since they come and go."""

    _SECONDS = 2.0

    def __init__(self, client: distributed.Client) -> None:
        self._client: Any = client
        self._looked = -self._SECONDS
        self._threads: Dict[str, int] = {}

    def threads(self) -> Dict[str, int]:
        if time.monotonic() - self._looked >= self._SECONDS:
            self._threads = dict(self._client.nthreads())
            self._looked = time.monotonic()
            if not self._threads:
                self._client.wait_for_workers(1)
                return self.threads()
        return self._threads

    def slots(self) -> int:
        return sum(self.threads().values())

    def preferred(self, number: int) -> str:
        """The same one for the same task of a later call, which then finds its documents parsed."""
        addresses = sorted(self.threads())
        return addresses[number % len(addresses)]


def _error_of(future: Any) -> Optional[BaseException]:
    """What a task ended with. One that was cancelled has no exception until its result is asked."""
    error: Optional[BaseException] = future.exception()
    return distributed.CancelledError(future.key) if future.cancelled() else error


class _Run:
    """One call of ``map``.

    As many tasks are sent as keep the workers busy, and one more whenever one is done: so neither
    the scheduler nor the storage of pieces fills up however many inputs there are.

    The scheduler gives a task up when it has lost several workers with it, and with it whatever else
    waited there each time. Which input it was that ended them is found out: those of such a task are
    sent again one by one, and those that have to be given up once more at last each with nothing
    beside it.
    """

    _MOST_IN_BATCH = 64
    _TASKS_FOR_EACH_SLOT = 4

    def __init__(
        self,
        client: distributed.Client,
        work: _Work,
        batch: Optional[int],
        progress: Optional[Callable[[int, int], object]],
    ) -> None:
        self.outcome = Outcome()
        self._progress = progress
        self._done = 0
        self._client: Any = client
        self._work = work
        self._batch = batch
        self._workers = _Workers(client)
        self._completed = _dask.as_completed()
        self._tasks: Dict[Any, _Task] = {}
        self._number = 0
        self._folded: Dict[int, List[Any]] = {}
        self._errors: Dict[int, BaseException] = {}
        self._cut: List[Records] = []
        self._suspects: List[_Task] = []

    def run(self, inputs: Iterable[Input]) -> None:
        waiting = self._batches(inputs)
        is_more = True
        while is_more or self._tasks:
            while is_more and len(self._tasks) < self._workers.slots() * self._TASKS_FOR_EACH_SLOT:
                task = next(waiting, None)
                is_more = task is not None
                if task is not None:
                    self._send(task)
            if self._tasks:
                self._receive(next(self._completed))
        for suspect in self._suspects:
            self._send(suspect._replace(is_alone=True))
            self._receive(next(self._completed))
        self.outcome.failures = [
            Failure(self.outcome.inputs[index], error)
            for index, error in sorted(self._errors.items())
        ]

    def partial_items(self) -> Iterable[Any]:
        if self._work.fold is None:
            return self.outcome.items()
        return itertools.chain.from_iterable(items for _, items in sorted(self._folded.items()))

    def end(self) -> None:
        """Nothing of the call is left on the workers, or in the folders of pieces."""
        if self._tasks:
            self._client.cancel(list(self._tasks))
        self._tasks.clear()
        for records in self._cut:
            records.close()

    # The inputs in tasks, each input with its place among the results.
    def _batches(self, inputs: Iterable[Input]) -> Iterator[_Task]:
        known = list(inputs)
        size = self._batch or self._size_for(len(known))
        paths: List[str] = []
        for each in known:
            if isinstance(each, Records):
                if paths:
                    yield self._task(paths)
                    paths = []
                yield from self._pieces(each)
                continue
            paths.append(os.fspath(each))
            if len(paths) == size:
                yield self._task(paths)
                paths = []
        if paths:
            yield self._task(paths)

    def _size_for(self, count: int) -> int:
        tasks = max(1, self._workers.slots() * self._TASKS_FOR_EACH_SLOT * 2)
        return max(1, min(self._MOST_IN_BATCH, count // tasks))

    def _task(self, paths: List[str]) -> _Task:
        start = len(self.outcome.inputs)
        self.outcome.inputs.extend(paths)
        self.outcome.results.extend([None] * len(paths))
        return _Task(start, paths)

    # A piece is a task; where the cutting fails, that is one more input, which has failed.
    def _pieces(self, records: Records) -> Iterator[_Task]:
        self._cut.append(records)
        try:
            for path in records.pieces():
                yield self._task([path])
        except (xquery.Error, OSError) as error:
            self._errors[self._task([records.path]).start] = error

    def _send(self, task: _Task) -> None:
        future = self._client.submit(
            _evaluate,
            self._work,
            task.paths,
            pure=False,
            workers=[self._workers.preferred(self._number)],
            allow_other_workers=True,
        )
        self._number += 1
        self._tasks[future] = task
        self._completed.add(future)

    def _receive(self, future: Any) -> None:
        task = self._tasks.pop(future)
        error = _error_of(future)
        if isinstance(error, distributed.KilledWorker) and not task.is_alone:
            if len(task.paths) == 1:
                self._suspects.append(task)
                return
            for offset, path in enumerate(task.paths):
                self._send(_Task(task.start + offset, [path]))
            return
        if error is not None:
            for offset in range(len(task.paths)):
                self._errors[task.start + offset] = error
        else:
            self._keep(task, future.result())
        for offset, path in enumerate(task.paths):
            if task.start + offset not in self._errors:
                for records in self._cut:
                    records.done(path)
        self._done += len(task.paths)
        if self._progress is not None:
            self._progress(self._done, len(self._errors))

    def _keep(self, task: _Task, done: _Done) -> None:
        if isinstance(done.folded, BaseException):
            raise done.folded
        if done.folded is not None:
            self._folded[task.start] = done.folded
        for offset, result in enumerate(done.results):
            if isinstance(result, BaseException):
                self._errors[task.start + offset] = result
            elif done.folded is None:
                self.outcome.results[task.start + offset] = result
