"""Values that the types of Python do not hold, each as a class of its own.

Each is written, by ``str``, as the language writes it, can be given for a variable, and is
immutable.

>>> import xquery
>>> xquery.query("xs:gYear('2026'), xdt:yearMonthDuration('P1Y2M')")
<xquery.Result [GYear(year=2026, tzinfo=None), MonthDuration(months=14)]>
>>> str(xquery.MonthDuration(14))
'P1Y2M'
"""

from __future__ import annotations

import datetime
from dataclasses import dataclass
from typing import ClassVar, Optional


class URI(str):
    """An xs:anyURI: a str that is a URI reference."""

    __slots__ = ()
    _type_name: ClassVar[str] = "xs:anyURI"

    def __repr__(self) -> str:
        return f"URI({str.__repr__(self)})"


class Untyped(str):
    """An xdt:untypedAtomic, which a query takes for a number, a date or a string as it needs it.

    For variables; what is untyped in a result arrives as a plain str.

    >>> import xquery
    >>> text = "declare variable $limit external; $limit + 1"
    >>> xquery.query(text, limit=xquery.Untyped("20")).one()
    21.0
    """

    __slots__ = ()
    _type_name: ClassVar[str] = "xdt:untypedAtomic"

    def __repr__(self) -> str:
        return f"Untyped({str.__repr__(self)})"


class Notation(str):
    """An xs:NOTATION, as it is written."""

    __slots__ = ()
    _type_name: ClassVar[str] = "xs:NOTATION"

    def __repr__(self) -> str:
        return f"Notation({str.__repr__(self)})"


class HexBinary(bytes):
    """An xs:hexBinary. Plain bytes are an xs:base64Binary."""

    __slots__ = ()

    def __repr__(self) -> str:
        return f"HexBinary({bytes.__repr__(self)})"


@dataclass(frozen=True)
class QName:
    """A qualified name. The prefix is for printing alone.

    >>> import xquery
    >>> xquery.QName("a", "http://example.org/", "x") == xquery.QName("a", "http://example.org/")
    True
    """

    local_name: str
    namespace: Optional[str] = None
    prefix: Optional[str] = None

    def __eq__(self, other: object) -> bool:
        if not isinstance(other, QName):
            return NotImplemented
        return (self.local_name, self.namespace) == (other.local_name, other.namespace)

    def __hash__(self) -> int:
        return hash((self.local_name, self.namespace))

    def __str__(self) -> str:
        return f"{self.prefix}:{self.local_name}" if self.prefix else self.local_name


def _year(year: int) -> str:
    return f"-{-year:04}" if year < 0 else f"{year:04}"


def _zone(tzinfo: Optional[datetime.tzinfo]) -> str:
    if tzinfo is None:
        return ""
    offset = tzinfo.utcoffset(None)
    if offset is None:
        raise ValueError(f"{tzinfo} has no offset from UTC without a day and a time")
    minutes, rest = divmod(offset, datetime.timedelta(minutes=1))
    if rest:
        raise ValueError(f"an offset from UTC is of whole minutes: {offset}")
    if minutes == 0:
        return "Z"
    return f"{'-' if minutes < 0 else '+'}{abs(minutes) // 60:02}:{abs(minutes) % 60:02}"


def _clock(hour: int, minute: int, second: int, nanosecond: int) -> str:
    fraction = f".{nanosecond:09}".rstrip("0") if nanosecond else ""
    return f"{hour:02}:{minute:02}:{second:02}{fraction}"


@dataclass(frozen=True)
class DateTime:
    """An xs:dateTime that no datetime holds: of a year before 1 or after 9999, or with a fraction
    of a microsecond. There is a year 0."""

    _type_name: ClassVar[str] = "xs:dateTime"
    year: int
    month: int
    day: int
    hour: int = 0
    minute: int = 0
    second: int = 0
    nanosecond: int = 0
    tzinfo: Optional[datetime.tzinfo] = None

    def __str__(self) -> str:
        clock = _clock(self.hour, self.minute, self.second, self.nanosecond)
        return f"{_year(self.year)}-{self.month:02}-{self.day:02}T{clock}{_zone(self.tzinfo)}"


