#include "bench/Rows.h"

int main() {
  bench::Table table;
  addCounterStoreRows(table);
  return table.finish() == 0 ? 0 : 1;
}
