// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Texts that are kept in the counters database beside the counters, each under a name, so that a
// transaction can change both. Their table is made with the first of them.
#pragma once

#include <string>
#include <string_view>

#include "base/Result.h"
#include "host/counters/SQLite.h"

namespace host {

// Makes their table.
inline constexpr char kKeptTable[] =
    "CREATE TABLE IF NOT EXISTS kept(name TEXT PRIMARY KEY NOT NULL, text BLOB NOT NULL) STRICT";

// Keeps a text in the place of the one that is under the name; an empty one removes it.
base::Result<void> keepText(sqlite::Connection& connection, std::string_view name,
                            std::string_view text);

// What is kept under the name; empty when nothing is.
base::Result<std::string> keptText(sqlite::Connection& connection, std::string_view name);

}  // namespace host
