// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a whitelist means: a key passes only if an entry of a group that is taken covers it, with
// that entry's options, and what is reported lies as near to the value as these say.

#include <cmath>
#include <cstdint>
#include <optional>

#include "Input.h"
#include "device/DeviceContext.h"
#include "platform/testing/FakePlatform.h"
#include "plist/PropertyList.h"
#include "report/Arithmetic.h"
#include "report/PLConfig.h"
#include "report/Sections.h"

namespace {

using fuzz::require;
using plist::Dictionary;
using report::CounterOptions;

constexpr std::string_view kWords[] = {"ScalarKeys",
                                       "ScalarKeyPrefixes",
                                       "DistributionKeys",
                                       "DistributionKeyPrefixes",
                                       "bucket_interval",
                                       "sig_fig",
                                       "intervals",
                                       "InternalTesting",
                                       "",
                                       "a",
                                       "a.",
                                       "a.b",
                                       "a.b.",
                                       "a.bc",
                                       "b",
                                       "b\xC3\xA9",
                                       "com.norba.x"};

bool isUnsigned(const plist::Value* value) {
  const auto* number = value != nullptr ? value->as<plist::Number>() : nullptr;
  if (value == nullptr) return true;
  return number != nullptr &&
         (number->type() == plist::Number::Type::uint64 || number->doubleValue() >= 0);
}

// Whether an entry can be understood; then it is a dictionary.
bool isSound(const plist::Value& value) {
  const auto* entry = value.as<Dictionary>();
  if (entry == nullptr || !isUnsigned(entry->find("bucket_interval"))) return false;
  if (!isUnsigned(entry->find("sig_fig"))) return false;
  const plist::Value* intervals = entry->find("intervals");
  if (intervals == nullptr) return true;
  const auto* bounds = intervals->as<plist::Array>();
  return bounds != nullptr && std::ranges::all_of(*bounds, [](const plist::Value& bound) {
           return bound.as<plist::Number>() != nullptr;
         });
}

// The entry that covers a key, found by going through all of them: the key's own, else that of the
// longest prefix, of equal ones the last; null when none does.
struct Search {
  const Dictionary& groups;
  std::optional<bool> switched;  // the group "a", by a preference
  bool isInternal;

  const Dictionary* in(std::string section, std::string_view key) const {
    if (const Dictionary* exact = longest(section, key, false)) return exact;
    section.replace(section.size() - 1, 1, "Prefixes");
    return longest(section, key, true);
  }

