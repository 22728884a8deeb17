// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the figures of a drive mean for who relies on it: a table of rules, and what comes of it.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <string>
#include <utility>
#include <vector>

namespace NANDInfo {

// From the best to the worst. Unknown: something that a verdict needs wasn't to be had, and nothing
// that was known is worse than good.
enum class Verdict : std::uint8_t { good, unknown, watch, replace };
const char* nameOf(Verdict verdict);

// What tells the figures, which decides on those that there must be.
enum class Source : std::uint8_t { NVMe = 1, lifeTime = 2, controller = 4 };

using HealthFigures = std::map<std::string, std::uint64_t, std::less<>>;

struct Judgement {
  Verdict verdict = Verdict::good;
  std::vector<std::pair<Verdict, std::string>> reasons;  // in the order of the rules
};

// `acknowledged` holds counts that somebody has seen and lives with: only what has grown since
// then counts. A count below the one acknowledged began anew.
Judgement judge(const HealthFigures& figures, Source source, const HealthFigures& acknowledged);

// Those of the figures that a rule looks at, and those of them that can be acknowledged.
HealthFigures judged(const HealthFigures& figures);
HealthFigures acknowledgeable(const HealthFigures& figures);

}  // namespace NANDInfo
