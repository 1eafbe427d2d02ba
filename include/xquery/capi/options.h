/* What a compilation or an evaluation may take, what it may load, and how it is ended from
 * elsewhere. */
#ifndef XQUERY_CAPI_OPTIONS_H
#define XQUERY_CAPI_OPTIONS_H

#include "xquery/capi/basics.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- cancellation ---------------------------------------------------------------------------- */

/* A flag that ends what goes on under it. It is shared with the options that it was given to and
 * with all that was set up by those, so it may be freed while they go on. */
typedef struct xq_cancel xq_cancel;

XQUERY_EXPORT xq_status xq_cancel_new(xq_cancel** cancel);
/* Ends the evaluations and compilations under the flag within a tenth of a second, and those that
 * begin while it is raised: XQ_ERROR, category XQ_CATEGORY_LIMIT, "limit: evaluation cancelled".
 * It is never lowered but by xq_cancel_lower.
 *
 * Both may be called from any thread at any time, also while others do, and from a signal handler:
 * they write one word and call nothing. Nobody may free the handle meanwhile. */
XQUERY_EXPORT xq_status xq_cancel_raise(const xq_cancel* cancel);
XQUERY_EXPORT xq_status xq_cancel_lower(const xq_cancel* cancel);
XQUERY_EXPORT xq_status xq_cancel_is_raised(const xq_cancel* cancel, int* is_raised);
/* Null is let pass. */
XQUERY_EXPORT xq_status xq_cancel_free(xq_cancel* cancel);

/* ---- options --------------------------------------------------------------------------------- */

/* Settings for compilations, contexts or both. Whoever takes them copies them: changes and freeing
 * them make no difference to what was set up before. The functions answer XQ_OK, XQ_USAGE,
 * XQ_MEMORY, and XQ_INPUT where they take text; a function that fails changes nothing. */
typedef struct xq_options xq_options;

/* Without limits, with leave to load files, http and https URLs, planned. */
XQUERY_EXPORT xq_status xq_options_new(xq_options** options);
/* Null is let pass. */
XQUERY_EXPORT xq_status xq_options_free(xq_options* options);

/* How a query is compiled; contexts do not look at it. */
typedef int xq_way;
enum {
  XQ_WAY_PLANNED = 0,   /* unless the environment variable XQUERY_PLAN is "0" at the time */
  XQ_WAY_PLAIN = 1,     /* evaluated step by step as it is written, to compare with */
  XQ_WAY_EXPLAINED = 2, /* planned; plan and warnings can be looked at */
  XQ_WAY_STREAMED = 3,  /* to be evaluated record by record, by xq_stream; XQ_ERROR, with the place
                           and the reason, where that cannot be done */
  XQ_WAY_PROFILED = 4   /* planned; evaluations are counted and timed, see xq_profile */
};
XQUERY_EXPORT xq_status xq_options_set_way(xq_options* options, xq_way way);

/* ---- limits ---------------------------------------------------------------------------------- */

/* Reaching one ends the compilation or the evaluation within a tenth of a second: XQ_ERROR,
 * category XQ_CATEGORY_LIMIT, with a message that begins with "limit: ". The context can be used
 * again at once. Two hold always: nesting, by the stack of the calling thread, and the memory of
 * the machine. */

/* How long one of them may take, from its beginning; 0 or less ends it at once. */
XQUERY_EXPORT xq_status xq_options_set_timeout(xq_options* options, int64_t nanoseconds);
/* The end of all of them, from the time of this call. With a timeout the earlier one counts. */
XQUERY_EXPORT xq_status xq_options_set_deadline(xq_options* options, int64_t nanoseconds_from_now);
/* Bytes that the values that one evaluation makes may take at a time. */
XQUERY_EXPORT xq_status xq_options_set_memory(xq_options* options, uint64_t bytes);
/* The flag that ends them; null for none. */
XQUERY_EXPORT xq_status xq_options_set_cancel(xq_options* options, const xq_cancel* cancel);
/* Takes all four back. */
XQUERY_EXPORT xq_status xq_options_clear_limits(xq_options* options);

/* ---- what may be loaded ---------------------------------------------------------------------- */

/* The policy is asked about every document, module, stylesheet and raw body before anything is
 * fetched, and about the target of every redirect. A document that it forbids is the empty sequence
 * to the query, a module is an error. A host that runs the queries of others begins with deny_all
 * and allows from there. */
XQUERY_EXPORT xq_status xq_options_deny_all(xq_options* options);
/* Back to any file, http and https URL. */
XQUERY_EXPORT xq_status xq_options_allow_all(xq_options* options);
/* Any URL of the scheme, as "https". */
XQUERY_EXPORT xq_status xq_options_allow_scheme(xq_options* options, const char* scheme,
                                                size_t length);
