// Captured buffers, decoded without a controller.
//
// FILE is an ordinary path of the calling process, "-" its standard input; at most 16 MiB are read.
#pragma once

#include <cstddef>
#include <span>
#include <string>
#include <string_view>

#include "NANDInfo/CounterRecords.h"
#include "tools/nandinfo/Commands.h"

namespace nandinfo {

// {"ok": whether the parser reported success, "fields": [[name, value], …] in the buffer's order,
// "error": the library's message}.
CommandResult decodeFTL(const Invocation& invocation);
CommandResult decodeFTLStat(const Invocation& invocation);
CommandResult decodeLegacy(const Invocation& invocation);
CommandResult decodeMSP(const Invocation& invocation);

// The words of the common layout, from the file's first counter block; one that ends after the
// words that the layout reads is taken for the rest as zeros.
CommandResult decodeCounters(const Invocation& invocation);

// A vendor's layout of the counter block.
struct CounterLayout {
  const char* name;
  std::size_t words;  // the highest that it reads, and one
  void (*parse)(NANDInfo::CounterBlock block, NANDInfo::NandCountersRecord& record);
};
std::span<const CounterLayout> counterLayouts();
const CounterLayout* findCounterLayout(std::string_view name);

}  // namespace nandinfo
