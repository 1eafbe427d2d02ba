"""What queries load: policies, loaders, modules, traces, and documents that are missing."""

from __future__ import annotations

import math
import threading
import warnings
from decimal import Decimal
from fractions import Fraction
from pathlib import Path
from typing import Any, Callable, Dict, List, Optional, Tuple, Union

import pytest

import xquery
from xquery import Policy, Resource

DOC = "declare variable $url external; doc($url)/*/name()"


@pytest.fixture
def folder(tmp_path: Path) -> Path:
    (tmp_path / "a.xml").write_text("<a/>")
    return tmp_path


def loaded(url: str, policy: Policy) -> List[str]:
    with warnings.catch_warnings():
        warnings.simplefilter("ignore", xquery.MissingDocumentWarning)
        names: List[str] = xquery.compile(DOC, policy=policy).evaluate(url=url).to_list()
    return names


def test_policies(folder: Path) -> None:
    url = (folder / "a.xml").as_uri()
    assert loaded(url, Policy()) == ["a"]
    assert loaded(url, Policy.deny()) == []
    assert loaded(url, Policy.deny().allow_files(folder)) == ["a"]
    assert loaded(url, Policy.deny().allow_files(folder / "none")) == []
    assert loaded(url, Policy.deny().allow_scheme("file")) == ["a"]
    assert loaded(url, Policy.deny().allow_scheme("https")) == []
    with pytest.raises(ValueError, match="no such rule"):
        xquery.compile("1", policy=Policy((("allow_all", ""),)))


def test_relative_references(folder: Path, monkeypatch: pytest.MonkeyPatch) -> None:
    monkeypatch.chdir(folder)
    assert loaded("a.xml", Policy()) == ["a"]
    query = xquery.compile("doc('a.xml')/*/name()", url=(folder / "main.xq").as_uri())
    monkeypatch.chdir("/")
    assert query.evaluate().one() == "a"


def test_missing_documents_are_warnings(folder: Path) -> None:
    with pytest.warns(xquery.MissingDocumentWarning) as caught:
        xquery.query("doc('file:///none.xml')")
    assert str(caught[0].message) == "file:///none.xml: No such file or directory"


def test_a_warning_is_one_of_the_line_that_calls_the_package(books: xquery.Node) -> None:
    query = xquery.compile("doc('file:///none.xml')")
    calls: List[Callable[[], object]] = [
        lambda: query.evaluate(),
        lambda: query.profile(),
        lambda: xquery.query("doc('file:///none.xml')"),
        lambda: xquery.Context().evaluate(query),
        lambda: books.find("doc('file:///none.xml')"),
        lambda: books.find_all("doc('file:///none.xml')"),
    ]
    for call in calls:
        with pytest.warns(xquery.MissingDocumentWarning) as caught:
            call()
        assert [warning.filename for warning in caught] == [__file__]


def test_a_warning_that_is_an_error_ends_the_evaluation() -> None:
    with warnings.catch_warnings():
        warnings.simplefilter("error")
        with pytest.raises(xquery.MissingDocumentWarning):
            xquery.query("doc('file:///none.xml')")


def test_missing_documents_are_heard() -> None:
    heard: List[Tuple[str, str]] = []
    query = xquery.compile(
        "doc('file:///none.xml'), 1",
        policy=Policy.deny(),
        missing=lambda url, reason: heard.append((url, reason)),
    )
    assert query.evaluate() == [1]
    assert heard == [("file:///none.xml", "not allowed")]


def test_traces() -> None:
    heard: List[Tuple[str, xquery.Result]] = []
    query = xquery.compile(
        "trace((1, 'a'), 'two'), trace((), 'none'), trace(<a/>, 'node')",
        trace=lambda label, items: heard.append((label, items)),
    )
    assert query.evaluate()[:2] == [1, "a"]
    assert [(label, len(items)) for label, items in heard] == [("two", 2), ("none", 0), ("node", 1)]
    assert heard[2][1].one().name == "a"


def test_what_a_trace_raises_ends_the_evaluation() -> None:
    def trace(label: str, items: xquery.Result) -> None:
        raise KeyError(label)

    with pytest.raises(KeyError, match="mine"):
        xquery.compile("trace(1, 'mine'), 1 idiv 0", trace=trace).evaluate()


def test_a_trace_may_evaluate() -> None:
    heard: List[int] = []

    def trace(label: str, items: xquery.Result) -> None:
        heard.append(xquery.query("declare variable $a external; count($a)", a=items).one())

    assert xquery.compile("trace((1, 2), 'a')", trace=trace).evaluate() == [1, 2]
    assert heard == [2]


@pytest.mark.parametrize(
    "answer, names",
    [
        (b"<b/>", ["b"]),
        ("<b/>", ["b"]),
        (None, []),
        (Resource("<b/>"), ["b"]),
        (Resource(b"<b/>", status=404), []),
        (Resource("<b/>", status=200, url="http://example.org/b"), ["b"]),
        (Resource("<p>x", mime_type="text/html"), ["html"]),
    ],
)
def test_loaders(answer: Union[None, bytes, str, Resource], names: List[str]) -> None:
    asked: List[Tuple[str, str]] = []

    def load(url: str, purpose: str) -> Union[None, bytes, str, Resource]:
        asked.append((url, purpose))
        return answer

    query = xquery.compile(DOC, loader=load, missing=lambda url, reason: None)
    assert query.evaluate(url="http://example.org/x") == names
    assert asked == [("http://example.org/x", "document")]


