// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A library to preload into a program under test: it counts the program's state-changing calls to
// the C library, and makes the n-th fail or kills the program there.
//
// Counted are calls that make, rename, link or remove files and folders, write to or cut regular
// files, and synchronise; not writes to standard output and error, pipes and sockets, nor memory
// mappings and what the C library does inside itself (stdio).
//
//   MORVEND_FAULT_AT      the number of the call, from 1
//   MORVEND_FAULT_KIND    kill-before, kill-after, EIO, ENOSPC, or short: only half of the bytes
//   are
//                         written (calls that write nothing aren't changed)
//   MORVEND_FAULT_ONWARD  if set, every later call fails in the same way, too
//   MORVEND_FAULT_COUNT   a file that gets the number of calls when the program ends normally
#define _GNU_SOURCE
#undef _FORTIFY_SOURCE  // it would take the names that are defined here
#include <dlfcn.h>
#include <errno.h>
#include <fcntl.h>
#include <signal.h>
#include <stdarg.h>
#include <stdatomic.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/uio.h>
#include <time.h>
#include <unistd.h>

#define EXPORTED __attribute__((visibility("default")))

enum Kind { NONE, KILL_BEFORE, KILL_AFTER, FAIL, SHORT };

static enum Kind kind = NONE;
static int failure = 0;
static long at = 0;
static int onward = 0;
static atomic_long calls = 0;

__attribute__((constructor)) static void readEnvironment(void) {
  const char* number = getenv("MORVEND_FAULT_AT");
  const char* name = getenv("MORVEND_FAULT_KIND");
  onward = getenv("MORVEND_FAULT_ONWARD") != NULL;
  if (number == NULL || name == NULL) return;
  at = strtol(number, NULL, 10);
  if (strcmp(name, "kill-before") == 0) kind = KILL_BEFORE;
  if (strcmp(name, "kill-after") == 0) kind = KILL_AFTER;
  if (strcmp(name, "short") == 0) kind = SHORT;
  if (strcmp(name, "EIO") == 0) failure = EIO;
  if (strcmp(name, "ENOSPC") == 0) failure = ENOSPC;
  if (failure != 0) kind = FAIL;
}

__attribute__((destructor)) static void writeCount(void) {
  const char* path = getenv("MORVEND_FAULT_COUNT");
  if (path == NULL) return;
  const int file = (int)syscall(SYS_openat, AT_FDCWD, path, O_WRONLY | O_CREAT | O_TRUNC, 0600);
  if (file >= 0) dprintf(file, "%ld\n", atomic_load(&calls));
}

static void* original(const char* name) {
  void* function = dlsym(RTLD_NEXT, name);
  if (function == NULL) abort();
  return function;
}

static void die(void) {
  syscall(SYS_kill, getpid(), SIGKILL);
  for (;;) pause();
}

// Counts a call and says what is to happen to it; a fault before it has happened on return.
static enum Kind count(void) {
  const long number = atomic_fetch_add(&calls, 1) + 1;
  if (kind == NONE || number < at || (number > at && !onward)) return NONE;
  if (kind == KILL_BEFORE) die();
  if (kind == FAIL) errno = failure;
  return kind;
}

static int isRegular(int file) {
  struct stat status;
  return file != STDOUT_FILENO && file != STDERR_FILENO && fstat(file, &status) == 0 &&
         S_ISREG(status.st_mode);
}

// A call with a fault around it.
#define AROUND(call)                 \
  do {                               \
    const enum Kind fault = count(); \
    if (fault == FAIL) return -1;    \
    const int result = (call);       \
    if (fault == KILL_AFTER) die();  \
    return result;                   \
  } while (0)

#define ORIGINAL(name) (__extension__(__typeof__(&name)) original(#name))

#define WRAPPED(name, parameters, arguments) \
  EXPORTED int name parameters { AROUND(ORIGINAL(name) arguments); }

WRAPPED(fsync, (int file), (file))
WRAPPED(fdatasync, (int file), (file))
WRAPPED(ftruncate, (int file, off_t size), (file, size))
WRAPPED(ftruncate64, (int file, off64_t size), (file, size))
WRAPPED(fallocate, (int file, int mode, off_t offset, off_t size), (file, mode, offset, size))
WRAPPED(fallocate64, (int file, int mode, off64_t offset, off64_t size), (file, mode, offset, size))
WRAPPED(fchmod, (int file, mode_t mode), (file, mode))
WRAPPED(rename, (const char* from, const char* to), (from, to))
WRAPPED(renameat, (int fromFolder, const char* from, int toFolder, const char* to),
        (fromFolder, from, toFolder, to))
