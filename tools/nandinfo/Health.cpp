// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/Health.h"

#include <algorithm>
#include <string>
#include <utility>
#include <vector>

#include "NANDInfo/NANDInfo.h"
#include "platform/Names.h"
#include "platform/PreferenceStore.h"
#include "tools/common/Table.h"
#include "tools/common/TerminalText.h"
#include "tools/nandinfo/Drives.h"
#include "tools/nandinfo/HealthRules.h"

namespace nandinfo {

namespace {

using plist::Array;
using plist::Dictionary;

constexpr char kAcknowledged[] = "AcknowledgedHealth";

// A drive, or what stands for one, with what a verdict is made of.
struct Patient {
  std::string name, model, identity;  // the last one is the drive's wherever it is plugged in
  Source source = Source::controller;
  HealthFigures figures = {}, acknowledged = {};
  std::string unknown = {};  // why there are no figures
  Judgement judgement = {};
};

HealthFigures numbersIn(const Dictionary* dictionary) {
  HealthFigures figures;
  if (dictionary == nullptr) return figures;
  for (const auto& [key, value] : *dictionary) {
    if (const auto* number = value.as<plist::Number>()) figures[key] = number->uint64Value();
  }
  return figures;
}

Dictionary dictionaryOf(const HealthFigures& figures) {
  Dictionary dictionary;
  for (const auto& [key, value] : figures) dictionary.set(key, value);
  return dictionary;
}

std::string textIn(const Dictionary& dictionary, const char* key) {
  const std::string* text = dictionary.text(key);
  return text != nullptr ? *text : "";
}

Patient patientOf(const Dictionary& drive) {
  Patient patient{.name = textIn(drive, "name"), .model = textIn(drive, "model"), .identity = {}};
  const std::string serial = textIn(drive, "serial");
  patient.identity = serial.empty() ? patient.name : patient.model + " " + serial;
  patient.source = textIn(drive, "kind") == "NVMe" ? Source::NVMe : Source::lifeTime;
  patient.figures = numbersIn(drive.dictionary("figures"));
  // A drive with neither a spare nor a threshold for it doesn't count it.
  const auto isZero = [&patient](const char* figure) {
    const auto found = patient.figures.find(figure);
    return found != patient.figures.end() && found->second == 0;
  };
  if (isZero("availableSpare") && isZero("availableSpareThreshold")) {
    patient.figures.erase("availableSpare");
  }
  patient.unknown = textIn(drive, "unknown");
  return patient;
}

// A figure of the verdict and the counters that tell it, of which the largest counts; a last one
// that ends with "_" is an array.
struct Counterpart {
  const char* figure;
  std::vector<std::string> counters;
};

// What a storage controller's statistics say of the same.
Patient controllerOf(const NANDInfo::Services& services) {
  Patient controller{.name = "controller", .model = {}, .identity = "controller"};
  const auto counters = NANDInfo::CopyNANDFTLInfo(services, false, true);
  const auto* isQRT1 = counters ? counters->number(NANDInfo::kNANDInfoIsQRT1Controller) : nullptr;
  if (isQRT1 == nullptr) {
    controller.unknown = std::string("no flash drive or storage controller answers (") +
                         NANDInfo::GetAPIErrorMessage() + ")";
    return controller;
  }
  std::vector<Counterpart> counterparts = {
      {"criticalWarning", {"smartCritWarnings"}},
      {"percentageUsed", {"fwUpdatesPercentUsed", "slcPercentUsed", "percentUsed"}},
      {"availableSpare", {"spareAvailablePercent"}},
      {"mediaErrors", {isQRT1->boolValue() ? "ueccReads" : "raidSmartErrors"}},
      {"endToEndErrors", {}},
      {"dieFailures", {"numDieFailures"}}};
  constexpr int kEndToEndCounters = 12;
  for (int i = 0; i < kEndToEndCounters; ++i) {
    counterparts[4].counters.push_back("E2EDPErrorCounters_" + std::to_string(i));
  }
  for (const auto& [figure, names] : counterparts) {
    for (const std::string& name : names) {
      const auto* number = counters->number(name);
      if (number == nullptr) continue;
      std::uint64_t& value = controller.figures[figure];
      value = std::max(value, number->uint64Value());
    }
  }
  return controller;
}

std::vector<Patient> patientsOf(const Invocation& invocation) {
  std::vector<Patient> patients;
  for (const Dictionary& drive : describedDrives(invocation.services.registry)) {
    patients.push_back(patientOf(drive));
  }
  if (patients.empty()) patients.push_back(controllerOf(invocation.services));
  return patients;
}

base::Result<void> acknowledge(const Invocation& invocation, Dictionary& baseline,
                               const std::vector<Patient>& patients) {
  for (const Patient& patient : patients) {
    if (!patient.unknown.empty()) continue;
    baseline.set(patient.identity, dictionaryOf(acknowledgeable(patient.figures)));
  }
  const plist::Value value(baseline);
  invocation.services.preferences.QNSPreferencesSetValue(kAcknowledged, &value,
                                                         platform::kDaemonName);
  return invocation.kept ? invocation.kept() : base::Result<void>();
}

int statusOf(Verdict verdict) {
  constexpr int kStatuses[] = {0, 3, 10, 11};
  return kStatuses[static_cast<std::size_t>(verdict)];
}

Dictionary describe(const Patient& patient) {
  Dictionary drive{{"name", patient.name}};
  if (!patient.model.empty()) drive.set("model", patient.model);
  drive.set("verdict", nameOf(patient.judgement.verdict));
  Array reasons;
  for (const auto& [verdict, reason] : patient.judgement.reasons) reasons.push_back(reason);
  drive.set("reasons", std::move(reasons));
  drive.set("figures", dictionaryOf(judged(patient.figures)));
  if (!patient.acknowledged.empty()) {
    drive.set("acknowledged", dictionaryOf(patient.acknowledged));
  }
  return drive;
}

// The verdict in a line, then each drive's with its reasons and figures.
std::string textOf(Verdict verdict, const std::vector<Patient>& patients) {
  std::string text = std::string("The storage: ") + nameOf(verdict) + "\n";
  for (const Patient& patient : patients) {
    text += "\n" + tools::printable(patient.name);
    if (!patient.model.empty()) text += " (" + tools::printable(patient.model) + ")";
    text += std::string(": ") + nameOf(patient.judgement.verdict) + "\n";
    for (const auto& [reasonsVerdict, reason] : patient.judgement.reasons) {
      text += std::string("  ") + nameOf(reasonsVerdict) + ": " + tools::printable(reason) + "\n";
    }
    tools::Table table({{}, {.align = tools::Table::Align::right}}, 2);
    for (const auto& [name, value] : judged(patient.figures)) {
      table.addRow({name, std::to_string(value)});
    }
    text += table.text();
  }
  return text;
}

}  // namespace

CommandResult healthVerdict(const Invocation& invocation) {
  std::vector<Patient> patients = patientsOf(invocation);
  const auto stored =
      invocation.services.preferences.QNSPreferencesGetValue(kAcknowledged, platform::kDaemonName);
  const auto* known = stored ? stored->as<Dictionary>() : nullptr;
  Dictionary baseline = known != nullptr ? *known : Dictionary();
  if (invocation.arguments.acknowledge) {
    const auto kept = acknowledge(invocation, baseline, patients);
    if (!kept) return kept.error();
  }
  Verdict worst = Verdict::good;
  Array drives;
  for (Patient& patient : patients) {
    patient.acknowledged = numbersIn(baseline.dictionary(patient.identity));
    if (patient.unknown.empty()) {
      patient.judgement = judge(patient.figures, patient.source, patient.acknowledged);
    } else {
      patient.judgement = {Verdict::unknown, {{Verdict::unknown, patient.unknown}}};
    }
    worst = std::max(worst, patient.judgement.verdict);
    drives.push_back(describe(patient));
  }
  CommandResult result(Dictionary{{"verdict", nameOf(worst)}, {"drives", std::move(drives)}});
  result.text = textOf(worst, patients);
  result.status = statusOf(worst);
  return result;
}

}  // namespace nandinfo
