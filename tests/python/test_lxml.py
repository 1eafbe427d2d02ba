"""Trees from and to lxml."""

from __future__ import annotations

import pytest

import xquery

etree = pytest.importorskip("lxml.etree", reason="lxml is not installed (Debian's python3-lxml)")

TEXTS = [
    "<a/>",
    "<a x='1'>t<b>u</b>v<!--c--><?p i?></a>",
    "<a xmlns='http://u/' xmlns:p='http://v/' p:x='1'><p:b/><c xmlns=''/></a>",
    "<!--before--><?before it?><a/><!--after-->",
    "<a> \n <b>\u00e4\u20ac\U0001f600</b>&lt;&amp;&gt;\t</a>",
    "<a><![CDATA[<&>]]></a>",
]


@pytest.mark.parametrize("text", TEXTS)
def test_documents_there_and_back(text: str) -> None:
    tree = etree.ElementTree(etree.fromstring(text))
    document = xquery.from_lxml(tree)
    assert document.kind == "document"
    again = xquery.to_lxml(document)
    assert etree.tostring(again, method="c14n") == etree.tostring(tree, method="c14n")


def test_an_element_is_by_itself_and_keeps_its_namespaces() -> None:
    inner = etree.fromstring("<a xmlns:p='v'><p:b>t</p:b>tail</a>")[0]
    node = xquery.from_lxml(inner)
    assert (node.kind, node.name, node.namespace, node.text) == ("element", "p:b", "v", "t")
    assert node.parent is None
    element = xquery.to_lxml(node)
    assert (element.tag, element.text, element.tail) == ("{v}b", "t", None)


def test_comments_and_instructions() -> None:
    root = etree.fromstring("<a><!--c--><?p i?></a>")
    comment, instruction = xquery.from_lxml(root[0]), xquery.from_lxml(root[1])
    assert (comment.kind, comment.text) == ("comment", "c")
    assert (instruction.kind, instruction.name, instruction.text) == (
        "processing-instruction", "p", "i",
    )
    assert etree.tostring(xquery.to_lxml(comment)) == b"<!--c-->"
    assert etree.tostring(xquery.to_lxml(instruction)) == b"<?p i?>"


def test_a_document_type_is_left_out() -> None:
    tree = etree.ElementTree(etree.fromstring("<!DOCTYPE a [<!ENTITY e 'x'>]><a>&e;</a>"))
    assert xquery.from_lxml(tree).text == "x"


def test_deep_trees() -> None:
    depth = 2000
    document = xquery.parse(b"<a>" * depth + b"</a>" * depth)
    tree = xquery.to_lxml(document)
    assert sum(1 for _ in tree.iter()) == depth
    assert sum(1 for _ in xquery.from_lxml(tree).walk()) == depth + 1


def test_refused() -> None:
    attribute = xquery.parse("<a x='1'/>").find("/a/@x")
    with pytest.raises(TypeError, match="attribute"):
        xquery.to_lxml(attribute)
    with pytest.raises(TypeError, match="no tree of lxml"):
        xquery.from_lxml("<a/>")
