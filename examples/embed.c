#include <xquery/capi.h>

#include <stdio.h>

int main(int argc, char** argv) {
  xq_node* books = NULL;
  xq_query* query = NULL;
  xq_context* context = NULL;
  xq_value* items = NULL;
  xq_error* error = NULL;
  xq_text text = XQ_TEXT_INIT;
  xq_string why;
  size_t at = XQ_BEFORE;
  const char* file = argc > 1 ? argv[1] : "examples/books.xml";
  xq_status status = xq_read_file(file, XQ_NUL, XQ_READ_XML, &books, &error);
  if (!status) status = xq_compile("//book[price > 10]/title", XQ_NUL, NULL, &query, &error);
  if (!status) status = xq_context_new(&context);
  if (!status) status = xq_context_set_node(context, books);
  if (!status) status = xq_evaluate(context, query, &items, &error);
  while (!status && xq_value_next(items, &at) == XQ_OK) {
    if (!xq_value_string(items, at, &text)) puts(text.data);
  }
  if (error && !xq_error_description(error, &why)) fprintf(stderr, "%s\n", why.data);
  xq_text_free(&text);
  xq_error_free(error);
  xq_value_free(items);
  xq_context_free(context);
  xq_query_free(query);
  xq_node_free(books);
  return status;
}
