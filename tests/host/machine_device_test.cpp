// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The services of this machine, over made-up files of the kernel and of the system.

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/utsname.h>
#include <systemd/sd-bus.h>
#include <systemd/sd-id128.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <optional>
#include <regex>
#include <span>
#include <string>
#include <string_view>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

#include "base/ByteReader.h"
#include "host/files/DeviceRoot.h"
#include "host/machine/Applications.h"
#include "host/machine/DeviceProperties.h"
#include "host/machine/Kernel.h"
#include "host/machine/Locale.h"
#include "host/machine/NetworkUsage.h"
#include "host/machine/ReportingChannels.h"
#include "host/machine/SourceFiles.h"
#include "host/machine/UnitTraffic.h"
#include "support/PrivateBus.h"
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

TEST_F(MachineDevice, ErrorCountersAreSummedOverTheDevicesOfADriver) {
  const std::pair<const char*, std::string> sound[] = {
      {"sys/devices/system/edac/mc/mc0/ce_count", "3\n"},
      {"sys/devices/system/edac/mc/mc0/ue_count", "0\n"},
      {"sys/devices/system/edac/mc/power/x", "1"},
      {"sys/bus/pci/devices/0000:01/aer_dev_correctable", "RxErr 9\nTOTAL_ERR_COR 5\n"},
      {"sys/bus/pci/devices/0000:01/aer_dev_fatal", "TOTAL_ERR_FATAL 1\n"},
      {"sys/bus/pci/devices/0000:01/uevent", "DRIVER=nvme\nPCI_ID=1\n"},
      {"sys/bus/pci/devices/0000:02/aer_dev_correctable", "TOTAL_ERR_COR 7"},
      {"sys/bus/pci/devices/0000:02/uevent", "DRIVER=nvme"},
      {"sys/bus/pci/devices/0000:03/aer_dev_correctable", "TOTAL_ERR_COR 7"},
      {"sys/bus/pci/devices/0000:03/uevent", "PCI_ID=2"},
      {"sys/block/sda/device/ioerr_cnt", "0x1f\n"},
      {"sys/block/loop0/size", "1"},
      {"sys/class/net/a/device/uevent", "DRIVER=e 1\n"},
      {"sys/class/net/a/statistics/rx_errors", "18446744073709551615"},
      {"sys/class/net/a/statistics/tx_errors", "many"},
      {"sys/class/net/b/device/uevent", "DRIVER=e 1"},
      {"sys/class/net/b/statistics/rx_errors", "2"},
      {"sys/class/net/lo/statistics/rx_errors", "4"},
  };
  machine::ReportingChannels facility(files);
  EXPECT_TRUE(facility.copyChannels(~0U).empty());
  for (const auto& [path, text] : sound) folder.write(path, text);
  for (const unsigned none : {0U, 0x200U}) EXPECT_TRUE(facility.copyChannels(none).empty());
  const auto channels = facility.copyChannels(0x100);
  EXPECT_EQ(facility.copyChannels(1).size(), channels.size());
  Texts names, samples;
  for (const auto& channel : channels) {
    EXPECT_EQ(channel.format, platform::kSimpleChannelFormat);
    names.push_back(channel.name);
  }
  const auto subscription = facility.subscribe(channels);
  std::filesystem::remove(folder / "sys/bus/pci/devices/0000:01/aer_dev_fatal");
  const auto taken = subscription->createSamples();
  for (const auto& [channel, value] : *taken) {
    samples.push_back(channel.name + " " + std::to_string(value));
  }
  EXPECT_EQ(names, (Texts{"aer.nvme.correctable", "aer.nvme.fatal", "block.sda.io_errors",
                          "edac.mc0.corrected", "edac.mc0.uncorrected", "net.e_1.rx_errors"}));
  EXPECT_EQ(samples,
            (Texts{"aer.nvme.correctable 12", "block.sda.io_errors 31", "edac.mc0.corrected 3",
                   "edac.mc0.uncorrected 0", "net.e_1.rx_errors 9223372036854775807"}));
}

