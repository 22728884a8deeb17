// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The storage library for C, and for whatever can call C: what the flash controller and the drives
// count, by the names of the command nandinfo. See nandinfo(3).
//
// A call changes nothing: not on the device, nor in the process (no signal, no locale, no text on
// its standard streams). Any call may be made from any thread, two at once on one device included:
// each has its own table of drivers, its own error and, within a result, the message of its own
// first error ("TLM_APIErrorMessage"), whatever other calls run; there is no lock that one waits
// for. A program that uses the C++ interface, too, keeps that one to one thread at a time, as its
// header says; the two don't disturb each other.
//
// Texts are UTF-8 and end with a NUL. What this header says holds as long as NANDINFO_API stays:
// new functions, names, flags and fields at the end of the options may be added, nothing goes.
#ifndef NANDINFO_H
#define NANDINFO_H

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#define NANDINFO_API 1
#define NANDINFO_FUNCTION __attribute__((visibility("default")))

// What a call returns, and what `code` of its error is.
enum {
  NANDINFO_OK = 0,
  NANDINFO_USAGE = 1,          // a missing argument, an unknown name, options that don't fit it
  NANDINFO_NO_DEVICE = 2,      // the device root isn't there
  NANDINFO_NO_CONTROLLER = 3,  // there is no storage controller, or none that answers
  NANDINFO_FAILED = 4,         // there is no result, or one that says itself that it isn't right
  NANDINFO_NO_MEMORY = 5,
  NANDINFO_INTERNAL = 6  // a fault of the library
};

// Why a call failed; written by every call that takes one, which may be null. With NANDINFO_OK the
// text is empty, or says what was amiss and didn't matter. A longer one is cut, at a character.
typedef struct nandinfo_error {
  int code;
  char text[508];
} nandinfo_error;

// The version of the library that is loaded, such as "0.1.0", and its NANDINFO_API.
NANDINFO_FUNCTION const char* nandinfo_version(void);
NANDINFO_FUNCTION int nandinfo_api(void);

// What is asked.

enum {
  NANDINFO_ROUND = 1,          // keep the significant digits only
  NANDINFO_ALL = 2,            // every counter, unrounded
  NANDINFO_STAT_KEYS = 4,      // with it: under the keys instead of the names
  NANDINFO_HISTORY = 8,        // the last six windows of four hours, instead of `hours`
  NANDINFO_NO_DELTA = 16,      // the counters as they were then, instead of differences
  NANDINFO_ACCUMULATING = 32,  // one kind of counters; without either, both
  NANDINFO_DYNAMIC = 64
};

// Begins with its own size, sizeof(nandinfo_options); everything else may be 0. A larger size than
// the library knows is taken if what it doesn't know is 0. A null pointer means no options. What a
// name doesn't take must not be given.
typedef struct nandinfo_options {
  size_t size;
  const char* code;    // of an image, four letters: "ean image-size", "ean update-count"
  const char* layout;  // of a counter block: the buffers "telemetry", "counters"
  uint32_t flags;
  uint32_t hours;     // "magazine": from so many hours ago until now
  uint32_t channels;  // "telemetry": of the controller; 0: as many as fill the buffer
  uint32_t reserved;  // 0
} nandinfo_options;

// The names that can be collected, and the kinds of buffers that can be decoded, in the command's
// order; null beyond the last. `description`, if it isn't null, gets a sentence. Both texts stay.
NANDINFO_FUNCTION const char* nandinfo_name(size_t index, const char** description);
NANDINFO_FUNCTION const char* nandinfo_kind(size_t index, const char** description);

// A device. Each call on it looks anew.
typedef struct nandinfo_device nandinfo_device;

// Opens the device root `root`: a recorded device if it has a folder device/, else this machine. A
// null pointer: the root of the commands, which is that of MORVEND_ROOT or the build's own. Only
// NANDINFO_OK gives a device.
NANDINFO_FUNCTION int nandinfo_open(const char* root, nandinfo_device** device,
                                    nandinfo_error* error);

// When no call on it runs any more; null is allowed. Values that came from it stay.
NANDINFO_FUNCTION void nandinfo_close(nandinfo_device* device);

// A value, with all that is in it.
typedef struct nandinfo_value nandinfo_value;

// Asks a device. `*value` is the result, the caller's to free, or null: beside NANDINFO_FAILED
// there may be one, as the command prints it.
NANDINFO_FUNCTION int nandinfo_collect(nandinfo_device* device, const char* name,
                                       const nandinfo_options* options, nandinfo_value** value,
                                       nandinfo_error* error);

// Decodes a buffer that was captured, of at most 16 MiB; no device is asked. `*value` as above.
NANDINFO_FUNCTION int nandinfo_decode(const char* kind, const void* bytes, size_t size,
                                      const nandinfo_options* options, nandinfo_value** value,
                                      nandinfo_error* error);

// Of what a call gave, with everything in it; null is allowed.
NANDINFO_FUNCTION void nandinfo_free(nandinfo_value* value);

// What a result holds. A value is never changed: any thread may look. A null pointer is a value of
// no type. What a function gives of a value is borrowed from the result until that is freed.

enum {
  NANDINFO_NONE = 0,
  NANDINFO_BOOLEAN = 1,
  NANDINFO_INTEGER = 2,   // of 64 bits with a sign
  NANDINFO_UNSIGNED = 3,  // without
  NANDINFO_REAL = 4,
  NANDINFO_TEXT = 5,
  NANDINFO_DATA = 6,
  NANDINFO_DATE = 7,
  NANDINFO_ARRAY = 8,
  NANDINFO_DICTIONARY = 9
};
NANDINFO_FUNCTION int nandinfo_type(const nandinfo_value* value);

// Of a number or a boolean, in the type that is asked for: between the two types of 64 bits the
// bits stay, a real is cut and saturates. A date as a real: seconds since 1970. Of anything else 0.
NANDINFO_FUNCTION int64_t nandinfo_integer(const nandinfo_value* value);
NANDINFO_FUNCTION uint64_t nandinfo_unsigned(const nandinfo_value* value);
NANDINFO_FUNCTION double nandinfo_real(const nandinfo_value* value);

// Of a text, else null.
NANDINFO_FUNCTION const char* nandinfo_text(const nandinfo_value* value);

// The bytes, `*size` of them, of data; else null and 0.
NANDINFO_FUNCTION const void* nandinfo_data(const nandinfo_value* value, size_t* size);

// How many elements an array has, or entries a dictionary; else 0.
NANDINFO_FUNCTION size_t nandinfo_count(const nandinfo_value* value);

// One of them, in their order; null beyond the last. `key`, if it isn't null, gets the entry's key,
// or null for an element.
NANDINFO_FUNCTION const nandinfo_value* nandinfo_at(const nandinfo_value* value, size_t index,
                                                    const char** key);

// The value of a dictionary's key; null if there is none.
NANDINFO_FUNCTION const nandinfo_value* nandinfo_find(const nandinfo_value* value, const char* key);

// JSON as the command prints it: on one line, or indented if `indented` isn't 0. The caller's, for
// nandinfo_free_text; null if there is no memory. Of a null pointer "null".
NANDINFO_FUNCTION char* nandinfo_json(const nandinfo_value* value, int indented);
NANDINFO_FUNCTION void nandinfo_free_text(char* text);

#ifdef __cplusplus
}
#endif

#endif
