/* SPDX-License-Identifier: Apache-2.0 */
// See failing_calls.h. Nothing here allocates while calls fail.
#define _GNU_SOURCE
#include "tests/sweep/failing_calls.h"

#include <dirent.h>
#include <dlfcn.h>
#include <errno.h>
#include <execinfo.h>
#include <fcntl.h>
#include <stdarg.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <time.h>
#include <unistd.h>

static struct {
  int on, traceAll, call, error, lasting, record, trace;
  long left;
} plan;

// The C library's own, which need no look-up.
extern void* __libc_malloc(size_t size);
extern void* __libc_calloc(size_t count, size_t size);
extern void* __libc_realloc(void* memory, size_t size);
extern void* __libc_memalign(size_t alignment, size_t size);

static void Record(const void* bytes, size_t size) {
  if (syscall(SYS_write, plan.record, bytes, size) < 0) _exit(99);
}
static void Tell(const char* text) { Record(text, strlen(text)); }

static void TellAll(const char* name, const char* path, int descriptor) {
  char link[40], target[1024] = "";
  void* frames[40];
  plan.on = 0;
  Tell(name);
  if (plan.trace) {
    snprintf(link, sizeof link, "/proc/self/fd/%d", descriptor);
    if (path == NULL && syscall(SYS_readlink, link, target, sizeof target - 1) > 0) path = target;
    Tell(" ");
    Tell(path != NULL ? path : "");
    Tell("\n");
    backtrace_symbols_fd(frames, backtrace(frames, 40), plan.record);
  }
  plan.on = 1;
}

enum { kWayDepth = 14 };
static void Trace(int call) {
  void* frames[kWayDepth];
  struct TracedCall traced = {.call = call, .way = 0};
  plan.on = 0;
  const int depth = backtrace(frames, kWayDepth);
  for (int i = 0; i < depth; ++i) {
    traced.way = (traced.way ^ (unsigned long)frames[i]) * 0x9e3779b97f4a7c15u;
  }
  Record(&traced, sizeof traced);
  plan.on = 1;
}

// Whether this call fails; errno says how, unless it is a read that is cut short.
static int Fails(int call, const char* name, const char* path, int descriptor) {
  if (!plan.on) return 0;
  if (plan.traceAll) Trace(call);
  if (plan.traceAll || call != plan.call) return 0;
  if (plan.left > 0 || (plan.left < 0 && !plan.lasting)) {
    if (plan.left > 0) --plan.left;
    return 0;
  }
  if (plan.left == 0) TellAll(name, path, descriptor);
  plan.left = -1;
  if (plan.error > 0) errno = plan.error;
  return 1;
}

void FailCalls(int call, long n, int error, int lasting, int record, int trace) {
  void* frame;
  if (trace) backtrace(&frame, 1);  // which loads what it needs, the first time
  plan.call = call;
  plan.left = n;
  plan.error = error;
  plan.lasting = lasting;
  plan.record = record;
  plan.trace = trace;
  plan.on = 1;
}

void LetCallsBe(void) { plan.on = 0; }

void TraceCalls(int record) {
  plan.traceAll = 1;
  FailCalls(kMemory, 0, 0, 0, record, 1);
}

static void __attribute__((constructor)) ReadPlan(void) {
  int call, error, lasting, record, trace;
  long n;
  const char* text = getenv(VESK2_FAIL_CALLS);
  if (text == NULL) return;
  if (sscanf(text, "%d %ld %d %d %d %d", &call, &n, &error, &lasting, &record, &trace) != 6)
    abort();
  FailCalls(call, n, error, lasting, record, trace);
}

// ---- Memory ------------------------------------------------------------------------------------

static int NoMemory(const char* name) { return Fails(kMemory, name, NULL, -1); }

void* malloc(size_t size) { return NoMemory("malloc") ? NULL : __libc_malloc(size); }
void* calloc(size_t count, size_t size) {
  return NoMemory("calloc") ? NULL : __libc_calloc(count, size);
}
void* realloc(void* memory, size_t size) {
  return NoMemory("realloc") ? NULL : __libc_realloc(memory, size);
}
void* reallocarray(void* memory, size_t count, size_t size) {
  size_t bytes;
  if (__builtin_mul_overflow(count, size, &bytes)) return NULL;
  return realloc(memory, bytes);
}
void* memalign(size_t alignment, size_t size) {
  return NoMemory("memalign") ? NULL : __libc_memalign(alignment, size);
}
void* aligned_alloc(size_t alignment, size_t size) { return memalign(alignment, size); }
int posix_memalign(void** out, size_t alignment, size_t size) {
  void* const memory = memalign(alignment, size);
  if (memory == NULL) return ENOMEM;
  *out = memory;
  return 0;
}