TEST_F(MachineDevice, ApplicationsAreTheDesktopEntriesThatAreShown) {
  const std::string shown = "#x\n[Desktop Entry]\nType = Application \n[Desktop Action a]\n";
  const std::string hidden = "[Desktop Entry]\nType=Application\nHidden=true\n";
  const struct {
    std::string path, text;
    const char* counts;  // the types of all so far
  } rows[] = {
      {"usr/share/applications/a.desktop", shown, "s"},
      {"usr/share/applications/deep/er/b.desktop", shown + "NoDisplay=true", "ss"},
      {"usr/share/applications/c.desktop", "[Desktop Entry]\nType=Link\n", "ss"},
      {"usr/share/applications/d.desktop", "Type=Application\n[Desktop Entry]\n", "ss"},
      {"usr/share/applications/e.desktop", "[Desktop Entry]\nType=Application\nNoDisplay=true",
       "ss"},
      {"usr/share/applications/f.desktop", shown + std::string(256 << 10, '#'), "ss"},
      {"usr/share/applications/g.txt", shown, "ss"},
      {"usr/share/applications/1/2/3/4/5/h.desktop", shown, "ss"},
      {"home/u/.local/share/applications/a.desktop", shown, "ss"},
      {"home/u/.local/share/applications/i.desktop", shown, "ssu"},
      {"var/lib/flatpak/exports/share/applications/j.desktop", shown, "ssuu"},
      {"usr/local/share/applications/a.desktop", hidden, "suu"},
  };
  for (const auto& row : rows) {
    folder.write(row.path, row.text);
    std::string counts;
    machine::Applications(files).enumerateBundles([&](auto type) {
      counts += type == platform::InstalledApplications::BundleType::user ? 'u' : 's';
    });
    EXPECT_EQ(counts, row.counts) << row.path;
  }
  std::filesystem::create_symlink(".", folder / "usr/share/applications/loop");
  int found = 0;
  machine::Applications(files).enumerateBundles([&](auto) { ++found; });
  EXPECT_LT(found, 40) << "a loop of folders ends";
}

// The kernel's own form: what was swapped out, where the storage library looks for it.
TEST_F(MachineDevice, TheSnapshotHoldsWhatWasSwappedOut) {
  machine::Kernel kernel(files);
  machine::KernelSnapshots snapshots(files, kernel);
  constexpr auto kFlags = platform::KernelSnapshots::kChunkedData;
  EXPECT_EQ(snapshots.capture(kFlags), std::nullopt);
  const std::uint64_t page = kernel.pageSize();
  for (const auto& [text, bytes] :
       {std::pair<const char*, std::uint64_t>{"pswpin 1\npswpout 5\n", 5 * page},
        {"pswpout 99999999999999999999", UINT64_MAX}}) {
    folder.write("proc/vmstat", text);
    EXPECT_EQ(snapshots.capture(0), std::nullopt);
    const auto snapshot = snapshots.capture(kFlags);
    ASSERT_TRUE(snapshot);
    // Container, its kind, thread name, four counters, end, end of the buffer.
    ASSERT_EQ(snapshot->size(), 5 * 16 + 4 + sizeof "VM_swapout" + 32);
    base::ByteReader reader{
        std::span<const std::byte>(*snapshot).subspan(2 * 16 + 4 + sizeof "VM_swapout" + 16 + 24)};
    EXPECT_EQ(reader.read<std::uint64_t>(), bytes);
  }
}

