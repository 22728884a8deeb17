// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/outbox/ServitaLogFiles.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <map>
#include <string_view>
#include <utility>

#include "HostServices.h"

namespace host {
namespace {

constexpr char kFolder[] = "var/log/servita/";

using Files = std::map<std::string, std::string>;

// The logs of "a", each with the letter of its place as its bytes; a space is a gap.
Files logs(std::string_view letters) {
  Files files;
  for (std::size_t i = 0; i < letters.size(); ++i) {
    if (letters[i] == ' ') continue;
    files["a.log" + (i == 0 ? "" : "." + std::to_string(i))] = letters[i];
  }
  return files;
}

TEST(ServitaLogFiles, OldLogsMoveUpToTheFirstFreeNumber) {
  const Files others{{"a.log.1", "1"}, {".log", "x"}, {"alog", "y"}, {"a.log.old", "z"}};
  const std::pair<Files, Files> rows[] = {
      {logs("a"), logs(" a")},
      {logs("ab d"), logs(" abd")},  // the gap that a killed roll-over left
      {logs("abcdefghi"), logs(" abcdefgi")},
      {{{"a.log", "a"}, {"b.log", "b"}}, {{"a.log.1", "a"}, {"b.log.1", "b"}}},
      {others, others}};  // without a current file nothing moves; other names aren't logs
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

TEST(ServitaLogFiles, WhatIsNoLogStaysAndIsPassedOver) {
  for (const support::Kind kind : support::kOtherKinds) {
    for (const std::string place : {"a.log", "a.log.1"}) {
      support::HostServices host;
      const auto at = host.folder.path() / kFolder / place, target = host.folder / "target";
      support::put(kind, at, target);
      if (place != "a.log") host.folder.write("var/log/servita/a.log", "0");
      host.folder.write("var/log/servita/b.log", "b");
      ServitaLogFiles(host.root, host.log).rollServitaLogs();
      EXPECT_TRUE(support::untouched(kind, at, target));
      EXPECT_EQ(host.folder.read("var/log/servita/b.log.1"), "b");
      EXPECT_EQ(host.folder.read("var/log/servita/a.log.2"), place == "a.log" ? "" : "0");
      EXPECT_EQ(host.log.count("error: Could not roll " + host.root.hostPath(kFolder) + place +
                               ": not a regular file"),
                1);
    }
  }
  support::HostServices empty;
  ServitaLogFiles(empty.root, empty.log).rollServitaLogs();
  EXPECT_TRUE(empty.log.lines().empty());
}

}  // namespace
}  // namespace host
