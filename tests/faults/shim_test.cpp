// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The shim itself: a fault that it doesn't make would make every fault test pass.

#include <gtest/gtest.h>

#include <csignal>
#include <utility>

#include "faults/FaultRun.h"
#include "support/TemporaryFolder.h"

namespace {

using faults::Outcome;

constexpr std::size_t kCalls = 9;

Outcome runCalls(const support::TemporaryFolder& root, const faults::Fault& fault) {
  return faults::run({FAULT_SUBJECT, root.path().string()}, {}, fault);
}

TEST(FaultShim, CountsTheCallsOfItsKindAndNothingElse) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  const std::pair<const char*, std::size_t> rows[] = {
      {"EIO", kCalls}, {"EMFILE", 2}, {"unreadable", 1}};
  for (const auto& [kind, calls] : rows) {
    const support::TemporaryFolder root;
    EXPECT_EQ(faults::count({FAULT_SUBJECT, root.path().string()}, {}, kind), calls) << kind;
    const support::TemporaryFolder failing;
    EXPECT_EQ(runCalls(failing, {calls, kind}).status, 1) << kind;
  }
}

TEST(FaultShim, KillsAndFailsAtTheCallThatIsNamed) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  for (std::size_t at = 1; at <= kCalls; ++at) {
    const support::TemporaryFolder before, after, failing;
    EXPECT_EQ(runCalls(before, {at, "kill-before"}).signal, SIGKILL);
    EXPECT_EQ(runCalls(after, {at, "kill-after"}).signal, SIGKILL);
    EXPECT_EQ(runCalls(failing, {at, "EIO"}).status, 1);
    const auto has = [](const support::TemporaryFolder& root, const char* name) {
      return std::filesystem::exists(root / name);
    };
    EXPECT_EQ(has(before, "folder"), at > 1);
    EXPECT_EQ(has(after, "folder"), at < 9);
    EXPECT_EQ(has(failing, "folder"), at == 9);
    EXPECT_EQ(has(before, "file"), at > 2 && at <= 8);
    EXPECT_EQ(has(after, "other"), at >= 8);
  }
  const support::TemporaryFolder root;
  EXPECT_EQ(runCalls(root, {kCalls + 1, "kill-before"}).status, 0);
}

TEST(FaultShim, WritesHalfOfTheBytesOnceOrFromThereOn) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  const std::pair<faults::Fault, const char*> rows[] = {
      {{}, "02345678abcdef"}, {{3, "short"}, "0234abcdef"}, {{3, "short", true}, "0234ab"}};
  for (const auto& [fault, bytes] : rows) {
    const support::TemporaryFolder root;
    EXPECT_EQ(runCalls(root, fault).status, 0);
    EXPECT_STREQ(root.read("other").c_str(), bytes);
  }
  const support::TemporaryFolder root;
  runCalls(root, {3, "EIO", true});
  EXPECT_EQ(root.read("file"), "");
}

}  // namespace
