// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A library to preload into a program under test: it counts the program's calls to the C library of
// one class, and makes the n-th fail or kills the program there.
//
// The classes are
//   changes   calls that make, rename, link or remove files and folders, write to or cut regular
//             files, and synchronise; not writes to standard output and error, pipes and sockets
//   opens     calls that give a descriptor of a file, a folder or a socket
//   reads     calls that read files, folders or their status, map files, or open them for reading
// and never what the C library does inside itself (stdio, the loading of libraries).
//
//   MORVEND_FAULT_AT      the number of the call, from 1; 0 is none
//   MORVEND_FAULT_KIND    of changes: kill-before, kill-after, EIO, ENOSPC, or short: only half of
//                         the bytes are written (calls that write nothing aren't changed); of
//                         opens: EMFILE; of reads: unreadable, which is EIO
//   MORVEND_FAULT_ONWARD  if set, every later call fails in the same way, too
//   MORVEND_FAULT_HURRY   if set, nobody sleeps: what is waited for by turns is given up at once
//   MORVEND_FAULT_COUNT   a file that gets the number of calls when the program ends normally
#define _GNU_SOURCE
#undef _FORTIFY_SOURCE  // it would take the names that are defined here
#include <dirent.h>
#include <dlfcn.h>
#include <errno.h>
#include <fcntl.h>
#include <linux/openat2.h>
#include <signal.h>
#include <stdarg.h>
#include <stdatomic.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/mman.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <sys/syscall.h>
#include <sys/uio.h>
#include <time.h>
#include <unistd.h>

#define EXPORTED __attribute__((visibility("default")))

enum Kind { NONE, KILL_BEFORE, KILL_AFTER, FAIL, SHORT };
enum Class { CHANGES = 1, OPENS = 2, READS = 4 };

static enum Kind kind = NONE;
static int failure = 0;
static long at = 0;
static int onward = 0;
static int hurry = 0;
static unsigned counted = CHANGES;
static atomic_long calls = 0;

