// nandinfo as a process, on a device root with a controller.

#include <gtest/gtest.h>

#include <filesystem>
#include <nlohmann/json.hpp>
#include <set>
#include <sstream>

#include "end_to_end/Device.h"
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
      {"ftl --all", 0, "\"hostWriteLogHisto_9\": 14009,\n", ""},
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
      {"ftl --unknown", 2, "",
       "nandinfo: The following argument was not expected: --unknown (see "},
  };
  for (const auto& row : rows) {
    const Output output = nandinfo(device, row.arguments);
    EXPECT_EQ(output.status, row.status) << row.arguments;
    EXPECT_NE(output.out.find(row.out), std::string::npos) << output.out.substr(0, 500);
    EXPECT_EQ(nlohmann::json::accept(output.out), row.status != 2) << row.arguments;
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
    for (const char* line : {"$p/nandinfo disk", "$p/nandinfo decode ftl -", "$p/pelloran show",
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
  ASSERT_EQ(device.names(kSubmitted).size(), 1u);
  const std::string log = device.root().read(kSubmitted + ("/" + device.names(kSubmitted)[0]));
  EXPECT_NE(log.find(";UserWamp:"), std::string::npos) << log;
  const auto valuesOf = [&device](const std::string& path, const char* key) {
    std::set<nlohmann::json> values;
    std::istringstream lines(device.root().read(path));
    for (std::string line; std::getline(lines, line);) {
      values.insert(nlohmann::json::parse(line)[key]);
    }
    return values;
  };
  const std::string structured = "var/spool/morvend/structured";
  ASSERT_EQ(device.names(structured).size(), 1u);
  EXPECT_TRUE(valuesOf(structured + "/" + device.names(structured)[0], "type").contains(176));

  const auto summary = nlohmann::json::parse(nandinfo(device, "extract --monthly").out);
  EXPECT_TRUE(summary.contains("msp_index"));
  EXPECT_EQ(valuesOf("var/spool/morvend/events.jsonl", "event").size(), 9u);
}

TEST(NandinfoProgram, ACaptureAnswersAsTheDeviceDid) {
  const Device device = deviceWithController(), copy;
  ASSERT_EQ(nandinfo(device, "capture " + (copy.root() / "device").string()).status, 0);
  copy.root().write("device/properties.plist", device.root().read("device/properties.plist"));
  for (const char* arguments :
       {"info", "ftl", "ftl --round", "ftl --all", "ftl --all --stat-keys", "msp", "msp --round",
        "storage --round", "health servita", "health lab", "health ota", "recommends-deletion",
        "ean image-size dBIC", "ean image-size dLTH", "ean update-count ifw1"}) {
    const Output original = nandinfo(device, arguments), again = nandinfo(copy, arguments);
    EXPECT_EQ(original.out, again.out) << arguments;
    EXPECT_EQ(original.err, again.err) << arguments;
    EXPECT_EQ(original.status, again.status);
  }
  ASSERT_EQ(nandinfo(copy, "capture " + (copy.root() / "second").string()).status, 0);
  ASSERT_EQ(copy.names("second").size(), 9u);
  for (const std::string& name : copy.names("second")) {
    if (name == "manifest.json") continue;
    EXPECT_EQ(copy.root().read("second/" + name), copy.root().read("device/" + name)) << name;
  }
  auto first = nlohmann::json::parse(copy.root().read("device/manifest.json"));
  auto second = nlohmann::json::parse(copy.root().read("second/manifest.json"));
  first["time"] = second["time"];
  EXPECT_EQ(first, second);
}

// A full disk at any call: the capture is whole, or nothing of it is there.
TEST(NandinfoProgram, ACaptureIsWholeOrNotThere) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  const Device device = deviceWithController();
  const std::string folder = device.root() / "capture";
  const std::size_t calls = device.countCalls("nandinfo", {"capture", folder, "--compact"});
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
