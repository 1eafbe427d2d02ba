"""Nodes: what they tell, how they compare, what is found from them."""

from __future__ import annotations

import copy
import gc
import pickle
from typing import Any

import pytest

import xquery

MIXED = xquery.parse(
    "<!--before--><?do it?><a xmlns='u' xmlns:p='v' p:x='1' y='&lt;'>t<b/>u<p:c>deep</p:c></a>"
)


def test_kinds() -> None:
    root = MIXED[2]
    kinds = [node.kind for node in MIXED] + [root.find("@y").kind, root[0].kind]
    assert kinds == ["comment", "processing-instruction", "element", "attribute", "text"]
    assert MIXED.kind == "document"


def test_names() -> None:
    c = MIXED.find("//*[local-name() = 'c']")
    assert (c.name, c.local_name, c.prefix, c.namespace) == ("p:c", "c", "p", "v")
    root = c.parent
    assert (root.name, root.local_name, root.prefix, root.namespace) == ("a", "a", None, "u")
    assert (MIXED.name, MIXED.local_name, MIXED.namespace) == (None, None, None)
    assert MIXED[1].name == "do"
    assert MIXED[0].name is None


def test_text() -> None:
    root = MIXED[2]
    assert root.text == "tudeep" == str(root)
    assert MIXED[0].text == "before"
    assert root.find("@y").text == "<"


def test_attributes() -> None:
    root = MIXED[2]
    assert root.attributes == {"p:x": "1", "y": "<"}
    assert root.get("y") == "<"
    assert root.get("none") is None
    assert root.get("none", 3) == 3
    assert MIXED.attributes == {}
    assert MIXED[0].get("y", "else") == "else"


def test_namespaces_in_scope() -> None:
    assert MIXED[2].namespaces == {None: "u", "p": "v"}
    inner = xquery.parse("<a xmlns='u' xmlns:p='v'><b xmlns='' xmlns:p='w'/></a>").find("//b")
    assert inner.namespaces == {"p": "w"}


def test_children() -> None:
    root = MIXED[2]
    assert [child.kind for child in root] == ["text", "element", "text", "element"]
    assert root.children == list(root)
    assert len(root) == 4
    assert root[-1].local_name == "c"
    with pytest.raises(IndexError):
        root[4]
    with pytest.raises(IndexError):
        root[-5]


def test_a_node_without_children_is_true() -> None:
    b = MIXED[2][1]
    assert len(b) == 0
    assert b


def test_walking() -> None:
    names = [node.name for node in MIXED.walk() if node.kind == "element"]
    assert names == ["a", "b", "p:c"]
    assert [node.text for node in MIXED[2][3].walk()] == ["deep", "deep"]
    root = MIXED[2]
    assert root[0].next == root[1]
    assert root[1].previous == root[0]
    assert root[0].previous is None
    assert root.root == MIXED == root.document
    assert MIXED.parent is None


def test_paths() -> None:
    price = xquery.parse("<a><b/><b><c x='1'/></b></a>").find("//c/@x")
    assert price.path == "/a[1]/b[2]/c[1]/@x"


def test_xml() -> None:
    node = xquery.parse("<a xmlns:p='v'><p:b>x &amp; y</p:b></a>").find("/a/*")
    assert node.xml() == '<p:b xmlns:p="v">x &amp; y</p:b>'
    indented = xquery.parse("<a><b/></a>").xml(indent=True)
    assert "\n  <b/>\n" in indented


def test_finding(books: xquery.Node) -> None:
    book = books.find("//book[price > 20]")
    assert book.find("title/string()") == "A Field Guide to Lichens"
    assert book.find("nothing") is None
    assert book.find("count(author)") == 2
    assert len(books.find_all("//book")) == 4
    assert books.find_all("//book").first() == book


def test_finding_loads_nothing(books: xquery.Node) -> None:
    with pytest.warns(xquery.MissingDocumentWarning, match="not allowed"):
        assert books.find("doc('file:///etc/hostname')") is None


def test_finding_with_a_broken_path(books: xquery.Node) -> None:
    with pytest.raises(xquery.CompileError):
        books.find("//[")


