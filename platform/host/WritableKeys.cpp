#include "platform/host/WritableKeys.h"

#include <algorithm>

#include "platform/host/UTF8.h"

namespace platform::host {

std::optional<Dictionary> withWritableKeys(const Dictionary& dictionary) {
  const auto canBeWritten = [](const Dictionary::Entry& entry) { return isWritable(entry.key); };
  if (std::all_of(dictionary.begin(), dictionary.end(), canBeWritten)) return std::nullopt;
  Dictionary written;
  std::string room;
  for (const Dictionary::Entry& entry : dictionary) {
    written.set(writable(entry.key, room), entry.value);
  }
  return written;
}

}  // namespace platform::host