// ---- Files -------------------------------------------------------------------------------------

// The function of this name behind this library.
#define NEXT(name)               \
  static __typeof__(&name) next; \
  if (next == NULL) *(void**)(&next) = dlsym(RTLD_NEXT, #name)

// A function that fails by `failure`; of `path` and `descriptor` it has at most one.
#define FAILING(call, path, descriptor, failure, result, name, parameters, arguments) \
  result name parameters {                                                            \
    NEXT(name);                                                                       \
    return Fails(call, #name, path, descriptor) ? (failure) : next arguments;         \
  }

int open(const char* path, int flags, ...) {
  NEXT(open);
  va_list rest;
  va_start(rest, flags);
  const mode_t mode = flags & (O_CREAT | O_TMPFILE) ? va_arg(rest, mode_t) : 0;
  va_end(rest);
  return Fails(kOpen, "open", path, -1) ? -1 : next(path, flags, mode);
}
int openat(int directory, const char* path, int flags, ...) {
  NEXT(openat);
  va_list rest;
  va_start(rest, flags);
  const mode_t mode = flags & (O_CREAT | O_TMPFILE) ? va_arg(rest, mode_t) : 0;
  va_end(rest);
  return Fails(kOpen, "openat", path, -1) ? -1 : next(directory, path, flags, mode);
}
int open64(const char*, int, ...) __attribute__((alias("open")));
int openat64(int, const char*, int, ...) __attribute__((alias("openat")));
int __open_2(const char* path, int flags) { return open(path, flags); }
int __openat_2(int directory, const char* path, int flags) {
  return openat(directory, path, flags);
}
int __open64_2(const char*, int) __attribute__((alias("__open_2")));
int __openat64_2(int, const char*, int) __attribute__((alias("__openat_2")));

FAILING(kOpen, path, -1, NULL, FILE*, fopen, (const char* path, const char* mode), (path, mode))
FAILING(kOpen, path, -1, NULL, FILE*, fopen64, (const char* path, const char* mode), (path, mode))
FAILING(kOpen, path, -1, NULL, DIR*, opendir, (const char* path), (path))
FAILING(kOpen, NULL, fd, NULL, DIR*, fdopendir, (int fd), (fd))

FAILING(kScan, NULL, dirfd(dir), NULL, struct dirent*, readdir, (DIR * dir), (dir))
FAILING(kScan, NULL, dirfd(dir), NULL, struct dirent64*, readdir64, (DIR * dir), (dir))

ssize_t read(int fd, void* out, size_t size) {
  NEXT(read);
  if (!Fails(kRead, "read", NULL, fd)) return next(fd, out, size);
  if (plan.error == kShortRead) return next(fd, out, size > 1 ? size / 2 : size);
  return plan.error == kEarlyEnd ? 0 : -1;
}
ssize_t __read_chk(int fd, void* out, size_t size, size_t room) {
  if (size > room) abort();
  return read(fd, out, size);
}

FAILING(kStat, path, -1, -1, int, stat, (const char* path, struct stat* out), (path, out))
FAILING(kStat, path, -1, -1, int, lstat, (const char* path, struct stat* out), (path, out))
FAILING(kStat, NULL, fd, -1, int, fstat, (int fd, struct stat* out), (fd, out))
FAILING(kStat, path, -1, -1, int, fstatat, (int fd, const char* path, struct stat* out, int flags),
        (fd, path, out, flags))
FAILING(kStat, path, -1, -1, int, stat64, (const char* path, struct stat64* out), (path, out))
FAILING(kStat, path, -1, -1, int, lstat64, (const char* path, struct stat64* out), (path, out))
FAILING(kStat, NULL, fd, -1, int, fstat64, (int fd, struct stat64* out), (fd, out))
FAILING(kStat, path, -1, -1, int, statx,
        (int fd, const char* path, int flags, unsigned mask, struct statx* out),
        (fd, path, flags, mask, out))
FAILING(kStat, path, -1, -1, int, access, (const char* path, int mode), (path, mode))
FAILING(kStat, path, -1, -1, int, faccessat, (int fd, const char* path, int mode, int flags),
        (fd, path, mode, flags))
FAILING(kStat, path, -1, -1, ssize_t, readlink, (const char* path, char* out, size_t size),
        (path, out, size))
FAILING(kStat, path, -1, NULL, char*, realpath, (const char* path, char* out), (path, out))

// ---- The clock ---------------------------------------------------------------------------------

FAILING(kClock, NULL, -1, -1, int, clock_gettime, (clockid_t clock, struct timespec* out),
        (clock, out))
FAILING(kClock, NULL, -1, -1, time_t, time, (time_t * out), (out))
