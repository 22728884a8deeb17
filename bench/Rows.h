// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What is measured, by theme: each function adds its rows to the table.
#pragma once

#include "bench/Bench.h"

namespace bench {

// Start and end of the program, and whole reports, as processes.
void addProcessRows(Table& table);

// Whole days with a storage controller, as processes; prints below a row what the steps take.
void addDailyRunRows(Table& table);

// Whole days of sample devices with ever more counters, as processes: the cost of a counter beside
// what it is with fewer.
void addGrowthRows(Table& table);

// Reading and writing the counters store.
void addCounterStoreRows(Table& table);

// The whitelist lookup and the statistics of distributions.
void addReportRows(Table& table);

// Writing and reading a property list that looks like a report.
void addPropertyListRows(Table& table);

// Decoding controller buffers, and renaming and filtering what they hold.
void addStorageParserRows(Table& table);
void addStorageTableRows(Table& table);

}  // namespace bench
