// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/NandinfoCommand.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <charconv>
#include <memory>
#include <span>
#include <string_view>
#include <system_error>

#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/queries/ControllerWatch.h"
#include "base/Text.h"
#include "platform/SystemLog.h"
#include "plist/JSON.h"
#include "tools/common/ClosestName.h"
#include "tools/common/CommandLine.h"
#include "tools/common/Terminal.h"
#include "tools/common/TerminalText.h"
#include "tools/nandinfo/Commands.h"
#include "tools/nandinfo/TableText.h"

namespace nandinfo {

namespace {

using NANDInfo::ControllerWatch;
using NANDInfo::Needs;
using plist::Array;
using plist::Dictionary;
using plist::Value;

constexpr int kFailed = 1, kUsage = 2;

constexpr char kFooter[] =
    "Results are JSON; on a terminal, tables.\n"
    "Examples:\n"
    "  nandinfo ftl --round\n"
    "  nandinfo ftl --all --stat-keys --compact\n"
    "  nandinfo magazine --hours 24\n"
    "  nandinfo extract --monthly --from 4\n"
    "  nandinfo ean image-size dBIC\n"
    "  nandinfo counters padSizes\n"
    "  nandinfo capture copy\n"
    "  nandinfo decode ftl copy/statistics-0.bin\n"
    "  nandinfo decode counters 1y copy/telemetry-0.bin\n"
    "  nandinfo decode capture copy\n"
    "Exit status: 0 done; 1 the work failed; 2 wrong usage.\n"
    "'health' alone: 0 good; 10 watch; 11 replace; 3 unknown.\n";

constexpr char kGlobalOptions[] = "Global options: --json and --compact.";

struct Form {
  bool json = false, compact = false;
};

bool isEmpty(const Value& value) {
  const auto* dictionary = value.as<Dictionary>();
  const auto* array = value.as<Array>();
  return (dictionary != nullptr && dictionary->empty()) || (array != nullptr && array->empty());
}

std::string shown(const CommandServices& services, const Command& command, Form form,
                  const CommandResult& result) {
  if (services.outIsTerminal && !form.json && !form.compact) {
    if (!result.text.empty()) return result.text;
    if (!result.value) return {};
    const Value& value = *result.value;
    const auto* records = value.as<Array>();
    const bool isLone = records != nullptr && records->size() == 1;  // it stands upright
    if (!isEmpty(value)) return tableText(isLone ? records->front() : value, services.width);
    return command.empty != nullptr ? base::format("(%s)\n", command.empty) : "(nothing)\n";
  }
  std::string json;
  if (!result.value) {
    json = "null";
  } else if (form.compact) {
    plist::appendJSON(json, *result.value);
  } else {
    plist::appendIndentedJSON(json, *result.value);
  }
  return tools::printableJSON(std::move(json)) + '\n';
}

std::string nameOf(const Command& command) {
  return command.group != nullptr ? base::format("%s %s", command.group, command.name)
                                  : command.name;
}

class Run {
 public:
  Run(const CommandServices& services, const Command& command)
      : services_(services),
        command_(command),
        watch_(services.storage, services.log != nullptr && services.log->isSystemLog()
                                     ? ControllerWatch::DirectTexts::passed
                                     : ControllerWatch::DirectTexts::kept) {}

  int run(const Arguments& arguments, Form form) {
    if (command_.needs != Needs::noDevice && !services_.root) {
      return failed(services_.root.error().text);
    }
    const CommandResult result = resultOf(arguments);
    const std::string problem = command_.needs == Needs::answer ? watch_.problem() : "";
    if (services_.log != nullptr) complaints_ = services_.log->take();
    // What the library makes of no answer is no verdict.
    if (!problem.empty()) return failed(problem);
    watch_.sendEvents();
    complaints_.insert(complaints_.end(), watch_.texts().begin(), watch_.texts().end());
    services_.out << shown(services_, command_, form, result) << std::flush;
    if (!services_.out) {
      say("the output can't be written");
      return kFailed;
    }
    if (const auto why = failureOf(result)) return failed(*why);
    for (const std::string& complaint : complaints_) say(complaint);
    return result.status;
  }

 private:
  CommandResult resultOf(const Arguments& arguments) {
    if (services_.log != nullptr) services_.log->keep();
    tools::Progress progress(services_.err, services_.errIsTerminal);
    return nandinfo::run(
        command_,
        {watch_.services(), arguments, [&](const std::string& text) { progress.show(text); },
         services_.width, services_.recordDrives, services_.kept, services_.runLock});
  }

  void say(const std::string& what) {
    services_.err << "nandinfo: " << nameOf(command_) << ": " << tools::printable(what) << '\n';
  }
  // In one line, with what there was to complain of as the reasons.
  int failed(std::string why) {
    say(NANDInfo::withReasons(std::move(why), complaints_));
    return kFailed;
  }

