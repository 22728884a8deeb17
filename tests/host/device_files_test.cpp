// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The services of a recorded device, which answer from files below device/.

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <future>
#include <limits>
#include <regex>
#include <set>
#include <span>
#include <thread>

#include "host/Host.h"
#include "host/files/DeviceFile.h"
#include "host/outbox/RandomUUID.h"
#include "host/process/LibraryLoader.h"
#include "host/process/SystemClock.h"
#include "host/recorded/Applications.h"
#include "host/recorded/DeviceProperties.h"
#include "host/recorded/EccEventFiles.h"
#include "host/recorded/Kernel.h"
#include "host/recorded/Locale.h"
#include "host/recorded/NetworkUsage.h"
#include "host/recorded/ReportingChannels.h"
#include "host/recorded/SystemVersion.h"
#include "platform/AllServices.h"
#include "platform/FaultwatchSupport.h"
#include "platform/InstalledApplications.h"
#include "platform/PreferenceStore.h"
#include "platform/testing/RecordingLog.h"
#include "plist/MD5.h"
#include "plist/PropertyList.h"
#include "support/TemporaryFolder.h"

namespace {

using namespace host::recorded;
using namespace host;
using BundleType = platform::InstalledApplications::BundleType;
using Texts = std::vector<std::string>;

class DeviceFiles : public testing::Test {
 protected:
  void writePlist(const char* path, const plist::Value& value) {
    folder.write(path, *plist::writeXML(value));
  }

