// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <cstring>
#include <nlohmann/json.hpp>
#include <sstream>

#include "NANDInfo/NANDInfo.h"
#include "platform/DeviceRegistry.h"
#include "plist/PropertyList.h"
#include "support/CommandLine.h"
#include "support/ControllerLists.h"
#include "support/ControllerRoot.h"
#include "support/FreshErrors.h"
#include "support/StorageDevice.h"
#include "support/TemporaryFolder.h"
#include "tools/nandinfo/Commands.h"
#include "tools/nandinfo/NandinfoCommand.h"
#include "tools/nandinfo/TableText.h"

namespace {

using plist::Array;
using plist::Dictionary;
using plist::Value;
using support::argumentsOf;
using support::header;
using Words = std::vector<std::string>;

class Nandinfo : public testing::Test {
 protected:
  int run(const Words& arguments) {
    std::vector<const char*> argv = {"nandinfo"};
    for (const auto& argument : arguments) argv.push_back(argument.c_str());
    std::ostringstream outStream, errStream;
    support::freshErrors();
    const int status =
        nandinfo::runNandinfo({device.platform, outStream, errStream, terminal, terminal, 60},
                              static_cast<int>(argv.size()), argv.data());
    out = outStream.str();
    err = errStream.str();
    EXPECT_EQ(device.registry.problems(), Words());
    return status;
  }

  std::string file(const char* name, const support::Bytes& bytes) {
    folder.write(name, {reinterpret_cast<const char*>(bytes.data()), bytes.size()});
    return folder / name;
  }

