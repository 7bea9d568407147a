// The few operating-system calls the commands make, with the C library's arguments and errno
// behaviour, aimed at the managed host rather than the machine the tool happens to run on.
#pragma once

#include <sys/time.h>
#include <sys/types.h>
#include <time.h>

namespace HostOs {

time_t time(time_t* out);
struct tm* localtime(const time_t* when);
struct tm* localtime_r(const time_t* when, struct tm* out);
time_t mktime(struct tm* broken);
int settimeofday(const struct timeval* tv, const struct timezone* tz);
int nanosleep(const struct timespec* request, struct timespec* remaining);
void syslog(int priority, const char* format, ...) __attribute__((format(printf, 2, 3)));
int kill(pid_t pid, int signal);
int mount(const char* source, const char* target, const char* fstype, unsigned long flags,
          const void* data);
int umount(const char* target);
int unlink(const char* path);

}  // namespace HostOs