  const CommandServices& services_;
  const Command& command_;
  ControllerWatch watch_;
  std::vector<std::string> complaints_;  // of the services, who know the file, then the library's
};

// An option with a decimal number, at most `most`.
CLI::Option* addNumber(CLI::App& app, const std::string& name, std::uint32_t& number,
                       std::uint32_t most, const std::string& description) {
  const auto set = [&number, name, most](const std::string& text) {
    const char* const end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, number);
    if (error == std::errc() && stop == end && number <= most) return;
    throw CLI::ValidationError(
        name, base::format("'%s' is not a number from 0 to %u", text.c_str(), most));
  };
  return app.add_option_function<std::string>(name, set, description)->type_name("N");
}

void addWindow(CLI::App& app, Arguments& arguments) {
  CLI::App* which = app.add_option_group("Window", "What is shown")->require_option(1);
  CLI::Option* hours = addNumber(*which, "--hours", arguments.hours, UINT32_MAX,
                                 "from so many hours ago until now, as differences");
  which->add_flag("--history", arguments.history,
                  "the write amplification of the last six windows of four hours");
  app.add_flag("--no-delta", arguments.noDelta, "the counters as they were then")->needs(hours);
  addNumber(app, "--mode", arguments.mode, NANDInfo::kMagazineBoth,
            "0: the accumulating counters, 1: the dynamic ones, 2: both (default)")
      ->needs(hours);
}

void addSteps(CLI::App& app, Arguments& arguments) {
  constexpr std::uint32_t kLastStep = 6;
  std::string steps = "the first step (default: 0):";
  for (std::uint32_t step = 0; step <= kLastStep; ++step) {
    steps += base::format("\n%u  %s", step, NANDInfo::kEV_Extraction_Step_Names[step].name);
  }
  app.add_flag("--monthly", arguments.monthly, "with the last step, which is the monthly one");
  addNumber(app, "--from", arguments.from, kLastStep, steps);
}

// Lists every command of the table, instead of the groups that hold some.
class Help : public CLI::Formatter {
 public:
  std::string make_subcommands(const CLI::App* app, CLI::AppFormatMode mode) const override {
    if (app->get_parent() != nullptr) return Formatter::make_subcommands(app, mode);
    std::string list = "\nCommands:\n";
    for (const Command& command : commands()) {
      list += base::format("  %-21s  %s\n", nameOf(command).c_str(), command.description);
    }
    return list;
  }
};

void addOptions(CLI::App& app, const Command& command, Arguments& arguments) {
  const auto takes = [&command](int part) { return (command.takes & part) != 0; };
  CLI::Option* round = nullptr;
  if (takes(NANDInfo::kRound)) {
    round = app.add_flag("--round", arguments.round, "keep the significant digits only");
  }
  if (takes(NANDInfo::kAll)) {
    CLI::Option* all = app.add_flag("--all", arguments.all, "every counter, unrounded");
    round->excludes(all);
    app.add_flag("--stat-keys", arguments.statKeys, "under the keys instead of the names")
        ->needs(all);
  }
  if (takes(NANDInfo::kCode)) {
    app.add_option("CODE", arguments.code, "four letters, such as dBIC")
        ->required()
        ->check([](const std::string& code) {
          return NANDInfo::isCode(code) ? ""
                                        : "'" + tools::printable(code) + "' is not four letters";
        });
  }
  if (takes(NANDInfo::kLayout)) {
    std::string names;
    for (const NANDInfo::CounterLayout& layout : NANDInfo::counterLayouts()) {
      names.append(names.empty() ? "" : ", ").append(layout.name);
    }
    app.add_option("LAYOUT", arguments.layout, names)
        ->required()
        ->check([names](const std::string& name) {
          return NANDInfo::findCounterLayout(name) != nullptr
                     ? ""
                     : "'" + tools::printable(name) + "' is not a layout: " + names;
        });
  }
  if (takes(kFile)) {
    app.add_option("FILE", arguments.file, "the buffer; - for standard input")->required();
  }
  if (takes(kFolder)) {
    app.add_option("DIR", arguments.folder, "an empty folder, or one that is to be made")
        ->required();
    app.add_flag("--redact", arguments.redact, "leave out what identifies the device");
  }
  if (takes(kCapture)) {
    app.add_option("DIR", arguments.folder, "what 'nandinfo capture' has made, or a folder device/")
        ->required();
  }
  if (takes(NANDInfo::kChannels)) {
    addNumber(app, "--channels", arguments.channels, NANDInfo::kMaxBuffer / NANDInfo::kChannelSize,
              "of the controller (default: as many as the file has room for, if it is full)");
  }
  if (takes(kNames)) {
    app.add_option("NAME", arguments.names,
                   "a counter, an array or one of its elements, a key of the counters service");
  }
  if (takes(kRecord)) {
    app.add_flag("--record", arguments.record,
                 "read the NVMe drives' health logs, for those who can't (as root)");
  }
  if (takes(kAcknowledge)) {
    app.add_flag("--acknowledge", arguments.acknowledge,
                 "the errors until now are known; from now on only further ones count");
  }
  if (takes(NANDInfo::kWindow)) addWindow(app, arguments);
  if (takes(kSteps)) addSteps(app, arguments);
}

// What is wrong with the names of the command; empty when nothing is, or there are none. No option
// that stands before them has a value.
std::string unknownCommand(int argc, const char* const* argv) {
  std::string name;
  bool isGroup = false;
  for (const std::string_view word : std::span(argv, static_cast<std::size_t>(argc)).subspan(1)) {
    if (word.starts_with('-')) continue;
    std::vector<std::string_view> known;
    bool isKnown = false;
    for (const Command& command : commands()) {
      const std::string_view group = command.group != nullptr ? command.group : "";
      if (isGroup && group != name) continue;
      known.push_back(isGroup || group.empty() ? command.name : group);
      isKnown |= known.back() == word;
    }
    const std::string whole = (isGroup ? name + " " : "") + std::string(word);
    if (!isKnown) {
      const std::string_view closest = tools::closestName(word, known);
      return "there is no command '" + whole + "'" +
             (closest.empty() ? "" : "; did you mean '" + std::string(closest) + "'?");
    }
    const auto all = commands();
    if (isGroup || std::none_of(all.begin(), all.end(), [&](const Command& command) {
          return command.group != nullptr && command.group == word;
        })) {
      break;
    }
    name = word;
    isGroup = true;
  }
  return {};
}

// The command that the command line has named so far, each name after a blank.
std::string namesOfCommand(const CLI::App& app) {
  std::string names;
  for (const CLI::App* command = &app; !command->get_subcommands().empty();) {
    command = command->get_subcommands().front();
    names += " " + command->get_name();
  }
  return names;
}

}  // namespace

