// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/Drives.h"

#include <string>
#include <utility>

#include "NANDInfo/queries/Drives.h"
#include "tools/nandinfo/TableText.h"

namespace nandinfo {

namespace {

using plist::Array;
using plist::Dictionary;

// A column for each drive, with its figures below what it is.
Dictionary columnsOf(const Array& drives) {
  Dictionary columns;
  for (const plist::Value& drive : drives) {
    Dictionary column = *drive.as<Dictionary>();
    const std::string* name = column.text("name");
    std::string title = name != nullptr ? *name : "?";
    if (const Dictionary* figures = column.dictionary("figures")) {
      const Dictionary all = *figures;
      column.remove("figures");
      for (const auto& [key, value] : all) column.set(key, value);
    }
    column.remove("name");
    columns.set(std::move(title), std::move(column));
  }
  return columns;
}

CommandResult record(const Invocation& invocation) {
  if (!invocation.recordDrives) return base::Error{"there is nobody who could record drives"};
  const auto recorded = invocation.recordDrives();
  if (!recorded) return recorded.error();
  Array results;
  std::string errors;
  for (const auto& [name, kept] : *recorded) {
    Dictionary result{{"name", name}};
    if (!kept) {
      result.set("error", kept.error().text);
      errors += (errors.empty() ? "" : "; ") + kept.error().at(name).text;
    }
    results.push_back(std::move(result));
  }
  if (errors.empty()) return {std::move(results)};
  return {std::move(results), base::Error{std::move(errors)}};
}

}  // namespace

CommandResult drives(const Invocation& invocation) {
  if (invocation.arguments.record) return record(invocation);
  CommandResult result(plist::Value(NANDInfo::describedDrives(invocation.services.registry)));
  const auto& shown = *result.value->as<Array>();
  if (!shown.empty()) result.text = tableText(columnsOf(shown), invocation.width);
  return result;
}

}  // namespace nandinfo
