#include <gtest/gtest.h>

#include "base/Text.h"
#include "tools/pelloran/ImportLine.h"
#include "tools/pelloran/MachineFigures.h"

namespace {

using Kind = host::CounterChange::Kind;

constexpr pelloran::Moment kNow{20000, 3600};

TEST(PelloranImportLine, NumbersKeepTheirValueAndMissingFieldsMeanNow) {
  struct {
    const char* line;
    Kind kind;
    std::int64_t amount;
    double sample;
    std::int32_t day, seconds;
  } const cases[] = {
      {R"({"set": "k", "value": 9223372036854775807})", Kind::set, INT64_MAX, 0, 20000, 3600},
      {R"({"add": "k", "value": -9223372036854775808})", Kind::add, INT64_MIN, 0, 20000, 3600},
      {R"({"add": "k", "value": 1e3, "day": 5.0})", Kind::add, 1000, 0, 5, 3600},
      {R"({"push": "k", "value": 18446744073709551615})", Kind::push, 0, 18446744073709551615.0,
       20000, 3600},
      {R"({"push": "k", "value": 5e-324, "day": "yesterday", "seconds": 0})", Kind::push, 0, 5e-324,
       19999, 0},
      {R"( {"seconds": 86399, "day": "today", "value": 1, "push": "k"} )", Kind::push, 0, 1, 20000,
       86399},
      {R"({"set": "k", "value": 1, "day": "2026-11-22"})", Kind::set, 1, 0, 20779, 3600},
  };
  for (const auto& row : cases) {
    const auto parsed = pelloran::parseImportLine(row.line, kNow);
    ASSERT_TRUE(parsed) << row.line << ": " << parsed.error().text;
    EXPECT_EQ(parsed->key, "k");
    EXPECT_EQ(parsed->change.kind, row.kind) << row.line;
    EXPECT_EQ(parsed->change.amount, row.amount) << row.line;
    EXPECT_EQ(parsed->change.sample, row.sample) << row.line;
    EXPECT_EQ(parsed->change.day, row.day) << row.line;
    EXPECT_EQ(parsed->change.seconds, row.seconds) << row.line;
  }
}

TEST(PelloranImportLine, AnythingElseIsRefusedWithAReason) {
  const std::string deep(100000, '['), longest(1025, 'k');
  std::vector<std::string> lines = {"", "1", "null", "[]", "{", deep, "{\"set\": " + deep};
  // Beginnings, and contents that can't follow.
  const std::pair<const char*, std::vector<std::string>> contents[] = {
      {"{", {""}},
      {R"({"set": "k")",
       {"", R"(, "value": 1} x)", R"(, "value": 1, "push": "k")", R"(, "set": "k", "value": 1)",
        R"(, "value": 1, "value": 2)", R"(, "value": 1, "more": 2)"}},
      {R"({"set": "k", "value": )",
       {R"({"value": 1})", "null", R"("1")", "1.5", "9223372036854775808", "-1e19"}},
      {R"({"push": "k", "value": )", {"1e999", "NaN"}},
      {R"({"value": 1, "push": )",
       {"5", R"("")", R"("\u0000")", R"("\ud800")", "\"\xff\"", '"' + longest + '"'}},
      {R"({"push": "k", "value": 1, "day": )", {"2147483648", "0.5", "-1", R"("-1")", R"("soon")"}},
      {R"({"push": "k", "value": 1, "seconds": )", {"86400", "-1", R"("1")"}}};
  for (const auto& [beginning, refused] : contents) {
    for (const std::string& content : refused) lines.push_back(beginning + content + "}");
  }
  for (const auto& line : lines) {
    const auto parsed = pelloran::parseImportLine(line, kNow);
    EXPECT_FALSE(parsed) << line.substr(0, 80);
    EXPECT_FALSE(parsed.error().text.empty()) << line.substr(0, 80);
  }
}

std::string text(const pelloran::MachineFigures& figures) {
  std::string lines;
  for (const auto& [key, count] : figures.counts) lines += key + " " + std::to_string(count) + "\n";
  for (const auto& [key, value] : figures.measurements) {
    lines += key + " ~" + base::doubleText(value) + "\n";
  }
  return lines;
}

TEST(PelloranMachineFigures, SoundLinesAreReadAndOthersSkipped) {
  pelloran::MachineFigures figures;
  parseVmstat(
      "pgfault 12\nnr_free_pages 5\npswpin\npgpgin -1\noom_kill 1x\n\n"
      "pswpout 99999999999999999999999\npgmajfault 7",
      figures);
  EXPECT_EQ(text(figures),
            "host.vmstat.pgfault 12\nhost.vmstat.pswpout 9223372036854775807\n"
            "host.vmstat.pgmajfault 7\n");
  figures = {};
  parseMeminfo("MemTotal: 9 kB\nMemFree:  123 kB\nDirty 5 kB\nSlab:\nCached: 7", figures);
  EXPECT_EQ(text(figures), "host.meminfo.MemFree ~123\nhost.meminfo.Cached ~7\n");
  figures = {};
  parseLoadavg("0.5 nan 2.25 1/2 3", figures);
  EXPECT_EQ(text(figures), "host.loadavg.1m ~0.5\nhost.loadavg.15m ~2.25\n");
  figures = {};
  parsePressure("io", "some avg10=1.50 avg60=2 total=77\nfull avg10=inf total=-1\nall avg10=1\n",
                figures);
  EXPECT_EQ(text(figures), "host.pressure.io.some.total 77\nhost.pressure.io.some.avg10 ~1.5\n");
  figures = {};
  parseTemperature("0", "45500\n", figures);
  parseTemperature("1", "hot\n", figures);
  parseTemperature("2", "", figures);
  EXPECT_EQ(text(figures), "host.thermal.0.celsius ~45.5\n");
}

TEST(PelloranMachineFigures, OnlyWholeDisksAreCounted) {
  const auto disksOf = [](std::initializer_list<const char*> names) {
    std::string lines = "   8 0 cut 1 2 3\n";
    for (const char* name : names) {
      lines += base::format("   8       0 %s 1 2 3 4 5 6 7 8 0 9 10 11\n", name);
    }
    pelloran::MachineFigures figures;
    pelloran::parseDiskstats(lines, figures);
    std::string disks;
    for (const auto& [key, count] : figures.counts) {
      if (key.ends_with(".sectors_written") && count == 7) {
        disks += key.substr(10, key.size() - 10 - 16) + " ";
      }
    }
    return disks;
  };
  EXPECT_EQ(disksOf({"sda", "sda1", "sda12", "sdaa", "sdaa1", "loop0", "ram1", "zram0"}),
            "sda sdaa ");
  EXPECT_EQ(disksOf({"nvme0n1p1", "nvme0n1", "nvme0n10", "mmcblk0", "mmcblk0p2"}),
            "nvme0n1 nvme0n10 mmcblk0 ");
  EXPECT_EQ(disksOf({"md1", "md12", "dm-1", "dm-10"}), "md1 md12 dm-1 dm-10 ");
}

}  // namespace
