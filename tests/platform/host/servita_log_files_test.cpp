#include "platform/host/ServitaLogFiles.h"

#include <gtest/gtest.h>

#include <map>

#include "HostServices.h"

namespace platform::host {
namespace {

constexpr char kFolder[] = "var/log/servita/";

using Files = std::map<std::string, std::string>;

TEST(ServitaLogFiles, OldLogsMoveUpToTheFirstFreeNumber) {
  const std::pair<Files, Files> rows[] = {
      {{{"a.log", "0"}}, {{"a.log.1", "0"}}},
      {{{"a.log", "0"}, {"a.log.1", "1"}, {"b.log", "b"}},
       {{"a.log.1", "0"}, {"a.log.2", "1"}, {"b.log.1", "b"}}},
      // The gap that a killed roll-over left.
      {{{"a.log", "0"}, {"a.log.1", "1"}, {"a.log.3", "3"}},
       {{"a.log.1", "0"}, {"a.log.2", "1"}, {"a.log.3", "3"}}},
      {{{"a.log", "0"},
        {"a.log.1", "1"},
        {"a.log.2", "2"},
        {"a.log.3", "3"},
        {"a.log.4", "4"},
        {"a.log.5", "5"},
        {"a.log.6", "6"},
        {"a.log.7", "7"},
        {"a.log.8", "8"}},
       {{"a.log.1", "0"},
        {"a.log.2", "1"},
        {"a.log.3", "2"},
        {"a.log.4", "3"},
        {"a.log.5", "4"},
        {"a.log.6", "5"},
        {"a.log.7", "6"},
        {"a.log.8", "8"}}},
      // Without a current file nothing moves; other names aren't logs.
      {{{"a.log.1", "1"}, {".log", "x"}, {"alog", "y"}, {"a.log.old", "z"}},
       {{"a.log.1", "1"}, {".log", "x"}, {"alog", "y"}, {"a.log.old", "z"}}}};
  for (const auto& [before, after] : rows) {
    support::HostServices host;
    for (const auto& [name, bytes] : before) host.folder.write(kFolder + name, bytes);
    ServitaLogFiles(host.root, host.log).rollServitaLogs();
    Files found;
    for (const auto& entry : std::filesystem::directory_iterator(host.folder / kFolder)) {
      const std::string name = entry.path().filename();
      found[name] = host.folder.read(kFolder + name);
    }
    EXPECT_EQ(found, after);
    EXPECT_TRUE(host.log.lines().empty());
  }
}

TEST(ServitaLogFiles, ALogWithAnythingElseInItsWayStays) {
  for (const support::Kind kind : support::kOtherKinds) {
    for (const char* place : {"a.log", "a.log.1"}) {
      support::HostServices host;
      const auto at = host.folder.path() / kFolder / place, target = host.folder / "target";
      support::put(kind, at, target);
      if (std::string_view(place) != "a.log") host.folder.write("var/log/servita/a.log", "0");
      host.folder.write("var/log/servita/b.log", "b");
      ServitaLogFiles(host.root, host.log).rollServitaLogs();
      EXPECT_TRUE(support::untouched(kind, at, target));
      EXPECT_EQ(host.folder.read("var/log/servita/b.log.1"), "b");
      EXPECT_EQ(host.log.count(std::string("error: Could not roll /var/log/servita/") + place +
                               ": not a regular file"),
                1);
    }
  }
  support::HostServices empty;
  ServitaLogFiles(empty.root, empty.log).rollServitaLogs();
  EXPECT_TRUE(empty.log.lines().empty());
}

}  // namespace
}  // namespace platform::host
