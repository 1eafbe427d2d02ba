/* Takes the place of malloc and its kin in the whole process, the library's included. Under a
 * sanitizer, which has its own, OperatorNew.cpp takes the place of the operators alone. */
#include "FailingAllocations.h"

#include <errno.h>
#include <stddef.h>

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

static int fails(void) {
  if (!next_allocation_fails()) return 0;
  errno = ENOMEM;
  return 1;
}

void* malloc(size_t size) {
  return fails() ? NULL : __libc_malloc(size);
}

void* calloc(size_t count, size_t size) {
  return fails() ? NULL : __libc_calloc(count, size);
}

void* realloc(void* block, size_t size) {
  return fails() ? NULL : __libc_realloc(block, size);
}

void* aligned_alloc(size_t alignment, size_t size) {
  return fails() ? NULL : __libc_memalign(alignment, size);
}

int posix_memalign(void** block, size_t alignment, size_t size) {
  if (fails()) return ENOMEM;
  *block = __libc_memalign(alignment, size);
  return *block ? 0 : ENOMEM;
}

#endif
