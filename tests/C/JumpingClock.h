/* A clock of the day that jumps, for the whole process, the library included. */
#ifndef XQUERY_TESTS_C_JUMPINGCLOCK_H
#define XQUERY_TESTS_C_JUMPINGCLOCK_H

/* From now on it goes on by so many seconds whenever somebody looks, or back. Other clocks go on as
 * ever. */
void jump_by(long long seconds);
/* It is the system's again. */
void stop_jumping(void);
/* How often somebody looked since it began to jump. */
long looks_at_clock(void);

#endif
