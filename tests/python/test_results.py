"""Results: sequences that make their items when they are asked for."""

from __future__ import annotations

import copy
import pickle
from collections.abc import Sequence

import pytest

import xquery

TEN = xquery.query("1 to 10")


def test_it_is_a_sequence() -> None:
    assert isinstance(TEN, Sequence)
    assert len(TEN) == 10
    assert list(TEN) == list(range(1, 11))
    assert list(reversed(TEN)) == list(range(10, 0, -1))
    assert 3 in TEN
    assert 11 not in TEN


def test_indexes() -> None:
    assert (TEN[0], TEN[9], TEN[-1], TEN[-10]) == (1, 10, 10, 1)
    for index in (10, -11):
        with pytest.raises(IndexError, match="10 items"):
            TEN[index]
    for far in (10**30, -(10**30), 2**63, -(2**63) - 1):
        with pytest.raises(IndexError, match="^the result has 10 items$"):
            TEN[far]
    for wrong in ("a", 1.0, None):
        with pytest.raises(TypeError, match="^an item is asked for by an int or a slice, not by "):
            TEN[wrong]  # type: ignore[call-overload]
    assert TEN[True] == 2


@pytest.mark.parametrize("start", [None, -12, -3, 0, 2, 9, 12])
@pytest.mark.parametrize("stop", [None, -12, -3, 0, 2, 9, 12])
@pytest.mark.parametrize("step", [None, -3, -1, 1, 2])
def test_slices(start: int, stop: int, step: int) -> None:
    plain = list(range(1, 11))
    part = TEN[start:stop:step]
    assert isinstance(part, xquery.Result)
    assert part.to_list() == plain[start:stop:step]
    assert part[::-2].to_list() == plain[start:stop:step][::-2]


def test_equality() -> None:
    assert TEN == list(range(1, 11))
    assert TEN == tuple(range(1, 11))
    assert TEN == xquery.query("1 to 10")
    assert TEN != [1]
    assert TEN[:0] == []
    with pytest.raises(TypeError):
        hash(TEN)


def test_truth() -> None:
    assert TEN
    assert not xquery.query("()")


def test_index_and_count() -> None:
    items = xquery.query("'a', 'b', 'a'")
    assert items.index("b") == 1
    assert items.index("a", 1) == 2
    assert items.count("a") == 2
    with pytest.raises(ValueError):
        items.index("a", 1, 2)


@pytest.mark.parametrize("start", [0, 1, -1, -2, 3, 10**30, -(10**30), True])
@pytest.mark.parametrize("stop", [3, 1, -1, 10**30, -(10**30)])
def test_index_within_a_part_is_that_of_a_list(start: int, stop: int) -> None:
    items = xquery.query("'a', 'b', 'a'")
    for value in ("a", "b"):
        try:
            expected = items.to_list().index(value, start, stop)
        except ValueError:
            with pytest.raises(ValueError, match="^no such item$"):
                items.index(value, start, stop)
        else:
            assert items.index(value, start, stop) == expected


def test_index_within_nonsense() -> None:
    with pytest.raises(TypeError, match="indices must be integers"):
        TEN.index(1, "x")  # type: ignore[arg-type]
    with pytest.raises(TypeError, match="indices must be integers"):
        TEN.index(1, 0, "x")  # type: ignore[arg-type]


def test_copies_are_the_same_result() -> None:
    assert copy.copy(TEN) is TEN
    assert copy.deepcopy([TEN])[0] is TEN


def test_results_are_not_pickled() -> None:
    with pytest.raises(TypeError, match="^a result cannot be pickled: send to_list()"):
        pickle.dumps(TEN)
    assert pickle.loads(pickle.dumps(TEN.to_list())) == TEN


def test_first_and_one() -> None:
    assert TEN.first() == 1
    assert xquery.query("()").first() is None
    assert xquery.query("()").first("none") == "none"
    assert xquery.query("5").one() == 5
    with pytest.raises(ValueError, match="10 items, not one"):
        TEN.one()


def test_strings_and_types(books: xquery.Node) -> None:
    items = xquery.query("1, 'a', 2.5, (//title)[1], true(), 'ü'", books)
    assert items.strings() == ["1", "a", "2.5", "A Field Guide to Lichens", "true", "ü"]
    assert items.types == [
        "xs:integer", "xs:string", "xs:decimal", "element()", "xs:boolean", "xs:string",
    ]


def test_representation() -> None:
    assert repr(TEN) == "<xquery.Result [1, 2, 3, 4, 5, ... 10 items]>"
    assert repr(xquery.query("()")) == "<xquery.Result []>"
    assert repr(xquery.query("'a'")) == "<xquery.Result ['a']>"


def test_the_length_of_what_is_left() -> None:
    items = iter(TEN)
    next(items)
    assert items.__length_hint__() == 9  # type: ignore[attr-defined]
