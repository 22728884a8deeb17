// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The documents, against what they are about: the programs and their help, and the names in the
// source.

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <set>
#include <sstream>
#include <thread>
#include <utility>
#include <vector>

#include "end_to_end/Device.h"
#include "support/PrivateBus.h"

namespace end_to_end {
namespace {

const std::filesystem::path kSource = MORVEND_SOURCE_DIR;

std::string contentOf(const std::filesystem::path& path) {
  std::ostringstream text;
  text << std::ifstream(kSource / path).rdbuf();
  EXPECT_FALSE(text.str().empty()) << path;
  return text.str();
}

// What the pattern's first group matches, wherever the pattern does.
std::set<std::string> found(const std::string& text, const char* pattern) {
  const std::regex expression(pattern);
  return {std::sregex_token_iterator(text.begin(), text.end(), expression, 1), {}};
}

// What a program's help, and that of its commands, names, in the form of its manual page.
std::set<std::string> namedInHelp(const std::string& program, const std::string& command = "") {
  const support::TemporaryFolder folder;
  const std::string line = program + command + " --help > " + (folder / "help").string();
  faults::run({"/bin/sh", "-c", PROGRAMS "/" + line}, {"MORVEND_ROOT=/nonexistent"});
  const std::string help = folder.read("help");
  std::set<std::string> named;
  for (const auto& option : found(help, "\n *[-h,]*-(-[a-z-]+)")) named.insert("Fl " + option);
  const std::size_t commands = std::min(help.find("ommands:\n"), help.size());
  for (const auto& name : found(help.substr(commands, help.find("\n\n", commands) - commands),
                                "\n  ([a-z-]+( [a-z-]+)?)  ")) {
    named.insert("Cm" + command + " " + name);
    named.merge(namedInHelp(program, command + " " + name));
  }
  return named;
}

// An option or a command that nobody described.
TEST(Documents, ManualPagesNameWhatTheHelpNames) {
  for (const std::string program : {"nandinfo", "pelloran", "mkdevice"}) {
    const std::string page = contentOf("packaging/man/" + program + ".1");
    const auto named = namedInHelp(program);
    EXPECT_GT(named.size(), 4u) << program;
    for (const std::string& name : named) {
      EXPECT_TRUE(std::regex_search(page, std::regex(name + "(?![a-z-])"))) << program << name;
    }
  }
}

// A counter, an event, a notification or a preference domain that the day uses in silence.
TEST(Documents, TheDayAndItsDataNameEveryKey) {
  const std::string documents = contentOf("docs/DATA.md") + contentOf("docs/DAY.md");
  std::vector<std::filesystem::path> sources = {"NANDInfo/include/NANDInfo/Events.h",
                                                "NANDInfo/deliver/NANDLogWriter.cpp",
                                                "NANDInfo/deliver/StructuredLogs.cpp"};
  for (const char* room : {"daemon", "report"}) {
    for (const auto& file : std::filesystem::directory_iterator(kSource / room)) {
      if (file.path().extension() == ".cpp") sources.push_back(file.path());
    }
  }
  std::set<std::string> names;
  for (const auto& source : sources) {
    names.merge(found(contentOf(source), "\"((?:com\\.norba|datausage)\\.[\\w./]*)\""));
  }
  EXPECT_GT(names.size(), 30u);
  for (const std::string& name : names) {
    EXPECT_NE(documents.find(name), std::string::npos) << name;
  }
}

// README.md, docs/*.md and the manual pages.
std::vector<std::filesystem::path> documents() {
  std::vector<std::filesystem::path> paths = {"README.md"};
  for (const char* folder : {"docs", "packaging/man"}) {
    for (const auto& file : std::filesystem::directory_iterator(kSource / folder)) {
      paths.push_back(file.path().lexically_relative(kSource));
    }
  }
  std::sort(paths.begin(), paths.end());
  return paths;
}

using Block = std::vector<std::string>;

// The blocks of commands: what is indented by four blanks, or fenced without a language or as a
// shell's. One with a line drawn in it is a picture.
std::vector<Block> blocksOfMarkdown(std::istream& text) {
  std::vector<Block> blocks;
  bool fenced = false, taken = false, blank = true;
  for (std::string line; std::getline(text, line);) {
    if (line.starts_with("```")) {
      fenced = !fenced;
      taken = fenced && (line == "```" || line == "```sh");
      if (taken) blocks.emplace_back();
    } else if (fenced ? taken : line.starts_with("    ") && (blank || taken)) {
      if (!fenced && !taken) blocks.emplace_back();
      taken = true;
      blocks.back().push_back(fenced ? line : line.substr(4));
    } else if (!fenced) {
      taken = taken && line.empty();
    }
    blank = line.empty();
  }
  std::erase_if(blocks, [](const Block& block) {
    return std::ranges::any_of(block, [](const std::string& line) {
      return line.find("\xE2\x94") != line.npos;  // box drawing
    });
  });
  return blocks;
}

// Literal displays, and lines by themselves.
std::vector<Block> blocksOfManual(std::istream& text) {
  const auto unescaped = [](std::string line) {
    for (const auto& [escape, meant] : {std::pair{"\\e", "\\"}, {"\\(dq", "\""}, {"\\&", ""}}) {
      for (std::size_t at = 0; (at = line.find(escape, at)) != line.npos;) {
        line.replace(at, std::strlen(escape), meant);
        at += std::strlen(meant);
      }
    }
    return line;
  };
  std::vector<Block> blocks;
  bool within = false;
  for (std::string line; std::getline(text, line);) {
    if (line.starts_with(".Dl ")) {
      blocks.push_back({unescaped(line.substr(4))});
    } else if (line.starts_with(".Bd -literal")) {
      within = true;
      blocks.emplace_back();
    } else if (line == ".Ed") {
      within = false;
    } else if (within) {
      blocks.back().push_back(unescaped(line));
    }
  }
  return blocks;
}

// Each command with the lines that go on with it, which are indented or close its brace.
std::vector<std::string> commandsOf(const std::filesystem::path& document) {
  std::istringstream text(contentOf(document));
  std::vector<std::string> commands;
  for (const Block& block :
       document.extension() == ".md" ? blocksOfMarkdown(text) : blocksOfManual(text)) {
    for (const std::string& line : block) {
      if (&line != &block.front() && (line.empty() || line[0] == ' ' || line[0] == '}')) {
        commands.back() += "\n" + line;
      } else {
        commands.push_back(line);
      }
    }
  }
  return commands;
}

// What isn't run as it stands, and why: not at all, or with another word in front and that status.
struct Otherwise {
  const char *beginning, *reason, *inFront = nullptr;
  int status = 0;
};
constexpr Otherwise kOtherwise[] = {
    {"./dev ", "it builds the tree, or runs this test"},
    {"sudo ", "it changes the machine"},
    {"busctl ", "it listens on the system's bus"},
    {"journalctl ", "it reads the machine's journal"},
    {"name=", "for the messages"},
    {"message", "it sends over a bus; see the next test"},
    {"<", "a whitelist"},
    {"{\"set\"|", "the form of a line, not a line"},
    {"pelloran sample --every 60 ", "it goes on for an hour", "timeout 2 ", 124},
};

// Whether a command begins with one of our programs, or with one that does no harm.
bool mayBeRun(const std::string& command) {
  std::smatch word;
  std::regex_search(command, word, std::regex("^(?:[A-Z_]+=\\S+ +)*(\\S+)"));
  static const std::set<std::string> kHarmless = {"cd", "cp", "echo", "export", "ls", "mkdir"};
  return kHarmless.contains(word[1]) || std::filesystem::exists(PROGRAMS "/" + word[1].str());
}

// A command that has changed, or a page that hasn't: each document's commands in their order, in a
// folder that holds a sample device, unless the document makes that itself.
TEST(Documents, TheirCommandsDoWhatTheySay) {
  std::set<const Otherwise*> used;
  int ran = 0;
  for (const auto& document : documents()) {
    std::string script =
        "set -o pipefail\nexport PATH=" PROGRAMS ":$PATH DBUS_SYSTEM_BUS_ADDRESS=unix:path=/none\n";
    const auto commands = commandsOf(document);
    if (std::ranges::none_of(commands, [](const std::string& command) {
          return command.starts_with("mkdevice device");
        })) {
      script += "mkdevice device\nexport MORVEND_ROOT=$PWD/device\n";
    }
    std::string expected;
    for (const std::string& command : commands) {
      const auto* otherwise = std::ranges::find_if(
          kOtherwise, [&](const Otherwise& row) { return command.starts_with(row.beginning); });
      const bool asItStands = otherwise == std::end(kOtherwise);
      if (!asItStands) used.insert(otherwise);
      if (!asItStands && otherwise->inFront == nullptr) continue;
      if (!mayBeRun(command)) {
        ADD_FAILURE() << document << ": neither run nor listed: " << command;
        continue;
      }
      ++ran;
      const int number = ran;
      script += (asItStands ? "" : otherwise->inFront) + command + "\necho " +
                std::to_string(number) + " $? >> statuses\n";
      expected +=
          std::to_string(number) + " " + std::to_string(asItStands ? 0 : otherwise->status) + "\n";
    }
    if (expected.empty()) continue;
    const support::TemporaryFolder folder;
    folder.write("script", script);
    const auto outcome = faults::run(
        {"/bin/bash", "-c", "cd " + folder.path().string() + " && exec bash script > output"},
        {"LC_ALL=C"});
    EXPECT_EQ(folder.read("statuses"), expected) << document << "\n"
                                                 << script << outcome.standardError;
  }
  EXPECT_GT(ran, 15);
  for (const Otherwise& row : kOtherwise) {
    EXPECT_TRUE(used.contains(&row)) << "no document has it any more: " << row.beginning;
  }
}

// A message that starts the service, by a sender that doesn't stay, and is lost: the manual page's,
// with nothing running each time.
TEST(Documents, TheirMessagesStartTheService) {
  std::string script = "set -e\n";
  for (const std::string& command : commandsOf("packaging/man/morvend.8")) {
    if (command.starts_with("name=") || command.starts_with("message")) script += command + "\n";
  }
  for (int start = 0; start < 3; ++start) {
    Device device;
    device.fill();
    const support::PrivateBus bus("MORVEND_ROOT=" + device.root().path().string() +
                                  " " PROGRAMS "/morvend");
    const auto sent =
        faults::run({"/bin/bash", "-c", script}, {"DBUS_SYSTEM_BUS_ADDRESS=" + bus.address()});
    EXPECT_EQ(sent.status, 0) << script << sent.standardError;
    for (int i = 0; i < 4000 && device.dailyLogs().empty(); ++i) {
      std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    const pid_t service = support::BusClient(bus.address()).serviceProcess();
    for (int signal = SIGTERM; ::kill(service, signal) == 0; signal = 0) {
      std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    const auto logs = device.dailyLogs();
    ASSERT_EQ(logs.size(), 1u);
    const auto* applications = logs[0].array("PLActivatedAppInfo");
    ASSERT_NE(applications, nullptr);
    EXPECT_EQ(applications->size(), 1u);
  }
}

}  // namespace
}  // namespace end_to_end
