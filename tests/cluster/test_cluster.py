"""A query over many documents on two workers, as processes on this machine.

By hand, for figures: XQUERY_CLUSTER_FILES=2000 and XQUERY_CLUSTER_MEGABYTES=1024 in the environment
make the tests of many files and of a large document long, and with -s they tell how long they took.
"""

import doctest
import gzip
import os
import pathlib
import re
import subprocess
import time

import distributed
import pytest
import xquery
from xquery import cluster as xc

from poison import poison

PAGE = pathlib.Path(__file__).resolve().parents[2] / "docs" / "cluster.md"
FILES = int(os.environ.get("XQUERY_CLUSTER_FILES", "100"))
MEGABYTES = int(os.environ.get("XQUERY_CLUSTER_MEGABYTES", "3"))
SUM = "declare variable $results external; sum($results)"


def write_files(folder, count, records=50):
    """Files of persons; answers the paths and the sum of the incomes in each."""
    paths, sums = [], []
    for number in range(count):
        incomes = [number * 7 + record for record in range(records)]
        persons = "".join(
            f"<person id='p{number}-{record}'><name>Ünal {record}</name>"
            f"<income>{income}</income></person>\n"
            for record, income in enumerate(incomes)
        )
        path = folder / f"people-{number:05}.xml"
        path.write_text(f"<people n='{number}'>{persons}</people>")
        paths.append(path)
        sums.append(sum(incomes))
    return paths, sums


def in_one_process(query, paths):
    compiled = xquery.compile(query)
    return [compiled.evaluate(xquery.parse(path, query=compiled)).to_list() for path in paths]


def test_many_files_on_two_workers_come_to_what_one_process_finds(two_workers, folder):
    records = 1000 if FILES >= 1000 else 50
    paths, sums = write_files(folder, FILES, records)
    query = "sum(for $p in /people/person order by string($p/name) return xs:integer($p/income))"
    xc.map(two_workers.client, "1", paths[:8], batch=1)  # what is imported at first is
    started, worked = time.monotonic(), time.process_time()
    expected = in_one_process(query, paths)
    alone, worked_alone = time.monotonic() - started, time.process_time() - worked
    before = two_workers.client.run(time.process_time)
    outcome = xc.map(two_workers.client, query, paths, combine=SUM, cache=0)
    together = time.monotonic() - started - alone
    after = two_workers.client.run(time.process_time)
    worked_together = max(after[worker] - before[worker] for worker in before)
    assert outcome.results == expected == [[each] for each in sums]
    assert outcome.failures == []
    assert outcome.inputs == [str(path) for path in paths]
    assert outcome.combined == [sum(sums)]
    print(f"\n{FILES} files: one process {alone:.2f} s, two workers {together:.2f} s, "
          f"speed-up {alone / together:.2f}; processor time {worked_alone:.2f} s and at most "
          f"{worked_together:.2f} s, speed-up of free processors {worked_alone / worked_together:.2f}")


def test_items_of_every_kind_arrive(two_workers, folder):
    paths, _ = write_files(folder, 1, 2)
    query = """declare variable $more external;
      (/people/person[1]/name, /people/@n, 1, 2.5, "text", true(), xs:date("2004-10-29"), $more)"""
    outcome = xc.map(two_workers.client, query, paths, variables={"more": [3, 4]})
    (items,) = outcome.results
    here = xquery.compile(query).evaluate(paths[0], {"more": [3, 4]}).to_list()
    assert items[0] == "<name>Ünal 0</name>" and isinstance(items[0], xc.XML)
    assert items[0].node().text == "Ünal 0"
    assert items[1] == "0"
    assert items[2:] == here[2:]
    assert [type(item) for item in items[2:]] == [type(item) for item in here[2:]]
    nodes = xc.map(two_workers.client, "/people/person/name", paths,
                   "declare variable $results external; <all>{ $results }</all>")
    empty = xc.map(two_workers.client, "document { () }", paths,
                   "declare variable $results external; count($results)")
    assert (empty.results, empty.combined) == ([[""]], [1])
    assert nodes.combined[0].xml() == "<all><name>Ünal 0</name><name>Ünal 1</name></all>"


