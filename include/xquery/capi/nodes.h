/* Documents, the nodes in them, and how they are written. */
#ifndef XQUERY_CAPI_NODES_H
#define XQUERY_CAPI_NODES_H

#include "xquery/capi/basics.h"
#include "xquery/capi/errors.h"

#ifdef __cplusplus
extern "C" {
#endif

/* A handle to a node, which keeps the whole document. Several handles may refer to one node. The
 * handle itself is for one thread at a time where it is moved or freed; documents are never changed
 * through this interface, and any number of threads may read and query one. */
typedef struct xq_node xq_node;

/* ---- reading --------------------------------------------------------------------------------- */

/* Flags, to be added; 0 is XML with all of its white space. */
typedef int xq_reading;
enum {
  XQ_READ_XML = 0,
  XQ_READ_STRIP_SPACE = 1, /* drops text of white space only, unless xml:space says preserve */
  XQ_READ_CDATA = 2,       /* CDATA sections are written as such again */
  XQ_READ_HTML = 4         /* HTML of any quality: elements are in the XHTML namespace */
};

/* Documents are XML 1.0 with namespaces, in any encoding, plain or packed by gzip, xz, zstd or
 * bzip2. External entities are never read. What cannot be read or is not well formed is XQ_INPUT
 * with an error that has the place. The node is the document, and the caller's. */

/* A path is bytes, without a zero among them, and never a null pointer; "-" is standard input. */
XQUERY_EXPORT xq_status xq_read_file(const char* path, size_t length, xq_reading flags,
                                     xq_node** document, xq_error** error);
/* Not looked at after the call. XQ_NUL is no length here. */
XQUERY_EXPORT xq_status xq_read_memory(const char* bytes, size_t length, xq_reading flags,
                                       xq_node** document, xq_error** error);
/* What the callback gives, in pieces. A negative answer is XQ_HOST. */
XQUERY_EXPORT xq_status xq_read_input(xq_read read, void* data, xq_reading flags,
                                      xq_node** document, xq_error** error);

/* The document's own URI; XQ_END where none was set. What a host reads has none. */
XQUERY_EXPORT xq_status xq_node_document_uri(const xq_node* node, xq_text* uri);

/* ---- handles --------------------------------------------------------------------------------- */

/* Another handle to the same node. */
XQUERY_EXPORT xq_status xq_node_share(const xq_node* node, xq_node** other);
/* Null is let pass. */
XQUERY_EXPORT xq_status xq_node_free(xq_node* node);

/* ---- what a node is -------------------------------------------------------------------------- */

typedef int xq_kind;
enum {
  XQ_KIND_DOCUMENT = 1,
  XQ_KIND_ELEMENT = 2,
  XQ_KIND_ATTRIBUTE = 3,
  XQ_KIND_NAMESPACE = 4,
  XQ_KIND_PROCESSING_INSTRUCTION = 5,
  XQ_KIND_COMMENT = 6,
  XQ_KIND_TEXT = 7
};
XQUERY_EXPORT xq_status xq_node_kind(const xq_node* node, xq_kind* kind);

/* The name as written, prefix:local; its parts; its namespace. XQ_END, and the empty text, where
 * there is none: texts, comments and documents have no name. That of a namespace is its prefix, of
 * an instruction its target. */
XQUERY_EXPORT xq_status xq_node_name(const xq_node* node, xq_text* name);
XQUERY_EXPORT xq_status xq_node_local_name(const xq_node* node, xq_text* name);
XQUERY_EXPORT xq_status xq_node_prefix(const xq_node* node, xq_text* prefix);
XQUERY_EXPORT xq_status xq_node_namespace_uri(const xq_node* node, xq_text* uri);
/* The text of a text, comment, instruction, attribute or namespace; all text below an element or a
 * document. */
XQUERY_EXPORT xq_status xq_node_string(const xq_node* node, xq_text* text);
/* The path that leads from the root to this node alone: "/site[1]/people[1]/person[3]/@id". */
XQUERY_EXPORT xq_status xq_node_path(const xq_node* node, xq_text* path);

/* ---- where it leads -------------------------------------------------------------------------- */

typedef int xq_step;
enum {
  XQ_STEP_PARENT = 0,
  XQ_STEP_FIRST_CHILD = 1, /* attributes and namespaces are no children */
  XQ_STEP_LAST_CHILD = 2,
  XQ_STEP_NEXT_SIBLING = 3,
  XQ_STEP_PREVIOUS_SIBLING = 4,
  XQ_STEP_NEXT = 5, /* in document order, without attributes and namespaces */
  XQ_STEP_ROOT = 6, /* the topmost node */
  XQ_STEP_FIRST_ATTRIBUTE = 7,
  XQ_STEP_NEXT_ATTRIBUTE = 8,  /* of the same element */
  XQ_STEP_FIRST_NAMESPACE = 9, /* that is declared on the element */
  XQ_STEP_NEXT_NAMESPACE = 10
};
/* A handle to the node there; XQ_END where there is none. */
XQUERY_EXPORT xq_status xq_node_step(const xq_node* node, xq_step step, xq_node** there);
/* Lets the handle refer to the node there, which takes no memory; where there is none XQ_END, and
 * the handle stays where it is.
 *
 *   xq_status status = xq_node_step(element, XQ_STEP_FIRST_CHILD, &child);
 *   for (; status == XQ_OK; status = xq_node_move(child, XQ_STEP_NEXT_SIBLING)) ...
 *   xq_node_free(child);
 */
XQUERY_EXPORT xq_status xq_node_move(xq_node* node, xq_step step);

/* Counted each time. */
XQUERY_EXPORT xq_status xq_node_child_count(const xq_node* node, size_t* count);
XQUERY_EXPORT xq_status xq_node_attribute_count(const xq_node* node, size_t* count);
/* The child with that number, from 0; XQ_END behind the last one. Linear in the number. */
XQUERY_EXPORT xq_status xq_node_child(const xq_node* node, size_t index, xq_node** child);
/* The value of an attribute, by its name as written; XQ_END where there is none. */
XQUERY_EXPORT xq_status xq_node_attribute(const xq_node* node, const char* name, size_t length,
                                          xq_text* value);
/* By local name and namespace; the empty URI is no namespace. */
XQUERY_EXPORT xq_status xq_node_attribute_ns(const xq_node* node, const char* uri,
                                             size_t uri_length, const char* local_name,
                                             size_t local_name_length, xq_text* value);

/* ---- order ----------------------------------------------------------------------------------- */

/* 1 when both handles refer to one node. */
XQUERY_EXPORT xq_status xq_node_is_same(const xq_node* a, const xq_node* b, int* is_same);
/* -1, 0 or 1: document order. XQ_MISMATCH for nodes that are not under one root. */
XQUERY_EXPORT xq_status xq_node_compare(const xq_node* a, const xq_node* b, int* order);

/* ---- writing --------------------------------------------------------------------------------- */

/* Flags. Without any what is written reads back as the same nodes. */
typedef int xq_writing;
enum {
  XQ_WRITE_XML = 0,
  XQ_WRITE_INDENTED = 1 /* elements on lines of their own, for people */
};
/* In UTF-8, with the namespace declarations that the piece needs; an attribute as name="value". */
XQUERY_EXPORT xq_status xq_node_xml(const xq_node* node, xq_writing flags, xq_text* xml);
/* In pieces of bounded size. XQ_HOST when the callback fails. */
XQUERY_EXPORT xq_status xq_node_write(const xq_node* node, xq_writing flags, xq_write write,
                                      void* data);

#ifdef __cplusplus
}
#endif

#endif
