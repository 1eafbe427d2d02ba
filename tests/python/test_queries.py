"""Compiled queries: variables, contexts, plans, profiles, warnings, pickling."""

from __future__ import annotations

import copy
import json
import pickle
import time
from pathlib import Path
from typing import List

import pytest

import xquery

ABOVE = "declare variable $limit external; //book[price > $limit]/title/string()"


def test_variables_by_keyword(books: xquery.Node) -> None:
    query = xquery.compile(ABOVE)
    assert query.evaluate(books, limit=20) == ["A Field Guide to Lichens"]
    assert query(books, limit=20.0) == ["A Field Guide to Lichens"]
    assert query.evaluate(books, {"limit": 20}) == ["A Field Guide to Lichens"]


def test_names_that_are_none_of_python() -> None:
    query = xquery.compile("declare variable $max-price external; $max-price")
    assert query.evaluate(None, {"max-price": 3}).one() == 3
    query = xquery.compile(
        "declare variable $self external; declare variable $doc external;"
        "declare variable $variables external; $self + $doc + $variables"
    )
    assert query.evaluate(self=1, doc=2, variables=3).one() == 6
    with pytest.raises(TypeError, match="twice"):
        query.evaluate(None, {"doc": 1}, doc=1)
    with pytest.raises(TypeError, match="is a str"):
        query.evaluate(None, {1: 1})  # type: ignore[dict-item]


def test_a_variable_that_is_missing() -> None:
    with pytest.raises(xquery.Error, match="unresloved external variable - limit"):
        xquery.compile(ABOVE).evaluate()


def test_context_items(books: xquery.Node) -> None:
    query = xquery.compile("string(.)")
    assert query.evaluate("<a>b</a>").one() == "b"
    assert query.evaluate(b"<a>b</a>").one() == "b"
    assert query.evaluate(Path("examples/books.xml")).one() == books.text
    assert query.evaluate(7).one() == "7"
    with open("examples/books.xml", "rb") as file:
        assert query.evaluate(file).one() == books.text


def test_one_after_another_know_nothing_of_each_other(books: xquery.Node) -> None:
    query = xquery.compile("count(//book)")
    assert query.evaluate(books).one() == 4
    with pytest.raises(xquery.Error):
        query.evaluate()


def test_a_query_without_a_value() -> None:
    assert xquery.query("").to_list() == []


def test_a_query_in_a_file(tmp_path: Path) -> None:
    (tmp_path / "lib.xq").write_text(
        "module namespace l = 'l'; declare function l:two() { 2 };", encoding="utf-8"
    )
    main = tmp_path / "main.xq"
    main.write_text("\ufeffimport module namespace l = 'l' at 'lib.xq'; l:two()", encoding="utf-8")
    assert xquery.compile(main).evaluate().one() == 2
    assert xquery.query(main).one() == 2
    text = main.read_text(encoding="utf-8")
    assert xquery.compile(text, url=main.as_uri()).evaluate().one() == 2
    with pytest.raises(xquery.CompileError, match="can't access module"):
        xquery.compile(text)
    with pytest.raises(FileNotFoundError):
        xquery.compile(tmp_path / "none.xq")


def test_a_text_that_is_no_text() -> None:
    with pytest.raises(ValueError):
        xquery.compile("'\ud800'")
    with pytest.raises(TypeError):
        xquery.compile(b"1")  # type: ignore[arg-type]


def test_namespaces_of_the_host() -> None:
    query = xquery.compile("<p:a/>", namespaces={"p": "http://example.org/"})
    assert query.evaluate().one().namespace == "http://example.org/"


def test_contexts(books: xquery.Node) -> None:
    with xquery.Context() as context:
        assert context.evaluate("count(//book)", books).one() == 4
        # The context item stays in force, and so does the clock.
        query = context.compile("count(//title), current-dateTime()")
        first = context.evaluate(query)
        time.sleep(0.01)
        assert context.evaluate(query) == first
        assert context.evaluate(ABOVE, None, {"limit": 20}).first() == "A Field Guide to Lichens"
    with pytest.raises(ValueError, match="closed"):
        context.evaluate("1")


