// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The services of this machine, over made-up files of the kernel and of the system.

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/utsname.h>
#include <systemd/sd-id128.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <optional>
#include <regex>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "host/files/DeviceRoot.h"
#include "host/machine/DeviceProperties.h"
#include "host/machine/Kernel.h"
#include "host/machine/Locale.h"
#include "host/machine/SourceFiles.h"
#include "support/TemporaryFolder.h"

namespace {

using namespace host;
using Texts = std::vector<std::string>;

class MachineDevice : public testing::Test {
 protected:
  support::TemporaryFolder folder;
  DeviceRoot files{folder.path().string()};
};

std::string kernelValue(platform::Kernel& kernel, const char* name, std::size_t room = 64) {
  std::string buffer(room, '#');
  const auto read = kernel.sysctlbyname(name, std::as_writable_bytes(std::span(buffer)));
  return read.error == 0 ? buffer.substr(0, read.length) : "error " + std::to_string(read.error);
}

// Whatever stands where a file should be, or in it, is nothing.
TEST_F(MachineDevice, SourcesAreReadWithinBounds) {
  folder.write("whole", std::string(machine::kMaxSource, 'x'));
  folder.write("long", std::string(machine::kMaxSource + 1, 'x'));
  folder.write("names/b", "");
  folder.write("names/a", "");
  ASSERT_EQ(::mkfifo((folder / "fifo").c_str(), 0600), 0);
  std::filesystem::create_symlink("/etc/passwd", folder / "outside");
  std::filesystem::create_symlink("loop", folder / "loop");
  std::filesystem::create_symlink("/whole", folder / "inside");
  for (const char* name : {"long", "fifo", "outside", "loop", "names", "missing"}) {
    EXPECT_EQ(machine::sourceText(files, name), std::nullopt) << name;
  }
  for (const char* name : {"whole", "inside"}) EXPECT_TRUE(machine::sourceText(files, name));
  EXPECT_EQ(machine::sourceNames(files, "names"), (Texts{"a", "b"}));
  EXPECT_EQ(machine::sourceNames(files, "whole"), Texts{});
  EXPECT_TRUE(machine::sourceText(DeviceRoot("/"), "/proc/stat")) << "its size is said to be 0";
  const struct {
    std::string text;
    std::optional<std::uint64_t> count;
  } rows[] = {{"12\n", 12}, {"\t7 \n8", 7}, {"0x1f", 31}, {"99999999999999999999", UINT64_MAX},
              {"-1", {}},   {"1x", {}},     {"0x", {}},   {"", {}},
              {"\n5", {}},  {"+5", {}}};
  for (const auto& row : rows) {
    folder.write("count", row.text);
    EXPECT_EQ(machine::sourceCount(files, "count"), row.count) << row.text;
  }
}

TEST_F(MachineDevice, KernelValuesAreThoseThatLinuxHas) {
  machine::Kernel kernel(files);
  EXPECT_EQ(kernelValue(kernel, "kern.bootsessionuuid"), "error " + std::to_string(ENOENT));
  EXPECT_EQ(kernelValue(kernel, "vm.swapusage"), "error " + std::to_string(ENOENT));
  const std::string identifier = "0e7c5a3b-1234-4abc-9def-00112233aabb";
  const struct {
    std::string boot, swap, identifier, total;
  } rows[] = {
      {identifier + "\n", "MemTotal: 5 kB\nSwapTotal:      1024 kB\n",
       std::string("0E7C5A3B-1234-4ABC-9DEF-00112233AABB", 37), std::string("\0\0\x10", 3)},
      {identifier + "0", "SwapTotal: 18446744073709551615 kB", "error 2",
       "\xff\xff\xff\xff\xff\xff\xff\xff"},
      {std::string(36, 'x'), "SwapTotal: -1 kB", "error 2", "error 2"},
      {"", "SwapTotals: 1 kB", "error 2", "error 2"},
  };
  for (const auto& row : rows) {
    folder.write("proc/sys/kernel/random/boot_id", row.boot);
    folder.write("proc/meminfo", row.swap);
    EXPECT_EQ(kernelValue(kernel, "kern.bootsessionuuid"), row.identifier) << row.boot;
    std::string total = row.total;
    if (!total.starts_with("error")) total.resize(32, '\0');
    EXPECT_EQ(kernelValue(kernel, "vm.swapusage"), total) << row.swap;
    if (!total.starts_with("error")) total.resize(8, '\0');
    EXPECT_EQ(kernelValue(kernel, "vm.swapusage", 8), total) << row.swap;
  }
  EXPECT_EQ(kernelValue(kernel, "kern.next_ecc_event"), "error 2");
  EXPECT_EQ(kernel.pageSize(), static_cast<std::uint64_t>(::sysconf(_SC_PAGESIZE)));
}

TEST_F(MachineDevice, NobodyLearnsTheMachinesOwnIdentifier) {
  const auto identifier = machine::DeviceProperties(files, files).textProperty("SystemIdentifier");
  sd_id128_t own;
  ASSERT_EQ(identifier.has_value(), ::sd_id128_get_machine(&own) == 0);
  if (!identifier) GTEST_SKIP() << "this machine has no identifier";
  EXPECT_TRUE(std::regex_match(*identifier, std::regex("[0-9a-f]{32}"))) << *identifier;
  EXPECT_FALSE(::sd_id128_string_equal(identifier->c_str(), own));
  EXPECT_EQ(machine::DeviceProperties(files, files).textProperty("SystemIdentifier"), identifier);
}

TEST_F(MachineDevice, TheModelIsTheFirmwaresElseTheArchitecture) {
  machine::DeviceProperties properties(files, files);
  utsname host;
  ASSERT_EQ(::uname(&host), 0);
  const auto model = [&] { return properties.textProperty("HardwareModel"); };
  EXPECT_EQ(model(), host.machine);
  folder.write("proc/device-tree/model", std::string_view("Board 4\0", 8));
  EXPECT_EQ(model(), "Board 4");
  folder.write("sys/class/dmi/id/product_name", " \n");
  EXPECT_EQ(model(), "Board 4");
  folder.write("sys/class/dmi/id/product_name", "Model 7 \n");
  EXPECT_EQ(model(), "Model 7");
  EXPECT_EQ(properties.textProperty("InverseDeviceID"), std::nullopt);
  EXPECT_FALSE(properties.booleanProperty("InternalBuild"));
  EXPECT_EQ(properties.multiUserIndicator(), 0u);
}

TEST_F(MachineDevice, TheVersionIsTheReleases) {
  const struct {
    const char *release, *text;
  } rows[] = {
      {"NAME=x\nVERSION_ID=\"12\"\nBUILD_ID='b\\'1'\n", "12 (b'1)"},
      {"VERSION_ID=12", "12 (12)"},
      {"BUILD_ID=rolling\nXVERSION_ID=1\nVERSION_IDX=2\n", "rolling"},
      {"", ""},
  };
  machine::SystemVersion version(files);
  for (const char* path : {"usr/lib/os-release", "etc/os-release"}) {
    for (const auto& row : rows) {
      folder.write(path, row.release);
      EXPECT_EQ(version.operatingSystemVersion(), row.text);
    }
    EXPECT_EQ(version.systemVersionDictionary(), std::nullopt);
  }
}

TEST_F(MachineDevice, LanguagesAreTheEnvironmentsElseTheSystems) {
  const struct {
    const char *file, *language, *lang;
    Texts preferred;
    std::optional<std::string> country;
  } rows[] = {
      {"", "", "de_AT.UTF-8@euro", {"de-AT"}, "AT"},
      {"", "fr_CA:fr:en", "de_AT", {"fr-CA", "fr", "en"}, "AT"},
      {"", "", "C.UTF-8", {}, std::nullopt},
      {"", "::", "POSIX", {}, std::nullopt},
      {"", "", "eo", {"eo"}, std::nullopt},
      {"", "", "", {}, std::nullopt},
      {"LANG=\"pt_BR.UTF-8\"\n", "", "", {"pt-BR"}, "BR"},
      {"LANG=pt_BR\nLANGUAGE=pt:es\n", "", "it_IT", {"pt", "es"}, "IT"},
      {"LANG=pt_BR", "it", "", {"it"}, "BR"},
  };
  for (const char* path : {"etc/default/locale", "etc/locale.conf"}) {
    for (const auto& row : rows) {
      folder.write(path, row.file);
      ::setenv("LANGUAGE", row.language, 1);
      ::setenv("LANG", row.lang, 1);
      machine::Locale locale(files);
      EXPECT_EQ(locale.preferredLanguages(), row.preferred) << row.file << row.lang;
      EXPECT_EQ(locale.countryCode(), row.country) << row.file << row.lang;
      EXPECT_EQ(locale.systemLocalizations(), Texts{"en"});
    }
  }
}

}  // namespace
