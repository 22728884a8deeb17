// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/Files.h"

#include <cerrno>
#include <chrono>
#include <filesystem>
#include <numeric>
#include <system_error>
#include <utility>
#include <vector>

#include <fcntl.h>
#include <gtest/gtest.h>

#include "HostServices.h"
#include "host/files/DeviceFileSystem.h"
#include "host/files/Patience.h"
#include "host/files/SystemError.h"

namespace host {
namespace {

using Missing = DeviceRoot::Missing;
using Links = DeviceRoot::Links;
using support::TemporaryFolder;

TEST(DeviceRoot, NoPathLeadsOutside) {
  const TemporaryFolder outer;
  outer.write("secret", "outside");
  outer.write("root/inside", "inside");
  std::filesystem::create_symlink(outer / "secret", outer / "root/absolute");
  std::filesystem::create_symlink("../secret", outer / "root/relative");
  std::filesystem::create_symlink("/inside", outer / "root/within");
  std::filesystem::create_symlink("..", outer / "root/up");
  const DeviceRoot root((outer / "root").string());
  platform::fakes::RecordingLog log;
  DeviceFileSystem files(root);
  for (const char* path :
       {"/absolute", "/relative", "../secret", "/x/../../secret", "/up/secret"}) {
    EXPECT_FALSE(files.readFile(path, 100)) << path;
    EXPECT_FALSE(files.fileStatus(path)) << path;
  }
  for (const char* path : {"/within", "inside", "//inside", "/../inside", "/up/inside"}) {
    EXPECT_EQ(files.readFile(path, 100), "inside") << path;
    EXPECT_EQ(files.fileStatus(path), 6u) << path;
  }
  EXPECT_EQ(files.readFile("/inside", 2), "in");
  EXPECT_FALSE(files.readFile(std::string_view("/inside\0x", 9), 100));
}

TEST(DeviceRoot, FoldersAreMadePrivateAndNeverThroughLinks) {
  const TemporaryFolder root;
  const DeviceRoot device(root.path().string());
  EXPECT_FALSE(device.openFolder("/a/b/c", Missing::fails));
  ASSERT_TRUE(device.openFolder("/a/b/c", Missing::create));
  for (const char* made : {"a", "a/b", "a/b/c"}) {
    EXPECT_EQ(std::filesystem::status(root / made).permissions(),
              std::filesystem::perms::owner_all);
  }
  std::filesystem::create_symlink("/a", root / "link");
  EXPECT_TRUE(device.openFolder("/link/new", Missing::create)
                  .error()
                  .is(std::errc::too_many_symbolic_link_levels));
  EXPECT_FALSE(std::filesystem::exists(root / "a/new"));
  EXPECT_TRUE(device.openFolder("/link/new", Missing::create, Links::followed));
  EXPECT_TRUE(std::filesystem::exists(root / "a/new"));
  root.write("file", "");
  EXPECT_TRUE(
      device.openFolder("/file/below", Missing::create).error().is(std::errc::not_a_directory));
}

TEST(Files, NothingButARegularFileOfOneNameIsWritten) {
  platform::fakes::RecordingLog log;
  std::vector<support::Kind> kinds(std::begin(support::kOtherKinds),
                                   std::end(support::kOtherKinds));
  kinds.push_back(support::Kind::secondName);
  for (const support::Kind kind : kinds) {
    for (const bool append : {false, true}) {
      const TemporaryFolder root;
      const auto at = root / "folder/file", target = root / "target";
      support::put(kind, at, target);
      const auto folder = DeviceRoot(root.path().string()).openFolder("/folder", Missing::fails);
      const auto written = append ? appendLines(folder->get(), "file", "x\n", {log, "file"})
                                  : replaceFile(folder->get(), "file", "x");
      const bool shared = kind == support::Kind::secondName;
      EXPECT_TRUE(!written && written.error().text ==
                                  (shared ? "a file with several names" : "not a regular file"));
      EXPECT_TRUE(support::untouched(kind, at, target));
    }
  }
}

TEST(Patience, TriesAgainWhatMayPassWithinItsBounds) {
  std::vector<int> pauses;
  Patience patience([&pauses](std::chrono::milliseconds time) {
    pauses.push_back(static_cast<int>(time.count()));
  });
  // Fails as often; how often it was tried.
  const auto tries = [&](int failures, int error) {
    int tried = 0;
    const auto done = patience([&]() -> base::Result<void> {
      if (++tried <= failures) return systemError(error);
      return {};
    });
    EXPECT_EQ(static_cast<bool>(done), tried > failures);
    return tried;
  };
  for (const int error : {ENOENT, EACCES, EROFS, ENOTDIR, ELOOP}) EXPECT_EQ(tries(9, error), 1);
  EXPECT_TRUE(pauses.empty());
  EXPECT_EQ(tries(0, EIO), 1);
  EXPECT_EQ(tries(1, EIO), 2);
  EXPECT_EQ(tries(3, ENOSPC), 4);
  EXPECT_EQ(tries(9, EMFILE), 4);
  EXPECT_EQ(pauses, (std::vector<int>{100, 100, 400, 1500, 100, 400, 1500}));
  for (const int left : {3, 2, 2, 2, 2, 1, 1}) EXPECT_EQ(tries(9, EIO), left);
  EXPECT_EQ(std::accumulate(pauses.begin(), pauses.end(), 0), 5000);
}

TEST(Files, WhatStandsInTheWayOfAFileBesideIsPassedBy) {
  const TemporaryFolder root;
  const auto folder = DeviceRoot(root.path().string()).openFolder("/", Missing::fails);
  root.write("target", "kept");
  std::filesystem::create_symlink("target", root / ".file.new");
  for (int number = 1; number <= kMaxNamesBeside; ++number) {
    const std::string text = std::to_string(number), suffix = number > 1 ? "-" + text : "";
    EXPECT_TRUE(replaceFile(folder->get(), "file", text));
    EXPECT_EQ(root.read("file"), text);
    std::filesystem::copy_file(root / "file", root / "damaged");
    EXPECT_TRUE(keepBeside(folder->get(), "damaged", "kept"));
    EXPECT_EQ(root.read("kept" + suffix), text);
    root.write(".file.new" + suffix + "/in the way", "");
    std::filesystem::remove(root / ("kept" + suffix));
    std::filesystem::create_directory(root / ("kept" + suffix));
  }
  EXPECT_FALSE(replaceFile(folder->get(), "file", "new"));
  EXPECT_FALSE(keepBeside(folder->get(), "file", "kept"));
  EXPECT_EQ(root.read("file"), std::to_string(kMaxNamesBeside));
  EXPECT_EQ(root.read("target"), "kept");
}

TEST(Files, AnUnfinishedLineIsRemovedBeforeOneIsAppended) {
  platform::fakes::RecordingLog log;
  const std::string line(5000, 'l'), torn(10000, 't');
  const std::pair<std::string, std::string> rows[] = {
      {"", ""},         {"one\n", "one\n"},
      {"torn", ""},     {line + "\n" + torn, line + "\n"},
      {"\n", "\n"},     {line + "\n\n" + torn, line + "\n\n"},
      {torn + torn, ""}};
  for (const auto& [before, kept] : rows) {
    const TemporaryFolder root;
    root.write("file", before);
    const FileDescriptor folder(::open(root.path().c_str(), O_RDONLY | O_DIRECTORY));
    EXPECT_TRUE(appendLines(folder.get(), "file", "new\nlines\n", {log, "file"}));
    EXPECT_EQ(root.read("file"), kept + "new\nlines\n");
  }
}

}  // namespace
}  // namespace host