  support::TemporaryFolder folder;
  DeviceRoot root{folder.path().string()};
  platform::fakes::RecordingLog log;
};

TEST_F(DeviceFiles, ABrokenFileIsSaidOnceAndCountsAsMissing) {
  folder.write("device/broken.plist", "<plist><dict>");
  std::filesystem::create_directories(folder / "device/folder.plist");
  ASSERT_EQ(::mkfifo((folder / "device/fifo.plist").c_str(), 0600), 0);
  std::filesystem::create_symlink("loop.plist", folder / "device/loop.plist");
  std::ofstream(folder / "device/long.plist");
  std::filesystem::resize_file(folder / "device/long.plist", plist::kMaxSize + 1);
  for (const char* name : {"broken", "folder", "fifo", "loop", "long"}) {
    const std::string path = std::string("device/") + name + ".plist";
    DeviceFile file(root, log, path);
    for (int i = 0; i < 2; ++i) EXPECT_EQ(file.value(), nullptr) << name;
    EXPECT_EQ(log.count("error: " + (folder / path).string() + ": "), 1) << name;
  }
  log.clear();
  DeviceFile missing(root, log, "device/missing.plist");
  EXPECT_EQ(missing.value(), nullptr);
  const DeviceRoot nowhere("/nonexistent");
  DeviceFile rootless(nowhere, log, "device/missing.plist");
  EXPECT_EQ(rootless.value(), nullptr);
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(DeviceFiles, KernelValuesComeInTheirForms) {
  writePlist("device/kernel.plist",
             plist::Dictionary{{"integer", std::int64_t{0x0102030405060708}},
                               {"negative", std::int64_t{-2}},
                               {"data", plist::Data{9, 8, 7}},
                               {"text", "abc"},
                               {"busy", plist::Dictionary{{"Error", std::int64_t{EBUSY}}}},
                               {"no number", plist::Dictionary{{"Error", "x"}}},
                               {"success?", plist::Dictionary{{"Error", std::int64_t{0}}}},
                               {"hw.pagesize", std::int64_t{16384}}});
  EccEventFiles events(root, log);
  Kernel kernel(root, log, events);
  const struct {
    const char* name;
    std::size_t room;
    int error;
    std::string bytes;
  } rows[] = {
      {"integer", 4, 0, "\x08\x07\x06\x05"},
      {"integer", 8, 0, "\x08\x07\x06\x05\x04\x03\x02\x01"},
      {"integer", 12, 0, "\x08\x07\x06\x05\x04\x03\x02\x01"},
      {"negative", 4, 0, "\xFE\xFF\xFF\xFF"},
      {"data", 3, 0, "\x09\x08\x07"},
      {"data", 2, ENOMEM, ""},
      {"text", 4, 0, std::string("abc", 4)},
      {"text", 3, ENOMEM, ""},
      {"busy", 8, EBUSY, ""},
      {"no number", 8, EIO, ""},
      {"success?", 8, EIO, ""},
      {"unknown", 8, ENOENT, ""},
      {"kern.next_ecc_event", 72, ENOENT, ""},
  };
  for (const auto& row : rows) {
    std::string buffer(16, '#');
    const auto result = kernel.sysctlbyname(
        row.name,
        std::as_writable_bytes(std::span(buffer).first(std::min<std::size_t>(row.room, 16))));
    EXPECT_EQ(result.error, row.error) << row.name << " " << row.room;
    EXPECT_EQ(result.length, row.bytes.size()) << row.name << " " << row.room;
    EXPECT_EQ(buffer, row.bytes + std::string(16 - row.bytes.size(), '#')) << row.name;
  }
  EXPECT_EQ(kernel.pageSize(), 16384u);
}

TEST_F(DeviceFiles, EccEventsComeOnceInTheOrderOfTheirNames) {
  writePlist("device/kernel.plist",
             plist::Dictionary{
                 {"kern.next_ecc_event", plist::Dictionary{{"Error", std::int64_t{EBUSY}}}}});
  folder.write("device/ecc-events/2", "two");
  folder.write("device/ecc-events/10", "ten");
  folder.write("device/ecc-events/.1", "dot");
  folder.write("device/ecc-events/1-long", std::string(73, '3'));
  folder.write("device/ecc-events/rejected/1-long", "taken");
  folder.write("linked", "linked");
  std::filesystem::create_symlink("../../linked", folder / "device/ecc-events/1-within");
  std::filesystem::create_symlink(folder.path() / "linked", folder / "device/ecc-events/1-out");
  std::filesystem::create_directories(folder / "device/ecc-events/1-folder");
  EccEventFiles files(root, log);
  Kernel kernel(root, log, files);
  std::string buffer(72, '\0');
  const auto read = [&] {
    return kernel.sysctlbyname("kern.next_ecc_event", std::as_writable_bytes(std::span(buffer)));
  };
  for (const std::string_view expected : {"dot", "linked", "ten", "two"}) {
    EXPECT_EQ(read().length, expected.size());
    EXPECT_TRUE(buffer.starts_with(expected)) << expected;
  }
  EXPECT_EQ(read().error, EBUSY);
  EXPECT_EQ(folder.read("linked"), "linked");
  EXPECT_EQ(folder.read("device/ecc-events/rejected/1-long-2").size(), 73u);
  const std::string events = "error: " + (folder / "device/ecc-events").string();
  EXPECT_EQ(log.count(events + "/1-long: longer than an event; moved"), 1);
  EXPECT_EQ(log.count(events + "/1-out: No such file"), 1);
  // One that the caller has no room for stays, and one that can't be moved.
  buffer.resize(40);
  folder.write("device/ecc-events/3", std::string(72, '3'));
  EXPECT_EQ(read().error, ENOMEM);
  std::filesystem::remove_all(folder / "device/ecc-events/rejected");
  folder.write("device/ecc-events/rejected", "in the way");
  folder.write("device/ecc-events/0", std::string(73, '0'));
  buffer.resize(72);
  EXPECT_EQ(read().length, 72u);
  EXPECT_EQ(read().error, EBUSY);
  EXPECT_EQ(log.count(events + "/0: longer than an event, and can't be moved to rejected/"), 1);
  std::filesystem::rename(folder / "device/ecc-events", folder / "device/elsewhere");
  std::filesystem::create_symlink("elsewhere", folder / "device/ecc-events");
  EXPECT_EQ(read().error, EBUSY);
  EXPECT_EQ(log.count(events + ": too many links"), 1);
}

// What a killed run took comes again, unless its day is done; no event is lost or comes twice.
TEST_F(DeviceFiles, EccEventsWaitUntilWhatCameOfThemIsOnDisk) {
  const auto events = folder / "device/ecc-events";
  const auto read = [](EccEventFiles& files) {
    std::string buffer(72, '\0');
    const auto got = files.next(std::as_writable_bytes(std::span(buffer)));
    return buffer.substr(0, got ? got->length : 0);
  };
  const auto count = [&events] {
    return std::distance(std::filesystem::directory_iterator(events), {});
  };
  std::filesystem::create_directories(events);
  const std::optional<std::int32_t> days[] = {std::nullopt, -7, 20780};
  for (const auto& day : days) {
    folder.write("device/ecc-events/1", "one");
    folder.write("device/ecc-events/2.b", "two");
    {
      EccEventFiles killed(root, log);
      killed.hold(day);
      EXPECT_EQ(read(killed), "one");
      EXPECT_EQ(read(killed), "two");
      EXPECT_EQ(read(killed), "");
      EXPECT_EQ(count(), 2);
    }
    folder.write("device/ecc-events/1", "new");
    EccEventFiles next(root, log);
    EXPECT_TRUE(next.settle([&](const auto& of) { return of != day; }));
    next.hold(day);
    for (const char* event : {"new", "one", "two", ""}) EXPECT_EQ(read(next), event);
    EXPECT_TRUE(next.settle([&](const auto& of) { return of == day; }));
    EXPECT_EQ(count(), 0);
    folder.write("device/ecc-events/1", "not held");
    EXPECT_EQ(read(next), "not held");
    EXPECT_EQ(count(), 0);
  }
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(DeviceFiles, DevicePropertiesAndContainers) {
  host::recorded::DeviceProperties none(root, log);
  EXPECT_FALSE(none.booleanProperty("InternalBuild"));
  EXPECT_EQ(none.multiUserIndicator(), std::nullopt);
  writePlist("device/properties.plist",
             plist::Dictionary{{"InternalBuild", true}, {"MultiUser", std::int64_t{1}}});
  host::recorded::DeviceProperties properties(root, log);
  EXPECT_TRUE(properties.booleanProperty("InternalBuild"));
  EXPECT_EQ(properties.multiUserIndicator(), 1u);

  folder.write("var/containers/systemgroup/there/file", "");
  EXPECT_EQ(properties.systemGroupContainerPath("there").path, "/var/containers/systemgroup/there");
  for (const auto name : {std::string_view("absent"), std::string_view(), std::string_view("."),
                          std::string_view(".."), std::string_view("there/file"),
                          std::string_view("../systemgroup"), std::string_view("there\0x", 7)}) {
    const auto [path, error] = properties.systemGroupContainerPath(name);
    EXPECT_EQ(path, std::nullopt) << name;
    EXPECT_EQ(error, 2u) << name;
  }
}

// Whatever a service has no file for, or a broken one, the device hasn't got.
TEST_F(DeviceFiles, ARecordedDeviceAnswersAlone) {
  ::setenv("LANGUAGE", "fr", 1);
  ::setenv("LANG", "de_AT.UTF-8", 1);
  const auto known = [this] {
    const Host host({.root = folder.path(), .log = &log});
    const platform::AllServices& device = host.services();
    std::array<std::byte, 64> buffer;
    std::string names;
    const auto note = [&names](const char* name, bool isKnown) {
      if (isKnown) names += std::string(name) + " ";
    };
    for (const char* name : {"SystemIdentifier", "HardwareModel", "InverseDeviceID"}) {
      note(name, device.deviceProperties.textProperty(name).has_value());
    }
    note("usage", device.deviceProperties.diskUsage().has_value());
    note("statfs", device.files.statfs("/").has_value());
    note("version", device.systemVersion.systemVersionDictionary().has_value());
    note("version text", !device.systemVersion.operatingSystemVersion().empty());
    note("languages", !device.locale.preferredLanguages().empty());
    note("localizations", !device.locale.systemLocalizations().empty());
    note("country", device.locale.countryCode().has_value());
    for (const char* name : {"kern.bootsessionuuid", "vm.swapusage"}) {
      note(name, device.kernel.sysctlbyname(name, buffer).error == 0);
    }
    return names;
  };
  const std::string machine = known();
  for (const char* name : {"HardwareModel", "usage", "statfs", "languages", "localizations",
                           "country", "kern.bootsessionuuid", "vm.swapusage"}) {
    EXPECT_NE(machine.find(name), machine.npos) << name << " of " << machine;
  }
  folder.write("device", "no folder");
  EXPECT_EQ(known(), machine);
  std::filesystem::remove(folder / "device");
  std::filesystem::create_directories(folder / "device");
  EXPECT_EQ(known(), "");
  for (const char* file : {"properties", "system-version", "locale", "kernel"}) {
    folder.write("device/" + std::string(file) + ".plist", "broken");
  }
  EXPECT_EQ(known(), "");
  const plist::Dictionary numbers{
      {"SystemIdentifier", 1}, {"HardwareModel", 1}, {"InverseDeviceID", 1}};
  writePlist("device/properties.plist", numbers);
  EXPECT_EQ(known(), "");
  writePlist("device/properties.plist",
             plist::Dictionary{
                 {"SystemIdentifier", "a"}, {"HardwareModel", "b"}, {"InverseDeviceID", "c"}});
  EXPECT_EQ(known(), "SystemIdentifier HardwareModel InverseDeviceID ");
}

TEST_F(DeviceFiles, TheZoneIsTheHosts) {
  const char* before = std::getenv("TZ");
  const std::string zone = before != nullptr ? before : "";
  SystemClock clock;
  // Six months in summer time; a time that no calendar reaches has no zone.
  ::setenv("TZ", "ABC-1:30DEF,M4.1.0,M10.1.0", 1);
  EXPECT_EQ(clock.secondsFromUTC({1795320000}), 5400);
  EXPECT_EQ(clock.secondsFromUTC({1782864000.5}), 9000);
  EXPECT_EQ(clock.secondsFromUTC({1e300}), 0);
  ::setenv("TZ", "XYZ3", 1);
  EXPECT_EQ(clock.secondsFromUTC({1795320000}), -10800);
  before != nullptr ? ::setenv("TZ", zone.c_str(), 1) : ::unsetenv("TZ");
}

TEST_F(DeviceFiles, IncidentIdentifiersAreRandomUUIDs) {
  std::set<std::string> seen;
  for (int i = 0; i < 100; ++i) {
    const std::string text = randomUUID();
    EXPECT_TRUE(std::regex_match(
        text, std::regex("[0-9a-f]{8}-[0-9a-f]{4}-4[0-9a-f]{3}-[89ab][0-9a-f]{3}-[0-9a-f]{12}")))
        << text;
    seen.insert(text);
  }
  EXPECT_EQ(seen.size(), 100u);
}

TEST_F(DeviceFiles, VersionAndLocaleAreTheirFiles) {
  writePlist("device/system-version.plist",
             plist::Dictionary{{"ProductVersion", "7.1"}, {"ProductBuildVersion", "7B2"}});
  EXPECT_EQ(host::recorded::SystemVersion(root, log).operatingSystemVersion(), "7.1 (7B2)");
  writePlist("device/locale.plist",
             plist::Dictionary{{"PreferredLanguages", plist::Array{"ja", std::int64_t{1}}}});
  host::recorded::Locale locale(root, log);
  EXPECT_EQ(locale.preferredLanguages(), Texts{"ja"});
  EXPECT_EQ(locale.systemLocalizations(), Texts{});
  EXPECT_EQ(locale.countryCode(), std::nullopt);
}

TEST_F(DeviceFiles, TheBestMatchIsTheLongestPrefixOfEachLanguage) {
  const struct {
    Texts localizations, preferred, best;
  } rows[] = {
      {{"en", "de", "de-AT"}, {"de-AT"}, {"de-AT"}},
      {{"en", "zh", "zh-hant"}, {"zh-Hant-TW"}, {"zh-hant"}},
      {{"en", "d", "de"}, {"den", "de-CH", "DE"}, {"de"}},
      {{"fr", "en"}, {"ja", "en-US", "fr"}, {"en", "fr"}},
      {{"fr", "en"}, {"ja"}, {"fr"}},
      {{"fr", "en"}, {}, {"fr"}},
      {{}, {"en"}, {}},
      {{""}, {"en", ""}, {""}},
  };
  host::recorded::Locale locale(root, log);
  for (const auto& row : rows) {
    EXPECT_EQ(locale.bestMatch(row.localizations, row.preferred), row.best);
  }
}

TEST_F(DeviceFiles, ApplicationsAreTheDictionariesOfTheArray) {
  std::vector<BundleType> types;
  const auto collect = [&](BundleType type) { types.push_back(type); };
  host::recorded::Applications(root, log).enumerateBundles(collect);
  EXPECT_TRUE(types.empty());
  writePlist("device/applications.plist",
             plist::Array{plist::Dictionary{{"Type", "User"}}, plist::Dictionary{{"Type", "user"}},
                          "x", plist::Dictionary{}});
  host::recorded::Applications(root, log).enumerateBundles(collect);
  EXPECT_EQ(types, (std::vector{BundleType::user, BundleType::system, BundleType::system}));
}

TEST_F(DeviceFiles, ReportChannelsAreThoseOfACategoryWithANameAndAValue) {
  ReportingChannels missing(root, log);
  EXPECT_TRUE(missing.copyChannels(~0U).empty());
  EXPECT_EQ(missing.subscribe({}), nullptr);
  const auto channel = [](plist::Value name, plist::Value category, plist::Value value) {
    return plist::Dictionary{
        {"Name", name}, {"Category", category}, {"Format", 1}, {"Value", value}};
  };
  writePlist(
      "device/report-channels.plist",
      plist::Array{
          "x", channel("a", 0x300, 5), channel("other", 0x200, 6), channel(7, 0x100, 7),
          channel("text", 0x100, "8"), channel("untold", "0x100", 9), plist::Dictionary{},
          plist::Dictionary{{"Name", "b"}, {"Category", 0x100}, {"Value", std::int64_t{-9}}}});
  ReportingChannels facility(root, log);
  const auto channels = facility.copyChannels(0x100);
  auto asked = channels;
  asked.push_back({99, 1, "made up"});
  Texts found;
  for (const auto& one : channels) found.push_back(one.name + " " + std::to_string(one.format));
  EXPECT_EQ(found, (Texts{"a 1", "text 1", "b 0"}));
  found.clear();
  const auto samples = facility.subscribe(asked)->createSamples();
  for (const auto& [one, value] : *samples) {
    found.push_back(one.name + " " + std::to_string(one.format) + " " + std::to_string(value));
  }
  EXPECT_EQ(found, (Texts{"a 1 5", "b 0 -9"}));
}

TEST_F(DeviceFiles, NetworkUsageIsRepliedOnAThreadOfTheService) {
  using Answer = std::optional<plist::Array>;
  const auto ask = [this] {
    std::promise<Answer> answer;
    NetworkUsage service(root, log);
    service.queryAllProcesses([&, asker = std::this_thread::get_id()](const plist::Array* records) {
      EXPECT_NE(std::this_thread::get_id(), asker);
      answer.set_value(records != nullptr ? Answer(*records) : Answer());
    });
    return answer.get_future().get();
  };
  EXPECT_EQ(ask(), Answer());
  const plist::Array records{plist::Dictionary{{"procName", "p"}}, 7};
  const plist::Value delays[] = {0, -1e300, std::numeric_limits<double>::quiet_NaN(), "text",
                                 0.001};
  for (const plist::Value& delay : delays) {
    writePlist("device/network-usage.plist",
               plist::Dictionary{{"Records", records}, {"ReplyDelay", delay}});
    EXPECT_EQ(ask(), records);
  }
  for (const plist::Value& wrong :
       {plist::Value(plist::Dictionary{{"Records", "text"}}), plist::Value("text")}) {
    writePlist("device/network-usage.plist", wrong);
    EXPECT_EQ(ask(), Answer());
  }
}

// A device's files are read one after the other and held until the end.
TEST_F(DeviceFiles, TogetherTheyFillNoMachine) {
  const std::string line = "error: " + root.hostPath("device/large.plist") + ": ";
  folder.write("device/large.plist",
               "<plist><string>" + std::string(10 << 20, 'x') + "</string></plist>");
  DeviceFile files[] = {{root, log, "device/large.plist"},
                        {root, log, "device/large.plist"},
                        {root, log, "device/large.plist"},
                        {root, log, "device/large.plist"}};
  int held = 0;
  for (DeviceFile& file : files) held += file.value() != nullptr;
  EXPECT_TRUE(held == 2 || held == 3) << held;
  EXPECT_EQ(log.count(line), 4 - held);
}

struct CountingPreferences : platform::PreferenceStore {
  std::optional<plist::Value> QNSPreferencesGetValue(std::string_view key,
                                                     std::string_view domain) override {
    EXPECT_EQ(std::string(domain) + " " + std::string(key), "domain key");
    return value;
  }
  void QNSPreferencesSetValue(std::string_view, const plist::Value* newValue,
                              std::string_view) override {
    value = *newValue;
  }
  void QNSPreferencesSynchronize(std::string_view) override {}

  plist::Value value = std::int64_t{41};
};

TEST_F(DeviceFiles, ALibraryOfTheDeviceActsOnThisProcessesPreferences) {
  CountingPreferences preferences;
  // This machine has the installed module, a recorded device what its root carries.
  EXPECT_NE(LibraryLoader(root, preferences, log, LibraryLoader::Trusted::installed)
                .load(platform::kFaultwatchSupportPath),
            nullptr);
  std::filesystem::create_directory(folder / "device");
  LibraryLoader loader(root, preferences, log, LibraryLoader::Trusted::installed);
  EXPECT_EQ(loader.load(platform::kFaultwatchSupportPath), nullptr);
  const auto place = folder / std::string_view(platform::kFaultwatchSupportPath).substr(1);
  std::filesystem::create_directories(place.parent_path());
  // A link leads nowhere outside the root.
  std::filesystem::create_symlink(FAULTWATCH_SUPPORT_MODULE, place);
  EXPECT_EQ(loader.load(platform::kFaultwatchSupportPath), nullptr);
  std::filesystem::remove(place);
  folder.write("not-a-library", "text");
  EXPECT_EQ(loader.load("/not-a-library"), nullptr);
  EXPECT_EQ(loader.load("/System"), nullptr);

  std::filesystem::copy_file(FAULTWATCH_SUPPORT_MODULE, place);
  void* library = loader.load(platform::kFaultwatchSupportPath);
  ASSERT_NE(library, nullptr);
  EXPECT_EQ(loader.load(platform::kFaultwatchSupportPath), library);
  auto* get = reinterpret_cast<platform::QNSPreferencesGetIntegerValueFunction*>(
      loader.symbol(library, "QNSPreferencesGetIntegerValue"));
  auto* set = reinterpret_cast<platform::QNSPreferencesSetValueFunction*>(
      loader.symbol(library, "QNSPreferencesSetValue"));
  ASSERT_TRUE(get != nullptr && set != nullptr);
  bool found = false;
  EXPECT_EQ(get("key", "domain", &found), 41);
  EXPECT_TRUE(found);
  const plist::Value zero(std::int64_t{0});
  set("key", &zero, "domain");
  EXPECT_EQ(preferences.value, zero);
  EXPECT_EQ(loader.symbol(library, "QNSPreferencesSynchronize"), nullptr);
}

TEST_F(DeviceFiles, ARootRunsNoCodeOfItsOwnUnlessItIsTrusted) {
  const std::string path = platform::kFaultwatchSupportPath;
  const auto place = folder / path.substr(1);
  std::filesystem::create_directories(place.parent_path());
  std::filesystem::copy_file(FAULTWATCH_SUPPORT_MODULE, place);
  const auto size = std::filesystem::file_size(place);
  for (const bool longer : {true, false}) {
    // What stands behind the library's end is nothing to the linker.
    std::fstream file(place, std::ios::in | std::ios::out);
    file.seekp(longer ? std::streamoff(size) : std::streamoff(size) - 1) << '!';
    file.close();
    if (!longer) std::filesystem::resize_file(place, size);
    for (const auto trusted : {LibraryLoader::Trusted::installed, LibraryLoader::Trusted::root}) {
      log.clear();
      CountingPreferences preferences;
      LibraryLoader loader(root, preferences, log, trusted);
      const bool loads = trusted == LibraryLoader::Trusted::root;
      EXPECT_EQ(loader.load(path) != nullptr, loads) << longer;
      EXPECT_EQ(log.count("error: Not loading " + root.hostPath(path)), loads ? 0 : 1);
    }
  }
}

TEST(MD5, TheVectorsOfItsDefinition) {
  const struct {
    const char *text, *digest;
  } rows[] = {{"", "d41d8cd98f00b204e9800998ecf8427e"},
              {"abc", "900150983cd24fb0d6963f7d28e17f72"},
              {"12345678901234567890123456789012345678901234567890123456789012345678901234567890",
               "57edf4a22be3c955ac49da2e2107b67a"}};
  for (const auto& row : rows) {
    std::string hex;
    for (const int byte : plist::md5(row.text)) {
      hex += {"0123456789abcdef"[byte >> 4], "0123456789abcdef"[byte & 15]};
    }
    EXPECT_EQ(hex, row.digest);
  }
}

}  // namespace
