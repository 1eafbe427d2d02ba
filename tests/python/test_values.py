"""Values of every type, both ways."""

from __future__ import annotations

import datetime
import time
from datetime import timedelta, timezone
from decimal import Decimal
from fractions import Fraction
from typing import Any, Iterator, List, Optional

import pytest

import xquery
from xquery import (
    URI,
    Date,
    DateTime,
    Duration,
    GDay,
    GMonth,
    GMonthDay,
    GYear,
    GYearMonth,
    HexBinary,
    MonthDuration,
    Notation,
    QName,
    Time,
    Untyped,
)

EAST = timezone(timedelta(hours=5, minutes=30))
WEST = timezone(-timedelta(hours=3, minutes=30))
SCHEMA = "http://www.w3.org/2001/XMLSchema"



class Moving(datetime.tzinfo):
    """A zone like those of ZoneInfo: which offset it has depends on the day."""

    def utcoffset(self, moment: Optional[datetime.datetime]) -> Optional[timedelta]:
        if moment is None:
            return None
        return timedelta(hours=2 if 4 <= moment.month <= 9 else 1)

    def dst(self, moment: Optional[datetime.datetime]) -> Optional[timedelta]:
        return None

    def tzname(self, moment: Optional[datetime.datetime]) -> str:
        return "Moving"

    def __str__(self) -> str:
        return "Moving"


SAME = xquery.compile("declare variable $v external; $v")


def back(value: Any) -> Any:
    return SAME.evaluate(v=value).one()


# What a query writes, what arrives.
ARRIVING = [
    ("1", 1),
    ("xs:integer('-123456789012345678901234567890')", -123456789012345678901234567890),
    ("xs:unsignedLong('18446744073709551615')", 18446744073709551615),
    ("xs:long('-9223372036854775808')", -(2**63)),
    ("xs:byte('-128')", -128),
    ("2.50", Decimal("2.5")),
    ("xs:decimal('123456789012345678901234567890.125')", Decimal("123456789012345678901234567890.125")),
    ("1e3", 1000.0),
    ("xs:double('-INF')", float("-inf")),
    ("xs:float('1.5')", 1.5),
    ("true()", True),
    ("false()", False),
    ("'text'", "text"),
    ("'\u00e4\u20ac\U0001f600'", "\u00e4\u20ac\U0001f600"),
    ("'\ufeff'", "\ufeff"),
    ("''", ""),
    ("xdt:untypedAtomic('20')", "20"),
    ("xs:token('a b')", "a b"),
    ("xs:anyURI('http://example.org/')", URI("http://example.org/")),
    ("xs:QName('xs:date')", QName("date", SCHEMA)),
    ("xs:dateTime('2026-11-23T09:05:00')", datetime.datetime(2026, 11, 23, 9, 5)),
    (
        "xs:dateTime('2026-11-23T09:05:00.25+05:30')",
        datetime.datetime(2026, 11, 23, 9, 5, 0, 250000, EAST),
    ),
    ("xs:dateTime('-0044-03-15T12:00:00Z')", DateTime(-44, 3, 15, 12, 0, 0, 0, timezone.utc)),
    ("xs:dateTime('12026-01-01T00:00:00')", DateTime(12026, 1, 1)),
    ("xs:date('2024-02-29')", datetime.date(2024, 2, 29)),
    ("xs:date('2024-02-29-03:30')", Date(2024, 2, 29, WEST)),
    ("xs:date('10000-01-01')", Date(10000, 1, 1)),
    ("xs:time('23:59:59.5')", datetime.time(23, 59, 59, 500000)),
    ("xs:time('01:02:03Z')", datetime.time(1, 2, 3, tzinfo=timezone.utc)),
    ("xs:gYear('2026')", GYear(2026)),
    ("xs:gYearMonth('2026-11Z')", GYearMonth(2026, 11, timezone.utc)),
    ("xs:gMonthDay('--02-29')", GMonthDay(2, 29)),
    ("xs:gDay('---31')", GDay(31)),
    ("xdt:dayTimeDuration('P1DT2H3M4.5S')", timedelta(1, 7384, 500000)),
    ("xdt:dayTimeDuration('-PT0.5S')", timedelta(seconds=-0.5)),
    ("xdt:yearMonthDuration('-P1Y2M')", MonthDuration(-14)),
    ("xs:duration('P1Y2M3DT4H5M6.5S')", Duration(1, 2, 3, 4, 5, 6.5)),
    ("xs:hexBinary('00FF')", HexBinary(b"\x00\xff")),
    ("xs:base64Binary('AP8=')", b"\x00\xff"),
]


@pytest.mark.parametrize("text, value", ARRIVING, ids=[text for text, _ in ARRIVING])
def test_arrives_as(text: str, value: Any) -> None:
    item = xquery.query(text).one()
    assert item == value
    assert type(item) is type(value)


def test_a_date_of_a_zone_keeps_the_offset() -> None:
    item = xquery.query("xs:dateTime('2026-11-23T09:05:00-03:30')").one()
    assert item.utcoffset() == -timedelta(hours=3, minutes=30)
    assert xquery.query("xs:time('01:02:03+05:30')").one().utcoffset() == timedelta(hours=5.5)


