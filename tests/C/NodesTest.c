/* Nodes: what they are, where they lead, their order, and how they are written. */
#include "Testing.h"

#include <string.h>

static const char sample[] =
    "<r xmlns:p='urn:p' p:a='1' b='2'>text<?pi data?><!--note--><p:c><d/>e</p:c></r>";

/* The node that a path leads to in the sample. */
static xq_node* node_at(const char* path) {
  xq_node* document = document_of(sample);
  static const xq_namespace namespaces[] = {{"p", "urn:p"}};
  xq_query* query = compiled(path);
  xq_context* context = NULL;
  xq_value* items = NULL;
  xq_node* node = NULL;
  CHECK_OK(xq_context_new_with_namespaces(namespaces, 1, &context));
  CHECK_OK(xq_context_set_node(context, document));
  CHECK_OK(xq_evaluate(context, query, &items, NULL));
  CHECK_OK(xq_value_node(items, 0, &node));
  CHECK_OK(xq_value_free(items));
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_node_free(document));
  return node;
}

/* A name of null is none. */
static void check_node(xq_node* node, xq_kind kind, const char* name, const char* string) {
  xq_kind found = 0;
  xq_text text = XQ_TEXT_INIT;
  CHECK_OK(xq_node_kind(node, &found));
  CHECK_NUMBER(found, kind);
  CHECK_STATUS(xq_node_name(node, &text), name ? XQ_OK : XQ_END);
  CHECK_TEXT(text, name ? name : "");
  CHECK_OK(xq_node_string(node, &text));
  CHECK_TEXT(text, string);
  CHECK_OK(xq_text_free(&text));
  CHECK_OK(xq_node_free(node));
}

static void every_kind_has_its_name_and_text(void) {
  check_node(document_of(sample), XQ_KIND_DOCUMENT, NULL, "texte");
  check_node(node_at("/r"), XQ_KIND_ELEMENT, "r", "texte");
  check_node(node_at("/r/p:c"), XQ_KIND_ELEMENT, "p:c", "e");
  check_node(node_at("/r/@*[1]"), XQ_KIND_ATTRIBUTE, "p:a", "1");
  check_node(node_at("/r/text()"), XQ_KIND_TEXT, NULL, "text");
  check_node(node_at("/r/comment()"), XQ_KIND_COMMENT, NULL, "note");
  check_node(node_at("/r/processing-instruction()"), XQ_KIND_PROCESSING_INSTRUCTION, "pi", "data");
}

static void names_have_parts(void) {
  xq_node* node = node_at("/r/p:c");
  xq_text text = XQ_TEXT_INIT;
  CHECK_OK(xq_node_local_name(node, &text));
  CHECK_TEXT(text, "c");
  CHECK_OK(xq_node_prefix(node, &text));
  CHECK_TEXT(text, "p");
  CHECK_OK(xq_node_namespace_uri(node, &text));
  CHECK_TEXT(text, "urn:p");
  CHECK_OK(xq_node_path(node, &text));
  CHECK_TEXT(text, "/r[1]/p:c[1]");
  CHECK_OK(xq_node_move(node, XQ_STEP_FIRST_CHILD));
  CHECK_STATUS(xq_node_namespace_uri(node, &text), XQ_END);
  CHECK_TEXT(text, "");
  CHECK_OK(xq_node_free(node));
  CHECK_OK(xq_text_free(&text));
}

/* Where a step leads from a node, by its path; null for nowhere. */
static void check_step(const char* from, xq_step step, const char* to) {
  xq_node* node = node_at(from);
  xq_node* there = NULL;
  xq_text path = XQ_TEXT_INIT;
  CHECK_STATUS(xq_node_step(node, step, &there), to ? XQ_OK : XQ_END);
  CHECK((there != NULL) == (to != NULL));
  if (there && CHECK_OK(xq_node_path(there, &path))) CHECK_TEXT(path, to);
  /* Moving leads there as well, or stays. */
  CHECK_OK(xq_node_path(node, &path));
  CHECK_STATUS(xq_node_move(node, step), to ? XQ_OK : XQ_END);
  if (to) {
    int is_same = 0;
    CHECK_OK(xq_node_is_same(node, there, &is_same));
    CHECK_NUMBER(is_same, 1);
  } else {
    xq_text after = XQ_TEXT_INIT;
    CHECK_OK(xq_node_path(node, &after));
    CHECK_TEXT(after, path.data);
    CHECK_OK(xq_text_free(&after));
  }
  CHECK_OK(xq_text_free(&path));
  CHECK_OK(xq_node_free(there));
  CHECK_OK(xq_node_free(node));
}

