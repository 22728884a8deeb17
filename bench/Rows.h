// The groups of rows of the table.
#pragma once

#include "bench/Bench.h"

void addCounterStoreRows(bench::Table& table);