def test_not_a_number_arrives() -> None:
    item = xquery.query("xs:double('NaN')").one()
    assert item != item


# What is given, and the type that it has in a query.
GIVEN = [
    (0, "xs:integer"),
    (-(2**63), "xs:integer"),
    (2**64, "xs:integer"),
    (True, "xs:boolean"),
    (2.5, "xs:double"),
    (float("inf"), "xs:double"),
    (Decimal("12.50"), "xs:decimal"),
    (Decimal("1E+3"), "xs:decimal"),
    ("text", "xs:string"),
    ("", "xs:string"),
    ("\u00e4\u20ac\U0001f600", "xs:string"),
    (Untyped("20"), "xdt:untypedAtomic"),
    (URI("a/b?c#d"), "xs:anyURI"),
    (QName("a", "http://example.org/", "x"), "xs:QName"),
    (b"\x00\xff", "xs:base64Binary"),
    (b"", "xs:base64Binary"),
    (HexBinary(b"\x00\xff"), "xs:hexBinary"),
    (datetime.datetime(2026, 11, 23, 9, 5, 0, 123456, WEST), "xs:dateTime"),
    (datetime.datetime(1, 1, 1), "xs:dateTime"),
    (datetime.datetime(9999, 12, 31, 23, 59, 59, 999999, timezone.utc), "xs:dateTime"),
    (datetime.date(2024, 2, 29), "xs:date"),
    (datetime.time(23, 59, 59, 999999), "xs:time"),
    (datetime.time(1, 2, tzinfo=EAST), "xs:time"),
    (timedelta(days=-3, microseconds=7), "xdt:dayTimeDuration"),
    (timedelta(0), "xdt:dayTimeDuration"),
    (MonthDuration(14), "xdt:yearMonthDuration"),
    (MonthDuration(0), "xdt:yearMonthDuration"),
    (Duration(1, 2, 3, 4, 5, 6.5), "xs:duration"),
    (DateTime(-1, 1, 1, tzinfo=EAST), "xs:dateTime"),
    (DateTime(2026, 1, 1, nanosecond=1), "xs:dateTime"),
    (Date(2026, 11, 23, EAST), "xs:date"),
    (Time(1, 2, 3, 4), "xs:time"),
    (GYearMonth(-5, 12), "xs:gYearMonth"),
    (GYear(123456), "xs:gYear"),
    (GMonthDay(12, 31, WEST), "xs:gMonthDay"),
    (GMonth(2), "xs:gMonth"),
    (GDay(1, timezone.utc), "xs:gDay"),
]


@pytest.mark.parametrize("value, name", GIVEN, ids=[repr(value) for value, _ in GIVEN])
def test_comes_back(value: Any, name: str) -> None:
    result = SAME.evaluate(v=value)
    assert result.types == [name]
    assert result.one() == value
    expected = str if isinstance(value, Untyped) else type(value)
    assert type(result.one()) is expected


def test_a_datetime_comes_back_with_its_offset() -> None:
    when = datetime.datetime(2026, 11, 23, 9, 5, tzinfo=EAST)
    assert back(when).utcoffset() == when.utcoffset()
    assert back(when.replace(tzinfo=None)).tzinfo is None


@pytest.mark.parametrize("digits", [19, 20, 4300, 4301, 20000])
def test_an_int_of_many_digits(digits: int) -> None:
    value = 10 ** (digits - 1) + 7
    assert back(value) == value
    assert back(-value) == -value


def test_a_decimal_is_exact() -> None:
    value = Decimal("0." + "1234567890" * 20 + "1")
    assert back(value) == value
    assert str(back(Decimal("-0.10"))) == "-0.1"


def test_none_is_the_empty_sequence() -> None:
    assert SAME.evaluate(v=None).to_list() == []


def test_sequences_are_flat() -> None:
    def some() -> Iterator[Any]:
        yield 1
        yield ["a", (2.5, None, [])]

    assert SAME.evaluate(v=some()).to_list() == [1, "a", 2.5]
    assert SAME.evaluate(v=(1, 2)).to_list() == [1, 2]
    assert sorted(SAME.evaluate(v={1, 2})) == [1, 2]
    assert SAME.evaluate(v=range(3)).to_list() == [0, 1, 2]
    assert SAME.evaluate(v=SAME.evaluate(v=[1, 2, 3])[1:]).to_list() == [2, 3]


def test_a_node_is_itself(books: xquery.Node) -> None:
    assert back(books) == books
    assert back(books.find("//price[1]")).name == "price"


def test_numbers_of_other_classes() -> None:
    class Whole:
        def __index__(self) -> int:
            return 7

    class Broken:
        def __float__(self) -> float:
            return 0.5

    assert back(Whole()) == 7
    assert back(Broken()) == 0.5
    assert back(Fraction(1, 4)) == 0.25


def test_bytes_of_other_classes() -> None:
    assert back(bytearray(b"ab")) == b"ab"
    assert back(memoryview(b"abcd")[::2]) == b"ac"