 private:
  bool isTaken(const std::string& group) const {
    if (isInternal) return true;
    return group != "InternalTesting" && (group != "a" || switched.value_or(true));
  }
  const Dictionary* longest(const std::string& name, std::string_view key, bool prefixes) const {
    const Dictionary* found = nullptr;
    std::size_t length = 0;
    for (const auto& [group, content] : groups) {
      const auto* sections = content.as<Dictionary>();
      if (sections == nullptr || !isTaken(group)) continue;
      const Dictionary* section = sections->dictionary(name);
      if (section == nullptr) continue;
      for (const auto& [covers, entry] : *section) {
        const bool matches = prefixes ? key.starts_with(covers) : key == covers;
        if (!matches || covers.size() < length || !isSound(entry)) continue;
        found = entry.as<Dictionary>();
        length = covers.size();
      }
    }
    return found;
  }
};

void checkOptions(const CounterOptions& options, const Dictionary& entry) {
  const auto same = [&entry](const std::optional<std::uint64_t>& option, const char* name) {
    const auto* number = entry.number(name);
    return option ? number != nullptr && number->uint64Value() == *option : number == nullptr;
  };
  require(same(options.bucketInterval, "bucket_interval"), "the interval is the entry's");
  require(same(options.significantFigures, "sig_fig"), "the figures are the entry's");
  const auto* bounds = entry.array("intervals");
  require((bounds != nullptr) == options.intervals.has_value(), "the bounds are the entry's");
  require(bounds == nullptr || bounds->size() == options.intervals->size(), "all of them");
}

// In doubles, to whose precision this looks.
void checkRounding(std::int64_t value, const CounterOptions& options) {
  CounterOptions bucket;
  bucket.bucketInterval = options.bucketInterval;
  const std::int64_t bucketed = report::roundScalar(value, bucket);
  constexpr std::int64_t kHalf = std::int64_t{1} << 61;
  if (options.bucketInterval && *options.bucketInterval == 0) require(bucketed == 0, "no buckets");
  if (!options.bucketInterval) {
    require(bucketed == value, "without an interval there are no buckets");
  } else if (*options.bucketInterval > 0 && *options.bucketInterval < kHalf && value < kHalf &&
             value > -kHalf) {
    const auto interval = static_cast<std::int64_t>(*options.bucketInterval);
    const std::int64_t distance = bucketed - value;
    require(bucketed % interval == 0, "a bucket is a multiple of the interval");
    require(distance <= interval / 2 && -distance <= interval / 2, "it is the nearest");
  }
  const std::int64_t rounded = report::roundScalar(value, options);
  if (!options.significantFigures || bucketed == 0) {
    return require(rounded == bucketed, "without figures a bucket is what is reported");
  }
  const double magnitude = std::abs(static_cast<double>(bucketed));
  int digits = 0;
  for (double power = 1; power < magnitude; power *= 10) ++digits;
  if (*options.significantFigures > 19) return;
  const auto figures = static_cast<int>(*options.significantFigures);
  if (figures >= digits) return require(rounded == bucketed, "it has no more figures than that");
  const double unit = std::pow(10.0, digits - figures);
  const double distance = static_cast<double>(rounded) - static_cast<double>(bucketed);
  require(std::abs(distance) <= unit / 2 + magnitude * 1e-15, "it keeps its figures");
}

void checkHistogram(const CounterOptions& options, std::span<const double> samples) {
  report::Distribution distribution(options.intervals ? &*options.intervals : nullptr);
  distribution.add(samples);
  const auto histogram = distribution.histogram();
  require(options.intervals || !histogram, "only bounds make a histogram");
  if (!histogram) return;
  std::uint64_t counted = 0;
  for (const auto& bucket : *histogram) counted += bucket.value.as<plist::Number>()->uint64Value();
  // Buckets between the same bounds have the same label.
  const auto& bounds = options.intervals->values();
  if (std::ranges::adjacent_find(bounds, std::ranges::greater_equal()) != bounds.end()) return;
  require(counted == samples.size(), "each sample is in one bucket");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  fuzz::Input input(bytes, size);
  const unsigned device = input.number<std::uint8_t>();
  const auto value = static_cast<std::int64_t>(input.number<std::uint64_t>());
  const double samples[] = {static_cast<double>(value), static_cast<double>(device), -1.5, 0, 3};
  const Dictionary made = fuzz::Values(input, kWords).dictionary(8);
  const auto text = plist::writeXML(made);
  require(bool(text), "a whitelist can be written");

  platform::fakes::FakePlatform platform(platform::LogLevel::error);
  platform.files.contents["/Library/Application Support/Pelloran/Whitelist_Vrn.plist"] = *text;
  platform.device.internalBuild = (device & 1) != 0;
  Search search{made, {}, platform.device.internalBuild};
  if ((device & 2) != 0) {
    search.switched = (device & 4) != 0;
    platform.preferences.setMobile("com.norba.da", "a", *search.switched);
  }
  morvend::DeviceContext context(platform.platform);
  const auto config = report::PLConfig::init(platform.platform, context);
  require(config != nullptr, "a dictionary is a whitelist");

  report::Sections sections(config.get(), platform.log);
  for (const std::string_view key :
       {"", "a", "a.b", "a.b.c", "a.bc", "b\xC3\xA9", "com.norba.xy"}) {
    const Dictionary* entry = search.in("ScalarKeys", key);
    const CounterOptions* options = config->configOptionsForScalarKey(key);
    require(entry != nullptr || options == nullptr || search.isInternal,
            "a key that passes is covered");
    require(entry == nullptr || options != nullptr, "a key that is covered passes");
    if (entry != nullptr) checkOptions(*options, *entry);
    if (options != nullptr) checkRounding(value, *options);
    sections.addScalarForKey(key, [value] { return value; });
    require((sections.scalars.find(key) != nullptr) == (options != nullptr), "it is reported then");

    entry = search.in("DistributionKeys", key);
    options = config->configOptionsForDistributionKey(key);
    require(entry != nullptr || options == nullptr || search.isInternal, "so are distributions");
    require(entry == nullptr || options != nullptr, "so do distributions");
    if (entry != nullptr) checkOptions(*options, *entry);
    if (options != nullptr) checkHistogram(*options, samples);
  }
  return 0;
}
