// The file-backed services under every fault at every call: what stands on disk afterwards is the
// old or the new state, what was acknowledged is there, and a run without faults completes the
// work.

#include <gtest/gtest.h>

#include <csignal>
#include <functional>
#include <map>
#include <set>

#include "faults/FaultRun.h"
#include "faults/Subject.h"
#include "platform/host/HostPropertyListCodec.h"
#include "support/TemporaryFolder.h"

namespace {

using support::TemporaryFolder;

constexpr char kPreferences[] = "var/preferences/mobile/com.example.plist";
constexpr char kLog[] = "var/spool/morvend/submitted/log.193.20261122T040000Z";
constexpr char kOptions[] = ".options.plist";

// Every file below the root: its path and its bytes.
std::map<std::string, std::string> filesBelow(const TemporaryFolder& root) {
  std::map<std::string, std::string> files;
  for (const auto& entry : std::filesystem::recursive_directory_iterator(root.path())) {
    if (!entry.is_regular_file()) continue;
    const std::string path = entry.path().lexically_relative(root.path());
    files[path] = root.read(path);
  }
  return files;
}

using Prepare = std::function<void(const TemporaryFolder&)>;
using Check = std::function<void(const TemporaryFolder&, const faults::Outcome&)>;

// Does a work of the subject under every fault, each on a root of its own, with `afterFault` to
// check what stands there; then without a fault, with `afterNext`.
void underEveryFault(const std::string& work, const Prepare& prepare, const Check& afterFault,
                     const Check& afterNext) {
  const auto command = [&work](const TemporaryFolder& root) {
    return faults::Strings{FAULT_SUBJECT, work, root.path().string()};
  };
  const TemporaryFolder counted;
  prepare(counted);
  const std::size_t calls = faults::count(command(counted), {});
  ASSERT_GT(calls, 0u);
  for (const char* kind : faults::kKinds) {
    for (std::size_t at = 1; at <= calls; ++at) {
      for (const bool onward : {false, true}) {
        const bool kills = std::string_view(kind).starts_with("kill");
        if (kills && onward) continue;
        SCOPED_TRACE(work + ": " + kind + " at call " + std::to_string(at) +
                     (onward ? " and from there on" : ""));
        const TemporaryFolder root;
        prepare(root);
        const auto outcome = faults::run(command(root), {}, {at, kind, onward});
        // A call that only some outcomes of the work make may not be reached.
        EXPECT_TRUE(kills || outcome.signal == 0);
        EXPECT_TRUE(std::string_view(kind) != "short" || outcome.status == 0);
        afterFault(root, outcome);
        const auto next = faults::run(command(root), {});
        EXPECT_EQ(next.status, 0) << next.standardError;
        afterNext(root, next);
      }
    }
  }
}

std::string preferencesOf(const char* a, const char* b) {
  platform::host::HostPropertyListCodec codec;
  return *codec.writeXML(platform::Dictionary{{"a", a}, {"b", b}});
}

TEST(FilesUnderFaults, PreferencesAreTheOldOrTheNewWhole) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  const std::string old = preferencesOf("old", "old");
  const std::string now = preferencesOf(subject::kNewValue, subject::kNewValue);
  for (const std::string& before : {std::string(), old}) {
    underEveryFault(
        "preferences",
        [&](const TemporaryFolder& root) {
          if (!before.empty()) root.write(kPreferences, before);
        },
        [&](const TemporaryFolder& root, const faults::Outcome& outcome) {
          const std::string bytes = root.read(kPreferences);
          EXPECT_TRUE(bytes == now || (bytes == before && outcome.status != 0)) << bytes;
        },
        [&](const TemporaryFolder& root, const faults::Outcome&) {
          EXPECT_EQ(filesBelow(root), (std::map<std::string, std::string>{{kPreferences, now}}));
        });
  }
}

TEST(FilesUnderFaults, ABrokenPreferenceFileIsKeptBeforeItIsReplaced) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  const std::string broken = "<plist><dict>";
  const std::string kept = std::string(kPreferences) + ".corrupt";
  const std::string now = preferencesOf(subject::kNewValue, subject::kNewValue);
  underEveryFault(
      "preferences", [&](const TemporaryFolder& root) { root.write(kPreferences, broken); },
      [&](const TemporaryFolder& root, const faults::Outcome&) {
        EXPECT_TRUE(root.read(kPreferences) == broken || root.read(kept) == broken);
      },
      [&](const TemporaryFolder& root, const faults::Outcome&) {
        EXPECT_EQ(root.read(kPreferences), now);
        EXPECT_EQ(root.read(kept), broken);
      });
}

