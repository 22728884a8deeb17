// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "bench/ReportDevice.h"

#include <cstdlib>
#include <filesystem>
#include <random>
#include <stdexcept>
#include <system_error>

#include "base/CivilDate.h"
#include "plist/PropertyList.h"
#include "tools/mkdevice/SampleController.h"

namespace bench {

using plist::Array;
using plist::Dictionary;
using plist::Value;

namespace {

constexpr int kFamilies = 50;

std::string familyPrefix(int family) { return "com.example.family" + std::to_string(family) + "."; }
std::string scalarKey(int i) { return familyPrefix(i % kFamilies) + "counter" + std::to_string(i); }
std::string distributionKey(int i) { return "com.example.distribution" + std::to_string(i); }

}  // namespace

ReportDevice::ReportDevice(int scalars, int distributions, int samples) {
  writePropertyList("var/preferences/mobile/com.norba.quenset.plist",
                    Dictionary{{"DiagnosticLogSubmissionEnabled", true}});
  const Dictionary rounding{{"bucket_interval", 10}, {"sig_fig", 3}};
  const Dictionary counted{{"intervals", Array{Value(100), Value(1000)}}};
  Dictionary scalarKeys, scalarPrefixes, distributionKeys;
  for (int i = 0; i < scalars; i += 10) scalarKeys.set(scalarKey(i), rounding);
  for (int family = 0; family < kFamilies; ++family) {
    scalarPrefixes.set(familyPrefix(family), rounding);
  }
  for (int i = 0; i < distributions; i += 10) distributionKeys.set(distributionKey(i), counted);
  writePropertyList(
      "Library/Application Support/Pelloran/Whitelist_Vrn.plist",
      Dictionary{{"Group", Dictionary{{"ScalarKeys", std::move(scalarKeys)},
                                      {"ScalarKeyPrefixes", std::move(scalarPrefixes)},
                                      {"DistributionKeys", std::move(distributionKeys)},
                                      {"DistributionKeyPrefixes",
                                       Dictionary{{"com.example.distribution", Dictionary()}}}}}});
  fill(scalars, distributions, samples);
}

void ReportDevice::addStorage(mkdevice::ControllerKind controller) {
  const std::int32_t today = yesterday_ + 1;
  for (const auto& [path, content] :
       mkdevice::controllerFiles({.today = today, .controller = controller})) {
    if (const auto* bytes = content.as<std::string>()) {
      root_.write(path, *bytes);
    } else {
      writePropertyList(path, content);
    }
  }
  for (const char* name :
       {"statistics", "band-statistics", "telemetry-0", "telemetry-1", "telemetry-2", "defects"}) {
    buffers_.push_back(root_ / "device/controller" / (std::string(name) + ".bin"));
  }
  writePropertyList("device/kernel.plist",
                    Dictionary{{"kern.bootsessionuuid", today % 2 == 0 ? "1" : "0"}});
  Array records;
  for (int i = 0; i < 40; ++i) {
    records.push_back(Dictionary{{"procName", "process" + std::to_string(i)},
                                 {"since", plist::Date{today * 86400.0}},
                                 {"wifiInBytes", 1 << 20}});
  }
  writePropertyList("device/network-usage.plist", Dictionary{{"Records", std::move(records)}});
  const auto module = root_ / "System/Library/PrivateFrameworks/FaultwatchSupport.framework";
  std::filesystem::create_directories(module);
  std::filesystem::copy_file(FAULTWATCH_SUPPORT_MODULE, module / "FaultwatchSupport");
}

void forgetLogs(const support::TemporaryFolder& root) {
  std::error_code none;
  for (const char* folder : {"var/spool/morvend/submitted", "var/spool/morvend/structured"}) {
    for (const auto& log : std::filesystem::directory_iterator(root / folder, none)) {
      std::filesystem::remove(log);
    }
  }
}

void ReportDevice::forgetRuns() const {
  forgetLogs(root_);
  if (buffers_.empty()) return;
  // The storage log is weekly, and data usage a difference.
  for (const char* domain : {"com.norba.pellorand.morvend", "com.norba.quenset.morvend"}) {
    std::filesystem::remove(root_ / "var/preferences/mobile" / (std::string(domain) + ".plist"));
  }
}

Arguments ReportDevice::report() const {
  forgetRuns();
  ::setenv("MORVEND_ROOT", path_.c_str(), 1);
  return {program("morvend"), "-f"};
}

Arguments ReportDevice::bareReport() const {
  Arguments arguments{program("bare_report"), database(), std::to_string(yesterday_),
                      root_ / "bare.xml"};
  arguments.insert(arguments.end(), buffers_.begin(), buffers_.end());
  return arguments;
}

Arguments ReportDevice::pythonReport() const {
  return {"python3",
          MORVEND_SOURCE_DIR "/bench/yardsticks/python_report.py",
          database(),
          std::to_string(yesterday_),
          root_ / "Library/Application Support/Pelloran/Whitelist_Vrn.plist",
          root_ / "python.xml"};
}

void ReportDevice::writePropertyList(const std::string& path, const Value& value) {
  root_.write(path, *plist::writeXML(value));
}

void ReportDevice::fill(int scalars, int distributions, int samples) {
  using host::CounterChange;
  yesterday_ = base::dayBefore(host_.counters().PLDaysSince1970());
  std::vector<std::string> keys;
  for (int i = 0; i < scalars; ++i) keys.push_back(scalarKey(i));
  for (int i = 0; i < distributions; ++i) keys.push_back(distributionKey(i));
  std::mt19937_64 random(1);
  for (std::int32_t day = yesterday_ - 2; day <= yesterday_; ++day) {
    std::vector<CounterChange> changes;
    for (int i = 0; i < scalars; ++i) {
      changes.push_back({.kind = CounterChange::Kind::set,
                         .key = keys[static_cast<std::size_t>(i)],
                         .day = day,
                         .amount = static_cast<std::int64_t>(random() % 1000000)});
    }
    for (int i = 0; i < distributions; ++i) {
      for (int sample = 0; sample < samples; ++sample) {
        changes.push_back({.kind = CounterChange::Kind::push,
                           .key = keys[static_cast<std::size_t>(scalars + i)],
                           .day = day,
                           .sample = static_cast<double>(random() % 2000000) / 1000,
                           .seconds = sample});
      }
    }
    if (const auto applied = host_.counters().apply(changes); !applied) {
      throw std::runtime_error(applied.error().text);
    }
  }
  host_.counters().PLClientCheckpoint();
}

}  // namespace bench