/* Files in that folder and below it; links that lead out of it are not followed. The folder must
 * exist by now: one that does not allows nothing. A path is bytes, without a zero among them. */
XQUERY_EXPORT xq_status xq_options_allow_files_below(xq_options* options, const char* folder,
                                                     size_t length);
/* What is at or below a URL on a server, by its segments: "http://h/a" allows "http://h/a/b" and
 * not "http://h/ab". */
XQUERY_EXPORT xq_status xq_options_allow_urls_below(xq_options* options, const char* url,
                                                    size_t length);
/* From the first call on only the hosts named, whatever the scheme but file; "*.example.org" stands
 * for every name that ends so. The schemes have to be allowed as well. */
XQUERY_EXPORT xq_status xq_options_allow_host(xq_options* options, const char* name, size_t length);

typedef int xq_addresses;
enum {
  XQ_ADDRESSES_LOOPBACK = 0,   /* this machine */
  XQ_ADDRESSES_LINK_LOCAL = 1, /* neighbours; where clouds tell machines their secrets */
  XQ_ADDRESSES_PRIVATE = 2,    /* networks that are not public */
  XQ_ADDRESSES_SPECIAL = 3,    /* multicast, reserved and the like */
  XQ_ADDRESSES_LOCAL = 4       /* all of these */
};
/* Nothing is fetched from servers at such addresses, by whatever name. */
XQUERY_EXPORT xq_status xq_options_forbid_addresses(xq_options* options, xq_addresses addresses);
/* Whether a URL may be asked for: 1 or 0. XQ_INPUT for a text that is no URL. */
XQUERY_EXPORT xq_status xq_options_allows_url(const xq_options* options, const char* url,
                                              size_t length, int* is_allowed);

typedef int xq_loading_limit;
enum {
  XQ_LOADING_CONNECT_MILLISECONDS = 0, /* 10,000 unless set */
  XQ_LOADING_TOTAL_MILLISECONDS = 1,   /* of one resource with its redirects; 60,000 */
  XQ_LOADING_REDIRECTS = 2,            /* 5 */
  XQ_LOADING_BYTES = 3,                /* of one resource; 256 MiB */
  XQ_LOADING_MODULES = 4               /* of one compilation; 10,000 */
};
XQUERY_EXPORT xq_status xq_options_set_loading_limit(xq_options* options, xq_loading_limit limit,
                                                     uint64_t value);

/* The absolute URL of the query's text, or its file, against which the relative locations are
 * resolved that it names; for compilations. A path is bytes, without a zero among them. XQ_INPUT
 * for a text that is no absolute URL. */
XQUERY_EXPORT xq_status xq_options_set_base_url(xq_options* options, const char* url,
                                                size_t length);
XQUERY_EXPORT xq_status xq_options_set_base_path(xq_options* options, const char* path,
                                                 size_t length);

/* ---- a loader of the host's own -------------------------------------------------------------- */

typedef int xq_purpose;
enum {
  XQ_PURPOSE_DOCUMENT = 0,  /* fn:doc */
  XQ_PURPOSE_MODULE = 1,    /* import module; UTF-8 text */
  XQ_PURPOSE_BODY = 2,      /* ext:uri-body */
  XQ_PURPOSE_STYLESHEET = 3 /* ext:xslt-uri */
};

/* What was fetched: filled by the loader during its call. All that is given is copied. Without a
 * status or with 0, 200 or 304 the data is used, with any other there is none. The media type
 * "text/html" makes the document an HTML one; without one the path of the URL decides. */
typedef struct xq_resource xq_resource;
XQUERY_EXPORT xq_status xq_resource_set_data(xq_resource* resource, const char* bytes,
                                             size_t length);
/* Adds to what is there. */
XQUERY_EXPORT xq_status xq_resource_add_data(xq_resource* resource, const char* bytes,
                                             size_t length);
XQUERY_EXPORT xq_status xq_resource_set_status(xq_resource* resource, int status);
XQUERY_EXPORT xq_status xq_resource_set_media_type(xq_resource* resource, const char* type,
                                                   size_t length);

/* Fetches in place of the library, for every purpose, what the policy allows. Answers XQ_OK when it
 * has filled the resource, XQ_END when there is none such; with any other status the evaluation or
 * compilation ends with XQ_HOST.
 *
 * It is called on the thread that evaluates or compiles, unless that has limits: then on a thread
 * of its own, which is left behind where it does not answer in time. So it must refer to nothing
 * but its data, which is kept until it has answered. A loader given to several contexts is called
 * from several threads at once. */
typedef xq_status (*xq_load)(void* data, const char* url, size_t length, xq_purpose purpose,
                             xq_resource* resource);
/* A null `load` gives the library's own back. */
XQUERY_EXPORT xq_status xq_options_set_loader(xq_options* options, xq_load load, void* data,
                                              xq_destroy destroy);

#ifdef __cplusplus
}
#endif

#endif