  support::StorageDevice device;
  support::TemporaryFolder folder;
  bool terminal = false;
  std::string out, err;
};

TEST_F(Nandinfo, WrongUsageIsSaidInOneLine) {
  auto commands =
      argumentsOf({{"", {"", "helth", "--unknown\x1b[2J info", "health all", "decode ftl"}},
                   {"info ", {"disk", "--round"}},
                   {"ftl ", {"--round --all", "--stat-keys"}},
                   {"ean ", {"image-size dBI", "image-size dBIC5", "update-count d\nIC"}},
                   {"decode counters ", {"2y file", "1y"}},
                   {"magazine", {"", " --hours 4 --history", " --history --no-delta"}},
                   {"magazine --hours ", {"-1", "0x10", "4294967296", "4 --mode 3"}},
                   {"extract --from ", {"7", "\x1b"}}});
  commands.emplace_back();
  for (const auto& command : commands) {
    EXPECT_EQ(run(command), 2) << testing::PrintToString(command);
    EXPECT_TRUE(err.starts_with("nandinfo: ")) << err;
    EXPECT_TRUE(err.ends_with(" --help')\n")) << err;
    EXPECT_EQ(std::count(err.begin(), err.end(), '\n'), 1) << err;
    EXPECT_EQ(err.find('\x1b'), std::string::npos);
    EXPECT_EQ(out, "");
  }
  const std::pair<const char*, const char*> messages[] = {
      {"helth", "there is no command 'helth'; did you mean 'health'? (see 'nandinfo --help')"},
      {"--json zzz", "there is no command 'zzz' (see 'nandinfo --help')"},
      {"decode tfl x", "no command 'decode tfl'; did you mean 'ftl'? (see "},
      {"ean image-size", "(see 'nandinfo ean image-size --help')"},
  };
  for (const auto& [command, message] : messages) {
    run(argumentsOf(command));
    EXPECT_NE(err.find(message), std::string::npos) << err;
  }
  for (const nandinfo::Command& command : nandinfo::commands()) {
    Words words{command.name, "--help"};
    if (command.group != nullptr) words.insert(words.begin(), command.group);
    EXPECT_EQ(run(words), 0) << err;
    EXPECT_NE(out.find(command.description), std::string::npos) << out;
    EXPECT_EQ(run({"--help"}), 0);
    EXPECT_NE(out.find(command.description), std::string::npos) << out;
  }
  EXPECT_NE(out.find("Examples:"), std::string::npos);
  EXPECT_EQ(run({"--version"}), 0);
  EXPECT_TRUE(out.starts_with("nandinfo ")) << out;
}

TEST_F(Nandinfo, DecodesAFileOrSaysWhatIsWrongWithIt) {
  const auto counters = file("ftl", support::words({header(4, 1), UINT64_MAX, header(4, 1), 7,
                                                    header(4242, 2), 1, 2, header(4, 9)}));
  const auto empty = file("empty", {});
  const auto msp = file("msp", support::records({{0x2FFF, 4, {}}}));
  const struct {
    const char* form;
    std::string path;
    int status;
    const char *out, *err;
  } rows[] = {
      {"ftl", counters, 0,
       R"({"ok": true, "fields": [["hostWrites", 18446744073709551615], ["hostWrites", 7], )"
       R"(["Stat_4242_0", 1], ["Stat_4242_1", 2]], "error": "NA"})",
       ""},
      {"ftl-stat", counters, 0, R"(["Stat_4", 7])", ""},
      {"legacy", counters, 1, R"({"ok": false, "fields": [["hostWrites", 1844)", "decode legacy: "},
      {"ftl", empty, 1, R"({"ok": false, "fields": [], "error": )", "decode ftl: "},
      {"msp", msp, 1, R"({"ok": false, "fields": [], )", "decode msp: "},
      {"msp", folder / "none", 1, "null", "/none: No such file or directory"},
      {"msp", folder.path(), 1, "null", ": Is a directory"},
      {"msp", "/dev/zero", 1, "null", "/dev/zero: longer than 16 MiB"},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(run({"decode", row.form, row.path, "--compact"}), row.status) << row.path;
    EXPECT_NE(out.find(row.out), std::string::npos) << out;
    EXPECT_EQ(std::count(out.begin(), out.end(), '\n'), 1);
    EXPECT_NE(err.find(row.err), std::string::npos) << err;
    EXPECT_EQ(std::count(err.begin(), err.end(), '\n'), row.status) << err;
  }
}

// Every kind of bytes, given to every decoder that isn't for it.
TEST_F(Nandinfo, RefusesABufferOfAnotherKind) {
  const auto text = [](std::string_view characters) {
    const auto* bytes = reinterpret_cast<const std::byte*>(characters.data());
    return support::Bytes(bytes, bytes + characters.size());
  };
  const struct {
    const char* name;
    std::string_view decoder;
    support::Bytes bytes;
  } kinds[] = {
      {"FTL statistics", "ftl", support::everyFTLCounter()},
      {"MSP statistics", "msp", support::everyMSPCounter(1)},
      {"a validity list", "validity", support::validityList(2, {{3, 70}, {3, 80}, {15, 90}})},
      {"a defects list", "defects", support::defectsList(9, {{0x20001, 1, 2, 3, 4, 5, 0xFB, 1}})},
      {"a kernel snapshot", "snapshot", support::kernelSnapshot(4096)},
      {"a property list", "", text("<?xml version=\"1.0\"?>\n<plist><dict/></plist>")},
      {"a property list", "", text("bplist00\1\2\3\4\5\6")},
      {"a text", "", text("hostWrites 17, and 18 \xC3\xA4\n")},
  };
  for (const auto& kind : kinds) {
    const std::string path = file("buffer", kind.bytes);
    for (const std::string_view decoder :
         {"ftl", "ftl-stat", "legacy", "msp", "validity", "defects", "snapshot"}) {
      const bool ftl = decoder.starts_with("ftl") || decoder == "legacy";
      const bool own = kind.decoder == (ftl ? "ftl" : decoder);
      EXPECT_EQ(run({"decode", std::string(decoder), path, "--compact"}), own ? 0 : 1) << err;
      EXPECT_EQ(out.starts_with(R"({"ok": true)"), own) << out.substr(0, 200);
      const std::string refusal = own ? "" : path + ": it holds " + kind.name + ", not ";
      EXPECT_NE(err.find(refusal), std::string::npos) << err;
    }
    EXPECT_EQ(run({"decode", "counters", "q8", path}), 1);
    support::Bytes cut(kind.bytes.begin(), kind.bytes.begin() + 3);
    for (const char* decoder : {"ftl", "msp", "validity", "defects", "snapshot"}) {
      EXPECT_EQ(run({"decode", decoder, file("cut", cut)}), 1);
      EXPECT_NE(err.find("/cut: 3 bytes are too few for "), std::string::npos) << err;
    }
  }
}

TEST_F(Nandinfo, DecodesListsAndSnapshots) {
  const auto validity = file("v", support::validityList(2, {{3, 70}, {16, 0}, {3, 80}, {15, 90}}));
  const auto defects = file("d", support::defectsList(9, {{0x20001, 1, 2, 3, 4, 5, 0xFB, 2}}));
  const auto telemetry = file("t", support::telemetryList(2));
  const auto snapshot = file("s", support::kernelSnapshot(4096));
  auto bytes = support::telemetryList(2);
  bytes.push_back(std::byte{0});
  const auto longer = file("l", bytes);
  const struct {
    Words command;
    int status;
    const char* out;
  } rows[] = {
      {{"validity", validity},
       0,
       R"("fields": [["ValidityList[3]", [70, 80]], ["ValidityList[15]", [90]]], "error": "NA"})"},
      {{"defects", defects},
       0,
       R"("Factory Count": 9, "defects": [{"Bus": 1, "CE": 2, "CAU": 1, "Block": 2, "Cycle": 3, )"
       R"("Reason": 4, "Page": 5, "Temperature": -5, "Mode": 2}], "error")"},
      {{"telemetry", "q8", telemetry}, 0, R"("1": {"RD": 100, "PE": 101, )"},
      {{"telemetry", "1y", telemetry}, 0, R"("dspExceptionParameter[11]": 1)"},
      {{"telemetry", "1y", longer}, 1, "8257 bytes are no whole number of channels"},
      {{"telemetry", "1y", longer, "--channels", "2"}, 0, R"("channels": {"0": {"RD": 0, )"},
      {{"telemetry", "1y", longer, "--channels", "3"}, 1, "there are not 3 channels in it"},
      {{"telemetry", "1y", snapshot}, 1, "it holds a kernel snapshot, not a telemetry list"},
      {{"snapshot", snapshot},
       0,
       R"(["VM_swapout[3]", 4096]], "items": [{"type": "container begin", "count": 1, "bytes": 8}, )"},
      {{"snapshot", telemetry}, 1, "no container"},
  };
  for (auto [command, status, part] : rows) {
    command.insert(command.begin(), {"decode", "--compact"});
    EXPECT_EQ(run(command), status) << err;
    EXPECT_NE((out + err).find(part), std::string::npos) << out;
  }
}

// What a capture says of itself is as foreign as its buffers.
TEST_F(Nandinfo, DecodesAWholeCapture) {
  const auto capture = [this](const Dictionary& buffers) {
    const Dictionary chip{{"chip-id", "QM8"}, {"manufacturer-id", "00"}, {"num-bus", 1}};
    folder.write(
        "c/registry.plist",
        *plist::writeXML(Dictionary{
            {"Children",
             Array{5, Dictionary{{"Class", support::kQRT3},
                                 {"Properties", Dictionary{{"Controller Characteristics", chip}}},
                                 {"Driver", Dictionary{{"Buffers", buffers}}}}}}}));
    return run({"decode", "capture", folder / "c", "--compact"});
  };
  const Array refused{Dictionary{{"File", "none"}, {"FailSize", 5}}};
  file("outside", support::everyFTLCounter());
  file("c/ftl", support::words({header(4, 1), 7}));
  file("c/kernel-snapshot.bin", support::kernelSnapshot(4096));
  const Dictionary good{{"13", "ftl"},
                        {"221:1", support::data(support::everyMSPCounter(1))},
                        {"17:0", support::data(support::telemetryList(1))},
                        {"11:0", Dictionary{{"Data", plist::Data()}, {"Announce", 5}}},
                        {"15:0", refused.front()},
                        {"39\x1b:0", "ftl"},
                        {"22:0", "ftl"}};
  EXPECT_EQ(capture(good), 0) << err;
  for (const char* part :
       {R"({"ok": true, "class": "NorbaQRT3NVMeController", "statistics 0": {"ok": true, )"
        R"("fields": [["hostWrites", 7]], "error": "NA"}, "msp 1": {"ok": true, "fields": [["pass)",
        R"("telemetry 0": {"ok": true, "channels": {"0": {"RD": 0, )",
        R"("retentionIndication[0]")",
        R"("kernel-snapshot": {"ok": true, "fields": [["VM_swapout[0]", 1])",
        R"("undecoded": ["buffer 39)", R"(, "snapshot 0"], "error": "NA"})"}) {
    EXPECT_NE(out.find(part), std::string::npos) << part << out;
  }
  const struct {
    Dictionary buffers;
    const char* err;
  } rows[] = {
      {{{"13", "../outside"}}, "/c: statistics 0: No such file or directory\n"},
      {{{"13:0", support::data(support::everyMSPCounter(1))}, {"221:0", "ftl"}},
       "/c: statistics 0: it holds MSP statistics, not FTL statistics\n"},
      {{{"10:4", "big"}}, "/c: read-statistics 4: the capture is longer than 16 MiB\n"},
  };
  file("c/big", support::Bytes(NANDInfo::kMaxBuffer));
  for (const auto& row : rows) {
    EXPECT_EQ(capture(row.buffers), 1);
    EXPECT_NE(err.find(row.err), std::string::npos) << err;
    EXPECT_TRUE(out.starts_with(R"({"ok": false, )")) << out;
  }
  std::filesystem::remove(folder / "c/kernel-snapshot.bin");
  EXPECT_EQ(capture({{"22:0", "ftl"}}), 1);
  folder.write("c/registry.plist", "<plist><dict>");
  for (const char* path : {"c", "outside", "none"}) {
    EXPECT_EQ(run({"decode", "capture", folder / path}), 1);
    EXPECT_EQ(out, "null\n");
    EXPECT_NE(err.find(folder / path), std::string::npos) << err;
  }
}

