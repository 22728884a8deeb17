// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The small services beside the registry: snapshots, purgeable space, disk usage, file systems,
// standard streams.
#include <gtest/gtest.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include "HostServices.h"

#include <array>
#include <filesystem>
#include "host/files/DeviceFileSystem.h"
#include "host/machine/DeviceProperties.h"
#include "host/process/StandardErrorLog.h"
#include "host/process/StandardStreams.h"
#include "host/recorded/DeviceProperties.h"
#include "host/recorded/FileSystem.h"
#include "host/recorded/KernelSnapshots.h"
#include "host/recorded/PurgeableSpace.h"
#include "platform/KernelSnapshots.h"
#include "plist/PropertyList.h"

namespace {

using namespace host::recorded;
using namespace host;

class StorageServices : public testing::Test, protected support::HostServices {};

TEST_F(StorageServices, ASnapshotIsTheFileOrAFailure) {
  KernelSnapshots snapshots(root);
  EXPECT_EQ(snapshots.capture(platform::KernelSnapshots::kChunkedData), std::nullopt);
  folder.write("device/kernel-snapshot.bin", std::string_view("a\0b", 3));
  const auto captured = snapshots.capture(platform::KernelSnapshots::kChunkedData | 1);
  ASSERT_TRUE(captured);
  EXPECT_EQ(*captured, (std::vector{std::byte{'a'}, std::byte{0}, std::byte{'b'}}));
  EXPECT_EQ(snapshots.capture(1), std::nullopt);
  std::filesystem::resize_file(folder / "device/kernel-snapshot.bin",
                               host::recorded::kMaxSnapshot + 1);
  EXPECT_EQ(snapshots.capture(platform::KernelSnapshots::kChunkedData), std::nullopt);
  std::filesystem::remove(folder / "device/kernel-snapshot.bin");
  std::filesystem::create_directory(folder / "device/kernel-snapshot.bin");
  EXPECT_EQ(snapshots.capture(platform::KernelSnapshots::kChunkedData), std::nullopt);
}

TEST_F(StorageServices, PurgeableSpaceIsPresentWithItsFileAndAnswersWithADictionary) {
  const plist::Value amounts(plist::Dictionary{{"SPACEREAP_TOTAL_AVAILABLE", std::int64_t{5}}});
  EXPECT_FALSE(PurgeableSpace(root, log).isPresent());
  for (const plist::Value& file : {amounts, plist::Value(plist::Array{})}) {
    folder.write("device/purgeable-space.plist", *plist::writeXML(file));
    PurgeableSpace service(root, log);
    EXPECT_TRUE(service.isPresent());
    const auto answer = service.SpacereapCopyItemizedPurgeableSpaceWithInfo({});
    EXPECT_EQ(answer ? *answer : plist::Value(plist::Array{}), file);
  }
}

TEST_F(StorageServices, DiskFiguresOfARecordedDeviceAreThoseOfItsProperties) {
  using Figures = std::array<std::optional<std::int64_t>, 3>;
  const auto entry = [](const char* name, plist::Array figures) {
    const bool usage = std::string_view(name) == "DiskUsage";
    const char* const keys[] = {usage ? "TotalDiskCapacity" : "BlockSize",
                                usage ? "TotalDataAvailable" : "Blocks",
                                usage ? "AmountDataAvailable" : "BlocksAvailable"};
    plist::Dictionary figuresOf;
    for (std::size_t i = 0; i < figures.size(); ++i) figuresOf.set(keys[i], std::move(figures[i]));
    return plist::Dictionary{{name, std::move(figuresOf)}};
  };
  const struct {
    plist::Dictionary properties;
    std::optional<Figures> usage, fileSystem;
  } rows[] = {
      {entry("DiskUsage", {std::int64_t{1} << 40, 7.9, 1e300}),
       Figures{std::int64_t{1} << 40, 7, INT64_MAX},
       {}},
      {entry("DiskUsage", {std::int64_t{-1}, -2.5}), Figures{-1, -2, std::nullopt}, {}},
      {entry("DiskUsage", {"text"}), Figures{}, {}},
      {{{"DiskUsage", "plenty"}, {"FileSystem", "ample"}}, {}, {}},
      {entry("FileSystem", {4096, 0, 3}), {}, Figures{4096, 0, 3}},
      {entry("FileSystem", {4096, 10}), {}, {}},
      {entry("FileSystem", {4096, -10, 3}), {}, {}},
      {{}, {}, {}},
  };
  for (const auto& row : rows) {
    folder.write("device/properties.plist", xml(row.properties));
    host::recorded::DeviceProperties properties(root, log);
    const auto usage = properties.diskUsage();
    const auto statistics = recorded::FileSystem(root, properties).statfs("/private/var");
    ASSERT_EQ(usage.has_value(), row.usage.has_value()) << xml(row.properties);
    ASSERT_EQ(statistics.has_value(), row.fileSystem.has_value()) << xml(row.properties);
    if (usage) {
      EXPECT_EQ((Figures{usage->totalDiskCapacity, usage->totalDataAvailable,
                         usage->amountDataAvailable}),
                *row.usage);
    }
    if (statistics) {
      const auto signedFigure = [](std::uint64_t figure) {
        return static_cast<std::int64_t>(figure);
      };
      EXPECT_EQ((Figures{signedFigure(statistics->blockSize), signedFigure(statistics->blocks),
                         signedFigure(statistics->blocksAvailable)}),
                *row.fileSystem);
    }
  }
}

TEST_F(StorageServices, OnThisMachineTheFileSystemIsThatOfAPathBelowTheRoot) {
  std::filesystem::create_directories(folder / "private/var");
  std::filesystem::create_symlink("/private", folder / "inside");
  std::filesystem::create_symlink("../../../../proc", folder / "outside");
  DeviceFileSystem files(root);
  struct statvfs host;
  ASSERT_EQ(::statvfs(folder.path().c_str(), &host), 0);
  const std::uint64_t total = host.f_blocks * host.f_frsize;
  for (const char* path : {"/", "/private/var", "/inside/var", "/.."}) {
    const auto found = files.statfs(path);
    ASSERT_TRUE(found) << path;
    EXPECT_EQ(found->blocks * found->blockSize, total) << path;
    EXPECT_LE(found->blocksAvailable, found->blocks) << path;
  }
  for (const char* path : {"/private/missing", "/proc", "/outside"}) {
    EXPECT_FALSE(files.statfs(path)) << path;
  }
  const auto usage = machine::DeviceProperties(root, root).diskUsage();
  ASSERT_TRUE(usage);
  EXPECT_EQ(usage->totalDiskCapacity, static_cast<std::int64_t>(total));
  EXPECT_EQ(usage->totalDataAvailable, usage->amountDataAvailable);
  EXPECT_LE(usage->totalDataAvailable, usage->totalDiskCapacity);
  EXPECT_FALSE(DeviceFileSystem(DeviceRoot("/nonexistent")).statfs("/"));
}

TEST(StandardStreams, ErrorsAreLinesAndOutputIsAsItIs) {
  StandardErrorLog log(platform::LogLevel::standard);
  StandardStreams streams(log);
  ::testing::internal::CaptureStderr();
  ::testing::internal::CaptureStdout();
  streams.writeError("no end");
  streams.writeError("two\nlines\n");
  streams.writeOutput("no end");
  // What a hostile controller's list brings forth.
  for (int i = 0; i < 1000; ++i) streams.writeError("mode " + std::to_string(i) + "\n");
  log.log(platform::LogLevel::standard, "other");
  for (int i = 0; i < 4; ++i) streams.writeOutput("\n");
  EXPECT_EQ(::testing::internal::GetCapturedStderr(),
            "no end\ntwo\nlines\nmode 0\nmode 1\nmode 2\n997 more messages like \"mode 2\"\n"
            "<5>other\n");
  EXPECT_EQ(::testing::internal::GetCapturedStdout(), "no end\n\n\n\n");
}

}  // namespace
