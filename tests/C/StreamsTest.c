/* Documents that are evaluated record by record. */
#include "Testing.h"

#include <stdio.h>
#include <string.h>

static const char records[] = "<a><b>1</b><b>2</b><b>3</b></a>";

typedef struct receiver {
  char all[100];
  int count;
  int ends_at;
  int fails_at;
  xq_node* kept;
  int keeps;
} receiver;

static xq_status receive(void* data, const xq_value* item) {
  receiver* by = (receiver*)data;
  xq_text text = XQ_TEXT_INIT;
  by->count++;
  CHECK_OK(xq_value_string(item, 0, &text));
  strcat(by->all, text.data);
  CHECK_OK(xq_text_free(&text));
  CHECK_STATUS(xq_value_free((xq_value*)item), XQ_USAGE);
  if (by->keeps && !by->kept) CHECK_OK(xq_value_node(item, 0, &by->kept));
  if (by->count == by->fails_at) return XQ_MEMORY;
  return by->count == by->ends_at ? XQ_END : XQ_OK;
}

static xq_status stream_text(const char* query_text, const char* xml, receiver* by,
                             xq_error** error) {
  xq_query* query = compiled_in(XQ_WAY_STREAMED, query_text);
  xq_context* context = NULL;
  xq_status status;
  CHECK_OK(xq_context_new(&context));
  status = xq_stream_input(context, query, read_string, &xml, XQ_READ_XML, receive, by, error);
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
  return status;
}

static void items_come_one_by_one(void) {
  receiver by = {"", 0, 0, 0, NULL, 0};
  CHECK_OK(stream_text("for $b in /a/b return string($b * 2)", records, &by, NULL));
  CHECK(strcmp(by.all, "246") == 0);
  CHECK_NUMBER(by.count, 3);
}

static void a_file_is_streamed(void) {
  char path[] = "capi-stream.xml";
  FILE* file = fopen(path, "w");
  receiver by = {"", 0, 0, 0, NULL, 0};
  xq_query* query = compiled_in(XQ_WAY_STREAMED, "/a/b");
  xq_context* context = NULL;
  xq_error* error = NULL;
  CHECK(file != NULL && fputs(records, file) >= 0);
  fclose(file);
  CHECK_OK(xq_context_new(&context));
  CHECK_OK(xq_stream_file(context, query, path, XQ_NUL, XQ_READ_XML, receive, &by, NULL));
  CHECK(strcmp(by.all, "123") == 0);
  CHECK(remove(path) == 0);
  CHECK_STATUS(xq_stream_file(context, query, path, XQ_NUL, XQ_READ_XML, receive, &by, &error),
               XQ_INPUT);
  CHECK(error != NULL);
  CHECK_OK(xq_error_free(error));
  CHECK_STATUS(xq_stream_file(context, query, NULL, 0, XQ_READ_XML, receive, &by, NULL), XQ_USAGE);
  CHECK_STATUS(xq_stream_file(context, query, "a", 1, XQ_READ_XML, NULL, NULL, NULL), XQ_USAGE);
  CHECK_STATUS(xq_stream_file(context, query, "a", 1, 99, receive, &by, NULL), XQ_USAGE);
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
}

static void the_receiver_ends_or_fails(void) {
  receiver ending = {"", 0, 2, 0, NULL, 0};
  receiver failing = {"", 0, 0, 2, NULL, 0};
  xq_error* error = NULL;
  CHECK_OK(stream_text("/a/b", records, &ending, &error));
  CHECK(strcmp(ending.all, "12") == 0);
  CHECK_STATUS(stream_text("/a/b", records, &failing, &error), XQ_HOST);
  CHECK(strcmp(failing.all, "12") == 0);
  CHECK(error == NULL);
}

static void malformed_text_is_an_error_after_the_items_before(void) {
  receiver by = {"", 0, 0, 0, NULL, 0};
  xq_error* error = NULL;
  xq_category category = -1;
  CHECK_STATUS(stream_text("/a/b", "<a><b>1</b><b>2</c></a>", &by, &error), XQ_INPUT);
  CHECK_OK(xq_error_category(error, &category));
  CHECK_NUMBER(category, XQ_CATEGORY_INPUT);
  CHECK(strcmp(by.all, "1") == 0);
  CHECK_OK(xq_error_free(error));
}

static void an_error_of_the_query_ends_the_stream(void) {
  receiver by = {"", 0, 0, 0, NULL, 0};
  xq_error* error = NULL;
  int64_t number = -1;
  CHECK_STATUS(stream_text("for $b in /a/b return 6 idiv ($b - 2)", records, &by, &error),
               XQ_ERROR);
  CHECK_OK(xq_error_number(error, &number));
  CHECK_NUMBER(number, 6);
  CHECK(strcmp(by.all, "-6") == 0);
  CHECK_OK(xq_error_free(error));
}

static void a_node_that_is_kept_ends_the_stream_and_stays_good(void) {
  receiver by = {"", 0, 0, 0, NULL, 1};
  xq_error* error = NULL;
  xq_string message;
  xq_text text = XQ_TEXT_INIT;
  CHECK_STATUS(stream_text("/a/b", records, &by, &error), XQ_ERROR);
  CHECK_OK(xq_error_message(error, &message));
  CHECK_TEXT(message, "a node of a stream is still referred to");
  CHECK_OK(xq_node_string(by.kept, &text));
  CHECK_TEXT(text, "1");
  CHECK_OK(xq_node_free(by.kept));
  CHECK_OK(xq_error_free(error));
  CHECK_OK(xq_text_free(&text));
}

static ptrdiff_t fail_to_read(void* data, char* buffer, size_t size) {
  (void)data, (void)buffer, (void)size;
  return -1;
}

static void a_reader_that_fails_gives_a_status(void) {
  xq_query* query = compiled_in(XQ_WAY_STREAMED, "/a/b");
  xq_query* other = compiled("/a/b");
  xq_context* context = NULL;
  xq_error* error = NULL;
  receiver by = {"", 0, 0, 0, NULL, 0};
  const char* text = records;
  CHECK_OK(xq_context_new(&context));
  CHECK_STATUS(xq_stream_input(context, query, fail_to_read, NULL, 0, receive, &by, &error),
               XQ_HOST);
  CHECK(error == NULL);
  CHECK_STATUS(xq_stream_input(context, query, NULL, NULL, 0, receive, &by, &error), XQ_USAGE);
  /* A query that was compiled otherwise. */
  CHECK_STATUS(xq_stream_input(context, other, read_string, &text, 0, receive, &by, &error),
               XQ_ERROR);
  CHECK(error != NULL);
  CHECK_OK(xq_error_free(error));
  CHECK_OK(xq_context_free(context));
  CHECK_OK(xq_query_free(query));
  CHECK_OK(xq_query_free(other));
}

const test_case streams_tests[] = {
    {"items come one by one", items_come_one_by_one},
    {"a file is streamed", a_file_is_streamed},
    {"the receiver ends or fails", the_receiver_ends_or_fails},
    {"malformed text is an error", malformed_text_is_an_error_after_the_items_before},
    {"an error of the query ends the stream", an_error_of_the_query_ends_the_stream},
    {"a node that is kept ends the stream", a_node_that_is_kept_ends_the_stream_and_stays_good},
    {"a reader that fails gives a status", a_reader_that_fails_gives_a_status},
    TEST_END,
};