// The bounds are those of the layouts: one word less than they read isn't enough, and what lies
// beyond is as good as zero.
TEST_F(Nandinfo, DecodesCounterBlocksThatHoldWhatTheLayoutReads) {
  const struct {
    const char* layout;
    std::uint32_t words, last;  // where the last word that is read goes to
  } rows[] = {
      {"1y", 533, 76},      {"1x-sandisk", 316, 72}, {"1x-hynix", 312, 72},
      {"generic", 121, 44}, {"q8", 127, 85},
  };
  for (const auto& [layout, count, last] : rows) {
    support::Bytes block;
    for (std::uint32_t i = 0; i < count; ++i) support::put(block, i, 4);
    EXPECT_EQ(run({"decode", "counters", layout, file("whole", block)}), 0) << err;
    const auto words = nlohmann::json::parse(out);
    ASSERT_EQ(words.size(), 177u);
    EXPECT_EQ(words[last], count - 1) << layout;
    EXPECT_EQ(*std::max_element(words.begin(), words.end()), count - 1) << layout;
    block.pop_back();
    EXPECT_EQ(run({"decode", "counters", layout, file("cut", block)}), 1);
    EXPECT_EQ(out, "null\n");
    EXPECT_NE(err.find("/cut: " + std::to_string(4 * count - 1) + " bytes"), std::string::npos);
  }
}

