/* Compile a query once, evaluate it as often as you like. */
#ifndef XQUERY_CAPI_QUERIES_H
#define XQUERY_CAPI_QUERIES_H

#include "xquery/capi/basics.h"
#include "xquery/capi/errors.h"
#include "xquery/capi/nodes.h"
#include "xquery/capi/options.h"
#include "xquery/capi/values.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- queries --------------------------------------------------------------------------------- */

/* A compiled query is immutable. Any number of threads may evaluate it at once, each with a context
 * of its own. */
typedef struct xq_query xq_query;

/* The options may be null, for those of xq_options_new. XQ_ERROR with the first of the errors that
 * were found (xq_error_next has the others) where the query does not compile, text that is not
 * UTF-8 included; XQ_HOST where the host's loader fails. */
XQUERY_EXPORT xq_status xq_compile(const char* text, size_t length, const xq_options* options,
                                   xq_query** query, xq_error** error);
/* Null is let pass. A callback may free the query that it is called for; evaluations that other
 * threads have begun must have ended. */
XQUERY_EXPORT xq_status xq_query_free(xq_query* query);

typedef int xq_plan_format;
enum { XQ_PLAN_TEXT = 0, XQ_PLAN_JSON = 1, XQ_PLAN_DOT = 2 };
/* How the query is evaluated, for people: docs/plan.md. XQ_END unless it was compiled with
 * XQ_WAY_EXPLAINED. */
XQUERY_EXPORT xq_status xq_query_plan(const xq_query* query, xq_plan_format format, xq_text* plan);
/* How it is evaluated record by record. XQ_END unless it was compiled with XQ_WAY_STREAMED. */
XQUERY_EXPORT xq_status xq_query_stream_plan(const xq_query* query, xq_text* plan);

/* What a query does that its author hardly wants: docs/warnings.md. What is pointed to is good as
 * long as the query is. */
typedef struct xq_warning {
  xq_string identifier; /* "unknown-function" and so on; they stay what they are */
  xq_string text;       /* one line for people */
  xq_string name;       /* of the function, variable or prefix; empty for others */
  xq_string module_url; /* empty for the query itself */
  int64_t line;         /* from 1; 0 where it is not known */
  int64_t column;       /* in characters, from 1; 0 where it is not known */
} xq_warning;
/* Those of a query that was compiled with XQ_WAY_EXPLAINED, in the order of its text, by their
 * number from 0; XQ_END behind the last one, and for any other query. */
XQUERY_EXPORT xq_status xq_query_warning(const xq_query* query, size_t index, xq_warning* warning);

/* ---- contexts -------------------------------------------------------------------------------- */

/* What queries are evaluated against. It keeps, from one evaluation to the next, what the host set,
 * the context item, the clock (current-dateTime and its kin answer when it was first asked) and the
 * documents that queries named. Making one takes a microsecond: where evaluations must not learn of
 * each other each gets its own. For one thread at a time; a call while another one is under way, a
 * callback's own included, is XQ_USAGE. */
typedef struct xq_context xq_context;

/* A prefix, which may be empty, and the namespace for names that the query itself does not
 * resolve. */
typedef struct xq_namespace {
  const char* prefix; /* ends at its zero, as the URI does; neither may be null */
  const char* uri;
} xq_namespace;

XQUERY_EXPORT xq_status xq_context_new(xq_context** context);
XQUERY_EXPORT xq_status xq_context_new_with_namespaces(const xq_namespace* namespaces, size_t count,
                                                       xq_context** context);
/* Null is let pass. */
XQUERY_EXPORT xq_status xq_context_free(xq_context* context);

/* What each of the following evaluations may take and load; null for the options of
 * xq_options_new. */
XQUERY_EXPORT xq_status xq_context_set_options(xq_context* context, const xq_options* options);

/* The value of an external variable in the following evaluations, by its name as the query has it,
 * prefix:local, without the dollar sign. Names that a query does not know do not matter to it. */
XQUERY_EXPORT xq_status xq_context_set_variable(xq_context* context, const char* name,
                                                size_t length, const xq_value* value);
/* Of an untyped text, as the command's --var, XQ_MISMATCH where it holds a character that XML does
 * not have; of a node. */
XQUERY_EXPORT xq_status xq_context_set_variable_text(xq_context* context, const char* name,
                                                     size_t length, const char* text,
                                                     size_t text_length);
XQUERY_EXPORT xq_status xq_context_set_variable_node(xq_context* context, const char* name,
                                                     size_t length, const xq_node* node);
XQUERY_EXPORT xq_status xq_context_clear_variables(xq_context* context);

/* The context item of the following evaluations: a document, most of the time. */
XQUERY_EXPORT xq_status xq_context_set_node(xq_context* context, const xq_node* node);
/* The item at that position of a value; XQ_END behind the last one. */
XQUERY_EXPORT xq_status xq_context_set_item(xq_context* context, const xq_value* value, size_t at);

/* Hears fn:trace. The value and the label are the library's and good during the call. Anything but
 * 0 ends the evaluation with XQ_HOST. */
typedef int (*xq_trace)(void* data, const xq_value* value, const char* label, size_t length);
/* Null takes it away: then traces go to the log, where XQUERY_LOG asks for one. */
XQUERY_EXPORT xq_status xq_context_set_trace(xq_context* context, xq_trace trace, void* data,
                                             xq_destroy destroy);
/* Hears of documents that a query named and that are missing, malformed or forbidden, which are the
 * empty sequence to it: the URL, and the reason for people. Called once for each URL. Anything but
 * 0 ends the evaluation with XQ_HOST. */
typedef int (*xq_missing)(void* data, const char* url, size_t length, const char* reason,
                          size_t reason_length);
XQUERY_EXPORT xq_status xq_context_set_missing(xq_context* context, xq_missing missing, void* data,
                                               xq_destroy destroy);

/* ---- evaluating ------------------------------------------------------------------------------ */

/* The items of the result, which the caller owns; the empty value for the empty sequence and for a
 * query without a body. XQ_ERROR, with the error, when the evaluation fails or one of the items is
 * an error, as that of a malformed `<!-- a -- b -->`; XQ_HOST when a callback fails. */
XQUERY_EXPORT xq_status xq_evaluate(xq_context* context, const xq_query* query, xq_value** items,
                                    xq_error** error);

/* Hears each item of a stream's result as soon as it is known: a value of that one item, which is
 * the library's and good during the call. XQ_OK goes on; XQ_END ends the stream, with XQ_OK;
 * anything else ends it with XQ_HOST.
 *
 * A record is gone when the next one is read: node handles and copies of the value that were taken
 * during the call are to be freed before it returns, or the stream ends with an error; they stay
 * good all the same. */
typedef xq_status (*xq_receive)(void* data, const xq_value* item);
/* Evaluates a query that was compiled with XQ_WAY_STREAMED over a document that is read meanwhile,
 * in the memory of its largest record. XQ_OK when it has been read as far as it was of use;
 * otherwise XQ_ERROR, XQ_INPUT or XQ_HOST, after the items before the failure. `path` is as for
 * xq_read_file. */
XQUERY_EXPORT xq_status xq_stream_file(xq_context* context, const xq_query* query, const char* path,
                                       size_t length, xq_reading flags, xq_receive receive,
                                       void* data, xq_error** error);
XQUERY_EXPORT xq_status xq_stream_input(xq_context* context, const xq_query* query, xq_read read,
                                        void* read_data, xq_reading flags, xq_receive receive,
                                        void* data, xq_error** error);

#ifdef __cplusplus
}
#endif

#endif