WRAPPED(renameat2,
        (int fromFolder, const char* from, int toFolder, const char* to, unsigned int flags),
        (fromFolder, from, toFolder, to, flags))
WRAPPED(link, (const char* from, const char* to), (from, to))
WRAPPED(linkat, (int fromFolder, const char* from, int toFolder, const char* to, int flags),
        (fromFolder, from, toFolder, to, flags))
WRAPPED(symlink, (const char* target, const char* path), (target, path))
WRAPPED(symlinkat, (const char* target, int folder, const char* path), (target, folder, path))
WRAPPED(unlink, (const char* path), (path))
WRAPPED(unlinkat, (int folder, const char* path, int flags), (folder, path, flags))
WRAPPED(mkdir, (const char* path, mode_t mode), (path, mode))
WRAPPED(mkdirat, (int folder, const char* path, mode_t mode), (folder, path, mode))
WRAPPED(rmdir, (const char* path), (path))

// An open call counts when it makes or empties a file: an existing one opens on a full disk, too.
#define OPENING(name, parameters, folder, ...)                                  \
  EXPORTED int name parameters {                                                \
    mode_t mode = 0;                                                            \
    const int temporary = (flags & O_TMPFILE) == O_TMPFILE;                     \
    int changes = (flags & O_TRUNC) != 0 || temporary;                          \
    if ((flags & O_CREAT) != 0 || temporary) {                                  \
      va_list rest;                                                             \
      va_start(rest, flags);                                                    \
      mode = va_arg(rest, mode_t);                                              \
      va_end(rest);                                                             \
      if (faccessat(folder, path, F_OK, AT_SYMLINK_NOFOLLOW) != 0) changes = 1; \
    }                                                                           \
    if (!changes) return ORIGINAL(name)(__VA_ARGS__, flags, mode);              \
    AROUND(ORIGINAL(name)(__VA_ARGS__, flags, mode));                           \
  }

OPENING(open, (const char* path, int flags, ...), AT_FDCWD, path)
OPENING(open64, (const char* path, int flags, ...), AT_FDCWD, path)
OPENING(openat, (int folder, const char* path, int flags, ...), folder, folder, path)
OPENING(openat64, (int folder, const char* path, int flags, ...), folder, folder, path)

// Nobody sleeps while calls fail: what is tried again is tried at once.
EXPORTED int nanosleep(const struct timespec* time, struct timespec* left) {
  return kind == FAIL ? 0 : ORIGINAL(nanosleep)(time, left);
}
EXPORTED int clock_nanosleep(clockid_t clock, int flags, const struct timespec* time,
                             struct timespec* left) {
  return kind == FAIL ? 0 : ORIGINAL(clock_nanosleep)(clock, flags, time, left);
}

// Half of the bytes, but at least one, so that a program that goes on comes to an end.
static size_t half(size_t size) { return size - size / 2; }

#define WRITING(name, parameters, call)    \
  EXPORTED ssize_t name parameters {       \
    if (!isRegular(file)) return call;     \
    const enum Kind fault = count();       \
    if (fault == FAIL) return -1;          \
    if (fault == SHORT) size = half(size); \
    const ssize_t result = call;           \
    if (fault == KILL_AFTER) die();        \
    return result;                         \
  }

WRITING(write, (int file, const void* bytes, size_t size), ORIGINAL(write)(file, bytes, size))
WRITING(pwrite, (int file, const void* bytes, size_t size, off_t offset),
        ORIGINAL(pwrite)(file, bytes, size, offset))
WRITING(pwrite64, (int file, const void* bytes, size_t size, off64_t offset),
        ORIGINAL(pwrite64)(file, bytes, size, offset))

EXPORTED ssize_t writev(int file, const struct iovec* parts, int number) {
  if (!isRegular(file)) return ORIGINAL(writev)(file, parts, number);
  const enum Kind fault = count();
  if (fault == FAIL) return -1;
  if (fault == SHORT && number > 0) {
    return ORIGINAL(write)(file, parts[0].iov_base, half(parts[0].iov_len));
  }
  const ssize_t result = ORIGINAL(writev)(file, parts, number);
  if (fault == KILL_AFTER) die();
  return result;
}