TEST_F(Nandinfo, SaysWhatIsKnownOfACounter) {
  const struct {
    const char* names;
    int status;
    const char* part;
  } rows[] = {
      {"padSizes_2", 0,
       R"([{"name": "padSizes_2", "key": "121", "elements": 4, "digits": 8, "whitelists": ["FTL", )"
       R"("magazine"], "magazine": "accumulated", "events": ["massStorage_NANDInfo_FTLCounters_1"], )"
       R"("countersKey": "com.norba.NANDInfo.PadSize3"}])"},
      {"padSizes", 0, R"([{"name": "padSizes_{0..3}", "key": "121", )"},
      {"com.norba.NANDInfo.PadSize3", 0, R"([{"name": "padSizes_2", "key": "121", )"},
      {"padSizes", 0, R"("countersKey": "com.norba.NANDInfo.PadSize{1..4}"}])"},
      {"bitflipAddr", 0, R"("countersKey": "com.norba.NANDInfo.BitFlipAddrCSW"}, {"name")"},
      {"bandsPerSpecialFlow", 0,
       R"({"name": "bandsPerSpecialFlow_3", "key": "114", "elements": 5})"},
      {"dspExceptionParameter114", 0,
       R"([{"name": "dspExceptionParameter114{0..19}", "key": "0x1091")"},
      {"version Count", 0,
       R"([{"name": "version", "key": "1", "elements": 1}, {"name": "Count", "key": "derived")"},
      {"version padSise", 1, "there is no counter 'padSise'; did you mean 'padSizes'?"},
  };
  for (const auto& [names, status, part] : rows) {
    Words command = argumentsOf(names);
    command.insert(command.begin(), {"counters", "--compact"});
    EXPECT_EQ(run(command), status) << err;
    EXPECT_NE((out + err).find(part), std::string::npos) << out << err;
  }
  terminal = true;
  EXPECT_EQ(run({"counters", "boots"}), 0);
  EXPECT_EQ(out,
            "name      boots\nkey       10\nelements  1\ndigits    5\n\nwhitelists:\nFTL\n\n"
            "events:\nmassStorage_NANDInfo_FTLCounters_1\n");
}