@dataclass(frozen=True)
class Date:
    """An xs:date that no date holds: with a zone, or of a year before 1 or after 9999."""

    _type_name: ClassVar[str] = "xs:date"
    year: int
    month: int
    day: int
    tzinfo: Optional[datetime.tzinfo] = None

    def date(self) -> datetime.date:
        """Without the zone; ValueError for a year that Python's dates do not have."""
        return datetime.date(self.year, self.month, self.day)

    def __str__(self) -> str:
        return f"{_year(self.year)}-{self.month:02}-{self.day:02}{_zone(self.tzinfo)}"


@dataclass(frozen=True)
class Time:
    """An xs:time that no time holds: with a fraction of a microsecond."""

    _type_name: ClassVar[str] = "xs:time"
    hour: int
    minute: int
    second: int = 0
    nanosecond: int = 0
    tzinfo: Optional[datetime.tzinfo] = None

    def __str__(self) -> str:
        clock = _clock(self.hour, self.minute, self.second, self.nanosecond)
        return f"{clock}{_zone(self.tzinfo)}"


@dataclass(frozen=True)
class GYearMonth:
    """An xs:gYearMonth: a month of a year."""

    _type_name: ClassVar[str] = "xs:gYearMonth"
    year: int
    month: int
    tzinfo: Optional[datetime.tzinfo] = None

    def __str__(self) -> str:
        return f"{_year(self.year)}-{self.month:02}{_zone(self.tzinfo)}"


@dataclass(frozen=True)
class GYear:
    """An xs:gYear."""

    _type_name: ClassVar[str] = "xs:gYear"
    year: int
    tzinfo: Optional[datetime.tzinfo] = None

    def __str__(self) -> str:
        return f"{_year(self.year)}{_zone(self.tzinfo)}"


@dataclass(frozen=True)
class GMonthDay:
    """An xs:gMonthDay: a day of every year."""

    _type_name: ClassVar[str] = "xs:gMonthDay"
    month: int
    day: int
    tzinfo: Optional[datetime.tzinfo] = None

    def __str__(self) -> str:
        return f"--{self.month:02}-{self.day:02}{_zone(self.tzinfo)}"


@dataclass(frozen=True)
class GMonth:
    """An xs:gMonth: a month of every year."""

    _type_name: ClassVar[str] = "xs:gMonth"
    month: int
    tzinfo: Optional[datetime.tzinfo] = None

    def __str__(self) -> str:
        return f"--{self.month:02}{_zone(self.tzinfo)}"


@dataclass(frozen=True)
class GDay:
    """An xs:gDay: a day of every month."""

    _type_name: ClassVar[str] = "xs:gDay"
    day: int
    tzinfo: Optional[datetime.tzinfo] = None

    def __str__(self) -> str:
        return f"---{self.day:02}{_zone(self.tzinfo)}"


@dataclass(frozen=True, order=True)
class MonthDuration:
    """An xdt:yearMonthDuration. (An xdt:dayTimeDuration is a timedelta.)"""

    _type_name: ClassVar[str] = "xdt:yearMonthDuration"
    months: int

    def __str__(self) -> str:
        years, months = divmod(abs(self.months), 12)
        shown = (f"{years}Y" if years else "") + (f"{months}M" if months or not years else "")
        return ("-P" if self.months < 0 else "P") + shown


@dataclass(frozen=True)
class Duration:
    """An xs:duration, each field as it is written, none of them negative.

    Also an xdt:dayTimeDuration that is too long for a timedelta.
    """

    _type_name: ClassVar[str] = "xs:duration"
    years: int = 0
    months: int = 0
    days: int = 0
    hours: int = 0
    minutes: int = 0
    seconds: float = 0
    negative: bool = False

    def __str__(self) -> str:
        fields = ((self.years, "Y"), (self.months, "M"), (self.days, "D"))
        day = "".join(f"{value}{letter}" for value, letter in fields if value)
        fields = ((self.hours, "H"), (self.minutes, "M"), (0, ""))
        clock = "".join(f"{value}{letter}" for value, letter in fields if value)
        if self.seconds or not (day or clock):
            seconds = f"{self.seconds:.9f}".rstrip("0").rstrip(".")
            clock += f"{seconds}S"
        return f"{'-' if self.negative else ''}P{day}{'T' + clock if clock else ''}"
