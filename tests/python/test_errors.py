"""Errors: numbers, texts, places and calls."""

from __future__ import annotations

import pickle

import pytest

import xquery


def failure(text: str) -> xquery.Error:
    with pytest.raises(xquery.Error) as caught:
        xquery.query(text)
    return caught.value


def test_a_failing_evaluation() -> None:
    error = failure("1 +\n  (1 idiv 0)")
    assert type(error) is xquery.Error
    assert (error.number, error.message, error.category) == (6, "divide by zero", "values")
    assert error.description == 'XQueryError:6 - "divide by zero" at line:2'
    assert error.place == (None, 2, 4, 8, "  (1 idiv 0)")
    assert error.calls == ()


def test_calls() -> None:
    text = "declare function local:f($x) { 1 idiv $x };\n"
    text += "declare function local:g($x) { local:f($x) };\nlocal:g(0)"
    error = failure(text)
    assert [call.function for call in error.calls] == ["local:f", "local:g"]
    assert [call.place and call.place.line for call in error.calls] == [2, 3]
    assert str(error) == (
        'XQueryError:6 - "divide by zero" at line:1\n'
        "  at line 1, column 32, in local:f\n"
        "    declare function local:f($x) { 1 idiv $x };\n"
        "                                   ^^^^^^^^^\n"
        "  called at line 2, column 32, in local:g\n"
        "  called at line 3, column 1"
    )


def test_many_calls_are_cut() -> None:
    text = "declare function local:f($x) { if ($x = 0) then 1 idiv 0 else 1 + local:f($x - 1) };"
    error = failure(text + " local:f(200)")
    assert len(error.calls) == 64
    assert error.calls_left_out == 137
    assert str(error).count("called at") == 10


def test_a_query_that_does_not_compile() -> None:
    error = failure("let $a := $b return $c")
    # Names of variables are resolved when they are needed.
    assert error.number == 8
    with pytest.raises(xquery.CompileError) as caught:
        xquery.compile(
            "declare base-uri 'a'; declare base-uri 'b';"
            "declare ordering ordered; declare ordering unordered; 1"
        )
    assert [each.number for each in caught.value.errors] == [32, 65]
    assert caught.value.number == 32
    assert caught.value.message == "Prolog contains more than one base URI declaration"
    assert failure("1 +").category == "syntax"


def test_what_a_query_raises() -> None:
    error = failure("error(xs:QName('xs:a'), 'mine')")
    assert error.category == "raised by the query"
    assert error.message.endswith("#a - mine")


def test_an_error_among_the_items() -> None:
    with pytest.raises(xquery.Error):
        xquery.query("1, <!-- a -- b -->")


def test_limits() -> None:
    endless = "count(for $i in 1 to 1000000, $j in 1 to 1000000 return $i)"
    with pytest.raises(xquery.LimitError, match="limit: deadline passed") as caught:
        xquery.compile(endless, seconds=0.05).evaluate()
    assert caught.value.category == "limit"
    with pytest.raises(xquery.LimitError, match="memory ceiling"):
        xquery.compile("count((1 to 10000000, 'a'))", memory=1 << 20).evaluate()
    with pytest.raises(xquery.LimitError, match="nested too deeply"):
        xquery.query("declare function local:f($x) { 1 + local:f($x) }; local:f(1)")
    with pytest.raises(xquery.LimitError, match="deadline"):
        xquery.compile("1", seconds=0)
    with pytest.raises(ValueError):
        xquery.compile("1", seconds=-1)
    with pytest.raises(ValueError, match="memory must not be negative"):
        xquery.compile("1", memory=-1)
    assert xquery.compile("1", memory=2**70).evaluate().one() == 1


@pytest.mark.parametrize("text", ["1 +", "1 idiv 0", "<p:a/>"])
def test_errors_can_be_pickled(text: str) -> None:
    error = failure(text)
    again = pickle.loads(pickle.dumps(error))
    assert type(again) is type(error)
    assert str(again) == str(error)
    assert again.__dict__.keys() == error.__dict__.keys()
    assert again.place == error.place


def test_representation() -> None:
    assert repr(failure("1 idiv 0")) == "<xquery.Error 6 'divide by zero'>"


def test_control_characters_of_a_query_are_not_shown() -> None:
    assert "\x1b" not in str(failure("1 idiv 0 (: \x1b[31m :)")).split("\n", 1)[1]


def test_documents() -> None:
    with pytest.raises(xquery.DocumentError) as caught:
        xquery.parse("<a>\n<b></a>")
    error = caught.value
    assert (error.name, error.category) == ("document", "document")
    assert error.place is not None and error.place.line == 2
    again = pickle.loads(pickle.dumps(error))
    assert str(again) == str(error)