// A verdict, a sum or an event that nobody has answered for.
TEST_F(Nandinfo, GivesNoVerdictWithoutAnAnswer) {
  const auto commands =
      argumentsOf({{"", {"info", "daily", "ftl", "ftl --all", "msp --round", "storage", "dump"}},
                   {"health ", {"servita", "lab", "ota"}},
                   {"magazine ", {"--hours 24", "--history"}},
                   {"extract ", {"--monthly", "--from 3"}}});
  auto& registry = device.registry;
  registry.add({.className = "NvramDiagService", .properties = {{"CommonUsed", 5}}});
  const struct {
    const char* err;
    bool there;
    platform::DriverStatus openStatus;
    const char* standing;  // the only command that is answered
  } states[] = {
      {"no storage controller found: the device registry offers none of Norba", false, 0, "x"},
      {"the storage controller NorbaQRT3NVMeController can't be opened (status 0xd)", true, 13,
       "x"},
      {"the storage controller NorbaQRT3NVMeController answers no command (status 0x2d)", true, 0,
       "x"},
      {"the storage controller NorbaQRT3NVMeController answers no", true, 0, "9 size 13/0"}};
  for (const auto& state : states) {
    registry.root->children.resize(1);
    if (state.there) {
      registry.add({.className = support::kQRT3,
                    .properties = {{"Controller Characteristics", Dictionary()}},
                    .openStatus = state.openStatus});
    }
    registry.standing = {{state.standing, registry.announce(16)}};
    for (const auto& command : commands) {
      EXPECT_EQ(run(command), 1) << command[0] << state.err;
      EXPECT_EQ(out, "") << command[0];
      EXPECT_NE(err.find(state.err), std::string::npos) << err;
      EXPECT_EQ(std::count(err.begin(), err.end(), '\n'), 1) << err;
    }
    EXPECT_TRUE(device.eventra.events.empty());
  }
  registry.root->children.resize(1);
  EXPECT_EQ(run({"recommends-deletion"}), 1);
  EXPECT_EQ(out, "");
  EXPECT_EQ(run({"capture", folder / "capture"}), 1);
  EXPECT_FALSE(std::filesystem::exists(folder / "capture"));
  EXPECT_EQ(run({"freezer"}), 0);
  EXPECT_EQ(out + err, "{}\n");

  registry.add({.className = "ZMCStorage"});
  EXPECT_EQ(run({"recommends-deletion"}), 1);
  EXPECT_NE(err.find("ZMCStorage answers no command (status 0x2d)"), std::string::npos) << err;
  registry.root->children.back().openStatus = 13;
  EXPECT_EQ(run({"capture", folder / "capture"}), 1);
  EXPECT_EQ(err, "nandinfo: capture: no storage controller can be opened\n");
  EXPECT_FALSE(std::filesystem::exists(folder / "capture"));
  registry.root->children.back().openStatus = 0;
  EXPECT_EQ(run({"msp"}), 1);
  EXPECT_NE(out.find("Controller does not support MSP data"), std::string::npos) << out;
  registry.root->children.resize(1);

  // A controller without the query has nothing to recommend; statistics that aren't any, no health.
  registry.add({.className = support::kQRT3});
  EXPECT_EQ(run({"recommends-deletion"}), 0);
  EXPECT_EQ(out + err, "false\n");
  registry.root->children.back().openStatus = 13;
  EXPECT_EQ(run({"recommends-deletion"}), 1);
  EXPECT_NE(err.find("can't be opened (status 0xd)"), std::string::npos) << err;
  registry.root->children.back().openStatus = 0;
  registry.alwaysTunnels(9, 13, 0, support::words({1}));
  for (const char* whom : {"lab", "ota"}) {
    EXPECT_EQ(run({"health", whom}), 1);
    EXPECT_EQ(out, "null\n") << whom;
    EXPECT_NE(err.find("parseFTL failed"), std::string::npos) << err;
  }
}

