/* Where the time of evaluations goes. */
#ifndef XQUERY_CAPI_PROFILE_H
#define XQUERY_CAPI_PROFILE_H

#include "xquery/capi/basics.h"
#include "xquery/capi/queries.h"

#ifdef __cplusplus
extern "C" {
#endif

/* A sum of evaluations of one query that was compiled with XQ_WAY_PROFILED. For one thread at a
 * time. */
typedef struct xq_profile xq_profile;

/* Of no evaluation yet. XQ_MISMATCH for a query that was compiled otherwise. The profile keeps the
 * query. */
XQUERY_EXPORT xq_status xq_profile_new(const xq_query* query, xq_profile** profile);
/* Null is let pass. */
XQUERY_EXPORT xq_status xq_profile_free(xq_profile* profile);

/* Adds all evaluations of the query against the context so far, to be called once for a context,
 * between evaluations. XQ_MISMATCH where another query was the last one that was profiled there. */
XQUERY_EXPORT xq_status xq_profile_add(xq_profile* profile, const xq_context* context);
XQUERY_EXPORT xq_status xq_profile_evaluations(const xq_profile* profile, uint64_t* count);

typedef int xq_profile_format;
enum {
  XQ_PROFILE_JSON = 0, /* docs/profile.md */
  XQ_PROFILE_TEXT = 1, /* a tree with counts and times in columns */
  XQ_PROFILE_HTML = 2  /* one page that needs no network */
};
/* The name of the query, such as its file, is shown; it may be empty. */
XQUERY_EXPORT xq_status xq_profile_describe(const xq_profile* profile, xq_profile_format format,
                                            const char* name, size_t length, xq_text* text);

#ifdef __cplusplus
}
#endif

#endif
