"""Trees from and to lxml, which is imported when it is needed."""

from __future__ import annotations

from typing import Any

from . import _xquery
from ._xquery import Node


def from_lxml(tree: Any) -> Node:
    """A copy of a tree of lxml: of an ElementTree a document, of an element an element by itself.

    >>> import xquery
    >>> from lxml import etree
    >>> xquery.from_lxml(etree.fromstring("<a><b>text</b></a>"))
    <xquery.Node element a 'text'>
    """
    from lxml import etree  # type: ignore[import]

    whole = isinstance(tree, etree._ElementTree)
    if not whole and not isinstance(tree, etree._Element):
        raise TypeError(f"{type(tree).__name__} is no tree of lxml")
    if isinstance(tree, (etree._Comment, etree._ProcessingInstruction)):
        wrapped = b"<a>" + etree.tostring(tree, encoding="UTF-8", with_tail=False) + b"</a>"
        return _xquery.parse_bytes(wrapped, "lxml", False, False, None)[0][0].copy()
    # Without the document type, whose declarations say nothing that is not in the tree already.
    text = etree.tostring(tree, encoding="UTF-8", with_tail=False, doctype="" if whole else None)
    document = _xquery.parse_bytes(text, "lxml", False, False, None)
    if not whole:
        return next(child for child in document if child.kind == "element").copy()
    if tree.docinfo.URL:
        _xquery.set_uri(document, tree.docinfo.URL)
    return document


def to_lxml(node: Node) -> Any:
    """A copy as a tree of lxml: of a document an ElementTree, of an element an element.

    Comments and processing instructions are their counterparts; what has no counterpart, as an
    attribute, is refused with TypeError.

    >>> import xquery
    >>> xquery.to_lxml(xquery.parse("<a><b/></a>").find("/a/b")).tag
    'b'
    """
    from lxml import etree

    if node.kind not in ("document", "element", "comment", "processing-instruction"):
        raise TypeError(f"lxml has no trees for nodes of the kind {node.kind}")
    parser = etree.XMLParser(
        huge_tree=True, resolve_entities=False, no_network=True, strip_cdata=False
    )
    if node.kind == "comment":
        return etree.Comment(node.text)
    if node.kind == "processing-instruction":
        return etree.ProcessingInstruction(node.name, node.text or None)
    root = etree.fromstring(node.xml().encode(), parser)
    return root.getroottree() if node.kind == "document" else root
