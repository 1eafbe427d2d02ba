/* The C interface: everything that a host needs, for programs in C and for what binds other
 * languages. It can be used from C99 on and from C++, and stands by itself: none of the C++ headers
 * is needed beside it.
 *
 *   xq_query *query;
 *   xq_error *error;
 *   if (xq_compile("1 + 1", XQ_NUL, NULL, &query, &error) != XQ_OK) ...
 *
 * Handles. A query, a context, a value, a node and so on is a handle: a pointer to something that
 * only the library looks into. Whoever is given one through an out parameter owns it and frees it
 * by the function of its kind. What handles refer to is shared and lives as long as any of them
 * needs it: a node keeps its document, a value its nodes, an error the text that it has a place in,
 * whatever is freed first. Handles that a callback is given belong to the library and are good
 * during the call.
 *
 * Statuses. Every function answers one (xq_status). Nothing is thrown and nothing ends the process:
 * a null handle, a handle of another kind and an argument that makes no sense are XQ_USAGE, and
 * where there is no memory the answer is XQ_MEMORY. Any other use of a handle that was freed,
 * freeing it again included, is undefined as it is for memory.
 *
 * Out parameters. They must not be null, but for those of errors (`xq_error **`). They are set in
 * any case, to null or 0 when the status is not XQ_OK, so that what they held before need not be
 * looked at; an xq_text holds the empty text then.
 *
 * Text is UTF-8: a pointer and a number of bytes, or XQ_NUL in place of the number for text that
 * ends at its first zero. Text that is not well-formed UTF-8 is XQ_INPUT. A null pointer is the
 * empty text where the number is 0 or XQ_NUL, and XQ_USAGE otherwise.
 *
 * Threads. Any function may be called on any thread. What the library is given as a pointer to a
 * const handle is only read, and any number of threads may do that at once: evaluate one query,
 * walk one document, read one value. What it is given otherwise is for one thread at a time: a
 * context, an options handle while it is set up, a node handle that is moved. A cancellation is the
 * exception and says so. Threads must not be cancelled (pthread_cancel) and must not leave by
 * longjmp while they are in the library; a callback of the host must return.
 *
 * Constants are given to functions as int, under the name of their family (xq_step and so on); a
 * number that is none of them is XQ_USAGE. Numbers stay what they are, and later versions may add
 * some: a host treats what it does not know as what it knows nothing of.
 */
#ifndef XQUERY_CAPI_H
#define XQUERY_CAPI_H

#include "xquery/capi/basics.h"
#include "xquery/capi/errors.h"
#include "xquery/capi/nodes.h"
#include "xquery/capi/options.h"
#include "xquery/capi/profile.h"
#include "xquery/capi/queries.h"
#include "xquery/capi/values.h"

#endif