TEST_F(MachineDevice, TheDefaultRouteIsTheOneOfTheLowestMetric) {
  const std::string heading = "Iface\tDestination\tGateway\tFlags\tRefCnt\tUse\tMetric\tMask\n";
  const auto route = [](const char* interface, const char* destination, const char* flags,
                        const char* metric, const char* mask = "00000000") {
    return std::string(interface) + "\t" + destination + "\t0\t" + flags + "\t0\t0\t" + metric +
           "\t" + mask + "\t0\n";
  };
  const std::string zeros(32, '0');
  folder.write("sys/class/net/wwan0/uevent", "INTERFACE=wwan0\nDEVTYPE=wwan\n");
  folder.write("sys/class/net/eth0/uevent", "INTERFACE=eth0\n");
  const struct {
    std::string four, six;
    bool isMobile;
  } rows[] = {
      {"", "", false},
      {heading + route("wwan0", "00000000", "0003", "700"), "", true},
      {route("wwan0", "00000000", "0003", "700") + route("eth0", "00000000", "0003", "100"), "",
       false},
      {route("wwan0", "00000000", "0003", "700") + route("eth0", "00000000", "0002", "100"), "",
       true},
      {route("wwan0", "0000A8C0", "0003", "1", "00FFFFFF"), "", false},
      {route("../wwan0", "00000000", "0003", "1") + "\n\n00000000 x", "", false},
      {"", zeros + " 00 " + zeros + " 00 " + zeros + " 00000400 1 0 00000003    wwan0\n", true},
      {"", zeros + " 00 " + zeros + " 00 " + zeros + " ffffffff 1 0 00200200       lo\n", false},
  };
  for (const auto& row : rows) {
    folder.write("proc/1/net/route", row.four);
    folder.write("proc/1/net/ipv6_route", row.six);
    EXPECT_EQ(machine::defaultRouteIsMobile(files), row.isMobile) << row.four << row.six;
  }
}

// However the route changes and a unit is started anew, a count only grows while its date stands,
// and both kinds together are what the unit has had.
TEST_F(MachineDevice, TrafficIsCountedOnceUnderTheKindOfItsDay) {
  using Counts = std::vector<std::int64_t>;
  const struct {
    double since;
    std::uint64_t received, sent;
    bool isMobile;
    Counts counts;
  } days[] = {
      {1000.25, 100, 10, false, {100, 10, 0, 0}},
      {1000.25, 150, 10, true, {100, 10, 50, 0}},
      {1000.25, 150, 30, false, {100, 30, 50, 0}},
      {1000.5, 170, 30, true, {100, 30, 70, 0}},
      {2000, 20, 2, true, {0, 0, 20, 2}},
      {2000, 5, 2, false, {5, 0, 0, 2}},
      {2000, UINT64_MAX - 1, 2, false, {INT64_MAX, 0, 0, 2}},
  };
  plist::Dictionary remembered{{"u", "no array"}};
  for (const auto& day : days) {
    const auto usage =
        machine::usageByRoute(remembered, {{"u", day.since, day.received, day.sent}}, day.isMobile);
    ASSERT_EQ(usage.records.size(), 1u);
    const auto& record = *usage.records[0].as<plist::Dictionary>();
    Counts counts;
    for (const char* name : {"wifiInBytes", "wifiOutBytes", "wwanInBytes", "wwanOutBytes"}) {
      counts.push_back(record.number(name)->int64Value());
    }
    EXPECT_EQ(counts, day.counts) << day.since << " " << day.received;
    EXPECT_EQ(*record.text("procName"), "u");
    EXPECT_EQ(record.date(platform::kUsageSinceKey)->secondsSince1970, day.since);
    remembered = usage.remembered;
  }
  EXPECT_TRUE(machine::usageByRoute(remembered, {}, false).remembered.empty());
}

// What is called systemd on a bus of the test's own: on a thread, as it answers.
class UnitsOnABus : public testing::Test {
 protected:
  UnitsOnABus() { ::setenv("DBUS_SYSTEM_BUS_ADDRESS", bus.address().c_str(), 1); }
  ~UnitsOnABus() override {
    stops = true;
    if (thread.joinable()) thread.join();
    ::unsetenv("DBUS_SYSTEM_BUS_ADDRESS");
  }

