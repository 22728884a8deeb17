// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "end_to_end/Damage.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <iterator>
#include <nlohmann/json.hpp>
#include <vector>

#include "base/Text.h"

namespace end_to_end {

namespace {

// How many logs have options.
std::ptrdiff_t optionsOf(const Device& device) {
  return std::ranges::count_if(device.names(kSubmitted), [](const std::string& name) {
    return name.ends_with(".options.plist");
  });
}

std::ptrdiff_t eventsOf(const Device& device) {
  return std::ssize(linesOf(device.root().read("var/spool/morvend/events.jsonl")));
}

struct Search : Damage {
  void count(const char* thing, std::ptrdiff_t found, std::ptrdiff_t expected) {
    if (found == expected) return;
    (found < expected ? lost : doubled) = true;
    what += base::format("%td instead of %td %s; ", found, expected, thing);
  }
  void require(bool whole, const std::string& thing) {
    if (whole) return;
    torn = true;
    what += thing + "; ";
  }
};

// Every file is whole, and nothing waits any longer.
void checkFiles(const Device& device, Search& damage) {
  for (const auto& entry : std::filesystem::recursive_directory_iterator(device.root().path())) {
    const std::string name = entry.path().filename();
    const std::string path = entry.path().lexically_relative(device.root().path());
    damage.require(
        !name.ends_with(".corrupt") && !name.starts_with(".p") && !name.ends_with(".waiting"),
        path);
    if (name.ends_with(".plist")) damage.require(device.readPropertyList(path).has_value(), path);
    if (!name.ends_with(".jsonl")) continue;
    const std::string text = device.root().read(path);
    damage.require(text.empty() || text.ends_with("}\n"), path);
    for (const std::string& line : linesOf(text)) {
      damage.require(nlohmann::json::accept(line), path + ": " + line);
    }
  }
  damage.require(device.databaseIsSound(), "the database");
}

// How many lines of structured data begin so.
std::ptrdiff_t linesOfType(const Device& device, const char* start) {
  return std::ranges::count_if(device.structuredLogs(), [start](const std::string& line) {
    return line.starts_with(start);
  });
}

}  // namespace

Damage damageOf(const Device& before, const Device& clean, const Device& device, Usage usage) {
  Search damage;
  damage.require(device.history() == before.history(), "the history");
  damage.require(device.record(kGateRecord) == Value(device.today() - 1), "the day's record");
  damage.require(device.record("TaskingID") == Value("T1"), "the tasking");
  damage.require(device.record("SSLastLoggedAt").has_value(), "the storage log's record");

  // Submitted whole, once, with its options: a single fault neither loses nor doubles it.
  const auto logs = device.dailyLogs();
  damage.count("daily logs", std::ssize(logs), std::ssize(clean.dailyLogs()));
  damage.count("options", optionsOf(device), optionsOf(clean));
  for (const Dictionary& log : logs) {
    for (const auto& section : device.expectedSections()) {
      const Value* found = log.find(section.key);
      damage.require(found != nullptr && *found == section.value, section.key);
    }
  }
  const Lines storage = device.storageLogs();
  damage.count("storage logs", std::ssize(storage), std::ssize(clean.storageLogs()));
  for (const std::string& log : storage) {
    damage.require(log.starts_with("System ID: ") && log.ends_with("ValidityList[1]:7\n"), log);
  }

  const auto rowsOf = [](const Device& of, bool ofUsage) {
    Lines rows = of.recorded();
    std::erase_if(rows, [ofUsage](const std::string& row) {
      return ofUsage == (row.find(" datausage.") == row.npos);
    });
    return rows;
  };
  const auto compareRows = [&](const char* what, bool ofUsage) {
    const Lines rows = rowsOf(device, ofUsage), expected = rowsOf(clean, ofUsage);
    damage.count(what, std::ssize(rows), std::ssize(expected));
    damage.require(std::ranges::includes(expected, rows), what);
  };
  compareRows("counters", false);

  // The dumped and the rolled logs are there, wherever the two runs have brought them; what the day
  // says of the device is there once, and so are its events.
  for (const char* type : {"{\"type\": 1}", "{\"type\": 172, ", "{\"type\": 176, "}) {
    damage.count(type, linesOfType(device, type), linesOfType(clean, type));
  }
  damage.count("events", eventsOf(device), eventsOf(clean));
  std::string rolled;
  for (const std::string& name : device.names("var/log/servita")) {
    rolled += device.root().read("var/log/servita/" + name);
  }
  damage.require(rolled == "new\nold\n", "the rolled logs");
  if (usage == Usage::left) device.run("morvend", {"-t"});
  compareRows("counters of data usage", true);
  constexpr char kBaseline[] = "var/preferences/mobile/com.norba.quenset.morvend.plist";
  damage.require(device.readPropertyList(kBaseline) == clean.readPropertyList(kBaseline),
                 "the baseline");
  checkFiles(device, damage);  // what waited beside the database has been recorded by a reader
  return damage;
}

void Figures::count(const Damage& damage, bool late, const std::string& texts,
                    const std::string& expected) {
  ++tried_;
  late_ += late ? 1 : 0;
  lost_ += damage.lost ? 1 : 0;
  doubled_ += damage.doubled ? 1 : 0;
  torn_ += damage.torn ? 1 : 0;
  EXPECT_EQ(damage.what, expected) << kind_ << ": " << texts;
}

Figures::~Figures() {
  std::printf("| %s | %zu | %zu | %zu | %zu | %zu |\n", kind_.c_str(), tried_, lost_, doubled_,
              torn_, late_);
}

}  // namespace end_to_end
