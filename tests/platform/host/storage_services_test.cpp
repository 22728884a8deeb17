// The small services beside the registry: snapshots, purgeable space, disk usage, file systems,
// standard streams.
#include <gtest/gtest.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include "HostServices.h"
#include "platform/host/DeviceFileSystem.h"
#include "platform/host/HostDeviceProperties.h"
#include "platform/host/HostKernelSnapshots.h"
#include "platform/host/HostPurgeableSpace.h"
#include "platform/host/HostStandardStreams.h"

namespace {

using namespace platform;
using namespace platform::host;

class StorageServices : public testing::Test, protected support::HostServices {};

TEST_F(StorageServices, ASnapshotIsTheFileOrAFailure) {
  HostKernelSnapshots snapshots(root);
  EXPECT_EQ(snapshots.capture(KernelSnapshots::kChunkedData), std::nullopt);
  folder.write("device/kernel-snapshot.bin", std::string_view("a\0b", 3));
  const auto captured = snapshots.capture(KernelSnapshots::kChunkedData | 1);
  ASSERT_TRUE(captured);
  EXPECT_EQ(*captured, (std::vector{std::byte{'a'}, std::byte{0}, std::byte{'b'}}));
  EXPECT_EQ(snapshots.capture(1), std::nullopt);
  std::filesystem::resize_file(folder / "device/kernel-snapshot.bin", kLargestSnapshot + 1);
  EXPECT_EQ(snapshots.capture(KernelSnapshots::kChunkedData), std::nullopt);
  std::filesystem::remove(folder / "device/kernel-snapshot.bin");
  std::filesystem::create_directory(folder / "device/kernel-snapshot.bin");
  EXPECT_EQ(snapshots.capture(KernelSnapshots::kChunkedData), std::nullopt);
}

TEST_F(StorageServices, PurgeableSpaceIsPresentWithItsFileAndAnswersWithADictionary) {
  const Dictionary amounts{{"SPACEREAP_TOTAL_AVAILABLE", std::int64_t{5}}};
  const struct {
    std::optional<Value> file;
    bool present, answers;
  } rows[] = {
      {std::nullopt, false, false}, {Value(amounts), true, true}, {Value(Array{}), true, false}};
  for (const auto& row : rows) {
    if (row.file) folder.write("device/purgeable-space.plist", *codec.writeXML(*row.file));
    HostPurgeableSpace service(root, codec, log);
    EXPECT_EQ(service.isPresent(), row.present);
    EXPECT_EQ(service.SpacereapCopyItemizedPurgeableSpaceWithInfo({}),
              row.answers ? std::optional(amounts) : std::nullopt);
  }
}

TEST_F(StorageServices, DiskUsageIsTheDevicesElseTheRootsFileSystem) {
  using Usage = std::array<std::optional<std::uint64_t>, 3>;
  struct statvfs host;
  ASSERT_EQ(::statvfs(folder.path().c_str(), &host), 0);
  const std::uint64_t total = host.f_blocks * host.f_frsize;
  const struct {
    Dictionary properties;
    std::optional<Usage> usage;
  } rows[] = {
      {{{"DiskUsage", Dictionary{{"TotalDiskCapacity", std::int64_t{1} << 40},
                                 {"TotalDataAvailable", 7.9},
                                 {"AmountDataAvailable", UINT64_MAX}}}},
       Usage{std::uint64_t{1} << 40, 7, UINT64_MAX}},
      {{{"DiskUsage",
         Dictionary{{"TotalDiskCapacity", std::int64_t{-1}}, {"TotalDataAvailable", -2.5}}}},
       Usage{0, 0, std::nullopt}},
      {{{"DiskUsage", Dictionary{{"TotalDiskCapacity", "text"}}}}, Usage{}},
      {{{"DiskUsage", "plenty"}}, std::nullopt},
  };
  for (const auto& row : rows) {
    folder.write("device/properties.plist", xml(row.properties));
    DeviceFile file(root, codec, log, "device/properties.plist");
    const auto usage = HostDeviceProperties(root, file).diskUsage();
    ASSERT_EQ(usage.has_value(), row.usage.has_value());
    if (usage) {
      EXPECT_EQ(
          (Usage{usage->totalDiskCapacity, usage->totalDataAvailable, usage->amountDataAvailable}),
          *row.usage);
    }
  }
  for (const char* properties : {"<plist><dict/></plist>", "<plist><array/></plist>", "broken"}) {
    folder.write("device/properties.plist", properties);
    DeviceFile file(root, codec, log, "device/properties.plist");
    const auto usage = HostDeviceProperties(root, file).diskUsage();
    ASSERT_TRUE(usage) << properties;
    EXPECT_EQ(usage->totalDiskCapacity, total);
    EXPECT_EQ(usage->totalDataAvailable, usage->amountDataAvailable);
    EXPECT_LE(usage->totalDataAvailable, total);
  }
}

TEST_F(StorageServices, TheFileSystemIsThatOfAPathBelowTheRoot) {
  std::filesystem::create_directories(folder / "private/var");
  std::filesystem::create_symlink("/private", folder / "inside");
  std::filesystem::create_symlink("../../../../proc", folder / "outside");
  DeviceFileSystem files(root);
  struct statvfs host;
  ASSERT_EQ(::statvfs(folder.path().c_str(), &host), 0);
  for (const char* path : {"/", "/private/var", "/inside/var", "/.."}) {
    const auto found = files.statfs(path);
    ASSERT_TRUE(found) << path;
    EXPECT_EQ(found->blocks * found->blockSize, host.f_blocks * host.f_frsize) << path;
    EXPECT_LE(found->blocksAvailable, found->blocks) << path;
  }
  for (const char* path : {"/private/missing", "/proc", "/outside"}) {
    EXPECT_FALSE(files.statfs(path)) << path;
  }
  EXPECT_FALSE(DeviceFileSystem(DeviceRoot("/nonexistent")).statfs("/"));
}

TEST(StandardStreams, ErrorsAreLinesAndOutputIsAsItIs) {
  const struct {
    int stream;
    void (StandardStreams::*write)(std::string_view);
    const char *text, *written;
  } rows[] = {
      {STDERR_FILENO, &StandardStreams::writeError, "no end", "no end\n"},
      {STDERR_FILENO, &StandardStreams::writeError, "two\nlines\n", "two\nlines\n"},
      {STDOUT_FILENO, &StandardStreams::writeOutput, "no end", "no end"},
  };
  for (const auto& row : rows) {
    int ends[2];
    ASSERT_EQ(::pipe(ends), 0);
    const int saved = ::dup(row.stream);
    ::dup2(ends[1], row.stream);
    HostStandardStreams streams;
    (static_cast<StandardStreams&>(streams).*row.write)(row.text);
    ::dup2(saved, row.stream);
    for (const int file : {saved, ends[1]}) ::close(file);
    char buffer[64];
    const ssize_t length = ::read(ends[0], buffer, sizeof buffer);
    EXPECT_EQ(std::string(buffer, static_cast<std::size_t>(std::max<ssize_t>(length, 0))),
              row.written);
    ::close(ends[0]);
  }
}

}  // namespace