int runNandinfo(const CommandServices& services, int argc, const char* const* argv) {
  Arguments arguments;
  Form form;
  const Command* chosen = nullptr;

  CLI::App app("Asks the storage controller what it counts.", "nandinfo");
  app.set_version_flag("--version", "nandinfo " MORVEND_VERSION);
  app.add_flag("--json", form.json, "JSON on a terminal, too");
  app.add_flag("--compact", form.compact, "JSON on one line");
  app.require_subcommand(1);
  app.fallthrough();
  app.footer(kFooter + tools::rootInHelp());
  tools::addCompletion(app);
  app.formatter(std::make_shared<Help>());
  // Only the commands that are named, unless all may be shown: to make them takes longer than most
  // of them run.
  const auto named = [words = std::span(argv, static_cast<std::size_t>(argc))](const char* word) {
    return std::find(words.begin(), words.end(), std::string_view(word)) != words.end();
  };
  const bool all = std::any_of(argv, argv + argc, [](std::string_view word) {
    return word == "-h" || word.starts_with("--help") || word.starts_with("--completion");
  });
  const auto wrong = [&services](const std::string& what, const std::string& command) {
    services.err << "nandinfo: " << tools::printable(what) << " (see 'nandinfo" << command
                 << " --help')\n";
    return kUsage;
  };
  if (const std::string unknown = unknownCommand(argc, argv); !all && !unknown.empty()) {
    return wrong(unknown, "");
  }
  CLI::App *group = nullptr, *alone = nullptr;  // `alone` was made last of those without a group
  for (const Command& command : commands()) {
    if (!all && !named(command.group != nullptr ? command.group : command.name)) continue;
    if (command.group != nullptr && (group == nullptr || group->get_name() != command.group)) {
      if (alone != nullptr && alone->get_name() == command.group) {
        group = alone->require_subcommand(0, 1);
      } else {
        group = app.add_subcommand(command.group, groupDescription(command.group));
        group->require_subcommand(1)->footer(kGlobalOptions);
      }
    }
    CLI::App& parent = command.group != nullptr ? *group : app;
    CLI::App* own = parent.add_subcommand(command.name, command.description);
    own->footer(kGlobalOptions);
    if (command.group == nullptr) alone = own;
    // A command of a group is called before what its word alone means.
    own->callback([&chosen, &command] {
      if (chosen == nullptr) chosen = &command;
    });
    addOptions(*own, command, arguments);
  }
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    if (error.get_exit_code() == 0) return app.exit(error, services.out, services.err);
    const auto unknown = app.remaining(true);
    return wrong(unknown.empty() ? error.what() : CLI::ExtrasError(unknown).what(),
                 namesOfCommand(app));
  }
  return Run(services, *chosen).run(arguments, form);
}

}  // namespace nandinfo