// An option that goes to the wrong argument, or to none.
TEST_F(Nandinfo, HandsItsOptionsOn) {
  device.registry.add({.className = support::kQRT3});
  device.setStatistics({{"hostWrites", {5000}}});
  for (const std::uint32_t hours : {0U, 4U, 8U, 12U, 16U, 20U, 24U, 168U, 720U}) {
    device.setSnapshot(hours,
                       {{"magazineFWVersion", {1, 2, 3}},
                        {"magazineInstanceMeta", {(std::uint64_t{4000000} - hours * 3600) << 24}},
                        {"hostWrites", {5000 - hours}},
                        {"numFreeVirtualBlocks", {hours}}});
  }
  const struct {
    Words command;
    std::vector<const char*> in, notIn;
  } rows[] = {
      {{"--hours", "24"}, {"\"hostWrites\": 24.0,", "\"numFreeVirtualBlocks\": 24,"}, {}},
      {{"--hours", "24", "--no-delta"}, {"\"hostWrites\": 4976.0,"}, {}},
      {{"--mode", "0", "--hours", "4"}, {"\"hostWrites\": 4.0,"}, {"numFree"}},
      {{"--mode", "1", "--hours", "4"}, {"\"numFreeVirtualBlocks\": 4,"}, {"\"hostWrites\""}},
      {{"--history"}, {"TLM_instantaneous_gc_wamp_5"}, {"hostWrites", "APIError"}},
  };
  for (auto [command, in, notIn] : rows) {
    command.insert(command.begin(), "magazine");
    EXPECT_EQ(run(command), 0) << err;
    for (const char* text : in) EXPECT_NE(out.find(text), std::string::npos) << text << out;
    for (const char* text : notIn) EXPECT_EQ(out.find(text), std::string::npos) << text << out;
  }
  const std::pair<Words, Words> extractions[] = {
      {{"extract", "--from", "5"}, {"SM.WeeklyMA.FTLCounters_1"}},
      {{"extract", "--from", "5", "--monthly"},
       {"SM.WeeklyMA.FTLCounters_1", "SM.Monthly.FTLCounters_1"}},
      {{"extract", "--from", "6"}, {}},
  };
  for (const auto& [command, events] : extractions) {
    device.eventra.events.clear();
    EXPECT_EQ(run(command), 0) << err;
    Words sent;
    for (const auto& event : device.eventra.events) {
      sent.push_back(event.first.substr(std::strlen("com.norba.massStorage.NANDInfo.")));
    }
    EXPECT_EQ(sent, events) << testing::PrintToString(command);
    EXPECT_NE(out.find("com.norba.NANDInfo.ErrorMessage"), std::string::npos) << out;
  }
}

