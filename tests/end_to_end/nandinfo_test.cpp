// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// nandinfo as a process, on a device root with a controller.

#include <gtest/gtest.h>

#include <filesystem>
#include <nlohmann/json.hpp>
#include <set>

#include "end_to_end/Device.h"
#include "support/ControllerLists.h"
#include "support/ControllerRoot.h"

namespace end_to_end {
namespace {

struct Output {
  int status;
  std::string out, err;
};

// Runs a line of the shell in which "$p" is the folder of the programs, with standard output in a
// file; as a user does, who doesn't ask for the log.
Output shell(const std::string& root, const std::string& line, std::string to = "") {
  const support::TemporaryFolder folder;
  if (to.empty()) to = folder / "out";
  const auto outcome =
      faults::run({"/bin/sh", "-c", "p=" PROGRAMS "; exec > " + to + " < /dev/null; " + line},
                  {"MORVEND_ROOT=" + root, "DBUS_SYSTEM_BUS_ADDRESS=unix:path=/nonexistent"});
  return {outcome.status, folder.read("out"), outcome.standardError};
}

Output nandinfo(const Device& device, const std::string& arguments, const std::string& to = "") {
  return shell(device.root().path(), "$p/nandinfo " + arguments, to);
}

Device deviceWithController() {
  Device device;
  support::writeController(device.root());
  return device;
}

TEST(NandinfoProgram, PrintsOneJSONObject) {
  const Device device = deviceWithController();
  const struct {
    const char* arguments;
    int status;
    const char *out, *err;
  } rows[] = {
      {"ftl", 0, "\"nandReads\": 19000,\n", ""},
      {"ftl --all --stat-keys --compact", 0, "\"Stat_14_9\": 14009, ", ""},
      {"info", 0, "\"com.norba.NANDInfo.NumLogicalWrites\": 4000", ""},
      {"msp --round", 0, "\n  \"2\": {\n", ""},
      {"storage", 0, "\"EAN_imageSize_BIC\": 4096", ""},
      {"disk", 0, "\"TLM_UserCapacity_MB\": ", ""},
      {"health lab", 0, "IsNANDRetirable\": ", ""},
      {"ean update-count ifw1", 0, "9223372036854775808\n", ""},
      {"recommends-deletion", 0, "false\n", ""},
      {"magazine --hours 24", 0, "\"hostWrites\": 24,\n", ""},
      {"nvram", 0, "{}", ""},
      {"decode msp -", 1, "\"ok\": false", "nandinfo: decode msp: "},
  };
  for (const auto& row : rows) {
    const Output output = nandinfo(device, row.arguments);
    EXPECT_EQ(output.status, row.status) << row.arguments;
    EXPECT_NE(output.out.find(row.out), std::string::npos) << output.out.substr(0, 500);
    EXPECT_TRUE(nlohmann::json::accept(output.out)) << row.arguments;
    EXPECT_TRUE(output.err.starts_with(row.err)) << output.err;
    EXPECT_EQ(output.err.empty(), row.status == 0) << output.err;
  }
  EXPECT_EQ(nandinfo(device, "disk", "/dev/full").err,
            "nandinfo: disk: the output can't be written\n");
}

// Reasons name the file as the user finds it; nothing else is said unless it is asked for.
TEST(NandinfoProgram, SaysInOneLineWhatWentWrong) {
  const Device device = deviceWithController();
  const std::string root = device.root().path();
  EXPECT_EQ(nandinfo(device, "ftl").err, "");
  EXPECT_EQ(shell(root, "MORVEND_LOG=default $p/nandinfo ftl --compact").err,
            "<5>NANDInfo: findNandExporterNew: Controller found: NorbaQRT3NVMeController\n");
  const std::string dump = nandinfo(device, "dump").err;
  EXPECT_TRUE(dump.starts_with("nandinfo: dump: not every list was dumped: DrvCall")) << dump;
  EXPECT_NE(dump.find("; ERROR: Could not determine the manufacturer-id; "), std::string::npos);
  std::filesystem::remove(device.root() / "device/statistics");
  EXPECT_EQ(nandinfo(device, "health lab").err,
            "nandinfo: health lab: the storage controller NorbaQRT3NVMeController answers no "
            "command (status 0x1): " +
                root + "/device/statistics: No such file or directory\n");
  device.root().write("device/registry.plist", "<plist><dict>");
  const Output broken = nandinfo(device, "extract");
  EXPECT_EQ(broken.status, 1);
  EXPECT_EQ(broken.out, "");
  EXPECT_TRUE(broken.err.starts_with("nandinfo: extract: no storage controller found: "));
  EXPECT_NE(broken.err.find(": " + root + "/device/registry.plist: "), std::string::npos);
  EXPECT_EQ(std::count(broken.err.begin(), broken.err.end(), '\n'), 1) << broken.err;
  EXPECT_EQ(device.names("var/spool/morvend"), Lines());
}

TEST(Programs, ARootThatIsNoneIsAnError) {
  const Device device;
  device.root().write("file", "");
  for (const std::string name : {"none", "file"}) {
    const std::string root = device.root() / name.c_str();
    const std::string problem = "the device root " + root + ": ";
    for (const char* line : {"$p/nandinfo extract", "$p/nandinfo decode ftl -", "$p/pelloran show",
                             "$p/pelloran set key 1"}) {
      const Output output = shell(root, line);
      EXPECT_EQ(output.status, 1) << line;
      EXPECT_NE(output.err.find(problem), std::string::npos) << output.err;
      EXPECT_EQ(std::count(output.err.begin(), output.err.end(), '\n'), 1) << output.err;
      EXPECT_EQ(output.out, "");
    }
    EXPECT_TRUE(shell(root, "$p/morvend -d").err.starts_with("<3>" + problem));
    EXPECT_EQ(shell(root, "$p/nandinfo --version && $p/pelloran --help").status, 0);
  }
}

// A reader that goes away ends a command as the signal does, after its work is done.
TEST(Programs, AReaderThatGoesAwayIsNoFailure) {
  const Device device = deviceWithController();
  const std::string root = device.root().path();
  shell(root, "for i in 1 2 3 4; do $p/pelloran set key.$i 1; done");
  for (const char* line :
       {"$p/nandinfo ftl --all", "$p/nandinfo --help", "$p/pelloran show", "$p/nandinfo extract"}) {
    // The reader closes the pipe, and then lets the command begin.
    const Output output = shell(root, std::string("mkfifo $MORVEND_ROOT/gone; { read x < "
                                                  "$MORVEND_ROOT/gone; ") +
                                          line +
                                          "; echo $? >&2; } | { exec <&-; echo x > "
                                          "$MORVEND_ROOT/gone; }; rm $MORVEND_ROOT/gone");
    EXPECT_EQ(output.err, "141\n") << line;
  }
  EXPECT_EQ(device.names("var/spool/morvend"), Lines{"events.jsonl"});
}

// On a made device, all of whose events are used.
TEST(NandinfoProgram, LeavesLogsAndEvents) {
  const Device device;
  ASSERT_EQ(device.run("mkdevice", {device.root().path()}).status, 0);
  std::filesystem::remove(device.root() / "device/analytics.plist");
  std::filesystem::remove_all(device.root() / "var/spool");

  EXPECT_EQ(nandinfo(device, "dump").out, "true\n");
  const auto textOf = [&device](const std::string& folder) {
    const Lines names = device.names(folder);
    EXPECT_EQ(names.size(), 1u) << folder;
    return names.empty() ? "" : device.root().read(folder + "/" + names[0]);
  };
  EXPECT_NE(textOf(kSubmitted).find(";UserWamp:"), std::string::npos);
  EXPECT_NE(textOf("var/spool/morvend/structured").find("\"type\": 176,"), std::string::npos);
  EXPECT_NE(nandinfo(device, "extract --monthly").out.find("\"msp_index\""), std::string::npos);
  std::set<std::string> events;
  for (const std::string& line : linesOf(device.root().read("var/spool/morvend/events.jsonl"))) {
    events.insert(nlohmann::json::parse(line)["event"]);
  }
  EXPECT_EQ(events.size(), 9u);
}

// Every command's output, complaints and exit status, one after the other.
std::string allAnswers(const support::TemporaryFolder& root) {
  constexpr char kScript[] =
      "all='info,daily,ftl,ftl --round,ftl --all,ftl --all --stat-keys,msp,msp --round,storage,"
      "storage --round,disk,freezer,health servita,health lab,health ota,magazine --hours 0,"
      "magazine --hours 5,magazine --hours 24 --no-delta,magazine --hours 720,"
      "magazine --hours 8784 --mode 0,magazine --history,nvram,extract,extract --monthly --from 4,"
      "dump,recommends-deletion,ean image-size dBIC,ean image-size ifw1,ean update-count ifw1,"
      "ean update-count LPEM'; IFS=,; for c in $all; do IFS=' '; echo \"== $c\"; "
      "$p/nandinfo --compact $c 2>&1; echo \"= $?\"; done";
  return shell(root.path(), kScript).out;
}

Dictionary announcing(std::int64_t size, Dictionary more) {
  more.set("Announce", size);
  return more;
}

// Devices of all kinds, most of them odd, each as the files that it has beside those of the
// controller's root.
std::vector<std::pair<const char*, std::vector<std::pair<const char*, Value>>>> oddDevices() {
  const auto kernel = [](Value session) {
    return Dictionary{{"kern.bootsessionuuid", std::move(session)}};
  };
  const auto controller = [](const char* className, Dictionary driver, Dictionary more = {}) {
    more.set("Class", className);
    more.set("Driver", std::move(driver));
    return more;
  };
  const auto registry = [](Array children) {
    return Dictionary{{"Children", std::move(children)}};
  };
  const plist::Data statistics =
      support::data(support::words({support::header(4, 1), 24, support::header(14, 1), 5}));
  const plist::Data msp = support::data(support::everyMSPCounter(7));
  const Dictionary characteristics{
      {"Controller Characteristics", Dictionary{{"chip-id", "QM8"},
                                                {"manufacturer-id", "2C64A1D40500"},
                                                {"num-bus", 1},
                                                {"serial-number", "SECRET-serial"}}}};
  const Dictionary phases{
      {"13", announcing(64, {{"Data", statistics}})},
      {"10:0", Dictionary{{"Data", statistics}, {"FailSize", std::int64_t{0xE00002C7}}}},
      {"10:5", announcing((16 << 20) + 1, {})},
      {"10:24", announcing(48, {{"Data", statistics}, {"FailData", 9}})},
      {"10:8784", statistics},
      {"221:0", msp},
      {"221:1", announcing(20, {{"Data", msp}})},
      {"221:4", msp},
      {"11", announcing(0, {{"FailData", 3}})},
      {"15", Dictionary{{"FailSize", 7}}},
      {"17:0", announcing(6000, {{"Data", plist::Data(100, 17)}})},
      {"17:2", announcing(100, {{"Data", plist::Data(5000, 17)}, {"FailData", 4}})}};
  const Dictionary unwilling{{"RefuseOpen", true}};
  return {
      {"whole",
       {{"device/kernel.plist", kernel("B-SECRET-session")},
        {"device/system-version.plist", Dictionary{{"ProductVersion", "1.0"}}},
        {"device/purgeable-space.plist", Dictionary{{"SPACEREAP_TOTAL_AVAILABLE", 5000}}},
        {"device/properties.plist",
         Dictionary{{"SystemIdentifier", "SECRET-system"},
                    {"InverseDeviceID", "SECRET-device"},
                    {"FileSystem", Dictionary{{"BlockSize", 4096},
                                              {"Blocks", std::int64_t{1} << 26},
                                              {"BlocksAvailable", std::int64_t{1} << 20}}}}}}},
      {"phases",
       {{"device/registry.plist",
         registry({controller("NorbaQRT3NVMeController", {{"Buffers", phases}, {"FailClose", true}},
                              {{"Properties", characteristics}}),
                   controller("NorbaNVMeEAN", unwilling)})},
        {"device/kernel.plist", kernel(Dictionary{{"Error", 5}})},
        {"device/purgeable-space.plist", "no answer"},
        {"device/analytics.plist",
         Dictionary{{"UsedEvents", Array{"com.norba.massStorage.NANDInfo.FTLCounters_1"}}}}}},
      {"unregistered",
       {{"device/registry.plist",
         registry({Dictionary{
             {"Class", "Bus"},
             {"Properties", characteristics},
             {"Children",
              Array{controller("NorbaEmbeddedNVMeController",
                               {{"Buffers", Dictionary{{"13", statistics}}}},
                               {{"Registered", false}}),
                    Dictionary{{"Class", "NvramDiagService"},
                               {"Children", Array{Dictionary{{"Properties",
                                                              Dictionary{{"Version", 2}}}}}}}}}}})},
        {"device/analytics.plist", Dictionary{{"Available", false}}}}},
      {"the second one",
       {{"device/registry.plist",
         registry({controller("ZMCStorage", {{"Buffers", Dictionary{{"13", statistics}}},
                                             {"RecommendsDeletion", plist::Data{1, 0, 0}}}),
                   controller("NorbaEmbeddedNVMeController", unwilling)})}}},
      {"silent",
       {{"device/registry.plist",
         registry({controller("ZMCStorage",
                              {{"Buffers", Dictionary{{"13", Dictionary{{"FailSize", 6}}}}},
                               {"RecommendsDeletion", 1}},
                              {{"Properties", Dictionary{{"PropertyMatch", "SECRET-match"}}}})})}}},
  };
}

TEST(NandinfoProgram, ACaptureAnswersAsTheDeviceDid) {
  for (const auto& [name, files] : oddDevices()) {
    SCOPED_TRACE(name);
    Device device = deviceWithController();
    const auto snapshot = support::data(support::kernelSnapshot(4096));
    device.root().write("device/kernel-snapshot.bin",
                        std::string(snapshot.begin(), snapshot.end()));
    for (const auto& [path, content] : files) device.writePropertyList(path, content);
    const Device copy, redacted;
    ASSERT_EQ(nandinfo(device, "capture " + (copy.root() / "device").string()).status, 0);
    ASSERT_EQ(nandinfo(device, "capture --redact " + (redacted.root() / "device").string()).status,
              0);
    const std::string answers = allAnswers(device.root());
    EXPECT_EQ(allAnswers(copy.root()), answers);
    EXPECT_EQ(allAnswers(redacted.root()), answers);
    for (const std::string& file : redacted.names("device")) {
      EXPECT_EQ(redacted.root().read("device/" + file).find("SECRET"), std::string::npos) << file;
    }

    // A capture of the capture is the same, and says neither when nor where it was made.
    ASSERT_EQ(nandinfo(copy, "capture " + (copy.root() / "second").string()).status, 0);
    ASSERT_EQ(copy.names("second"), copy.names("device"));
    for (const std::string& file : copy.names("second")) {
      if (file == "manifest.json") continue;
      EXPECT_EQ(copy.root().read("second/" + file), copy.root().read("device/" + file)) << file;
    }
    auto first = nlohmann::json::parse(copy.root().read("device/manifest.json"));
    auto second = nlohmann::json::parse(copy.root().read("second/manifest.json"));
    EXPECT_FALSE(first.contains("host"));
    first["time"] = second["time"];
    EXPECT_EQ(first, second);
  }
}

// A full disk at any call: the capture is whole, or nothing of it is there.
TEST(NandinfoProgram, ACaptureIsWholeOrNotThere) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  const Device device = deviceWithController();
  const std::string folder = device.root() / "capture";
  const std::size_t calls =
      device.countCalls("nandinfo", {"capture", folder, "--compact"}, "kill-before");
  const Lines whole = device.names("capture");
  ASSERT_GT(whole.size(), 5u);
  for (std::size_t at = 1; at <= calls; ++at) {
    std::filesystem::remove_all(folder);
    const auto outcome = device.run("nandinfo", {"capture", folder, "--compact"}, {at, "ENOSPC"});
    if (outcome.status == 0) {
      EXPECT_EQ(device.names("capture"), whole) << at;
    } else {
      EXPECT_EQ(outcome.status, 1) << at;
      EXPECT_NE(outcome.standardError.find("No space left"), std::string::npos) << at;
      EXPECT_EQ(device.names("capture"), Lines()) << at;
    }
  }
}

}  // namespace
}  // namespace end_to_end
