// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/queries/StorageHealth.h"

#include <algorithm>
#include <cstdint>
#include <utility>

#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/queries/Drives.h"
#include "platform/Names.h"
#include "platform/PreferenceStore.h"

namespace NANDInfo {

namespace {

using plist::Array;
using plist::Dictionary;

constexpr char kAcknowledged[] = "AcknowledgedHealth";

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
Patient controllerOf(const Services& services) {
  Patient controller{.name = "controller", .model = {}, .identity = "controller"};
  const auto counters = CopyNANDFTLInfo(services, false, true);
  const auto* isQRT1 = counters ? counters->number(kNANDInfoIsQRT1Controller) : nullptr;
  if (isQRT1 == nullptr) {
    controller.unknown =
        std::string("no flash drive or storage controller answers (") + GetAPIErrorMessage() + ")";
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

std::vector<Patient> patientsOf(const Services& services) {
  std::vector<Patient> patients;
  for (const plist::Value& drive : describedDrives(services.registry)) {
    patients.push_back(patientOf(*drive.as<Dictionary>()));
  }
  if (patients.empty()) patients.push_back(controllerOf(services));
  return patients;
}

void acknowledge(const Services& services, Dictionary& baseline,
                 const std::vector<Patient>& patients) {
  for (const Patient& patient : patients) {
    if (!patient.unknown.empty()) continue;
    baseline.set(patient.identity, dictionaryOf(acknowledgeable(patient.figures)));
  }
  const plist::Value value(baseline);
  services.preferences.QNSPreferencesSetValue(kAcknowledged, &value, platform::kDaemonName);
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

}  // namespace

StorageHealth storageHealth(const Services& services, bool acknowledges) {
  StorageHealth health{.patients = patientsOf(services)};
  const auto stored =
      services.preferences.QNSPreferencesGetValue(kAcknowledged, platform::kDaemonName);
  const auto* known = stored ? stored->as<Dictionary>() : nullptr;
  Dictionary baseline = known != nullptr ? *known : Dictionary();
  if (acknowledges) acknowledge(services, baseline, health.patients);
  for (Patient& patient : health.patients) {
    patient.acknowledged = numbersIn(baseline.dictionary(patient.identity));
    if (patient.unknown.empty()) {
      patient.judgement = judge(patient.figures, patient.source, patient.acknowledged);
    } else {
      patient.judgement = {Verdict::unknown, {{Verdict::unknown, patient.unknown}}};
    }
    health.verdict = std::max(health.verdict, patient.judgement.verdict);
  }
  return health;
}

Dictionary describe(const StorageHealth& health) {
  Array drives;
  for (const Patient& patient : health.patients) drives.push_back(describe(patient));
  return {{"verdict", nameOf(health.verdict)}, {"drives", std::move(drives)}};
}

}  // namespace NANDInfo