def test_text_of_a_loader_has_no_encoding_whatever_it_says() -> None:
    text = "<?xml version='1.0' encoding='ISO-8859-1'?><a>\u00e4</a>"
    answers: List[Union[bytes, str, Resource]] = [text, Resource(text), text.encode("latin-1")]
    for answer in answers:
        query = xquery.compile("string(doc('http://x/'))", loader=lambda url, purpose, a=answer: a)
        assert query.evaluate().one() == "\u00e4"


def test_a_loader_is_asked_for_what_is_allowed() -> None:
    asked: List[str] = []

    def load(url: str, purpose: str) -> Optional[bytes]:
        asked.append(url)
        return b"<a/>"

    query = xquery.compile(
        "doc('own:/a')/*/name(), doc('own:/b')/*/name(), doc('file:///c')",
        policy=Policy.deny().allow_scheme("own"),
        loader=load,
        missing=lambda url, reason: None,
    )
    assert query.evaluate() == ["a", "a"]
    assert asked == ["own:/a", "own:/b"]


@pytest.mark.parametrize("seconds", [None, 60.0])
def test_what_a_loader_raises_ends_the_evaluation(seconds: Optional[float]) -> None:
    def load(url: str, purpose: str) -> bytes:
        raise KeyError(url)

    query = xquery.compile(DOC, loader=load, seconds=seconds)
    with pytest.raises(KeyError, match="own"):
        query.evaluate(url="http://own/")
    caught: List[BaseException] = []

    def in_a_thread() -> None:
        try:
            query.evaluate(url="http://own/")
        except KeyError as error:
            caught.append(error)

    thread = threading.Thread(target=in_a_thread)
    thread.start()
    thread.join()
    assert len(caught) == 1


@pytest.mark.parametrize("answer", [1, ["a"], Resource(None)])  # type: ignore[arg-type]
def test_a_loader_that_answers_nonsense(answer: object) -> None:
    query = xquery.compile(DOC, loader=lambda url, purpose: answer)  # type: ignore[arg-type]
    with pytest.raises(TypeError):
        query.evaluate(url="http://own/")


MAIN = "import module namespace l = 'l' at '{}'; l:two()"
LIBRARY = "module namespace l = 'l'; declare function l:two() { 2 };"


def test_modules() -> None:
    text = MAIN.format("lib.xq")
    assert xquery.compile(text, modules={"lib.xq": LIBRARY}).evaluate().one() == 2
    text = MAIN.format("http://example.org/lib.xq")
    at_url = {"http://example.org/lib.xq": LIBRARY}
    assert xquery.compile(text, modules=at_url).evaluate().one() == 2
    assert xquery.compile(text, modules=at_url.get).evaluate().one() == 2
    with pytest.raises(xquery.CompileError, match="can't access module"):
        xquery.compile(text, modules={})


def test_modules_by_the_loader() -> None:
    def load(url: str, purpose: str) -> Optional[str]:
        return LIBRARY if purpose == "module" else None

    assert xquery.compile(MAIN.format("http://x/"), loader=load).evaluate().one() == 2


def test_functions_must_be_callable() -> None:
    for name in ("loader", "trace", "missing"):
        with pytest.raises(TypeError, match=f"{name} is not callable"):
            xquery.compile("1", **{name: 1})  # type: ignore[arg-type]


@pytest.mark.parametrize(
    "settings, text",
    [
        ({"seconds": "x"}, "seconds must be a number, not str"),
        ({"seconds": b"1"}, "seconds must be a number, not bytes"),
        ({"memory": "1"}, "memory must be an int, not str"),
        ({"memory": 1.5}, "memory must be an int, not float"),
        ({"policy": "deny"}, "policy must be a Policy, not str"),
        ({"url": 1}, "url must be a str, not int"),
        ({"cancellation": True}, "cancellation must be a Cancellation, not bool"),
        ({"namespaces": "p=u"}, "namespaces must be a mapping, not str"),
        ({"namespaces": {"p": 1}}, "a prefix or a namespace must be a str, not int"),
        ({"namespaces": {None: "u"}}, "a prefix or a namespace must be a str, not NoneType"),
    ],
)
def test_settings_of_wrong_types(settings: Dict[str, Any], text: str) -> None:
    takes: List[Callable[[], object]] = [
        lambda: xquery.compile("1", **settings),
        lambda: xquery.Context(**settings),
    ]
    for take in takes:
        with pytest.raises(TypeError, match=f"^{text}$"):
            take()


def test_settings_that_are_numbers_of_any_type() -> None:
    for seconds in (1, 2.5, Decimal("1.5"), Fraction(3, 2), True, 10**400, math.inf):
        one = xquery.compile("1", seconds=seconds)  # type: ignore[arg-type]
        assert one.evaluate().one() == 1
    for seconds in (-1, -math.inf, math.nan, -(10**400)):
        with pytest.raises(ValueError, match="^seconds must not be negative$"):
            xquery.compile("1", seconds=seconds)
    for memory in (10**6, 10**30):
        assert xquery.compile("1", memory=memory).evaluate().one() == 1


def test_prefixes_that_have_a_meaning_of_their_own() -> None:
    for prefix in ("xml", "xmlns"):
        with pytest.raises(ValueError, match=f"^prefix {prefix} can't be redeclared$"):
            xquery.compile("1", namespaces={prefix: "u"})
    reserved = {"p": "http://www.w3.org/XML/1998/namespace"}
    query = xquery.compile("string(/a/@p:lang)", namespaces=reserved)
    assert query.evaluate("<a xml:lang='de'/>").one() == "de"
