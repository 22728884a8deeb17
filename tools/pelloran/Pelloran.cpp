// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/pelloran/Pelloran.h"

#include <CLI/CLI.hpp>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <istream>
#include <limits>
#include <optional>
#include <ostream>
#include <unordered_set>
#include <vector>

#include "base/Convert.h"
#include "host/figures/DayFigures.h"
#include "tools/common/ClosestName.h"
#include "tools/common/CommandLine.h"
#include "tools/common/Terminal.h"
#include "tools/common/TerminalText.h"
#include "tools/pelloran/Arguments.h"
#include "tools/pelloran/ImportLine.h"
#include "tools/pelloran/Show.h"

namespace pelloran {

namespace {

using host::CounterChange;

constexpr int kDone = 0, kFailed = 1, kUsage = 2;
constexpr std::size_t kMaxLineSize = std::size_t{1} << 20;
constexpr std::size_t kLinesBetweenProgress = 50000;
constexpr double kMaxSampling = 366 * 86400.0;
constexpr char kReading[] = "machineFigures";  // the name under which the last one is kept

// What the command line says, as text; each command looks at its own part.
struct Arguments {
  std::string command;
  std::string key, value, prefix;
  std::optional<std::string> day, seconds, file, every, lasting;
  bool json = false;
};

// `command` is empty, or begins with a blank.
int wrongUsage(std::ostream& err, const std::string& why, const std::string& command) {
  err << "pelloran: " << tools::printable(why) << " (see 'pelloran" << command << " --help')\n";
  return kUsage;
}

class Command {
 public:
  Command(const Environment& environment, const Arguments& arguments)
      : environment_(environment), arguments_(arguments), now_(momentOf(environment.clock.now())) {}

  int change(CounterChange::Kind kind) {
    CounterChange change{
        .kind = kind, .key = arguments_.key, .day = now_.day, .seconds = now_.second};
    if (const auto sound = checkKey(change.key); !sound) return usage(sound.error().text);
    if (arguments_.day && !given(parseDay(*arguments_.day, now_.day), change.day)) return kUsage;
    if (kind == CounterChange::Kind::push) {
      if (!given(parseReal(arguments_.value), change.sample)) return kUsage;
    } else if (!given(parseInteger(arguments_.value), change.amount)) {
      return kUsage;
    }
    if (arguments_.seconds) {
      std::int64_t seconds = 0;
      if (!given(parseInteger(*arguments_.seconds), seconds)) return kUsage;
      if (!given(secondInDay(seconds), change.seconds)) return kUsage;
    }
    return outcome(environment_.store.apply({&change, 1}));
  }

  int import() {
    if (!arguments_.file) return import(environment_.in, "line ");
    std::ifstream file(*arguments_.file, std::ios::binary);
    if (!file) return failed(*arguments_.file + ": " + std::strerror(errno));
    return import(file, *arguments_.file + ":");
  }

  int show() {
    Shown shown{arguments_.prefix, std::numeric_limits<std::int32_t>::min(),
                std::numeric_limits<std::int32_t>::max()};
    if (arguments_.day) {
      if (!given(parseDay(*arguments_.day, now_.day), shown.firstDay)) return kUsage;
      shown.lastDay = shown.firstDay;
    }
    const auto history = environment_.store.history();
    const auto read =
        (arguments_.json ? showJsonLines : showTable)(*history, shown, environment_.out);
    environment_.out.flush();
    if (!environment_.out) return failed("the output can't be written");
    return outcome(read);
  }

