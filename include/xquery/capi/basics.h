/* What all of the C interface is made of: statuses, text, callbacks, the version. See capi.h for
 * the rules that hold everywhere. */
#ifndef XQUERY_CAPI_BASICS_H
#define XQUERY_CAPI_BASICS_H

#include "xquery/Export.h"

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/* ---- statuses -------------------------------------------------------------------------------- */

typedef int xq_status;
enum {
  XQ_OK = 0,
  XQ_END = 1,      /* there is none: no item, node, error or call there */
  XQ_ERROR = 2,    /* the query does not compile or its evaluation failed; an xq_error says why. In
                      a callback also that a limit of what goes on around it was reached */
  XQ_INPUT = 3,    /* a document cannot be read or is malformed; text that is not UTF-8 */
  XQ_USAGE = 4,    /* a null handle, one of another kind or one in use, a senseless argument */
  XQ_MEMORY = 5,   /* there is no memory for it; what was there before is as it was */
  XQ_MISMATCH = 6, /* an item of another type or out of range; nodes of different documents */
  XQ_HOST = 7,     /* a callback of the host said that it failed */
  XQ_INTERNAL = 8  /* a fault of the library's own; please report it */
};

/* A short text in English for a status, "unknown status" for any other number. Static: nobody frees
 * it. */
XQUERY_EXPORT const char* xq_status_text(xq_status status);

/* ---- text ------------------------------------------------------------------------------------ */

/* In place of a number of bytes: the text ends at its first zero. */
#define XQ_NUL ((size_t)-1)

/* Text that belongs to a handle and is good as long as that is: UTF-8, with a zero behind it that
 * `length` does not count. `data` is never null. */
typedef struct xq_string {
  const char* data;
  size_t length;
} xq_string;

/* A buffer of the host's, which functions fill, and enlarge as they need, so that a loop over many
 * texts asks for memory a few times only. UTF-8, or bytes where a function says so, with a zero
 * behind that `length` does not count. `data` is never null once a function was given it, and good
 * until the next one is. For one thread at a time.
 *
 *   xq_text text = XQ_TEXT_INIT;
 *   while (xq_value_next(items, &at) == XQ_OK) {
 *     if (xq_value_string(items, at, &text) == XQ_OK) puts(text.data);
 *   }
 *   xq_text_free(&text);
 */
typedef struct xq_text {
  const char* data;
  size_t length;
  size_t capacity; /* the library's own */
} xq_text;

/* clang-format off */
#define XQ_TEXT_INIT { NULL, 0, 0 }
/* clang-format on */

/* Gives the memory back; the text is empty and may be used again. Null is let pass. */
XQUERY_EXPORT xq_status xq_text_free(xq_text* text);

/* ---- callbacks of the host ------------------------------------------------------------------- */

/* Each is handed the pointer that was given with it, which may be null. They must return, and must
 * not throw. They are called on the thread of the call that they serve unless said otherwise. */

/* Fills the buffer; answers how many bytes, 0 at the end, negative on failure. Not called again
 * after either. */
typedef ptrdiff_t (*xq_read)(void* data, char* buffer, size_t size);
/* Takes some bytes of a longer text; anything but 0 is a failure, and ends the writing. */
typedef int (*xq_write)(void* data, const char* bytes, size_t length);
/* Called once when nobody in the library will use the pointer again, which may be on another thread
 * and long after the handle was freed that it was given to. It is also called where the function
 * that the pointer was given to fails. May be null. */
typedef void (*xq_destroy)(void* data);

/* ---- the library ----------------------------------------------------------------------------- */

/* The version of this header. */
#define XQ_VERSION_MAJOR 0
#define XQ_VERSION_MINOR 1
#define XQ_VERSION_PATCH 0

/* That of the library in use, as "0.1.0". Static. */
XQUERY_EXPORT const char* xq_version(void);
/* The same as a number: major * 1000000 + minor * 1000 + patch. */
XQUERY_EXPORT int xq_version_number(void);

/* Gives the system back the memory that evaluations freed and that is kept for the next ones. Takes
 * about a second for each gigabyte that is idle; may be called at any time on any thread. */
XQUERY_EXPORT xq_status xq_release_idle_memory(void);

#ifdef __cplusplus
}
#endif

#endif
