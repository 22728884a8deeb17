// What is measured, by theme: each function adds its rows to the table.
#pragma once

#include "bench/Bench.h"

namespace bench {

// Writing and reading a property list that looks like a report.
void addPropertyListRows(Table& table);

}  // namespace bench