def test_a_context_loads_documents_once() -> None:
    loaded: List[str] = []

    def load(url: str, purpose: str) -> bytes:
        loaded.append(url)
        return b"<a/>"

    with xquery.Context(loader=load) as context:
        for _ in range(3):
            context.evaluate("doc('http://example.org/a.xml')")
    assert loaded == ["http://example.org/a.xml"]


def test_a_context_is_for_one_evaluation_at_a_time() -> None:
    refused: List[Exception] = []

    def trace(label: str, items: xquery.Result) -> None:
        try:
            context.evaluate("1")
        except RuntimeError as error:
            refused.append(error)

    context = xquery.Context(trace=trace)
    assert context.evaluate("trace(1, 'a')").one() == 1
    assert "one evaluation at a time" in str(refused[0])


def test_plans() -> None:
    query = xquery.compile("count(//a)")
    assert "count" in query.plan()
    assert json.loads(query.plan("json"))
    assert query.plan("dot").startswith("digraph")
    with pytest.raises(ValueError, match="no such format"):
        query.plan("xml")


def test_profiles(books: xquery.Node) -> None:
    query = xquery.compile(ABOVE)
    profile = query.profile(books, limit=20)
    assert profile.result == ["A Field Guide to Lichens"]
    profile.evaluate(books, limit=0)
    assert profile.evaluations == 2
    assert json.loads(profile.json())["evaluations"] == 2
    assert profile.text()
    assert "<html" in profile.html().lower()
    with pytest.raises(xquery.Error):
        profile.evaluate(books)
    assert profile.evaluations == 3


def test_warnings() -> None:
    found = xquery.check("let $a := 1\n  return no:such(2)")
    assert ("unused-variable", "a", 1) in [(w.identifier, w.name, w.line) for w in found]
    assert xquery.check("1 + 1") == []
    with pytest.raises(xquery.CompileError):
        xquery.check("1 +")


def test_functions() -> None:
    known = {function.name: function for function in xquery.functions()}
    assert known["count"].least_arguments == known["count"].most_arguments == 1
    assert known["concat"].most_arguments is None
    assert len(xquery.functions()) > 150


def test_pickling(books: xquery.Node) -> None:
    policy = xquery.Policy.deny().allow_files("examples")
    query = xquery.compile(ABOVE, seconds=60, policy=policy, modules={"a.xq": "1"})
    again = pickle.loads(pickle.dumps(query))
    assert again.text == query.text
    assert again.evaluate(books, limit=20) == query.evaluate(books, limit=20)
    assert again._settings == query._settings
    assert copy.copy(query).evaluate(books, limit=20).first()
    limited = xquery.compile("for $i in 1 to 100000000 return ()", seconds=0.05)
    with pytest.raises(xquery.LimitError):
        pickle.loads(pickle.dumps(limited)).evaluate()


def test_what_cannot_be_pickled_says_so() -> None:
    with pytest.raises(Exception, match="pickle"):
        pickle.dumps(xquery.compile("1", missing=lambda url, reason: None))


def test_representation() -> None:
    assert repr(xquery.compile("1 +\n   1")) == "<xquery.Query '1 + 1'>"
    assert len(repr(xquery.compile("'" + "x" * 200 + "'"))) < 90
    assert repr(xquery.Policy.deny().allow_host("h")) == "Policy.deny().allow_host('h')"
    assert repr(xquery.Policy()) == "Policy()"


def test_policies_are_values() -> None:
    assert xquery.Policy.deny().allow_files("/a") == xquery.Policy.deny().allow_files(Path("/a"))
    assert xquery.Policy.deny() != xquery.Policy()