static void steps_lead_where_they_say(void) {
  check_step("/r", XQ_STEP_PARENT, "/");
  check_step("/", XQ_STEP_PARENT, NULL);
  check_step("/r/@b", XQ_STEP_PARENT, "/r[1]");
  check_step("/r", XQ_STEP_FIRST_CHILD, "/r[1]/text()[1]");
  check_step("/r/p:c/d", XQ_STEP_FIRST_CHILD, NULL);
  check_step("/r/@b", XQ_STEP_FIRST_CHILD, NULL);
  check_step("/r", XQ_STEP_LAST_CHILD, "/r[1]/p:c[1]");
  check_step("/r/text()", XQ_STEP_NEXT_SIBLING, "/r[1]/processing-instruction()[1]");
  check_step("/r/p:c", XQ_STEP_NEXT_SIBLING, NULL);
  check_step("/r/@b", XQ_STEP_NEXT_SIBLING, NULL);
  check_step("/r/p:c", XQ_STEP_PREVIOUS_SIBLING, "/r[1]/comment()[1]");
  check_step("/r/text()", XQ_STEP_PREVIOUS_SIBLING, NULL);
  check_step("/r/comment()", XQ_STEP_NEXT, "/r[1]/p:c[1]");
  check_step("/r/p:c/text()", XQ_STEP_NEXT, NULL);
  check_step("/r/p:c/d", XQ_STEP_ROOT, "/");
  check_step("/r", XQ_STEP_FIRST_ATTRIBUTE, "/r[1]/@p:a");
  check_step("/r/p:c", XQ_STEP_FIRST_ATTRIBUTE, NULL);
  check_step("/r/text()", XQ_STEP_FIRST_ATTRIBUTE, NULL);
  check_step("/r/@*[1]", XQ_STEP_NEXT_ATTRIBUTE, "/r[1]/@b");
  check_step("/r/@b", XQ_STEP_NEXT_ATTRIBUTE, NULL);
  check_step("/r", XQ_STEP_NEXT_ATTRIBUTE, NULL);
  check_step("/r", XQ_STEP_FIRST_NAMESPACE, "/r[1]/namespace::p");
  check_step("/r/p:c", XQ_STEP_FIRST_NAMESPACE, NULL);
  check_step("/r", XQ_STEP_NEXT_NAMESPACE, NULL);
}

static void steps_that_there_are_not_are_wrong_use(void) {
  xq_node* node = document_of(sample);
  xq_node* there = NULL;
  CHECK_STATUS(xq_node_step(node, -1, &there), XQ_USAGE);
  CHECK_STATUS(xq_node_step(node, XQ_STEP_NEXT_NAMESPACE + 1, &there), XQ_USAGE);
  CHECK_STATUS(xq_node_move(node, -1), XQ_USAGE);
  CHECK_STATUS(xq_node_move(node, XQ_STEP_NEXT_NAMESPACE + 1), XQ_USAGE);
  CHECK_OK(xq_node_free(node));
}

static void namespaces_have_prefix_and_uri(void) {
  xq_node* node = node_at("/r");
  CHECK_OK(xq_node_move(node, XQ_STEP_FIRST_NAMESPACE));
  CHECK_STATUS(xq_node_move(node, XQ_STEP_NEXT_NAMESPACE), XQ_END);
  check_node(node, XQ_KIND_NAMESPACE, "p", "urn:p");
}

