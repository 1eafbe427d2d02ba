/* Documents from files, memory and callbacks. */
#include "Testing.h"

#include <stdio.h>
#include <stdlib.h>
#include <string.h>

static void check_root(const xq_node* document, const char* xml) {
  xq_text text = XQ_TEXT_INIT;
  CHECK_OK(xq_node_xml(document, XQ_WRITE_XML, &text));
  CHECK(strstr(text.data, xml) != NULL);
  CHECK_OK(xq_text_free(&text));
}

static void memory_is_read(void) {
  xq_node* document = NULL;
  CHECK_OK(xq_read_memory("<a> <b/></a>", 12, XQ_READ_XML, &document, NULL));
  check_root(document, "<a> <b/></a>");
  CHECK_OK(xq_node_free(document));
}

static void flags_say_how(void) {
  xq_node* document = NULL;
  const char spaced[] = "<a> <b/></a>";
  const char section[] = "<a><![CDATA[<]]></a>";
  CHECK_OK(xq_read_memory(spaced, strlen(spaced), XQ_READ_STRIP_SPACE, &document, NULL));
  check_root(document, "<a><b/></a>");
  CHECK_OK(xq_node_free(document));
  CHECK_OK(xq_read_memory(section, strlen(section), XQ_READ_CDATA, &document, NULL));
  check_root(document, section);
  CHECK_OK(xq_node_free(document));
  CHECK_OK(xq_read_memory("<p>a<br>b", 9, XQ_READ_HTML, &document, NULL));
  check_answer("count(/*/*)", document, "2");
  CHECK_OK(xq_node_free(document));
  CHECK_STATUS(xq_read_memory("<a/>", 4, 8, &document, NULL), XQ_USAGE);
  CHECK_STATUS(xq_read_memory("<a/>", 4, -1, &document, NULL), XQ_USAGE);
  CHECK(document == NULL);
}

static void what_is_malformed_has_its_place(void) {
  xq_node* document = NULL;
  xq_error* error = NULL;
  xq_category category = -1;
  xq_string message;
  xq_string description;
  int64_t line = 0;
  int64_t column = 0;
  CHECK_STATUS(xq_read_memory("<a>\n<b></a>", 11, XQ_READ_XML, &document, &error), XQ_INPUT);
  CHECK(document == NULL);
  CHECK_OK(xq_error_category(error, &category));
  CHECK_NUMBER(category, XQ_CATEGORY_INPUT);
  CHECK_OK(xq_error_line(error, &line, &column));
  CHECK_NUMBER(line, 2);
  CHECK(column > 0);
  CHECK_OK(xq_error_message(error, &message));
  CHECK(message.length > 5);
  CHECK_OK(xq_error_description(error, &description));
  CHECK_BEGINS(description, "line 2, column ");
  CHECK_STATUS(xq_error_place(error, &(xq_place){{"", 0}, 0, 0, 0, {"", 0}}), XQ_END);
  CHECK_OK(xq_error_free(error));
  CHECK_STATUS(xq_read_memory("", 0, XQ_READ_XML, &document, NULL), XQ_INPUT);
  CHECK_STATUS(xq_read_memory(NULL, 0, XQ_READ_XML, &document, NULL), XQ_INPUT);
  CHECK_STATUS(xq_read_memory(NULL, 1, XQ_READ_XML, &document, NULL), XQ_USAGE);
  CHECK_STATUS(xq_read_memory("<a/>", XQ_NUL, XQ_READ_XML, &document, NULL), XQ_USAGE);
}

static void a_file_is_read(void) {
  char path[] = "capi-document.xml";
  FILE* file = fopen(path, "w");
  xq_node* document = NULL;
  CHECK(file != NULL && fputs("<a>file</a>", file) >= 0);
  fclose(file);
  CHECK_OK(xq_read_file(path, XQ_NUL, XQ_READ_XML, &document, NULL));
  check_answer("string(/a)", document, "file");
  CHECK_OK(xq_node_free(document));
  CHECK(remove(path) == 0);
}

static void a_file_that_is_not_there_is_an_error(void) {
  xq_node* document = NULL;
  xq_error* error = NULL;
  xq_string description;
  int64_t line = 1;
  int64_t column = 1;
  CHECK_STATUS(xq_read_file("/nowhere.xml", XQ_NUL, XQ_READ_XML, &document, &error), XQ_INPUT);
  CHECK_OK(xq_error_description(error, &description));
  CHECK_TEXT(description, "/nowhere.xml: No such file or directory");
  CHECK_STATUS(xq_error_line(error, &line, &column), XQ_END);
  CHECK_NUMBER(line, 0);
  CHECK_OK(xq_error_free(error));
  CHECK_STATUS(xq_read_file("a\0b", 3, XQ_READ_XML, &document, &error), XQ_USAGE);
  CHECK_STATUS(xq_read_file(NULL, 0, XQ_READ_XML, &document, &error), XQ_USAGE);
  CHECK(error == NULL);
}

