// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/Health.h"

#include <cstddef>
#include <string>

#include "NANDInfo/queries/StorageHealth.h"
#include "tools/common/Table.h"
#include "tools/common/TerminalText.h"

namespace nandinfo {

namespace {

int statusOf(NANDInfo::Verdict verdict) {
  constexpr int kStatuses[] = {0, 3, 10, 11};
  return kStatuses[static_cast<std::size_t>(verdict)];
}

// The verdict in a line, then each drive's with its reasons and figures.
std::string textOf(const NANDInfo::StorageHealth& health) {
  std::string text = std::string("The storage: ") + nameOf(health.verdict) + "\n";
  for (const NANDInfo::Patient& patient : health.patients) {
    text += "\n" + tools::printable(patient.name);
    if (!patient.model.empty()) text += " (" + tools::printable(patient.model) + ")";
    text += std::string(": ") + nameOf(patient.judgement.verdict) + "\n";
    for (const auto& [reasonsVerdict, reason] : patient.judgement.reasons) {
      text += std::string("  ") + nameOf(reasonsVerdict) + ": " + tools::printable(reason) + "\n";
    }
    tools::Table table({{}, {.align = tools::Table::Align::right}}, 2);
    for (const auto& [name, value] : NANDInfo::judged(patient.figures)) {
      table.addRow({name, std::to_string(value)});
    }
    text += table.text();
  }
  return text;
}

}  // namespace

CommandResult healthVerdict(const Invocation& invocation) {
  const bool acknowledges = invocation.arguments.acknowledge;
  const auto health = NANDInfo::storageHealth(invocation.services, acknowledges);
  if (acknowledges && invocation.kept) {
    if (const auto kept = invocation.kept(); !kept) return kept.error();
  }
  CommandResult result(plist::Value(describe(health)));
  result.text = textOf(health);
  result.status = statusOf(health.verdict);
  return result;
}

}  // namespace nandinfo