static void children_are_counted_and_reached_by_number(void) {
  xq_node* node = node_at("/r");
  xq_node* child = NULL;
  size_t count = 0;
  CHECK_OK(xq_node_child_count(node, &count));
  CHECK_NUMBER(count, 4);
  CHECK_OK(xq_node_attribute_count(node, &count));
  CHECK_NUMBER(count, 2);
  CHECK_OK(xq_node_child(node, 3, &child));
  check_node(child, XQ_KIND_ELEMENT, "p:c", "e");
  CHECK_STATUS(xq_node_child(node, 4, &child), XQ_END);
  CHECK_STATUS(xq_node_child(node, (size_t)-1, &child), XQ_END);
  CHECK(child == NULL);
  CHECK_OK(xq_node_move(node, XQ_STEP_FIRST_ATTRIBUTE));
  CHECK_OK(xq_node_child_count(node, &count));
  CHECK_NUMBER(count, 0);
  CHECK_OK(xq_node_attribute_count(node, &count));
  CHECK_NUMBER(count, 0);
  CHECK_OK(xq_node_free(node));
}

static void attributes_are_found_by_name(void) {
  xq_node* node = node_at("/r");
  xq_text text = XQ_TEXT_INIT;
  CHECK_OK(xq_node_attribute(node, "b", XQ_NUL, &text));
  CHECK_TEXT(text, "2");
  CHECK_OK(xq_node_attribute(node, "p:a", 3, &text));
  CHECK_TEXT(text, "1");
  CHECK_STATUS(xq_node_attribute(node, "a", XQ_NUL, &text), XQ_END);
  CHECK_TEXT(text, "");
  CHECK_STATUS(xq_node_attribute(node, "\xFF", XQ_NUL, &text), XQ_END);
  CHECK_STATUS(xq_node_attribute(node, NULL, 1, &text), XQ_USAGE);
  CHECK_OK(xq_node_attribute_ns(node, "urn:p", XQ_NUL, "a", XQ_NUL, &text));
  CHECK_TEXT(text, "1");
  CHECK_OK(xq_node_attribute_ns(node, "", 0, "b", 1, &text));
  CHECK_TEXT(text, "2");
  CHECK_STATUS(xq_node_attribute_ns(node, NULL, 0, "a", 1, &text), XQ_END);
  CHECK_STATUS(xq_node_attribute_ns(node, NULL, 1, "a", 1, &text), XQ_USAGE);
  CHECK_OK(xq_node_move(node, XQ_STEP_PARENT));
  CHECK_STATUS(xq_node_attribute(node, "b", XQ_NUL, &text), XQ_END);
  CHECK_OK(xq_node_free(node));
  CHECK_OK(xq_text_free(&text));
}

static void nodes_keep_their_document(void) {
  xq_node* document = document_of("<a><b>kept</b></a>");
  xq_node* node = NULL;
  xq_node* other = NULL;
  CHECK_OK(xq_node_step(document, XQ_STEP_FIRST_CHILD, &node));
  CHECK_OK(xq_node_share(node, &other));
  CHECK_OK(xq_node_free(document));
  CHECK_OK(xq_node_free(node));
  CHECK_OK(xq_node_move(other, XQ_STEP_FIRST_CHILD));
  check_node(other, XQ_KIND_ELEMENT, "b", "kept");
}

static void order_is_that_of_the_document(void) {
  xq_node* document = document_of(sample);
  xq_node* other = document_of(sample);
  xq_node* child = NULL;
  int order = 7;
  int is_same = 7;
  CHECK_OK(xq_node_step(document, XQ_STEP_FIRST_CHILD, &child));
  CHECK_OK(xq_node_compare(document, child, &order));
  CHECK_NUMBER(order, -1);
  CHECK_OK(xq_node_compare(child, document, &order));
  CHECK_NUMBER(order, 1);
  CHECK_OK(xq_node_compare(child, child, &order));
  CHECK_NUMBER(order, 0);
  CHECK_STATUS(xq_node_compare(child, other, &order), XQ_MISMATCH);
  CHECK_NUMBER(order, 0);
  CHECK_STATUS(xq_node_compare(child, NULL, &order), XQ_USAGE);
  CHECK_OK(xq_node_is_same(document, other, &is_same));
  CHECK_NUMBER(is_same, 0);
  CHECK_OK(xq_node_move(child, XQ_STEP_PARENT));
  CHECK_OK(xq_node_is_same(document, child, &is_same));
  CHECK_NUMBER(is_same, 1);
  CHECK_OK(xq_node_free(child));
  CHECK_OK(xq_node_free(other));
  CHECK_OK(xq_node_free(document));
}

