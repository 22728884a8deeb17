// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The tables of the counters database, and what else may be in it.
//
// What somebody adds (indexes, statistics, views, tables, triggers) is left alone: a connection
// runs nothing that the file brings along, and an index that does more than order rows is dropped.
#pragma once

#include <string>
#include <vector>

#include "base/Result.h"
#include "host/counters/SQLite.h"

namespace host {

// What a database is opened for. `create` makes the tables where there are none.
enum class DatabaseUse { read, write, create };

// Makes sure that what was opened is a database of this store, and makes it one if it is empty;
// false when it isn't to be made. Tables of the store's names that aren't its own are damage.
base::Result<bool> verifySchema(sqlite::Connection& connection, DatabaseUse use);

// Drops the indexes that have a say in what is written: those that could refuse it, or make it
// costly. Their names.
base::Result<std::vector<std::string>> dropMeddlingIndexes(sqlite::Connection& connection);

}  // namespace host