TEST(FilesUnderFaults, ALogIsSubmittedWholeOrNotAtAll) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  const auto nothing = [](const TemporaryFolder&) {};
  bool first = false;  // whether the faulty run left its log
  underEveryFault(
      "submission", nothing,
      [&](const TemporaryFolder& root, const faults::Outcome& outcome) {
        first = std::filesystem::exists(root / kLog);
        if (first) {
          EXPECT_EQ(root.read(kLog), subject::kLogBytes);
          EXPECT_NE(root.read(std::string(kLog) + kOptions).find("&lt;unknown&gt;"),
                    std::string::npos);
        }
        EXPECT_TRUE(first || outcome.status != 0);
      },
      [&](const TemporaryFolder& root, const faults::Outcome&) {
        // Nothing is left but whole logs with their options.
        const std::string second = std::string(kLog) + "-2";
        std::set<std::string> expected{kLog, std::string(kLog) + kOptions};
        if (first) expected.insert({second, second + kOptions});
        std::set<std::string> names;
        for (const auto& [name, bytes] : filesBelow(root)) names.insert(name);
        EXPECT_EQ(names, expected);
      });
}

TEST(FilesUnderFaults, AnEarlierDaysStructuredLogsAreNeverLost) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  const auto places = [](const TemporaryFolder& root, const std::string& bytes) {
    int number = 0;
    for (const auto& [name, content] : filesBelow(root)) number += content == bytes ? 1 : 0;
    return number;
  };
  underEveryFault(
      "structuredLogs",
      [](const TemporaryFolder& root) {
        root.write("var/spool/morvend/structured/2026-11-20.jsonl", "{\"one\": 1}\n");
        root.write("var/spool/morvend/structured/2026-11-21.jsonl", "{\"two\": 2}\n");
      },
      [&](const TemporaryFolder& root, const faults::Outcome&) {
        EXPECT_EQ(places(root, "{\"one\": 1}\n"), 1);
        EXPECT_EQ(places(root, "{\"two\": 2}\n"), 1);
      },
      [&](const TemporaryFolder& root, const faults::Outcome&) {
        EXPECT_EQ(root.read("var/spool/morvend/submitted/structured-2026-11-20.jsonl"),
                  "{\"one\": 1}\n");
        const std::string today = root.read("var/spool/morvend/structured/2026-11-22.jsonl");
        EXPECT_TRUE(today.starts_with("{\"type\"") && today.ends_with("}\n")) << today;
      });
}

TEST(FilesUnderFaults, ARollOverLosesNoLogBeforeItsTime) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  const auto contents = [](const TemporaryFolder& root) {
    std::set<std::string> all;
    for (const auto& [name, bytes] : filesBelow(root)) all.insert(bytes);
    return all;
  };
  const std::set<std::string> all{"0", "1", "2", "3"};
  underEveryFault(
      "rollOver",
      [](const TemporaryFolder& root) {
        root.write("var/log/servita/a.log", "0");
        for (const char* n : {"1", "2", "3"})
          root.write(std::string("var/log/servita/a.log.") + n, n);
      },
      [&](const TemporaryFolder& root, const faults::Outcome&) { EXPECT_EQ(contents(root), all); },
      [&](const TemporaryFolder& root, const faults::Outcome&) {
        EXPECT_EQ(contents(root), all);
        EXPECT_EQ(root.read("var/log/servita/a.log"), "");
      });
}

TEST(FilesUnderFaults, EventsAreWholeLinesAndNeverHangTheProcess) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  static constexpr char kEvents[] = "var/spool/morvend/events.jsonl";
  underEveryFault(
      "events", [](const TemporaryFolder& root) { root.write(kEvents, "{}\n{\"torn\": "); },
      [](const TemporaryFolder& root, const faults::Outcome&) {
        EXPECT_TRUE(root.read(kEvents).starts_with("{}\n"));
      },
      [](const TemporaryFolder& root, const faults::Outcome&) {
        const std::string lines = root.read(kEvents);
        EXPECT_EQ(lines.find("torn"), std::string::npos);
        EXPECT_TRUE(lines.ends_with("}\n"));
      });
}

}  // namespace