def test_a_failing_input_is_reported_and_the_others_go_on(two_workers, folder):
    paths, sums = write_files(folder, 12)
    broken, missing, a_folder, failing = paths[1], folder / "missing.xml", paths[4], paths[7]
    broken.write_text("<people>\n  <person></people>")
    a_folder.unlink()
    a_folder.mkdir()
    failing.write_text("<people><person><income>much</income></person></people>")
    paths.insert(9, missing)
    sums.insert(9, None)
    query = "sum(for $i in //income return xs:integer($i))"
    outcome = xc.map(two_workers.client, query, paths, combine=SUM)
    failed = {failure.input: failure for failure in outcome.failures}
    assert set(failed) == {str(path) for path in (broken, missing, a_folder, failing)}
    assert [each for each in outcome.results] == [
        None if str(path) in failed else [expected] for path, expected in zip(paths, sums)
    ]
    assert outcome.combined == [sum(each[0] for each in outcome.results if each)]
    assert isinstance(failed[str(broken)].error, xquery.DocumentError)
    assert failed[str(broken)].place.line == 2
    assert "person" in failed[str(broken)].message
    assert isinstance(failed[str(missing)].error, FileNotFoundError)
    assert isinstance(failed[str(a_folder)].error, (OSError, xquery.DocumentError))
    assert isinstance(failed[str(failing)].error, xquery.Error)
    assert failed[str(failing)].number != 0
    assert (failed[str(failing)].place.line, failed[str(failing)].place.column) == (1, 31)


def test_a_forbidden_file_is_reported(two_workers, folder):
    if not two_workers.is_restricted():
        pytest.skip("whoever runs this test may read everything, and nobody may not load the module")
    paths, sums = write_files(folder, 3)
    paths[1].chmod(0)
    outcome = xc.map(two_workers.client, "sum(//income)", paths)
    assert [failure.input for failure in outcome.failures] == [str(paths[1])]
    assert isinstance(outcome.failures[0].error, PermissionError)
    assert outcome.results == [[sums[0]], None, [sums[2]]]


# A moment's work each, so that there is a middle.
SLOW = "sum((//income, count(for $i in 1 to 30000 where $i mod 7 = 0 return $i) * 0))"


def test_what_a_lost_worker_had_is_evaluated_once_by_another(two_workers, folder):
    paths, sums = write_files(folder, 60)
    seen = []

    def kill_in_the_middle(done, failed):
        seen.append(done)
        if len(seen) == 3:
            two_workers.kill("two")

    outcome = xc.map(two_workers.client, SLOW, paths, combine=SUM, batch=2,
                     progress=kill_in_the_middle)
    assert 3 <= seen.index(60) and seen[2] < 60
    assert outcome.failures == []
    assert outcome.results == [[each] for each in sums]
    assert outcome.combined == [sum(sums)]
    assert sorted(seen) == seen and seen[-1] == len(paths)


def test_an_input_that_ends_its_workers_is_reported(two_workers, folder):
    two_workers.start_workers("three", "four")
    paths, sums = write_files(folder, 12)
    paths[5].write_text("<people poison=''/>")
    query = xquery.compile(
        "if (/people/@poison) then doc('http://poison.example/') else sum(//income)",
        loader=poison,
    )
    outcome = xc.map(two_workers.client, query, paths, batch=3)
    assert [failure.input for failure in outcome.failures] == [str(paths[5])]
    assert type(outcome.failures[0].error).__name__ == "KilledWorker"
    assert outcome.results == [None if i == 5 else [each] for i, each in enumerate(sums)]
    lost = [name for name in ("one", "two", "three", "four") if name not in two_workers.workers()]
    for name in lost:
        two_workers.processes.pop(name).wait()
    assert len(lost) == 3


