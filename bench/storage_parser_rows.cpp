#include "bench/Rows.h"

void bench::addStorageParserRows(Table&) {}
