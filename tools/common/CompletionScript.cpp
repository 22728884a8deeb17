// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/common/CompletionScript.h"

#include <CLI/CLI.hpp>
#include <vector>

namespace tools {

namespace {

struct Word {
  std::string text, description;
};

struct Option {
  std::vector<std::string> names;  // with their dashes
  std::string description;
  bool takesValue = false;
  std::string values;  // the only ones, with blanks between; empty: any
};

enum class Paths { none, files, folders };

// A place on the command line: after the program's name, or after that of a command.
struct Place {
  std::string after;  // the commands named so far, each with a blank in front
  std::vector<Word> commands;
  std::vector<Option> options;
  Paths paths = Paths::none;
};

std::string firstLine(const std::string& text) { return text.substr(0, text.find('\n')); }

// The words of a type that is one of some: "TEXT:{a,b}".
std::string valuesOf(const CLI::Option& option) {
  const std::string type = option.get_type_name();
  const std::size_t begin = type.find('{'), end = type.find('}');
  if (begin == type.npos || end == type.npos) return {};
  std::string values = type.substr(begin + 1, end - begin - 1);
  for (char& letter : values) {
    if (letter == ',') letter = ' ';
  }
  return values;
}

void addOptions(const CLI::App& app, Place& place) {
  for (const CLI::Option* option : app.get_options()) {
    const std::string name = option->get_name();
    if (name == "FILE") place.paths = Paths::files;
    if (name == "DIR") place.paths = Paths::folders;
    const bool isSaid =
        name == "--help" && !place.options.empty();  // a group of options has it, too
    if (isSaid || option->get_group().empty() || !option->nonpositional()) continue;
    Option& added = place.options.emplace_back();
    for (const std::string& shortName : option->get_snames())
      added.names.push_back("-" + shortName);
    for (const std::string& longName : option->get_lnames()) added.names.push_back("--" + longName);
    added.description = firstLine(option->get_description());
    added.takesValue = option->get_items_expected_max() > 0;
    if (added.takesValue) added.values = valuesOf(*option);
  }
}

void addPlaces(const CLI::App& app, const std::string& after, std::vector<Place>& places) {
  Place place;
  place.after = after;
  addOptions(app, place);
  std::vector<const CLI::App*> commands;
  for (const CLI::App* command : app.get_subcommands({})) {
    if (command->get_name().empty()) {  // a group of options
      addOptions(*command, place);
    } else {
      commands.push_back(command);
      place.commands.push_back({command->get_name(), firstLine(command->get_description())});
    }
  }
  // Global options may stand after a command, too.
  if (!places.empty() && app.get_parent()->get_fallthrough()) {
    const auto& global = places.front().options;
    for (const Option& option : global) {
      if (option.names.back() != "--help" && option.names.back() != "--version") {
        place.options.push_back(option);
      }
    }
  }
  places.push_back(std::move(place));
  for (const CLI::App* command : commands) {
    addPlaces(*command, after + " " + command->get_name(), places);
  }
}

std::string literal(const std::string& text) {
  std::string result = "'";
  for (const char letter : text) {
    if (letter == '\'') {
      result += "'\\''";
    } else {
      result += letter;
    }
  }
  return result + "'";
}

// Patterns of a shell's `case`, which are all places but the first.
std::string patterns(const std::vector<Place>& places, const char* between) {
  std::string text;
  for (const Place& place : places) {
    if (place.after.empty()) continue;
    text.append(text.empty() ? "" : between).append(literal(place.after));
  }
  return text.empty() ? literal(" ") : text;
}

// What bash and zsh have in common: `at` becomes the place and `values` the words after an option
// that takes one, which `offer` offers; then the places begin.
std::string placeAndValues(const std::vector<Place>& places, const std::string& before,
                           const std::string& earlier, const std::string& offer) {
  std::string text = "  for each in " + earlier + "; do\n    case \"$at $each\" in\n      (" +
                     patterns(places, " | ") + ") at+=\" $each\" ;;\n    esac\n  done\n" +
                     "  case \"$at " + before + "\" in\n";
  for (const Place& place : places) {
    for (const Option& option : place.options) {
      if (!option.takesValue) continue;
      for (const std::string& name : option.names) {
        text += "    (" + literal(place.after + " " + name) + ") values=" + literal(option.values) +
                " ;;\n";
      }
    }
  }
  return text + "    (*) values=none ;;\n  esac\n  if [[ $values != none ]]; then\n    " + offer +
         "\n    return\n  fi\n  case $at in\n";
}

std::string bashScript(const std::string& name, const std::vector<Place>& places) {
  std::string text =
      "_" + name + "() {\n  local word=${COMP_WORDS[COMP_CWORD]} at= each values words options\n" +
      placeAndValues(places, "${COMP_WORDS[COMP_CWORD - 1]}", "\"${COMP_WORDS[@]:1:COMP_CWORD-1}\"",
                     "COMPREPLY=($(compgen -W \"$values\" -- \"$word\"))");
  for (const Place& place : places) {
    std::string words, options;
    for (const Word& command : place.commands) words += " " + command.text;
    for (const Option& option : place.options) {
      for (const std::string& optionName : option.names) options += " " + optionName;
    }
    text += "    (" + literal(place.after) + ") words=" + literal(words) +
            " options=" + literal(options);
    if (place.paths == Paths::files) text += "; compopt -o default 2>/dev/null";
    if (place.paths == Paths::folders) text += "; compopt -o dirnames 2>/dev/null";
    text += " ;;\n";
  }
  return text +
         "  esac\n  [[ $word == -* ]] && words=$options\n"
         "  COMPREPLY=($(compgen -W \"$words\" -- \"$word\"))\n}\ncomplete -F _" +
         name + " " + name + "\n";
}

std::string zshScript(const std::string& name, const std::vector<Place>& places) {
  std::string text = "#compdef " + name + "\n_" + name +
                     "() {\n  local at= each values\n  local -a words_here\n" +
                     placeAndValues(places, "${words[CURRENT-1]}", "\"${(@)words[2,CURRENT-1]}\"",
                                    "compadd -- ${=values}");
  for (const Place& place : places) {
    text += "    (" + literal(place.after) + ") words_here=(";
    for (const Word& command : place.commands) {
      text += " " + literal(command.text + ":" + command.description);
    }
    for (const Option& option : place.options) {
      for (const std::string& optionName : option.names) {
        text += " " + literal(optionName + ":" + option.description);
      }
    }
    text += " )";
    if (place.paths == Paths::files) text += "; _files";
    if (place.paths == Paths::folders) text += "; _files -/";
    text += " ;;\n";
  }
  return text + "  esac\n  _describe " + name + " words_here\n}\n_" + name + " \"$@\"\n";
}

std::string fishScript(const std::string& name, const std::vector<Place>& places) {
  std::string text = "function __" + name +
                     "_at\n  set -l at ''\n  for each in (commandline -opc)[2..]\n"
                     "    switch \"$at $each\"\n      case " +
                     patterns(places, " ") +
                     "\n        set at \"$at $each\"\n    end\n  end\n"
                     "  test \"$at\" = \"$argv[1]\"\nend\ncomplete -c " +
                     name + " -f\n";
  for (const Place& place : places) {
    const std::string here =
        "complete -c " + name + " -n " + literal("__" + name + "_at \"" + place.after + "\"");
    if (place.paths != Paths::none) text += here + " -F\n";
    for (const Word& command : place.commands) {
      text += here + " -a " + command.text + " -d " + literal(command.description) + "\n";
    }
    for (const Option& option : place.options) {
      text += here;
      for (const std::string& optionName : option.names) {
        text +=
            optionName[1] == '-' ? " -l " + optionName.substr(2) : " -s " + optionName.substr(1);
      }
      if (option.takesValue) text += " -x -a " + literal(option.values);
      text += " -d " + literal(option.description) + "\n";
    }
  }
  return text;
}

}  // namespace

std::string completionScript(const CLI::App& app, std::string_view shell) {
  std::vector<Place> places;
  addPlaces(app, "", places);
  const std::string& name = app.get_name();
  const std::string text = shell == "bash"  ? bashScript(name, places)
                           : shell == "zsh" ? zshScript(name, places)
                                            : fishScript(name, places);
  // After the first line, which zsh reads.
  const std::size_t begin = shell == "zsh" ? text.find('\n') + 1 : 0;
  return text.substr(0, begin) + "# Made by '" + name + " --completion " + std::string(shell) +
         "'.\n" + text.substr(begin, text.size() - begin - 1);  // the caller ends the line
}

}  // namespace tools
