// The documents, against what they are about: the programs' help, and the names in the source.

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <regex>
#include <set>
#include <sstream>

#include "end_to_end/Device.h"

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
  std::vector<std::filesystem::path> sources = {"NANDInfo/Events.h", "NANDInfo/NANDLogWriter.cpp",
                                                "NANDInfo/StructuredLogs.cpp"};
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

}  // namespace
}  // namespace end_to_end
