// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Prints every measurement beside its yardstick, and which ones miss their goal.
//
// morvend_bench [GROUP...]: those of the groups alone.

#include <malloc.h>

#include <cstdlib>
#include <filesystem>
#include <string_view>

#include "bench/Rows.h"

namespace {

constexpr struct {
  std::string_view name;
  void (*add)(bench::Table&);
} kGroups[] = {{"process", bench::addProcessRows},      {"store", bench::addCounterStoreRows},
               {"report", bench::addReportRows},        {"plist", bench::addPropertyListRows},
               {"parser", bench::addStorageParserRows}, {"table", bench::addStorageTableRows},
               {"day", bench::addDailyRunRows},         {"growth", bench::addGrowthRows}};

constexpr char kMemory[] = "/dev/shm";

}  // namespace

int main(int argc, char** argv) {
  // The devices of whole runs lie in memory where there is a folder for it, unless somebody says
  // where: a run waits for the disk more often than the bare work, and on a disk that is what would
  // be measured. The store's rows wait as often as their yardsticks.
  const bool choosing = std::getenv("TMPDIR") == nullptr && std::filesystem::is_directory(kMemory);
  // Freed memory stays with the process, or a row would measure what an earlier one left of it.
  ::mallopt(M_MMAP_THRESHOLD, 1 << 30);
  ::mallopt(M_TRIM_THRESHOLD, 1 << 30);
  bench::Table table;
  for (const auto& [name, add] : kGroups) {
    bool asked = argc == 1;
    for (int i = 1; i < argc; ++i) asked |= name == argv[i];
    if (choosing && name == "store") ::unsetenv("TMPDIR");
    if (choosing && name != "store") ::setenv("TMPDIR", kMemory, 1);
    if (asked) add(table);
  }
  table.finish();
  return 0;
}
