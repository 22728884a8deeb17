// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The whitelist lookup, and the statistics of a distribution.

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "bench/Rows.h"
#include "platform/SystemLog.h"
#include "report/Arithmetic.h"
#include "report/PLConfig.h"
#include "report/PrefixTable.h"
#include "support/TestPlatform.h"

namespace {

using plist::Dictionary;
using plist::Number;

constexpr int kKeys = 5000, kPrefixes = 1000, kSamples = 100000;

// Keys as counters have them: a few levels of names, most of what they begin with shared.
std::string keyNumber(int i) {
  return "com.example.subsystem" + std::to_string(i % 50) + ".component" + std::to_string(i % 997) +
         ".counter" + std::to_string(i);
}

// A whitelist of which half the keys are exact entries, beside as many prefixes as asked for.
struct Whitelist {
  explicit Whitelist(int prefixes) {
    Dictionary exact, beginnings;
    for (int i = 0; i < kKeys; i += 2) exact.set(keyNumber(i), Dictionary{{"sig_fig", 2}});
    for (int i = 0; i < prefixes; ++i) {
      const std::string key = keyNumber(2 * i + 1);
      beginnings.set(key.substr(0, key.rfind('.') + 1), Dictionary{{"sig_fig", 3}});
    }
    platform.setWhitelist({{"Group", Dictionary{{"ScalarKeys", std::move(exact)},
                                                {"ScalarKeyPrefixes", std::move(beginnings)}}}});
    config = report::PLConfig::init(platform.platform, context);
  }

  void lookUp(const std::vector<std::string>& keys) const {
    for (const std::string& key : keys) bench::keep(config->configOptionsForScalarKey(key));
  }

  support::TestPlatform platform{platform::LogLevel::standard};
  morvend::DeviceContext context{platform.platform};
  std::unique_ptr<report::PLConfig> config;
};

// The three operations that each sample waits for: difference, quotient, sum.
void chain(const std::vector<double>& samples) {
  double mean = samples[0];
  double count = 1;
  for (std::size_t i = 1; i < samples.size(); ++i) {
    count += 1;
    const double delta = samples[i] - mean;
    mean += delta / count;
  }
  bench::keep(mean);
}

void summarise(const std::vector<double>& samples, const report::Intervals* intervals) {
  report::Distribution distribution(intervals);
  constexpr std::size_t kBlock = 512;
  for (std::size_t start = 0; start < samples.size(); start += kBlock) {
    distribution.add(std::span(samples).subspan(start, std::min(kBlock, samples.size() - start)));
  }
  bench::keep(distribution.statistics().size());
}

}  // namespace

void bench::addReportRows(Table& table) {
  std::vector<std::string> keys;
  for (int i = 0; i < kKeys; ++i) keys.push_back(keyNumber(i));
  const Whitelist with(kPrefixes), without(0);
  table.compare(
      "whitelist lookup, 1,000 prefixes", "the lookup with none", 3, kKeys,
      [&] { with.lookUp(keys); }, [&] { without.lookUp(keys); }, 51);

  std::vector<double> samples(kSamples);
  std::mt19937_64 random(1);
  for (double& sample : samples) sample = static_cast<double>(random() % 1000000) / 1000;
  std::vector<Number> bounds;
  for (int i = 0; i < 10; ++i) bounds.emplace_back(100 * i + 50.0);
  const report::Intervals ten(bounds);
  table.compare(
      "Welford over samples", "the chain of its three operations", 1.15, kSamples,
      [&] { summarise(samples, nullptr); }, [&] { chain(samples); }, 51);
  table.compare(
      "Welford over samples, ten bounds", "the chain of its three operations", 1.15 * 1.4, kSamples,
      [&] { summarise(samples, &ten); }, [&] { chain(samples); }, 51);
}
