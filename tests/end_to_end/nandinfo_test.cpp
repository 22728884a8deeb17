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

// Runs nandinfo with standard output in a file, as the shell would have it in a pipe.
Output nandinfo(const Device& device, const std::string& arguments, std::string to = "") {
  const support::TemporaryFolder folder;
  if (to.empty()) to = folder / "out";
  const std::string command = PROGRAMS "/nandinfo " + arguments + " > " + to + " < /dev/null";
  const auto outcome =
      faults::run({"/bin/sh", "-c", command},
                  {"MORVEND_ROOT=" + device.root().path().string(), "MORVEND_LOG=error",
                   "DBUS_SYSTEM_BUS_ADDRESS=unix:path=/nonexistent"});
  return {outcome.status, folder.read("out"), outcome.standardError};
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
      {"ftl --unknown", 2, "", "nandinfo: The following argument was not expected: --unknown\n"},
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
