// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/PLConfig.h"

#include <utility>

#include "base/Text.h"
#include "platform/FileSystem.h"
#include "platform/PreferenceStore.h"
#include "platform/SystemLog.h"
#include "plist/MD5.h"
#include "plist/PropertyList.h"

namespace report {

using platform::LogLevel;
using plist::Dictionary;
using plist::Value;

namespace {

constexpr char kWhitelistPath[] = "/Library/Application Support/Pelloran/Whitelist_Vrn.plist";
constexpr char kInternalTesting[] = "InternalTesting";
constexpr char kKeyGroupDomain[] = "com.norba.da";

std::string hexadecimal(const std::array<std::uint8_t, 16>& digest) {
  std::string text;
  for (const std::uint8_t byte : digest) text += base::format("%02x", byte);
  return text;
}

}  // namespace

// Merges key groups; a later entry replaces an earlier one of the same key.
struct PLConfig::Loader {
  const Services& services;
  PLConfig& config;
  OptionsTable scalarPrefixes{}, distributionPrefixes{};

  void skip(const std::string& what) {
    services.log.log(LogLevel::error, "Whitelist: skipping %s, it has the wrong type",
                     what.c_str());
  }

  bool isTaken(const std::string& group) {
    if (group == kInternalTesting && !config.isInternalDevice_) return false;
    bool found = false;
    const bool switchedOn =
        services.preferences.QNSPreferencesGetBooleanValue(group, kKeyGroupDomain, &found);
    if (config.isInternalDevice_ || switchedOn || !found) return true;
    services.log.log(LogLevel::standard, "keyGroup %s is disabled by tasking", group.c_str());
    return false;
  }

  void mergeSection(OptionsTable& into, const std::string& group, const Dictionary& sections,
                    const char* name) {
    const Value* section = sections.find(name);
    if (section == nullptr) return;
    const auto* entries = section->as<Dictionary>();
    if (entries == nullptr) return skip(group + "/" + name);
    for (const Dictionary::Entry& entry : *entries) {
      if (auto options = parseCounterOptions(entry.value)) {
        into.set(entry.key, std::move(*options));
      } else {
        skip(group + "/" + name + "/" + entry.key);
      }
    }
  }

  void mergeGroup(const std::string& group, const Value& value) {
    const auto* sections = value.as<Dictionary>();
    if (sections == nullptr) return skip(group);
    mergeSection(config.scalars_.keys, group, *sections, "ScalarKeys");
    mergeSection(config.distributions_.keys, group, *sections, "DistributionKeys");
    mergeSection(scalarPrefixes, group, *sections, "ScalarKeyPrefixes");
    mergeSection(distributionPrefixes, group, *sections, "DistributionKeyPrefixes");
  }

  void load(const Dictionary& groups) {
    for (const Dictionary::Entry& group : groups) {
      if (isTaken(group.key)) mergeGroup(group.key, group.value);
    }
    config.scalars_.prefixes = PrefixTable(std::move(scalarPrefixes));
    config.distributions_.prefixes = PrefixTable(std::move(distributionPrefixes));
  }
};

std::unique_ptr<PLConfig> PLConfig::init(const Services& services,
                                         morvend::DeviceContext& context) {
  std::unique_ptr<PLConfig> config(new PLConfig(services.log, context.PLIsInternalDevice()));
  // One byte more than the codec takes, so that a longer file is refused, not cut.
  const auto bytes = services.files.readFile(kWhitelistPath, plist::kMaxSize + 1);
  if (!bytes) {
    services.log.log(LogLevel::error, "Couldn't load whitelist");
    return nullptr;
  }
  config->configFileDigest_ = hexadecimal(plist::md5(*bytes));
  const auto parsed = plist::read(*bytes);
  const Dictionary* groups = parsed ? parsed->as<Dictionary>() : nullptr;
  if (groups == nullptr) {
    services.log.log(LogLevel::error, "Couldn't parse the contents of the config file. Error: %s",
                     parsed ? "the top level is not a dictionary" : parsed.error().text.c_str());
    return nullptr;
  }
  Loader{services, *config}.load(*groups);
  return config;
}

const CounterOptions PLConfig::kUnnamed{};

const CounterOptions* PLConfig::optionsForKey(const Table& table, std::string_view key) const {
  if (const auto* exact = table.keys.find(key)) return exact;
  const int length = static_cast<int>(key.size());
  if (const auto match = table.prefixes.longestPrefix(key); match.options != nullptr) {
    log_.log(LogLevel::debug, "prefix match %.*s for %.*s", static_cast<int>(match.prefix.size()),
             match.prefix.data(), length, key.data());
    return match.options;
  }
  if (!isInternalDevice_) return nullptr;
  log_.log(LogLevel::debug, "passing @{} for %.*s as device is Norba Internal", length, key.data());
  return &kUnnamed;
}

const CounterOptions* PLConfig::configOptionsForScalarKey(std::string_view key) const {
  return optionsForKey(scalars_, key);
}

const CounterOptions* PLConfig::configOptionsForDistributionKey(std::string_view key) const {
  return optionsForKey(distributions_, key);
}

}  // namespace report
