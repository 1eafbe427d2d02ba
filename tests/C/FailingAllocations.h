/* Allocations that fail, on the calling thread alone. */
#ifndef XQUERY_TESTS_C_FAILINGALLOCATIONS_H
#define XQUERY_TESTS_C_FAILINGALLOCATIONS_H

/* Lets the allocation with that number, counted from 1, and all after it fail or, with `only_one`,
 * it alone. */
void fail_from(long number, int only_one);
/* Ends that; answers how many were asked for. */
long stop_failing(void);
/* What `operator new` asks in a build whose sanitizer takes over malloc. */
int next_allocation_fails(void);

#endif