def test_a_str_of_ones_own_is_a_string() -> None:
    class Name(str):
        pass

    assert SAME.evaluate(v=Name("a")).types == ["xs:string"]


@pytest.mark.parametrize("value", [{"a": 1}, object(), 1j, print, type])
def test_refused_for_its_type(value: Any) -> None:
    with pytest.raises(TypeError, match="has no counterpart in a query"):
        SAME.evaluate(v=value)


@pytest.mark.parametrize(
    "value, reason",
    [
        ("a\0b", "U.0000"),
        ("\ud800", "surrogates not allowed"),
        (Decimal("NaN"), "xs:decimal has no NaN"),
        (Decimal("-Infinity"), "xs:decimal has no -Infinity"),
        (URI("a b"), "a b"),
        (QName("a b"), "a b"),
        (GMonth(13), "13"),
        (Date(2026, 2, 30), "30"),
        (datetime.datetime(2026, 1, 1, tzinfo=timezone(timedelta(seconds=30))), "whole minutes"),
        (datetime.datetime(2026, 1, 1, tzinfo=timezone(timedelta(hours=20))), "1200"),
        (datetime.time(1, tzinfo=Moving()), "Moving has no offset from UTC"),
        (GYear(2026, Moving()), "Moving has no offset from UTC"),
        (DateTime(12026, 1, 1, tzinfo=Moving()), "Moving has no offset from UTC"),
    ],
    ids=repr,
)
def test_refused_for_its_value(value: Any, reason: str) -> None:
    with pytest.raises(ValueError, match=reason):
        SAME.evaluate(v=value)


@pytest.mark.parametrize(
    "value",
    [
        Decimal("1E+90000000"),
        Decimal("-1E-90000000"),
        Decimal("1E+250000"),
        Decimal("1E-250001"),
        Decimal((0, (1,) * 250_001, -5)),
        1 << 1_000_001,
        -(1 << 100_000_000),
    ],
    ids=["large", "small", "one digit too many", "behind the point", "both", "int", "large int"],
)
def test_more_digits_than_a_decimal_has_are_refused_at_once(value: Any) -> None:
    started = time.process_time()
    with pytest.raises(ValueError, match="out of the range of xs:(decimal|integer)"):
        SAME.evaluate(v=value)
    assert time.process_time() - started < 0.5


def test_as_many_digits_as_a_decimal_has_are_taken() -> None:
    for value in (Decimal("1E+249999"), Decimal("1E-250000"), Decimal("-7E+249999")):
        assert back(value) == value
    for zero in (Decimal("0E+90000000"), Decimal("-0E-90000000")):
        assert back(zero) == 0


def test_a_zone_that_moves_is_given_by_its_offset() -> None:
    for month, hours in ((1, 1), (7, 2)):
        given = datetime.datetime(2026, month, 1, 12, tzinfo=Moving())
        arrived = back(given)
        assert arrived.tzinfo == timezone(timedelta(hours=hours))
        assert arrived.replace(tzinfo=None) == given.replace(tzinfo=None)


def test_the_longest_timedeltas() -> None:
    assert back(timedelta.min) == timedelta.min
    longest = timedelta(days=999999999)
    assert back(longest) == longest
    assert back(longest + timedelta(hours=23)) == longest + timedelta(hours=23)
    # Nearest to it as a double of seconds, and no timedelta any more.
    assert back(timedelta.max) == Duration(days=1000000000)
    assert back(timedelta.min + timedelta.resolution) == timedelta.min
    assert xquery.query("xdt:dayTimeDuration('P1000000000D')").one() == Duration(days=1000000000)


def test_a_list_that_holds_itself_is_refused() -> None:
    endless: List[Any] = []
    endless.append(endless)
    with pytest.raises(RecursionError):
        SAME.evaluate(v=endless)


def test_what_making_a_value_raises_is_raised() -> None:
    def broken() -> Iterator[int]:
        yield 1
        raise KeyError("broken")

    with pytest.raises(KeyError):
        SAME.evaluate(v=broken())


def test_a_duration_too_long_for_python() -> None:
    item = xquery.query("xdt:dayTimeDuration('-P2000000000DT1S')").one()
    assert item == Duration(days=2000000000, seconds=1.0, negative=True)


def test_values_can_be_written() -> None:
    assert str(MonthDuration(-14)) == "-P1Y2M"
    assert str(Duration(0, 0, 1, 0, 0, 0.5)) == "P1DT0.5S"
    assert str(Duration()) == "PT0S"
    assert str(DateTime(-44, 3, 15, 1, 2, 3, 40, WEST)) == "-0044-03-15T01:02:03.00000004-03:30"
    assert str(QName("a", "u", "p")) == "p:a"
    assert repr(URI("a")) == "URI('a')"
    assert repr(HexBinary(b"a")) == "HexBinary(b'a')"
    assert repr(Untyped("a")) == "Untyped('a')"
    assert repr(Notation("a")) == "Notation('a')"
    assert Date(2026, 1, 2, EAST).date() == datetime.date(2026, 1, 2)