TEST_F(Nandinfo, ShowsTablesOnATerminalOnly) {
  terminal = true;
  const auto counters = file("ftl", support::words({header(4, 1), 1234567, header(7, 1), 89}));
  EXPECT_EQ(run({"decode", "ftl", counters}), 0);
  EXPECT_EQ(out,
            "ok     true\nerror  NA\n\nfields:\nhostWrites  1,234,567\nhostReads          89\n");
  EXPECT_EQ(run({"decode", "ftl", counters, "--json"}), 0);
  EXPECT_EQ(out,
            "{\n  \"ok\": true,\n  \"fields\": [\n    [\"hostWrites\", 1234567],\n"
            "    [\"hostReads\", 89]\n  ],\n  \"error\": \"NA\"\n}\n");
  EXPECT_EQ(run({"freezer"}), 0);
  EXPECT_TRUE(out.starts_with("(there is no kernel snapshot")) << out;
  device.registry.add({.className = "NvramDiagService",
                       .properties = {{"Version", "\x1b[2J\x7f\xC2\x9B\xC2\xA0\xC3\x84"}}});
  EXPECT_EQ(run({"nvram", "--compact"}), 0);
  EXPECT_EQ(out, "{\"version\": \"\\u001b[2J\\u007f\\u009b\xC2\xA0\xC3\x84\"}\n");
}

TEST(NandinfoTable, ShowsEveryShape) {
  const Dictionary one{{"a", 1000}, {"name\x1b[2J", "x"}}, other{{"b", -1234567}, {"a", 22}};
  const struct {
    Value value;
    std::size_t width;
    const char* text;
  } rows[] = {
      {Dictionary{{"msg", "tab\there \xC2\x9B \xFF"}, {"0", one}, {"1", other}, {"e", Array{}}}, 80,
       "msg  tab?here ? \xEF\xBF\xBD\ne    []\n\n"
       "              0           1\na         1,000          22\nname?[2J  x\n"
       "b                -1,234,567\n"},
      {Dictionary{{"n", 1000}, {"error", "longer"}, {"m", 1}, {"d", plist::Date{0}}}, 80,
       "n      1,000\nerror  longer\nm          1\nd      1970-01-01T00:00:00Z\n"},
      {Dictionary{{"0", one}, {"1", one}, {"2", other}}, 23,
       "              0      1\na         1,000  1,000\nname?[2J  x      x\n\n"
       "2:\nb  -1,234,567\na          22\n"},
      {Dictionary{{"0", one}, {"1", other}}, 20,
       "0:\na         1,000\nname?[2J  x\n\n1:\nb  -1,234,567\na          22\n"},
      {Array{one, other}, 80, "a      name?[2J  b\n1,000  x\n   22            -1,234,567\n"},
      {Array{Dictionary{{"k", "\xC3\xA4\xC3\xB6\xC3\xBC\xC3\xA4"}}}, 3,
       "k\n\xC3\xA4\xC3\xB6\xE2\x80\xA6\n"},
      // Wide characters, one that combines, one that turns the direction of writing.
      {Array{Array{"\xE6\x97\xA5\xE6\x9C\xAC", 1}, Array{"e\xCC\x81", 2},
             Array{"a\xE2\x80\xAE", 3}},
       80, "\xE6\x97\xA5\xE6\x9C\xAC  1\ne\xCC\x81     2\na?    3\n"},
      {Array{Dictionary{{"\xE6\x97\xA5\xE6\x9C\xAC", 1}}}, 3, "\xE6\x97\xA5\xE2\x80\xA6\n1\n"},
      {Dictionary{{"c", Dictionary{{"a", Array{1}}, {"0", one}}}, {"z", 1}}, 80,
       "z  1\n\nc:\n\n0:\na         1,000\nname?[2J  x\n\na:\n0:  1\n"},
      {Array{0, 1, 2, 3, 4, 5, 6, 7, 100, 0.5}, 80,
       "0:    0    1  2  3  4  5  6  7\n8:  100  0.5\n"},
      {Array{-1234.5, 123456.0, 1e300}, 80, "0:  -1,234.5  123,456  1e+300\n"},
      {std::uint64_t{UINT64_MAX}, 80, "18,446,744,073,709,551,615\n"},
      {Array{}, 80, ""},
  };
  for (const auto& row : rows) EXPECT_EQ(nandinfo::tableText(row.value, row.width), row.text);
}