def test_workers_compile_once_and_keep_documents_up_to_a_bound(two_workers, folder):
    paths, sums = write_files(folder, 20)
    size = paths[0].stat().st_size

    def look():
        from xquery import cluster

        documents = cluster._documents
        return set(map(id, cluster._queries.values())), len(documents._known), documents._size

    query = "sum(//income) (: once :)"
    before = two_workers.client.run(look)
    for _ in range(2):
        outcome = xc.map(two_workers.client, query, paths, cache=4 * size, batch=1)
        assert outcome.results == [[each] for each in sums]
    for worker, (queries, number, kept) in two_workers.client.run(look).items():
        assert len(queries - before[worker][0]) == 1
        assert 1 <= number <= 4 and 0 < kept <= 4 * size
    paths[0].write_text("<people><income>1</income></people>")
    assert xc.map(two_workers.client, query, paths[:1]).results == [[1]]


def test_without_a_cache_no_document_is_kept(two_workers, folder):
    paths, sums = write_files(folder, 4)
    paths[0].write_text("")

    def kept():
        from xquery import cluster

        return len(cluster._documents._known)

    xc.map(two_workers.client, "sum(//income)", paths, batch=1)
    assert sum(two_workers.client.run(kept).values()) >= 3
    outcome = xc.map(two_workers.client, "sum(//income)", paths * 4, batch=1, cache=0)
    assert outcome.results == [None, *([each] for each in sums[1:])] * 4
    assert set(two_workers.client.run(kept).values()) == {0}


def test_inputs_of_tasks_that_somebody_cancels_are_reported(two_workers, folder):
    paths, sums = write_files(folder, 12)
    slow = "sum((//income, count(for $i in 1 to 300000 where $i mod 7 = 0 return $i) * 0))"

    def cancel(done, failed):
        if done == 1:
            client = two_workers.client
            client.cancel([distributed.Future(key, client) for key in list(client.futures)])

    outcome = xc.map(two_workers.client, slow, paths, batch=1, progress=cancel)
    failed = {failure.input for failure in outcome.failures}
    assert 0 < len(failed) < 12
    assert {type(failure.error) for failure in outcome.failures} == {distributed.CancelledError}
    assert outcome.results == [
        None if str(path) in failed else [each] for path, each in zip(paths, sums)
    ]


def test_what_a_folding_query_fails_with_is_raised(two_workers, folder):
    paths, _ = write_files(folder, 4)
    failing = "declare variable $results external; sum($results) idiv 0"
    for fold in (False, True):
        with pytest.raises(xquery.Error, match="divide by zero"):
            xc.map(two_workers.client, "sum(//income)", paths, failing, fold=fold)


def test_a_second_query_folds_on_the_workers_too(two_workers, folder):
    paths, sums = write_files(folder, 30)
    outcome = xc.map(two_workers.client, "//income/xs:integer(.)", paths, SUM, fold=True, batch=7)
    assert outcome.combined == [sum(sums)]
    assert outcome.failures == []
    assert outcome.results == [None] * 30
    assert xc.map(two_workers.client, "1", [], SUM).combined == [0]


def test_queries_that_do_not_compile_are_raised_here(two_workers):
    with pytest.raises(xquery.CompileError):
        xc.map(two_workers.client, "//a[", [])
    with pytest.raises(xquery.CompileError):
        xc.map(two_workers.client, "//a", [], combine="1 +")
    with pytest.raises(ValueError):
        xc.map(two_workers.client, "//a", [], fold=True)
    with pytest.raises(ValueError):
        xc.map(two_workers.client, "//a", [], batch=0)


# --- large documents ------------------------------------------------------------------------------


def write_site(path, megabytes):
    """Answers the number of persons and the sum of their incomes."""
    filler = "words " * 40
    count = total = size = 0
    with open(path, "w") as file:
        file.write("<site year='2004'><people>\n")
        while size < megabytes << 20:
            block = "".join(
                f"<person id='p{count + i}'><income>{(count + i) % 1000}</income>"
                f"<note>{filler}</note></person>\n"
                for i in range(1000)
            )
            total += sum((count + i) % 1000 for i in range(1000))
            count += 1000
            size += file.write(block)
        file.write("</people></site>")
    return count, total


