// Prints every measurement beside its yardstick; fails when one misses its goal.
#include "bench/Rows.h"

int main() {
  bench::Table table;
  bench::addPropertyListRows(table);
  return table.finish() == 0 ? 0 : 1;
}
