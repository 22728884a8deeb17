// The values that the report collects itself: PLReport's collectors.

#include <array>
#include <cmath>
#include <cstring>
#include <limits>
#include <optional>
#include <string>
#include <type_traits>
#include <vector>

#include "base/Convert.h"
#include "platform/Eventra.h"
#include "platform/InstalledApplications.h"
#include "platform/Kernel.h"
#include "platform/LocaleService.h"
#include "platform/SystemLog.h"
#include "report/KernelCounters.h"
#include "report/PLReport.h"

namespace report {

using base::saturatingCast;
using platform::LogLevel;

namespace {

constexpr int kInstalledApplicationBundles = 1;

// A kernel value of the width of T, or none when the read fails.
template <typename T>
std::optional<T> readKernelValue(platform::Kernel& kernel, const char* name) {
  static_assert(std::is_unsigned_v<T>);
  std::array<std::byte, sizeof(T)> buffer{};
  if (kernel.sysctlbyname(name, buffer).error != 0) return std::nullopt;
  T value = 0;
  for (std::size_t i = 0; i < sizeof(T); ++i) {
    value |= static_cast<T>(std::to_integer<T>(buffer[i]) << (8 * i));
  }
  return value;
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
  std::uint64_t total = 0;
  for (std::size_t i = 0; i < 8; ++i) {
    total |= std::to_integer<std::uint64_t>(record[i]) << (8 * i);
  }
  return static_cast<std::int64_t>(total);
}

}  // namespace

void PLReport::addInstalledAppInfo() {
  constexpr char kAll[] = "com.norba.tarvenn.numAllInstalledApps";
  constexpr char kThirdParty[] = "com.norba.tarvenn.numThirdPartyApps";
  constexpr char kEvent[] = "com.norba.tarvenn.appInstalls";
  const auto* allOptions = scalarOptions(kAll);
  const auto* thirdPartyOptions = scalarOptions(kThirdParty);
  if (allOptions == nullptr && thirdPartyOptions == nullptr &&
      !services_.eventra.EventraIsEventUsed(kEvent)) {
    return;
  }
  std::int64_t all = 0, thirdParty = 0;
  services_.applications.enumerateBundles([&](platform::InstalledApplications::BundleType type) {
    ++all;
    if (type == platform::InstalledApplications::BundleType::user) ++thirdParty;
  });
  if (allOptions != nullptr) addScalar(all, kAll, *allOptions);
  if (thirdPartyOptions != nullptr) addScalar(thirdParty, kThirdParty, *thirdPartyOptions);
  services_.eventra.EventraSendEventLazy(kEvent, [all, thirdParty] {
    return plist::Dictionary{{"numThirdPartyApps", thirdParty}, {"numAllApps", all}};
  });
}

void PLReport::addMetadataKeys() {
  const auto preferred = services_.locale.preferredLanguages();
  const auto matches =
      services_.locale.bestMatch(services_.locale.systemLocalizations(), preferred);
  auto firstOf = [](const std::vector<std::string>& languages) {
    return languages.empty() ? std::string("<unknown>") : languages.front();
  };
  metadataOutput_.set("PLUserInterfaceLanguage", firstOf(matches));
  metadataOutput_.set("PLPreferredUserInterfaceLanguage", firstOf(preferred));
  if (const auto country = services_.locale.countryCode()) {
    metadataOutput_.set("PLUserSetRegionFormat", *country);
  }
}

void PLReport::reportDatabaseSize() {
  addScalarForKey("com.norba.quenset.prnd.database.size",
                  [&] { return context_.GetCountersDatabaseSizeMB(); });
  addScalarForKey("com.norba.quenset.prnd.database.corruptions",
                  [&] { return context_.ReadAndResetDatabaseCorruptionCount(); });
}

void PLReport::reportCPUUptime() {
  addScalarForKey("com.norba.usage.cur_boot_session_cpu_uptime", [&]() -> std::int64_t {
    const auto timebase = services_.kernel.timebase();
    if (!timebase || timebase->denominator == 0) {
      services_.log.log(LogLevel::error, "Couldn't retrieve mach_timebase_info");
      return -1;
    }
    const double minutesPerTick = static_cast<double>(timebase->numerator) * 1e-9 /
                                  static_cast<double>(timebase->denominator) / 60;
    return saturatingCast<std::int64_t>(minutesPerTick *
                                        static_cast<double>(services_.kernel.absoluteTime()));
  });
}

// The gates are read whether or not a key is whitelisted; a key's own value only if it is.
void PLReport::reportVMStats() {
  platform::Kernel& kernel = services_.kernel;
  auto add32 = [&](const char* key, const char* name) {
    addScalarForKey(key, [&] { return kernelValue32(kernel, name); });
  };
  auto add64 = [&](const char* key, const char* name) {
    addScalarForKey(key, [&] { return kernelValue64(kernel, name); });
  };
  auto addPercentage = [&](const char* key, const char* name, std::uint64_t base) {
    addScalarForKey(key, [&] { return percentage(kernel, name, base); });
  };

  if (readKernelValue<std::uint32_t>(kernel, "vm.vmtc_total").value_or(0) != 0) {
    for (const KernelCounter& row : kTagCheckCounters) add32(row.key, row.name);
  }

  add32("com.norba.kernel.memorystatus_freeze_count", "kern.memorystatus_freeze_count");
  if (const auto pages =
          readKernelValue<std::uint64_t>(kernel, "kern.memorystatus_freeze_pageouts")) {
    addScalarForKey("com.norba.kernel.memorystatus_freeze_pageouts",
                    [&] { return static_cast<std::int64_t>(*pages); });
    const double frozenGiB = static_cast<double>(kernel.pageSize() * *pages) * std::ldexp(1.0, -30);
    if (frozenGiB >= 1.0) {
      addScalarForKey("com.norba.memorystatus_freezer_thaws_per_gb", [&] {
        return saturatingCast<std::int64_t>(
            kernelValueAsDouble(kernel, "kern.memorystatus_thaw_count_since_boot") / frozenGiB);
      });
    }
  }

  add64("com.norba.kernel.memorystatus_freeze_budget_pages_remaining",
        "kern.memorystatus_freeze_budget_pages_remaining");
  add32("com.norba.kernel.memorystatus_thaw_count", "kern.memorystatus_thaw_count");
  addScalarForKey("com.norba.kernel.swapusage", [&] { return totalSwapSize(kernel); });

  if (const auto considered = readKernelValue<std::uint64_t>(
          kernel, "kern.memorystatus_freezer_process_considered_count")) {
    for (const KernelCounter& row : kFreezerErrorCounters) {
      addPercentage(row.key, row.name, *considered);
    }
    addScalarForKey("com.norba.memorystatus_freezer_process_considered_count",
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
    addScalarForKey("com.norba.memorystatus_freezer_refreeze_average", [&] {
      const auto bytes =
          readKernelValue<std::uint64_t>(kernel, "kern.memorystatus_freezer_bytes_refrozen")
              .value_or(std::numeric_limits<std::uint64_t>::max());
      return static_cast<std::int64_t>(bytes / *refreezes);
    });
  }
}

}  // namespace report