  void serve() {
    client.emplace(bus.address());
    ASSERT_GE(sd_bus_request_name(client->bus(), "org.freedesktop.systemd1", 0), 0);
    ASSERT_GE(sd_bus_add_filter(client->bus(), nullptr, answer, this), 0);
    thread = std::thread([this] {
      while (!stops) {
        if (sd_bus_process(client->bus(), nullptr) == 0) sd_bus_wait(client->bus(), 10'000);
      }
    });
  }

  static int answer(sd_bus_message* call, void* test, sd_bus_error*) {
    auto& self = *static_cast<UnitsOnABus*>(test);
    if (sd_bus_message_is_method_call(call, nullptr, "ListUnitsByPatterns") > 0) {
      sd_bus_message* list = nullptr;
      sd_bus_message_new_method_return(call, &list);
      sd_bus_message_open_container(list, 'a', "(ssssssouso)");
      for (const char* unit : {"accounted.service", "restarts.service", "gone.service",
                               "other.scope", "whole.slice"}) {
        const std::string path = "/" + std::string(unit).substr(0, std::string(unit).find('.'));
        sd_bus_message_append(list, "(ssssssouso)", unit, "", "loaded", "active", "running", "",
                              path.c_str(), 0, "", "/");
      }
      sd_bus_message_close_container(list);
      sd_bus_send(nullptr, list, nullptr);
      sd_bus_message_unref(list);
      return 1;
    }
    const char *interface = nullptr, *name = nullptr;
    if (sd_bus_message_is_method_call(call, nullptr, "Get") <= 0 ||
        sd_bus_message_read(call, "ss", &interface, &name) < 0) {
      return 0;
    }
    const std::string path = sd_bus_message_get_path(call);
    if (path == "/gone") return sd_bus_reply_method_errorf(call, SD_BUS_ERROR_UNKNOWN_OBJECT, "-");
    std::uint64_t value = std::string_view(name) == "IPIngressBytes" ? 100 : 7;
    if (path == "/other") value = UINT64_MAX;
    if (std::string_view(name) == "ActiveEnterTimestamp") {
      value = 1'500'000 + (path == "/restarts" ? ++self.starts / 2 * 1'000'000 : 0);
    }
    sd_bus_reply_method_return(call, "v", "t", value);
    return 1;
  }

  support::PrivateBus bus;
  std::optional<support::BusClient> client;
  std::uint64_t starts = 0;
  std::atomic<bool> stops = false;
  std::thread thread;
};

TEST_F(UnitsOnABus, ThoseThatAreAccountedAreReadWithinOneRunOfTheirs) {
  using namespace std::chrono_literals;
  auto none = machine::unitTraffic(5s);
  ASSERT_TRUE(none) << none.error().text;
  EXPECT_TRUE(none->empty()) << "nobody is called systemd";
  serve();
  const auto traffic = machine::unitTraffic(5s);
  ASSERT_TRUE(traffic) << traffic.error().text;
  Texts found;
  for (const auto& unit : *traffic) {
    found.push_back(unit.name + " " + std::to_string(unit.since) + " " +
                    std::to_string(unit.received) + " " + std::to_string(unit.sent));
  }
  EXPECT_EQ(found, (Texts{"accounted.service 1.500000 100 7"})) << "one never stands still";
}

TEST_F(UnitsOnABus, ABusThatIsSilentOrGoneIsNotWaitedFor) {
  using namespace std::chrono_literals;
  bus.freeze();
  EXPECT_TRUE(machine::unitTraffic(20ms).error().is(std::errc::timed_out));
  bus.kill();
  const auto none = machine::unitTraffic(5s);
  ASSERT_TRUE(none) << none.error().text;
  EXPECT_TRUE(none->empty());
}

}  // namespace