  int sample() {
    if (arguments_.every.has_value() != arguments_.lasting.has_value()) {
      return usage("--every and --for need each other");
    }
    double every = 1, lasting = 0;
    if (arguments_.every) {
      if (!given(parseReal(*arguments_.every), every)) return kUsage;
      if (!given(parseReal(*arguments_.lasting), lasting)) return kUsage;
      if (every < 0.1 || lasting < 0 || lasting > kMaxSampling) {
        return usage("--every takes 0.1 seconds or more, --for up to a year");
      }
    }
    const auto start = std::chrono::steady_clock::now();
    const auto readings = base::saturatingCast<std::int64_t>(lasting / every) + 1;
    tools::Progress progress(environment_.err, environment_.errIsTerminal);
    for (std::int64_t reading = 1; reading <= readings; ++reading) {
      if (const auto recorded = record(); !recorded) {
        progress.clear();
        return failed(recorded.error().text);
      }
      if (reading == readings) break;
      progress.show("reading " + std::to_string(reading) + " of " + std::to_string(readings));
      environment_.waitUntil(
          start + std::chrono::duration_cast<std::chrono::steady_clock::duration>(
                      std::chrono::duration<double>(every * static_cast<double>(reading))));
    }
    return kDone;
  }

 private:
  int failed(const std::string& why) {
    environment_.err << "pelloran: " << tools::printable(why) << '\n';
    return kFailed;
  }
  int usage(const std::string& why) {
    return wrongUsage(environment_.err, why, " " + arguments_.command);
  }
  template <typename From, typename To>
  bool given(const base::Result<From>& result, To& value) {
    if (!result) {
      usage(result.error().text);
      return false;
    }
    value = *result;
    return true;
  }
  int outcome(const base::Result<void>& done) { return done ? kDone : failed(done.error().text); }

  // Reads everything before anything is written: nobody else waits while lines trickle in.
  int import(std::istream& in, const std::string& place) {
    std::unordered_set<std::string> keys;
    std::vector<CounterChange> changes;
    std::string buffer(kMaxLineSize + 1, '\0');
    std::size_t number = 0;
    tools::Progress progress(environment_.err, environment_.errIsTerminal);
    const auto wrong = [&](const std::string& why) {
      progress.clear();
      return failed(place + std::to_string(number) + ": " + why);
    };
    while (in) {
      ++number;
      in.getline(buffer.data(), static_cast<std::streamsize>(buffer.size()));
      auto length = static_cast<std::size_t>(in.gcount());
      if (in.bad()) return wrong("it can't be read");
      if (in.fail() && length > 0) return wrong("longer than 1 MiB");
      if (in.good()) --length;  // the line feed
      const std::string_view line(buffer.data(), length);
      if (line.find_first_not_of(" \t\r") == std::string_view::npos) continue;
      auto parsed = parseImportLine(line, now_);
      if (!parsed) return wrong(parsed.error().text);
      parsed->change.key = *keys.insert(std::move(parsed->key)).first;
      changes.push_back(parsed->change);
      if (number % kLinesBetweenProgress == 0)
        progress.show(std::to_string(number) + " lines read");
    }
    if (changes.empty()) return kDone;
    if (number >= kLinesBetweenProgress) {
      progress.show("writing " + std::to_string(changes.size()) + " changes");
    }
    const auto applied = environment_.store.apply(changes, host::CounterStore::Kept::onDisk);
    progress.clear();
    return outcome(applied);
  }

  // The reading is made with the store's lock held, so that two at once don't count the same twice.
  base::Result<void> record() {
    using Step = host::CounterStore::Step;
    host::figures::DayFigures day;  // holds the keys
    return environment_.store.applyAndKeep(
        kReading, [&](const std::string& before) -> base::Result<Step> {
          day = host::figures::dayFigures(before, environment_.figures());
          if (day.additions.empty() && day.samples.empty()) {
            return base::Error{"this machine shows no figures"};
          }
          const Moment now = momentOf(environment_.clock.now());
          Step step{.changes = {}, .text = day.remembered};
          for (const auto& [key, grown] : day.additions) {
            step.changes.push_back(
                {.kind = CounterChange::Kind::add, .key = key, .day = now.day, .amount = grown});
          }
          for (const auto& [key, value] : day.samples) {
            step.changes.push_back({.kind = CounterChange::Kind::push,
                                    .key = key,
                                    .day = now.day,
                                    .sample = value,
                                    .seconds = now.second});
          }
          return step;
        });
  }

