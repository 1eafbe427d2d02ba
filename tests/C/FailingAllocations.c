/* Takes the place of malloc and its kin in the whole process, the library's included. Under a
 * sanitizer, which has its own, OperatorNew.cpp takes the place of the operators alone. */
#define _GNU_SOURCE /* dladdr */

#include "FailingAllocations.h"

#include <dlfcn.h>
#include <errno.h>
#include <stddef.h>
#include <string.h>

static __thread long asked = 0;
static __thread long fails_at = 0;
static __thread int fails_once = 0;

void fail_from(long number, int only_one) {
  asked = 0;
  fails_once = only_one;
  fails_at = number;
}

long stop_failing(void) {
  fails_at = 0;
  return asked;
}

int next_allocation_fails(void) {
  if (!fails_at) return 0;
  asked++;
  return fails_once ? asked == fails_at : asked >= fails_at;
}

#ifndef XQUERY_SANITIZED

void* __libc_malloc(size_t size);
void* __libc_calloc(size_t count, size_t size);
void* __libc_realloc(void* block, size_t size);
void* __libc_memalign(size_t alignment, size_t size);

void* malloc(size_t size);
void* calloc(size_t count, size_t size);
void* realloc(void* block, size_t size);
void* aligned_alloc(size_t alignment, size_t size);
int posix_memalign(void** block, size_t alignment, size_t size);

/* GMP knows of no failure but the end of the process: its functions for memory cannot return
 * without any, and belong to GnuTLS wherever that is loaded. What they ask for is always there. */
static int is_asked_by_gmp(const void* caller) {
  Dl_info asking;
  if (!dladdr(caller, &asking) || !asking.dli_fname) return 0;
  return strstr(asking.dli_fname, "libgmp.") || strstr(asking.dli_fname, "libgnutls.");
}

static int fails(const void* caller) {
  if (!fails_at || is_asked_by_gmp(caller) || !next_allocation_fails()) return 0;
  errno = ENOMEM;
  return 1;
}

void* malloc(size_t size) {
  return fails(__builtin_return_address(0)) ? NULL : __libc_malloc(size);
}

void* calloc(size_t count, size_t size) {
  return fails(__builtin_return_address(0)) ? NULL : __libc_calloc(count, size);
}

void* realloc(void* block, size_t size) {
  return fails(__builtin_return_address(0)) ? NULL : __libc_realloc(block, size);
}

void* aligned_alloc(size_t alignment, size_t size) {
  return fails(__builtin_return_address(0)) ? NULL : __libc_memalign(alignment, size);
}

int posix_memalign(void** block, size_t alignment, size_t size) {
  if (fails(__builtin_return_address(0))) return ENOMEM;
  *block = __libc_memalign(alignment, size);
  return *block ? 0 : ENOMEM;
}

#endif
