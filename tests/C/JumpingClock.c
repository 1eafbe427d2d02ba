/* Takes the place of clock_gettime in the whole process. A sanitizer has its own. */
#define _GNU_SOURCE /* syscall */

#include "JumpingClock.h"

#include <sys/syscall.h>
#include <time.h>
#include <unistd.h>

static int is_jumping = 0;
static long long step = 0;
static long long offset = 0;
static long looks = 0;

void jump_by(long long seconds) {
  is_jumping = 1;
  step = seconds;
  offset = 0;
  looks = 0;
}

void stop_jumping(void) {
  is_jumping = 0;
}

long looks_at_clock(void) {
  return looks;
}

#ifndef XQUERY_SANITIZED

int clock_gettime(clockid_t clock, struct timespec* time) {
  const int result = (int)syscall(SYS_clock_gettime, clock, time);
  if (result == 0 && is_jumping && clock == CLOCK_REALTIME) {
    looks++;
    offset += step;
    time->tv_sec += offset;
  }
  return result;
}

#endif