  const Environment& environment_;
  const Arguments& arguments_;
  Moment now_;
};

}  // namespace

namespace {

// What is wrong with a command line that names no command, or one that isn't there.
std::string withoutCommand(const CLI::App& app, const CLI::ParseError& error) {
  const std::vector<std::string> words = app.remaining();
  if (words.empty()) return error.what();
  if (words.front().starts_with('-')) return CLI::ExtrasError(words).what();
  std::vector<std::string> names;
  for (const CLI::App* command : app.get_subcommands({})) names.push_back(command->get_name());
  const std::string_view closest =
      tools::closestName(words.front(), std::vector<std::string_view>(names.begin(), names.end()));
  return "there is no command '" + words.front() + "'" +
         (closest.empty() ? "" : "; did you mean '" + std::string(closest) + "'?");
}

}  // namespace

int runPelloran(const Environment& environment, int argc, const char* const* argv) {
  Arguments arguments;
  int (*work)(Command&) = nullptr;
  const auto runs = [&](CLI::App* command, int (*itsWork)(Command&)) {
    command->callback([&arguments, &work, command, itsWork] {
      arguments.command = command->get_name();
      work = itsWork;
    });
  };

  CLI::App app("Writes and reads the counters of a device.", "pelloran");
  app.set_version_flag("--version", "pelloran " MORVEND_VERSION);
  app.require_subcommand(1);
  app.footer(tools::rootInHelp());
  tools::addCompletion(app);

  struct {
    const char *name, *description, *valueDescription;
    int (*work)(Command&);
  } const writers[] = {
      {"set", "Set a counter", "an integer",
       [](Command& command) { return command.change(CounterChange::Kind::set); }},
      {"add", "Add to a counter", "an integer",
       [](Command& command) { return command.change(CounterChange::Kind::add); }},
      {"push", "Add a sample to a distribution", "a number",
       [](Command& command) { return command.change(CounterChange::Kind::push); }},
  };
  constexpr char dayDescription[] = "a day number, a date as 2026-11-22, today or yesterday";
  for (const auto& writer : writers) {
    CLI::App* command = app.add_subcommand(writer.name, writer.description);
    command->add_option("KEY", arguments.key, "the counter")->required();
    command->add_option("VALUE", arguments.value, writer.valueDescription)->required();
    command->add_option("--day", arguments.day, std::string(dayDescription) + "; default: today");
    if (std::string_view(writer.name) == "push") {
      command->add_option("--seconds", arguments.seconds, "second within the day; default: now");
    }
    runs(command, writer.work);
  }

  CLI::App* import = app.add_subcommand("import", "Record many changes at once, all or none");
  import->add_option("FILE", arguments.file, "JSON Lines; default: standard input");
  import->footer(
      "Each line: {\"set\"|\"add\"|\"push\": KEY, \"value\": NUMBER, \"day\": D, \"seconds\": S}\n"
      "The day and the seconds may be left out: now.");
  runs(import, [](Command& command) { return command.import(); });

  CLI::App* show = app.add_subcommand("show", "Print what is recorded");
  show->add_option("--day", arguments.day, std::string(dayDescription) + "; default: all");
  show->add_option("--prefix", arguments.prefix, "only keys that begin so");
  show->add_flag("--json", arguments.json, "as JSON Lines, with every sample");
  runs(show, [](Command& command) { return command.show(); });

  CLI::App* sample = app.add_subcommand(
      "sample", "Record this machine's own figures, under keys that begin with host.");
  sample->add_option("--every", arguments.every, "seconds between two readings");
  sample->add_option("--for", arguments.lasting, "seconds in which readings are made");
  runs(sample, [](Command& command) { return command.sample(); });

  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    if (error.get_exit_code() == 0) return app.exit(error, environment.out, environment.err);
    const auto named = app.get_subcommands();
    return named.empty() ? wrongUsage(environment.err, withoutCommand(app, error), "")
                         : wrongUsage(environment.err, error.what(), " " + named[0]->get_name());
  }
  if (!environment.root) {
    environment.err << "pelloran: " << environment.root.error().text << '\n';
    return kFailed;
  }
  Command command(environment, arguments);
  return work(command);
}

}  // namespace pelloran
