// Prints every measurement beside its yardstick, and which ones miss their goal.

#include "bench/Rows.h"

int main() {
  bench::Table table;
  bench::addProcessRows(table);
  bench::addCounterStoreRows(table);
  bench::addReportRows(table);
  bench::addPropertyListRows(table);
  bench::addStorageParserRows(table);
  bench::addStorageTableRows(table);
  bench::addDailyRunRows(table);
  table.finish();
  return 0;
}