__attribute__((constructor)) static void readEnvironment(void) {
  const char* number = getenv("MORVEND_FAULT_AT");
  const char* name = getenv("MORVEND_FAULT_KIND");
  onward = getenv("MORVEND_FAULT_ONWARD") != NULL;
  hurry = getenv("MORVEND_FAULT_HURRY") != NULL;
  if (number == NULL || name == NULL) return;
  at = strtol(number, NULL, 10);
  if (strcmp(name, "kill-before") == 0) kind = KILL_BEFORE;
  if (strcmp(name, "kill-after") == 0) kind = KILL_AFTER;
  if (strcmp(name, "short") == 0) kind = SHORT;
  if (strcmp(name, "EIO") == 0) failure = EIO;
  if (strcmp(name, "ENOSPC") == 0) failure = ENOSPC;
  if (strcmp(name, "EMFILE") == 0) counted = OPENS, failure = EMFILE;
  if (strcmp(name, "unreadable") == 0) counted = READS, failure = EIO;
  if (failure != 0) kind = FAIL;
  hurry = hurry || kind == FAIL;
  if (at == 0) kind = NONE;
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

// Counts a call that is of these classes, and says what is to happen to it; a fault before it has
// happened on return.
static enum Kind count(unsigned classes) {
  if ((classes & counted) == 0) return NONE;
  const long number = atomic_fetch_add(&calls, 1) + 1;
  if (kind == NONE || number < at || (number > at && !onward)) return NONE;
  if (kind == KILL_BEFORE) die();
  if (kind == FAIL) errno = failure;
  return kind;
}

#define ORIGINAL(name) (__extension__(__typeof__(&name)) original(#name))

static int isRegular(int file) {
  struct stat status;
  return file != STDOUT_FILENO && file != STDERR_FILENO && ORIGINAL(fstat)(file, &status) == 0 &&
         S_ISREG(status.st_mode);
}

// A call with a fault around it.
#define AROUND(type, classes, failed, call) \
  do {                                      \
    const enum Kind fault = count(classes); \
    if (fault == FAIL) return failed;       \
    type result = (call);                   \
    if (fault == KILL_AFTER) die();         \
    return result;                          \
  } while (0)

#define WRAPPED(name, parameters, arguments) \
  EXPORTED int name parameters { AROUND(int, CHANGES, -1, ORIGINAL(name) arguments); }

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

// An open call changes something when it makes or empties a file: an existing one opens on a full
// disk, too. Otherwise it is the first part of reading.
static unsigned opening(int changes) { return OPENS | (changes ? CHANGES : READS); }

#define OPENING(name, parameters, folder, ...)                                            \
  EXPORTED int name parameters {                                                          \
    mode_t mode = 0;                                                                      \
    const int temporary = (flags & O_TMPFILE) == O_TMPFILE;                               \
    int changes = (flags & O_TRUNC) != 0 || temporary;                                    \
    if ((flags & O_CREAT) != 0 || temporary) {                                            \
      va_list rest;                                                                       \
      va_start(rest, flags);                                                              \
      mode = va_arg(rest, mode_t);                                                        \
      va_end(rest);                                                                       \
      if (ORIGINAL(faccessat)(folder, path, F_OK, AT_SYMLINK_NOFOLLOW) != 0) changes = 1; \
    }                                                                                     \
    AROUND(int, opening(changes), -1, ORIGINAL(name)(__VA_ARGS__, flags, mode));          \
  }

OPENING(open, (const char* path, int flags, ...), AT_FDCWD, path)
OPENING(open64, (const char* path, int flags, ...), AT_FDCWD, path)
OPENING(openat, (int folder, const char* path, int flags, ...), folder, folder, path)
OPENING(openat64, (int folder, const char* path, int flags, ...), folder, folder, path)

// The one that has no function of its own. Arguments beyond those that were given are not looked
// at.
EXPORTED long syscall(long number, ...) {
  long given[6];
  va_list rest;
  va_start(rest, number);
  for (int i = 0; i < 6; ++i) given[i] = va_arg(rest, long);
  va_end(rest);
  const unsigned classes = number == SYS_openat2 ? opening(0) : 0;
  AROUND(long, classes, -1,
         ORIGINAL(syscall)(number, given[0], given[1], given[2], given[3], given[4], given[5]));
}

#define READING(type, failed, name, parameters, arguments) \
  EXPORTED type name parameters { AROUND(type, READS, failed, ORIGINAL(name) arguments); }
#define STATUS(name, parameters, arguments) READING(int, -1, name, parameters, arguments)

STATUS(stat, (const char* path, struct stat* status), (path, status))
STATUS(stat64, (const char* path, struct stat64* status), (path, status))
STATUS(lstat, (const char* path, struct stat* status), (path, status))
STATUS(lstat64, (const char* path, struct stat64* status), (path, status))
STATUS(fstat, (int file, struct stat* status), (file, status))
STATUS(fstat64, (int file, struct stat64* status), (file, status))
STATUS(fstatat, (int folder, const char* path, struct stat* status, int flags),
       (folder, path, status, flags))
STATUS(fstatat64, (int folder, const char* path, struct stat64* status, int flags),
       (folder, path, status, flags))
STATUS(statvfs, (const char* path, struct statvfs* status), (path, status))
STATUS(fstatvfs, (int file, struct statvfs* status), (file, status))
STATUS(access, (const char* path, int mode), (path, mode))
STATUS(faccessat, (int folder, const char* path, int mode, int flags), (folder, path, mode, flags))
READING(ssize_t, -1, readlink, (const char* path, char* text, size_t size), (path, text, size))
READING(ssize_t, -1, readlinkat, (int folder, const char* path, char* text, size_t size),
        (folder, path, text, size))
READING(struct dirent*, NULL, readdir, (DIR * listing), (listing))
READING(struct dirent64*, NULL, readdir64, (DIR * listing), (listing))

#define BYTES(name, parameters, arguments)                                      \
  EXPORTED ssize_t name parameters {                                            \
    AROUND(ssize_t, isRegular(file) ? READS : 0, -1, ORIGINAL(name) arguments); \
  }

BYTES(read, (int file, void* bytes, size_t size), (file, bytes, size))
BYTES(readv, (int file, const struct iovec* parts, int number), (file, parts, number))
BYTES(pread, (int file, void* bytes, size_t size, off_t offset), (file, bytes, size, offset))
BYTES(pread64, (int file, void* bytes, size_t size, off64_t offset), (file, bytes, size, offset))

#define MAPPING(name, offsetType)                                                  \
  EXPORTED void* name(void* address, size_t size, int access, int flags, int file, \
                      offsetType offset) {                                         \
    AROUND(void*, (flags & MAP_ANONYMOUS) != 0 ? 0 : READS, MAP_FAILED,            \
           ORIGINAL(name)(address, size, access, flags, file, offset));            \
  }
MAPPING(mmap, off_t)
MAPPING(mmap64, off64_t)

#define DESCRIPTOR(type, failed, name, parameters, arguments) \
  EXPORTED type name parameters { AROUND(type, OPENS, failed, ORIGINAL(name) arguments); }
DESCRIPTOR(int, -1, socket, (int domain, int type, int protocol), (domain, type, protocol))
DESCRIPTOR(int, -1, dup, (int file), (file))
DESCRIPTOR(DIR*, NULL, opendir, (const char* path), (path))
DESCRIPTOR(FILE*, NULL, fopen, (const char* path, const char* mode), (path, mode))
DESCRIPTOR(FILE*, NULL, fopen64, (const char* path, const char* mode), (path, mode))

// What is tried again while calls fail is tried at once.
EXPORTED int nanosleep(const struct timespec* time, struct timespec* left) {
  return hurry ? 0 : ORIGINAL(nanosleep)(time, left);
}
EXPORTED int clock_nanosleep(clockid_t clock, int flags, const struct timespec* time,
                             struct timespec* left) {
  return hurry ? 0 : ORIGINAL(clock_nanosleep)(clock, flags, time, left);
}

// Half of the bytes, but at least one, so that a program that goes on comes to an end.
static size_t half(size_t size) { return size - size / 2; }

#define WRITING(name, parameters, call)     \
  EXPORTED ssize_t name parameters {        \
    if (!isRegular(file)) return call;      \
    const enum Kind fault = count(CHANGES); \
    if (fault == FAIL) return -1;           \
    if (fault == SHORT) size = half(size);  \
    const ssize_t result = call;            \
    if (fault == KILL_AFTER) die();         \
    return result;                          \
  }

WRITING(write, (int file, const void* bytes, size_t size), ORIGINAL(write)(file, bytes, size))
WRITING(pwrite, (int file, const void* bytes, size_t size, off_t offset),
        ORIGINAL(pwrite)(file, bytes, size, offset))
WRITING(pwrite64, (int file, const void* bytes, size_t size, off64_t offset),
        ORIGINAL(pwrite64)(file, bytes, size, offset))

EXPORTED ssize_t writev(int file, const struct iovec* parts, int number) {
  if (!isRegular(file)) return ORIGINAL(writev)(file, parts, number);
  const enum Kind fault = count(CHANGES);
  if (fault == FAIL) return -1;
  if (fault == SHORT && number > 0) {
    return ORIGINAL(write)(file, parts[0].iov_base, half(parts[0].iov_len));
  }
  const ssize_t result = ORIGINAL(writev)(file, parts, number);
  if (fault == KILL_AFTER) die();
  return result;
}
