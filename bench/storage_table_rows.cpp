#include "bench/Rows.h"

void bench::addStorageTableRows(Table&) {}