// Everything that can be missing is: the driver has no MSP command, the EAN service refuses.
TEST_F(Nandinfo, CapturesWhatIsAnsweredAndListsWhatIsNot) {
  auto& registry = device.registry;
  registry.add({.className = "ZMCStorage", .properties = {{"PropertyMatch", Array{"x", 5}}}});
  registry.add({.className = "NorbaNVMeEAN", .openStatus = 7});
  registry.alwaysTunnels(8, 13, 0, support::words({1}));
  registry.alwaysTunnels(8, 10, 720, {});
  registry.standing["5"] = {.output = support::Bytes(4, std::byte{1})};
  device.clock.secondsSince1970 = 1795320000;

  EXPECT_EQ(run({"capture", folder / "c"}), 0) << err;
  const auto manifest = nlohmann::json::parse(folder.read("c/manifest.json"));
  EXPECT_EQ(out, folder.read("c/manifest.json"));
  EXPECT_EQ(manifest["time"], "2026-11-22T04:00:00Z");
  EXPECT_EQ(manifest["class"], "ZMCStorage");
  ASSERT_EQ(manifest["buffers"].size(), 2u);
  EXPECT_EQ(manifest["buffers"][0]["sha256"],
            "7c9fa136d4413fa6173637e883b6998d32e1d675f88cddff9dcbcf331820f4b8");
  EXPECT_EQ(manifest["buffers"][1].dump(),
            R"({"argument":720,"file":"read-statistics-720.bin","name":"read-statistics",)"
            R"("opType":10,"sha256":)"
            R"("e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855","size":0})");
  std::string leftOut;
  for (const auto& entry : manifest["leftOut"]) leftOut += entry["what"].get<std::string>() + ";";
  EXPECT_EQ(leftOut,
            "read-statistics 0 to 719;read-statistics 721 to 8784;msp;defects 0;telemetry 0 to 2;"
            "task-scheduler 0;snapshot 0;snapshot-header 0;band-statistics 0;NorbaNVMeEAN;"
            "NvramDiagService;");
  // A list is asked for as a dump asks: its number is in the flags.
  support::Bytes list(24);
  list[0] = std::byte{17};
  list[4] = std::byte{1 | 2 << 2};
  EXPECT_EQ(std::ranges::count(registry.inputs, list), 1);
  EXPECT_EQ(folder.read("c/statistics-0.bin"), std::string("\1\0\0\0\0\0\0\0", 8));
  const Dictionary driver{
      {"Buffers", Dictionary{{"13:0", "statistics-0.bin"}, {"10:720", "read-statistics-720.bin"}}},
      {"RecommendsDeletion", plist::Data(4, 1)}};
  EXPECT_EQ(
      device.parse(folder.read("c/registry.plist")),
      (Dictionary{{"Class", "Root"},
                  {"Children",
                   Array{Dictionary{{"Class", "ZMCStorage"},
                                    {"Properties", Dictionary{{"PropertyMatch", Array{"x", 5}}}},
                                    {"Driver", driver}},
                         Dictionary{{"Class", "NorbaNVMeEAN"},
                                    {"Driver", Dictionary{{"RefuseOpen", true}}}}}}}));

  const auto mode = [this](const char* name) {
    struct stat status {};
    ::stat((folder / name).c_str(), &status);
    return status.st_mode & 0777;
  };
  EXPECT_EQ(mode("c"), 0700u);
  for (const char* name : {"c/statistics-0.bin", "c/registry.plist", "c/manifest.json"}) {
    EXPECT_EQ(mode(name), 0600u) << name;
  }

  // Neither a folder that holds something nor what isn't one is touched; an empty one will do.
  EXPECT_EQ(run({"capture", folder / "c"}), 1);
  EXPECT_NE(err.find("/c: the folder is not empty"), std::string::npos) << err;
  EXPECT_EQ(nlohmann::json::parse(folder.read("c/manifest.json")), manifest);
  EXPECT_EQ(run({"capture", folder / "c/manifest.json"}), 1);
  EXPECT_EQ(run({"capture", folder / "not/there"}), 1);
  std::filesystem::create_directory(folder / "empty");
  terminal = true;
  EXPECT_EQ(run({"capture", folder / "empty"}), 0);
  EXPECT_NE(err.find("telemetry 2"), std::string::npos);
  EXPECT_TRUE(err.ends_with("\r\x1b[K")) << err;
  EXPECT_EQ(folder.read("empty/manifest.json"), folder.read("c/manifest.json"));
}

}  // namespace
