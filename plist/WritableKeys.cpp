// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/WritableKeys.h"

#include <algorithm>

#include "base/UTF8.h"

namespace plist {

std::optional<Dictionary> withWritableKeys(const Dictionary& dictionary) {
  const auto canBeWritten = [](const Dictionary::Entry& entry) {
    return base::isWritable(entry.key);
  };
  if (std::all_of(dictionary.begin(), dictionary.end(), canBeWritten)) return std::nullopt;
  Dictionary written;
  std::string room;
  for (const Dictionary::Entry& entry : dictionary) {
    written.set(base::writable(entry.key, room), entry.value);
  }
  return written;
}

}  // namespace plist
