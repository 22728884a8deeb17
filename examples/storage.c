/* SPDX-License-Identifier: Apache-2.0
 * Copyright the morvend authors */

/* How full the disk is, and how the storage is, of a device root or of this machine: storage
 * [ROOT]. Build: cc storage.c $(pkg-config --cflags --libs NANDInfo) -o storage */
#include <inttypes.h>
#include <nandinfo.h>
#include <stdio.h>

/* A value and, below it, all that it holds. */
static void show(const nandinfo_value* value, const char* key, int depth) {
  printf("%*s%s%s", 2 * depth, "", key != NULL ? key : "-", key != NULL ? ":" : "");
  switch (nandinfo_type(value)) {
    case NANDINFO_BOOLEAN:
      printf(" %s\n", nandinfo_integer(value) != 0 ? "yes" : "no");
      break;
    case NANDINFO_INTEGER:
      printf(" %" PRId64 "\n", nandinfo_integer(value));
      break;
    case NANDINFO_UNSIGNED:
      printf(" %" PRIu64 "\n", nandinfo_unsigned(value));
      break;
    case NANDINFO_REAL:
    case NANDINFO_DATE:
      printf(" %g\n", nandinfo_real(value));
      break;
    case NANDINFO_TEXT:
      printf(" %s\n", nandinfo_text(value));
      break;
    default:
      printf("\n");
  }
  const nandinfo_value* part;
  for (size_t i = 0; (part = nandinfo_at(value, i, &key)) != NULL; ++i) show(part, key, depth + 1);
}

int main(int argc, char** argv) {
  nandinfo_error error;
  nandinfo_device* device;
  if (nandinfo_open(argc > 1 ? argv[1] : NULL, &device, &error) != NANDINFO_OK) {
    fprintf(stderr, "storage: %s\n", error.text);
    return 1;
  }
  static const char* const names[] = {"disk", "health", "ftl"};
  const nandinfo_options rounded = {.size = sizeof rounded, .flags = NANDINFO_ROUND};
  int failed = 0;
  for (size_t i = 0; i < sizeof names / sizeof *names; ++i) {
    nandinfo_value* value;
    const int code = nandinfo_collect(device, names[i], i == 2 ? &rounded : NULL, &value, &error);
    if (code != NANDINFO_OK) {
      fprintf(stderr, "storage: %s: %s (%d)\n", names[i], error.text, code);
      failed = 1;
    }
    if (value != NULL) show(value, names[i], 0);
    nandinfo_free(value);
  }
  nandinfo_close(device);
  return failed;
}