def test_identity(books: xquery.Node) -> None:
    first, again = books.find("//book"), books.find("/*/book[1]")
    assert first == again
    assert hash(first) == hash(again)
    assert len({first, again, books}) == 2
    other: Any = "a book"
    assert first != other
    assert not first == other


def test_equal_text_is_not_equal() -> None:
    root = xquery.parse("<a><b/><b/></a>")[0]
    assert root[0] != root[1]
    assert xquery.parse("<a/>") != xquery.parse("<a/>")


def test_document_order(books: xquery.Node) -> None:
    nodes = list(books.walk())
    assert sorted(reversed(nodes)) == nodes
    assert nodes[0] < nodes[1] <= nodes[1] < nodes[2] > nodes[1] >= nodes[0]
    with pytest.raises(TypeError):
        nodes[0] < 1  # type: ignore[operator]


def test_order_across_trees_is_total() -> None:
    trees = [xquery.parse("<a><b/></a>") for _ in range(5)]
    nodes = [node for tree in trees for node in tree.walk()]
    ordered = sorted(nodes)
    assert sorted(reversed(ordered)) == ordered
    for tree in trees:
        places = [ordered.index(node) for node in tree.walk()]
        assert places == list(range(places[0], places[0] + 3))


def test_a_node_keeps_its_tree() -> None:
    node = xquery.parse("<a><b>kept</b></a>").find("//b")
    gc.collect()
    assert node.root.xml().endswith("<a><b>kept</b></a>")


def test_an_iterator_keeps_the_tree() -> None:
    children = iter(xquery.parse("<a><b/><c/></a>").find("/a"))
    gc.collect()
    assert [child.name for child in children] == ["b", "c"]


def test_a_copy_is_a_tree_of_its_own(books: xquery.Node) -> None:
    book = books.find("//book")
    copied = book.copy()
    assert copied != book
    assert copied.parent is None
    assert copied.xml() == book.xml()


def test_the_module_copy_keeps_nodes_as_they_are(books: xquery.Node) -> None:
    book = books.find("//book")
    assert copy.copy(book) is book
    assert copy.deepcopy(book) is book
    assert copy.deepcopy({"books": [book]}) == {"books": [book]}


def test_arguments_of_wrong_types(books: xquery.Node) -> None:
    with pytest.raises(TypeError, match="^a path is a str, not int$"):
        books.find(1)  # type: ignore[arg-type]
    with pytest.raises(TypeError, match="^a path is a str, not Query$"):
        books.find_all(xquery.compile("//book"))  # type: ignore[arg-type]
    with pytest.raises(TypeError, match="^the name of an attribute is a str, not bytes$"):
        books[0].get(b"isbn")  # type: ignore[call-overload]
    for index in ("0", slice(1), None, 0.0):
        with pytest.raises(TypeError, match="^a child is asked for by an int, not by "):
            books[index]  # type: ignore[index]
    for index in (10**30, -(10**30), 2**63, -(2**63) - 1):
        with pytest.raises(IndexError, match="^no such child$"):
            books[index]


def test_representation(books: xquery.Node) -> None:
    assert repr(books.find("//title")) == "<xquery.Node element title 'A Field Guide to Lichens'>"
    assert repr(books.find("//@isbn")) == "<xquery.Node attribute isbn '0-306-40615-2'>"
    assert repr(xquery.parse("<a/>")) == "<xquery.Node document>"
    assert repr(xquery.parse("<a/>")[0]) == "<xquery.Node element a>"
    long = xquery.parse(f"<a>{'x' * 50}</a>")[0]
    assert repr(long) == f"<xquery.Node element a '{'x' * 40}\u2026'>"


def test_nodes_are_not_pickled(books: xquery.Node) -> None:
    with pytest.raises(TypeError, match="xml"):
        pickle.dumps(books)


def test_nodes_are_not_made_by_hand() -> None:
    with pytest.raises(TypeError):
        xquery.Node()


def test_very_deep_documents_are_walked_and_freed() -> None:
    depth = 200_000
    document = xquery.parse(b"<a>" * depth + b"</a>" * depth)
    assert sum(1 for _ in document.walk()) == depth + 1
    del document