typedef struct source {
  const char* text;
  size_t at;
  size_t piece;
  size_t fails_at;
  int calls_after_end;
  int is_over;
} source;

static ptrdiff_t read_source(void* data, char* buffer, size_t size) {
  source* from = (source*)data;
  size_t left = strlen(from->text) - from->at;
  size_t count = from->piece < size ? from->piece : size;
  if (from->is_over) from->calls_after_end++;
  if (from->at >= from->fails_at) {
    from->is_over = 1;
    return -1;
  }
  if (count > left) count = left;
  memcpy(buffer, from->text + from->at, count);
  from->at += count;
  if (count == 0) from->is_over = 1;
  return (ptrdiff_t)count;
}

static void a_callback_is_read_in_pieces_of_any_size(void) {
  size_t piece;
  for (piece = 1; piece < 20; piece++) {
    source from = {"<a><b>x</b>\xC3\xA4</a>", 0, 0, (size_t)-1, 0, 0};
    xq_node* document = NULL;
    from.piece = piece;
    CHECK_OK(xq_read_input(read_source, &from, XQ_READ_XML, &document, NULL));
    check_root(document, "<a><b>x</b>\xC3\xA4</a>");
    CHECK_NUMBER(from.calls_after_end, 0);
    CHECK_OK(xq_node_free(document));
  }
}

static void a_callback_that_fails_gives_a_status(void) {
  size_t at;
  const char text[] = "<a><b>x</b></a>";
  for (at = 0; at < strlen(text); at++) {
    source from = {NULL, 0, 1, 0, 0, 0};
    xq_node* document = NULL;
    xq_error* error = NULL;
    from.text = text;
    from.fails_at = at;
    CHECK_STATUS(xq_read_input(read_source, &from, XQ_READ_XML, &document, &error), XQ_HOST);
    CHECK(document == NULL && error == NULL);
    CHECK_NUMBER(from.calls_after_end, 0);
  }
}

static ptrdiff_t read_too_much(void* data, char* buffer, size_t size) {
  (void)data, (void)buffer;
  return (ptrdiff_t)size + 1;
}

static void a_callback_that_claims_too_much_has_failed(void) {
  xq_node* document = NULL;
  CHECK_STATUS(xq_read_input(read_too_much, NULL, XQ_READ_XML, &document, NULL), XQ_HOST);
  CHECK_STATUS(xq_read_input(NULL, NULL, XQ_READ_XML, &document, NULL), XQ_USAGE);
}

static void malformed_text_of_a_callback_has_its_place(void) {
  source from = {"<a>\n<", 0, 2, (size_t)-1, 0, 0};
  xq_node* document = NULL;
  xq_error* error = NULL;
  int64_t line = 0;
  int64_t column = 0;
  CHECK_STATUS(xq_read_input(read_source, &from, XQ_READ_XML, &document, &error), XQ_INPUT);
  CHECK_OK(xq_error_line(error, &line, &column));
  CHECK_NUMBER(line, 2);
  CHECK_OK(xq_error_free(error));
}

static void a_document_has_a_uri_where_a_query_loaded_it(void) {
  xq_node* document = document_of("<a/>");
  xq_text uri = XQ_TEXT_INIT;
  CHECK_STATUS(xq_node_document_uri(document, &uri), XQ_END);
  CHECK_TEXT(uri, "");
  CHECK_OK(xq_node_free(document));
  CHECK_OK(xq_text_free(&uri));
}

const test_case documents_tests[] = {
    {"memory is read", memory_is_read},
    {"flags say how", flags_say_how},
    {"what is malformed has its place", what_is_malformed_has_its_place},
    {"a file is read", a_file_is_read},
    {"a file that is not there is an error", a_file_that_is_not_there_is_an_error},
    {"a callback is read in pieces of any size", a_callback_is_read_in_pieces_of_any_size},
    {"a callback that fails gives a status", a_callback_that_fails_gives_a_status},
    {"a callback that claims too much has failed", a_callback_that_claims_too_much_has_failed},
    {"malformed text of a callback has its place", malformed_text_of_a_callback_has_its_place},
    {"a document has a URI where a query loaded it", a_document_has_a_uri_where_a_query_loaded_it},
    TEST_END,
};
