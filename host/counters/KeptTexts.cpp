// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/counters/KeptTexts.h"

namespace host {

base::Result<void> keepText(sqlite::Connection& connection, std::string_view name,
                            std::string_view text) {
  if (auto made = connection.execute(kKeptTable); !made) return made;
  if (text.empty()) {
    return sqlite::Statement(connection, "DELETE FROM kept WHERE name = ?", name).run();
  }
  return sqlite::Statement(connection, "INSERT OR REPLACE INTO kept(name, text) VALUES(?, ?)", name,
                           sqlite::Blob{text})
      .run();
}

base::Result<std::string> keptText(sqlite::Connection& connection, std::string_view name) {
  bool any = false;
  sqlite::Statement table(connection, "SELECT 1 FROM sqlite_schema WHERE name = 'kept'");
  const auto looked = table.forEach([&any] {
    any = true;
    return false;
  });
  if (!looked) return looked.error();
  std::string text;
  if (!any) return text;
  sqlite::Statement kept(connection, "SELECT text FROM kept WHERE name = ?", name);
  const auto read = kept.forEach([&] {
    text = kept.column(0).bytes();
    return false;
  });
  if (!read) return read.error();
  return text;
}

}  // namespace host
