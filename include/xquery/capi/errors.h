/* Why a function answered XQ_ERROR or XQ_INPUT. */
#ifndef XQUERY_CAPI_ERRORS_H
#define XQUERY_CAPI_ERRORS_H

#include "xquery/capi/basics.h"

#ifdef __cplusplus
extern "C" {
#endif

/* Errors are immutable: any number of threads may look at one. */
typedef struct xq_error xq_error;

/* What kind of failure it is, so that nobody has to read texts, which a query can imitate. */
typedef int xq_category;
enum {
  XQ_CATEGORY_SYNTAX = 0,  /* the text of the query */
  XQ_CATEGORY_NAMES = 1,   /* names that are not declared, not resolved or declared twice */
  XQ_CATEGORY_TYPES = 2,   /* a value of another type or number of items than is asked for */
  XQ_CATEGORY_VALUES = 3,  /* a value of the right type that cannot be used */
  XQ_CATEGORY_LOADING = 4, /* a module that cannot be had */
  XQ_CATEGORY_LIMIT = 5,   /* a limit of the host or of the engine was reached */
  XQ_CATEGORY_RAISED_BY_QUERY = 6, /* by fn:error */
  XQ_CATEGORY_INTERNAL = 7,        /* how the engine is used */
  XQ_CATEGORY_INPUT = 8            /* a document that cannot be read or is malformed */
};

/* A piece of the text of a query or of a library module, counted in characters from 1: code points,
 * of which a tab is one. */
typedef struct xq_place {
  xq_string module_url; /* empty for the query itself */
  int64_t line;
  int64_t column;
  int64_t length;        /* of a piece on several lines that of all of them */
  xq_string source_line; /* the text of the line, without its end */
} xq_place;

/* A call of a declared function. */
typedef struct xq_call {
  xq_string function; /* its name as the call has it, prefix included */
  int has_place;      /* 0 where `place` is not known, and empty */
  xq_place place;     /* of the call */
} xq_call;

/* All of these answer XQ_OK or XQ_USAGE unless said otherwise; what they point to is good as long
 * as the error is. */

/* The number, as docs/errors.md lists them: 0 for limits, for documents that cannot be read and for
 * what a query raises. */
XQUERY_EXPORT xq_status xq_error_number(const xq_error* error, int64_t* number);
XQUERY_EXPORT xq_status xq_error_category(const xq_error* error, xq_category* category);
/* The message alone. */
XQUERY_EXPORT xq_status xq_error_message(const xq_error* error, xq_string* message);
/* All in one for people: `XQueryError:8 - "reference to ..." at line:3`, of a document
 * "line 3, column 7: " and what is wrong there. */
XQUERY_EXPORT xq_status xq_error_description(const xq_error* error, xq_string* description);
/* The line from 1; XQ_END, and 0, where none is known. Of a document that is malformed the column
 * is known as well, of a query xq_error_place knows more. */
XQUERY_EXPORT xq_status xq_error_line(const xq_error* error, int64_t* line, int64_t* column);
/* The innermost expression that was being evaluated, or what a compilation could not use. XQ_END
 * where that is not known. */
XQUERY_EXPORT xq_status xq_error_place(const xq_error* error, xq_place* place);
/* The calls of declared functions that led there, the innermost first, by their number from 0;
 * XQ_END behind the last one. Of more than 64 these are the 32 innermost and the 32 outermost. */
XQUERY_EXPORT xq_status xq_error_call(const xq_error* error, size_t index, xq_call* call);
/* How many calls are missing between those. */
XQUERY_EXPORT xq_status xq_error_calls_left_out(const xq_error* error, int64_t* count);
/* The error that was found after this one; XQ_END where there is none. A query that does not
 * compile may have several, anything else has one. The caller owns it, and each keeps itself. */
XQUERY_EXPORT xq_status xq_error_next(const xq_error* error, xq_error** next);

/* Null is let pass. XQ_USAGE for a handle of another kind, which is left as it is. */
XQUERY_EXPORT xq_status xq_error_free(xq_error* error);

#ifdef __cplusplus
}
#endif

#endif
