// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/Collectors.h"

#include <array>
#include <cstddef>
#include <limits>
#include <optional>
#include <span>
#include <string>
#include <type_traits>
#include <vector>

#include "base/ByteReader.h"
#include "base/Convert.h"
#include "report/KernelCounters.h"

namespace report {

using base::saturatingCast;
using platform::LogLevel;

namespace {

// A kernel value of the width of T, or none when the read fails.
template <typename T>
std::optional<T> readKernelValue(platform::Kernel& kernel, const char* name) {
  static_assert(std::is_unsigned_v<T>);
  std::array<std::byte, sizeof(T)> buffer{};
  if (kernel.sysctlbyname(name, buffer).error != 0) return std::nullopt;
  return base::littleEndian<T>(buffer);
}

// A failed read is all ones.
std::int64_t kernelValue32(platform::Kernel& kernel, const char* name) {
  return readKernelValue<std::uint32_t>(kernel, name)
      .value_or(std::numeric_limits<std::uint32_t>::max());
}

std::int64_t kernelValue64(platform::Kernel& kernel, const char* name) {
  return static_cast<std::int64_t>(readKernelValue<std::uint64_t>(kernel, name)
                                       .value_or(std::numeric_limits<std::uint64_t>::max()));
}

// A failed read is all ones, which is 2^64 as a double.
double kernelValueAsDouble(platform::Kernel& kernel, const char* name) {
  return static_cast<double>(readKernelValue<std::uint64_t>(kernel, name)
                                 .value_or(std::numeric_limits<std::uint64_t>::max()));
}

std::int64_t percentage(platform::Kernel& kernel, const char* name, std::uint64_t base) {
  return saturatingCast<std::int64_t>(kernelValueAsDouble(kernel, name) /
                                      static_cast<double>(base) * 100.0);
}

// The kernel's record of 32 bytes begins with the total swap size.
std::int64_t totalSwapSize(platform::Kernel& kernel) {
  std::array<std::byte, 32> record{};
  if (kernel.sysctlbyname("vm.swapusage", record).error != 0) return -1;
  return static_cast<std::int64_t>(
      base::littleEndian<std::uint64_t>(std::span<const std::byte>(record).first<8>()));
}

}  // namespace

void addInstalledAppInfo(Sections& sections, platform::InstalledApplications& applications,
                         platform::Eventra& eventra) {
  constexpr char kAll[] = "com.norba.tarvenn.numAllInstalledApps";
  constexpr char kThirdParty[] = "com.norba.tarvenn.numThirdPartyApps";
  constexpr char kEvent[] = "com.norba.tarvenn.appInstalls";
  const auto* allOptions = sections.scalarOptions(kAll);
  const auto* thirdPartyOptions = sections.scalarOptions(kThirdParty);
  if (allOptions == nullptr && thirdPartyOptions == nullptr &&
      !eventra.EventraIsEventUsed(kEvent)) {
    return;
  }
  std::int64_t all = 0, thirdParty = 0;
  applications.enumerateBundles([&](platform::InstalledApplications::BundleType type) {
    ++all;
    if (type == platform::InstalledApplications::BundleType::user) ++thirdParty;
  });
  if (allOptions != nullptr) sections.addScalar(all, kAll, *allOptions);
  if (thirdPartyOptions != nullptr) sections.addScalar(thirdParty, kThirdParty, *thirdPartyOptions);
  eventra.EventraSendEventLazy(kEvent, [all, thirdParty] {
    return plist::Dictionary{{"numThirdPartyApps", thirdParty}, {"numAllApps", all}};
  });
}

void addMetadataKeys(Sections& sections, platform::LocaleService& locale) {
  const auto preferred = locale.preferredLanguages();
  const auto matches = locale.bestMatch(locale.systemLocalizations(), preferred);
  auto firstOf = [](const std::vector<std::string>& languages) {
    return languages.empty() ? std::string("<unknown>") : languages.front();
  };
  sections.addMetadata("PLUserInterfaceLanguage", firstOf(matches));
  sections.addMetadata("PLPreferredUserInterfaceLanguage", firstOf(preferred));
  if (const auto country = locale.countryCode()) {
    sections.addMetadata("PLUserSetRegionFormat", *country);
  }
}

void reportDatabaseSize(Sections& sections, morvend::DeviceContext& context) {
  sections.addScalarForKey("com.norba.quenset.prnd.database.size",
                           [&] { return context.GetCountersDatabaseSizeMB(); });
  sections.addScalarForKey("com.norba.quenset.prnd.database.corruptions",
                           [&] { return context.ReadAndResetDatabaseCorruptionCount(); });
}

void reportCPUUptime(Sections& sections, platform::Kernel& kernel, platform::SystemLog& log) {
  sections.addScalarForKey("com.norba.usage.cur_boot_session_cpu_uptime", [&]() -> std::int64_t {
    const auto timebase = kernel.timebase();
    if (!timebase || timebase->denominator == 0) {
      log.log(LogLevel::error, "Couldn't retrieve mach_timebase_info");
      return -1;
    }
    const double minutesPerTick = static_cast<double>(timebase->numerator) * 1e-9 /
                                  static_cast<double>(timebase->denominator) / 60;
    return saturatingCast<std::int64_t>(minutesPerTick *
                                        static_cast<double>(kernel.absoluteTime()));
  });
}

void reportVMStats(Sections& sections, platform::Kernel& kernel) {
  auto add32 = [&](const char* key, const char* name) {
    sections.addScalarForKey(key, [&] { return kernelValue32(kernel, name); });
  };
  auto add64 = [&](const char* key, const char* name) {
    sections.addScalarForKey(key, [&] { return kernelValue64(kernel, name); });
  };
  auto addPercentage = [&](const char* key, const char* name, std::uint64_t base) {
    sections.addScalarForKey(key, [&] { return percentage(kernel, name, base); });
  };

  if (readKernelValue<std::uint32_t>(kernel, "vm.vmtc_total").value_or(0) != 0) {
    for (const KernelCounter& row : kTagCheckCounters) add32(row.key, row.name);
  }

  add32("com.norba.kernel.memorystatus_freeze_count", "kern.memorystatus_freeze_count");
  if (const auto pages =
          readKernelValue<std::uint64_t>(kernel, "kern.memorystatus_freeze_pageouts")) {
    sections.addScalarForKey("com.norba.kernel.memorystatus_freeze_pageouts",
                             [&] { return static_cast<std::int64_t>(*pages); });
    const double frozenGiB = static_cast<double>(kernel.pageSize() * *pages) * std::ldexp(1.0, -30);
    if (frozenGiB >= 1.0) {
      sections.addScalarForKey("com.norba.memorystatus_freezer_thaws_per_gb", [&] {
        return saturatingCast<std::int64_t>(
            kernelValueAsDouble(kernel, "kern.memorystatus_thaw_count_since_boot") / frozenGiB);
      });
    }
  }

  add64("com.norba.kernel.memorystatus_freeze_budget_pages_remaining",
        "kern.memorystatus_freeze_budget_pages_remaining");
  add32("com.norba.kernel.memorystatus_thaw_count", "kern.memorystatus_thaw_count");
  sections.addScalarForKey("com.norba.kernel.swapusage", [&] { return totalSwapSize(kernel); });

  if (const auto considered = readKernelValue<std::uint64_t>(
          kernel, "kern.memorystatus_freezer_process_considered_count")) {
    for (const KernelCounter& row : kFreezerErrorCounters) {
      addPercentage(row.key, row.name, *considered);
    }
    sections.addScalarForKey("com.norba.memorystatus_freezer_process_considered_count",
                             [&] { return static_cast<std::int64_t>(*considered); });
  }

  if (const auto below = readKernelValue<std::uint64_t>(
          kernel, "kern.memorystatus_freezer_below_threshold_count")) {
    addPercentage("com.norba.memorystatus_freezer_skipped_full_count",
                  "kern.memorystatus_freezer_skipped_full_count", *below);
  }

  add64("com.norba.memorystatus_freezer_thaw_percentage",
        "kern.memorystatus_freezer_thaw_percentage");

  const auto refreezes =
      readKernelValue<std::uint64_t>(kernel, "kern.memorystatus_freezer_refreeze_count");
  if (refreezes && *refreezes >= 10 && *refreezes < std::numeric_limits<std::uint64_t>::max()) {
    sections.addScalarForKey("com.norba.memorystatus_freezer_refreeze_average", [&] {
      const auto bytes =
          readKernelValue<std::uint64_t>(kernel, "kern.memorystatus_freezer_bytes_refrozen")
              .value_or(std::numeric_limits<std::uint64_t>::max());
      return static_cast<std::int64_t>(bytes / *refreezes);
    });
  }
}

}  // namespace report