def test_a_large_document_is_cut_and_folded(two_workers, folder):
    site = folder / "site.xml"
    count, total = write_site(site, MEGABYTES)
    pieces = folder / "pieces"
    pieces.mkdir()
    started = time.monotonic()
    each = max(1000, count // 50)
    # However the folder is written.
    records = xc.Records(site, "/site/people/person", each, f"{os.path.relpath(pieces)}/")
    query = "(count(/site[@year = 2004]/people/person), sum(//income))"
    outcome = xc.map(
        two_workers.client, query, [records],
        "declare variable $results external; "
        "(sum($results[position() mod 2 = 1]), sum($results[position() mod 2 = 0]))",
        cache=0,
    )
    together = time.monotonic() - started
    assert outcome.failures == []
    assert outcome.combined == [count, total]
    assert len(outcome.inputs) == -(-count // each)
    assert list(pieces.iterdir()) == []
    if MEGABYTES > 100:
        started = time.monotonic()
        alone = subprocess.run(["xquery", "-e", query, str(site)], capture_output=True, text=True)
        assert alone.stdout == f"{count}\n{total}\n"
        print(f"\n{MEGABYTES} MB: one process {time.monotonic() - started:.1f} s, "
              f"cut and on two workers {together:.1f} s")


def test_pieces_stay_where_they_are_wanted(two_workers, folder):
    site = folder / "site.xml"
    count, _ = write_site(site, 1)
    records = xc.Records(site, "/site/people/person", 1000, folder / "pieces", keep=True)
    outcome = xc.map(two_workers.client, "count(//person)", [records])
    assert sum(items[0] for items in outcome.results) == count
    assert outcome.inputs == sorted(str(path) for path in (folder / "pieces").iterdir())


def test_a_piece_that_fails_stays(two_workers, folder):
    site = folder / "site.xml"
    persons = "".join(f"<person><age>{'x' if i == 15 else i}</age></person>" for i in range(30))
    site.write_text(f"<site>{persons}</site>")
    beside = folder / "beside.xml"
    beside.write_text("<site/>")
    records = xc.Records(site, "/site/person", 10, folder / "pieces")
    outcome = xc.map(two_workers.client, "sum(for $a in //age return xs:integer($a))",
                     [records, beside])
    assert [items is None for items in outcome.results] == [False, True, False, False]
    assert [str(path) for path in (folder / "pieces").iterdir()] == [outcome.failures[0].input]
    assert beside.exists()


def test_a_large_document_that_is_bad_is_reported(two_workers, folder):
    site = folder / "site.xml"
    persons = "<person/>\n" * 25
    site.write_text(f"<site>\n{persons}<oops></site>")
    other, sums = write_files(folder, 1)
    inputs = [
        xc.Records(site, "/site/person", 10),
        other[0],
        xc.Records(folder / "none.xml", "/site/person", 10),
        xc.Records(site, "/site/person[", 10),
    ]
    outcome = xc.map(two_workers.client, "count(//person)", inputs)
    assert outcome.results == [[10], [10], None, [50], None, None]
    first, second, third = (failure.error for failure in outcome.failures)
    assert isinstance(first, xquery.DocumentError) and first.place.line == 27
    assert isinstance(second, OSError) and "No such file" in str(second)
    assert isinstance(third, xquery.Error) and third.number == 3
    with pytest.raises(ValueError):
        xc.Records(site, "/site/person", 0)


def test_examples_of_the_page_and_of_the_module(two_workers, folder, monkeypatch, capsys):
    failed, tried = doctest.testmod(xc)
    assert failed == 0 and tried > 0
    blocks = re.findall(r"^```python\n(.*?)^```", PAGE.read_text(), re.MULTILINE | re.DOTALL)
    assert len(blocks) == 2
    (folder / "orders").mkdir()
    for name, total in (("2003.xml.gz", 7), ("2004.xml.gz", 35)):
        order = f"<order country='DE'><total>{total}</total></order>"
        data = f"<orders>{order}<order country='FR'><total>1</total></order></orders>"
        (folder / "orders" / name).write_bytes(gzip.compress(data.encode()))
    write_site(folder / "site.xml", 1)
    monkeypatch.setattr("distributed.Client", lambda address: two_workers.client)
    names = {"client": two_workers.client}
    for block in blocks:
        exec(block.replace("/data/", f"{folder}/"), names)
    assert capsys.readouterr().out == "[42.0]\n"
