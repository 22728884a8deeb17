// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include <filesystem>
#include <sstream>

#include "host/counter_store_support.h"
#include "support/CommandLine.h"
#include "tools/pelloran/Pelloran.h"

namespace {

using support::argumentsOf;
using Lines = std::vector<std::string>;

class PelloranCommand : public testing::Test {
 protected:
  PelloranCommand() { here.clock.seconds = 20000 * 86400.0 + 3600; }

  int run(std::vector<std::string> arguments, const std::string& input = "") {
    std::vector<const char*> argv = {"pelloran"};
    for (const auto& argument : arguments) argv.push_back(argument.c_str());
    std::istringstream in(input);
    std::ostringstream outStream, errStream;
    waits = 0;
    const int status = pelloran::runPelloran(
        {here.store, here.clock, in, outStream, errStream, terminal, [this] { return figures; },
         [this](std::chrono::steady_clock::time_point) { ++waits; }},
        static_cast<int>(argv.size()), argv.data());
    out = outStream.str();
    err = errStream.str();
    return status;
  }

  support::TemporaryFolder folder;
  host::figures::MachineFigures figures;
  support::StoreFixture here{folder.path()};
  std::string out, err;
  bool terminal = false;
  int waits = 0;
};

TEST_F(PelloranCommand, ChangesAreRecordedUnderTheDayAndSecondThatWereMeant) {
  for (const char* command : {"set a 5", "add a -7", "add b -3 --day 2024-02-29",
                              "set c 9223372036854775807 --day yesterday", "add c 1 --day=19999",
                              "push d -1.5e3 --day today", "push d 2 --seconds 86399",
                              "push d 3 --seconds 0", "set -- -dash 1"}) {
    EXPECT_EQ(run(argumentsOf(command)), 0) << err;
    EXPECT_EQ(out + err, "");
  }
  EXPECT_EQ(here.rows(), (Lines{"19782 b -3", "19999 c 9223372036854775807", "20000 -dash 1",
                                "20000 a -2", "20000 d 3600:-1500 86399:2 0:3"}));
}

TEST_F(PelloranCommand, WrongUsageIsSaidInOneLineWithAHintAndWritesNothing) {
  const std::string longKey(1025, 'k');
  auto commands = argumentsOf(
      {{"", {"", "take a 1", "add a 9223372036854775808", "add a 1 --day=-1"}},
       {"set ",
        {"a", "a 1 2", "a 5.5", "a 5x", "a ", " 5", "\xc0\x80 5", "\xed\xa0\x80 5", "cut\xe2\x82 5",
         longKey + " 5", "a 1 --seconds 1"}},
       {"set a 1 --day ",
        {"", "2147483648", "tomorrow", "-1", "1969-12-31", "2026-02-29", "2026-11-22T00:00:00Z"}},
       {"push a ", {"nan", "inf", "1e999", "1 --seconds 86400", "1 --seconds -1"}},
       {"show ", {"extra", "--day -1"}},
       {"sample ", {"--every 1", "--for 1", "--every 0 --for 1", "--every 1 --for nan"}}});
  commands.emplace_back();
  for (const auto& command : commands) {
    EXPECT_EQ(run(command), 2) << testing::PrintToString(command);
    EXPECT_TRUE(err.starts_with("pelloran: ")) << err;
    EXPECT_TRUE(err.ends_with(" --help')\n")) << err;
    EXPECT_EQ(std::count(err.begin(), err.end(), '\n'), 1) << err;
    EXPECT_EQ(out, "");
  }
  EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
  run({"shwo", "--json"});
  EXPECT_EQ(err,
            "pelloran: there is no command 'shwo'; did you mean 'show'? (see 'pelloran --help')\n");
  run({"set", "a", "\x1b[5m"});
  EXPECT_EQ(err, "pelloran: '?[5m' is not an integer of 64 bits (see 'pelloran set --help')\n");
  EXPECT_EQ(run({"--help"}), 0);
  EXPECT_NE(out.find("import"), std::string::npos);
  EXPECT_EQ(run({"--version"}), 0);
  EXPECT_TRUE(out.starts_with("pelloran ")) << out;
}

TEST_F(PelloranCommand, AnImportIsRecordedWholeOrNamesTheLineThatStoppedIt) {
  const std::string sound =
      "{\"set\": \"a\", \"value\": 5.0}\r\n\n  \t\n"
      "{\"value\": -2, \"add\": \"a\", \"day\": \"yesterday\"}\n"
      "{\"push\": \"\\u00e4\", \"value\": 1, \"day\": \"1970-01-05\", \"seconds\": 7}\n";
  const std::string longest(std::size_t{1} << 20, ' ');
  EXPECT_EQ(run({"import"}, sound + "[]"), 1);
  EXPECT_EQ(err, "pelloran: line 6: not a JSON object\n");
  EXPECT_EQ(run({"import"}, sound + longest + " "), 1);
  EXPECT_EQ(err, "pelloran: line 6: longer than 1 MiB\n");
  EXPECT_EQ(here.rows(), Lines{});
  EXPECT_EQ(run({"import"}, longest + "\n" + sound), 0) << err;
  EXPECT_EQ(here.rows(), (Lines{"19999 a -2", "20000 a 5", "4 \xc3\xa4 7:1"}));

  folder.write("changes", "{\"add\": \"a\", \"value\": 1}");
  const std::string file = (folder / "changes").string();
  EXPECT_EQ(run({"import", file}), 0) << err;
  EXPECT_EQ(here.rows()[1], "20000 a 6");
  EXPECT_EQ(run({"import", file + ".missing"}), 1);
  EXPECT_EQ(run({"import", folder.path().string()}), 1);
  EXPECT_EQ(err, "pelloran: " + folder.path().string() + ":1: it can't be read\n");
}

TEST_F(PelloranCommand, ShowOrdersScalarsAndDistributionsTogether) {
  EXPECT_TRUE(here.store.set("b", 2, 1));
  EXPECT_TRUE(here.store.set("a\n\xc2\x9b\"", 1, 1));
  EXPECT_TRUE(here.store.set("c", 3, 0));
  EXPECT_TRUE(here.store.push("b", 4, 1, 9));
  EXPECT_TRUE(here.store.push("b", 1e22, 1, 8));
  EXPECT_EQ(run({"show", "--json"}), 0);
  EXPECT_EQ(out,
            "{\"day\": 0, \"key\": \"c\", \"value\": 3}\n"
            "{\"day\": 1, \"key\": \"a\\n\\u009b\\\"\", \"value\": 1}\n"
            "{\"day\": 1, \"key\": \"b\", \"value\": 2}\n"
            "{\"day\": 1, \"key\": \"b\", \"samples\": [[9, 4.0], [8, 1e+22]]}\n");
  EXPECT_EQ(run({"show", "--day", "1"}), 0);
  EXPECT_EQ(out,
            "DAY  DATE        KEY   VALUE\n"
            "1    1970-01-02  a??\"  1\n"
            "1    1970-01-02  b     2\n"
            "1    1970-01-02  b     count 2  min 4  mean 5e+21  max 1e+22\n");
  EXPECT_TRUE(here.store.set("\xe8\xa8\x88", 1, 2));  // two columns wide
  EXPECT_TRUE(
      here.store.set("u\xcc\x88\xc2\x9b!", 2, 2));  // combined with the one before; a control
  EXPECT_EQ(run({"show", "--day", "1970-01-03"}), 0);
  EXPECT_EQ(out,
            "DAY  DATE        KEY  VALUE\n"
            "2    1970-01-03  u\xcc\x88?!  2\n"
            "2    1970-01-03  \xe8\xa8\x88   1\n");
  EXPECT_EQ(run({"show", "--prefix", "c", "--json"}), 0);
  EXPECT_EQ(out, "{\"day\": 0, \"key\": \"c\", \"value\": 3}\n");
  EXPECT_EQ(run({"show", "--prefix", "x"}), 0);
  EXPECT_EQ(out, "");
}

TEST_F(PelloranCommand, AFailedReadOrWriteEndsWithOne) {
  here.home.reset();
  EXPECT_EQ(run({"set", "a", "1"}), 1);
  EXPECT_EQ(err, "pelloran: there is no home folder for the counters database\n");
  here.home = "/var/mobile";
  folder.write("var/mobile/Library/Pelloran", "a file in the place of the folder");
  EXPECT_EQ(run({"show"}), 1);
  EXPECT_TRUE(err.ends_with("/var/mobile/Library/Pelloran: Not a directory\n")) << err;
}

TEST_F(PelloranCommand, EachReadingOfTheMachineIsRecordedOnce) {
  EXPECT_EQ(run({"sample"}), 1);
  figures = {
      "boot", 5, {{"host.vmstat.pgfault", 100}}, {{"host.loadavg.1m", 0.25}, {"host.a", -1.5}}};
  terminal = true;
  EXPECT_EQ(run({"sample", "--every", "0.5", "--for", "1"}), 0) << err;
  EXPECT_EQ(waits, 2);
  EXPECT_NE(err.find("reading 2 of 3"), std::string::npos) << err;
  EXPECT_TRUE(err.ends_with("\r\x1b[K")) << err;
  const Lines rows{"20000 host.vmstat.pgfault 0", "20000 host.a 3600:-1.5 3600:-1.5 3600:-1.5",
                   "20000 host.loadavg.1m 3600:0.25 3600:0.25 3600:0.25"};
  EXPECT_EQ(here.rows(), rows);
  // The next day, and another boot.
  here.clock.seconds = here.clock.seconds + 86400;
  figures = {"boot", 9, {{"host.vmstat.pgfault", 130}}, {}};
  EXPECT_EQ(run({"sample"}), 0) << err;
  figures.counts[0].second = 160;
  EXPECT_EQ(run({"sample"}), 0) << err;
  figures = {"another", 9, {{"host.vmstat.pgfault", 7}}, {}};
  EXPECT_EQ(run({"sample"}), 0) << err;
  EXPECT_EQ(here.rows()[1], "20001 host.vmstat.pgfault 67");
}

}  // namespace