typedef struct sink {
  char text[400];
  size_t length;
  int fails;
  int calls;
} sink;

static int write_to(void* data, const char* bytes, size_t length) {
  sink* to = (sink*)data;
  to->calls++;
  if (to->fails || to->length + length >= sizeof(to->text)) return 1;
  memcpy(to->text + to->length, bytes, length);
  to->length += length;
  to->text[to->length] = 0;
  return 0;
}

static void nodes_are_written_as_xml(void) {
  xq_node* node = node_at("/r/p:c");
  xq_text text = XQ_TEXT_INIT;
  sink to = {"", 0, 0, 0};
  CHECK_OK(xq_node_xml(node, XQ_WRITE_XML, &text));
  CHECK_TEXT(text, "<p:c xmlns:p=\"urn:p\"><d/>e</p:c>");
  CHECK_OK(xq_node_write(node, XQ_WRITE_XML, write_to, &to));
  CHECK(strcmp(to.text, text.data) == 0);
  CHECK_OK(xq_node_free(node));
  node = document_of("<a><b/><c>d</c></a>");
  CHECK_OK(xq_node_move(node, XQ_STEP_FIRST_CHILD));
  CHECK_OK(xq_node_xml(node, XQ_WRITE_INDENTED, &text));
  CHECK_BEGINS(text, "<a>\n  <b/>\n  <c>d</c>\n</a>");
  CHECK_STATUS(xq_node_xml(node, 2, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_xml(node, -1, &text), XQ_USAGE);
  CHECK_STATUS(xq_node_write(node, 2, write_to, &to), XQ_USAGE);
  CHECK_OK(xq_text_free(&text));
  CHECK_OK(xq_node_free(node));
}

static int write_and_free(void* data, const char* bytes, size_t length) {
  xq_node** node = (xq_node**)data;
  (void)bytes, (void)length;
  CHECK_OK(xq_node_free(*node));
  *node = NULL;
  return 0;
}

static void a_writer_may_free_the_node(void) {
  char xml[20000] = "<a>";
  xq_node* node;
  while (strlen(xml) + 60 < sizeof(xml)) strcat(xml, "<b>some text that has to be written</b>");
  strcat(xml, "</a>");
  node = document_of(xml);
  CHECK_OK(xq_node_write(node, XQ_WRITE_XML, write_and_free, &node));
  CHECK(node == NULL);
}

static void a_failing_writer_gives_a_status(void) {
  xq_node* node = document_of(sample);
  sink to = {"", 0, 1, 0};
  CHECK_STATUS(xq_node_write(node, XQ_WRITE_XML, write_to, &to), XQ_HOST);
  CHECK_NUMBER(to.calls, 1);
  CHECK_STATUS(xq_node_write(node, XQ_WRITE_INDENTED, write_to, &to), XQ_HOST);
  CHECK_NUMBER(to.calls, 2);
  CHECK_STATUS(xq_node_write(node, XQ_WRITE_XML, NULL, NULL), XQ_USAGE);
  CHECK_OK(xq_node_free(node));
}

const test_case nodes_tests[] = {
    {"every kind has its name and text", every_kind_has_its_name_and_text},
    {"names have parts", names_have_parts},
    {"steps lead where they say", steps_lead_where_they_say},
    {"steps that there are not are wrong use", steps_that_there_are_not_are_wrong_use},
    {"namespaces have prefix and URI", namespaces_have_prefix_and_uri},
    {"children are counted and reached by number", children_are_counted_and_reached_by_number},
    {"attributes are found by name", attributes_are_found_by_name},
    {"nodes keep their document", nodes_keep_their_document},
    {"order is that of the document", order_is_that_of_the_document},
    {"nodes are written as XML", nodes_are_written_as_xml},
    {"a writer may free the node", a_writer_may_free_the_node},
    {"a failing writer gives a status", a_failing_writer_gives_a_status},
    TEST_END,
};
