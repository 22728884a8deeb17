#include <nlohmann/json.hpp>
#include <sstream>

#include "platform/Text.h"
#include "tools/demo/Screen.h"
#include "tools/demo/Show.h"

namespace demo {

using platform::Array;
using platform::Dictionary;
using platform::format;
using platform::Value;
using Align = Table::Align;

namespace {

constexpr char kDomain[] = "com.norba.pellorand.morvend";
constexpr std::size_t kMostLines = 6;

std::string preferencesPath(const std::string& user, const std::string& domain) {
  return "var/preferences/" + user + "/" + domain + ".plist";
}

// A file of JSON Lines: where it is; of its first lines what each is, and what it holds.
std::string linesOf(Device& device, const std::string& path, const char* kind,
                    const char* content) {
  using JSON = nlohmann::ordered_json;
  std::istringstream lines(device.bytes(path).value_or(""));
  Table table({{"", Align::left}, {"", Align::left}});
  std::size_t count = 0;
  for (std::string line; std::getline(lines, line);) {
    const auto parsed = JSON::parse(line, nullptr, false);
    if (!parsed.is_object() || ++count > kMostLines) continue;
    const auto what = parsed.value(kind, JSON());
    table.addRow({"  " + (what.is_string() ? shortKey(what.get<std::string>())
                                           : std::string(kind) + " " + what.dump()),
                  parsed.value(content, JSON()).dump()});
  }
  std::string shown = "  " + device.pathOf(path) + "\n" + table.text();
  if (count > kMostLines) shown += format("    … and %zu more\n", count - kMostLines);
  return shown;
}

std::string structuredLogsOf(Device& device) {
  const std::string folder = "var/spool/morvend/submitted/";
  std::string shown;
  for (const std::string& name : device.namesIn(folder)) {
    if (name.starts_with("structured-")) {
      shown += linesOf(device, std::string(folder).append(name), "type", "data");
    }
  }
  return shown;
}

std::string namesOf(Device& device, const std::string& folder) {
  std::string names;
  for (const std::string& name : device.namesIn(folder)) names += " " + name;
  return "  " + device.pathOf(folder) + "\n   " + names + "\n";
}

// Each setting of the tasking that was applied, as it is in its file now.
std::string settingsOf(Device& device, const Array& payload) {
  Table table({{"", Align::left}, {"", Align::left}});
  for (const Value& element : payload) {
    const auto* item = element.as<Dictionary>();
    const std::string* user = item != nullptr ? item->text("User") : nullptr;
    const std::string* domain = item != nullptr ? item->text("Domain") : nullptr;
    const std::string* key = item != nullptr ? item->text("Key") : nullptr;
    if (user == nullptr || domain == nullptr || key == nullptr) continue;
    const auto preferences = device.propertyList(preferencesPath(*user, *domain));
    table.addRow(
        {"  " + *user + "/" + *domain + ".plist",
         *key + " = " + platform::description(preferences ? preferences->find(*key) : nullptr)});
  }
  return "  " + device.pathOf("var/preferences") + "\n" + table.text();
}

std::string inShort(const Value& value) {
  if (const auto* array = value.as<Array>()) return format("%zu settings", array->size());
  const auto* dictionary = value.as<Dictionary>();
  if (dictionary == nullptr) return platform::description(value);
  std::string text;
  for (const auto& [key, content] : *dictionary) {
    text += (text.empty() ? "" : ", ") + key + " " + inShort(content);
  }
  return text;
}

std::string records(Device& device) {
  const std::string path = preferencesPath("mobile", kDomain);
  const auto preferences = device.propertyList(path);
  std::string shown = "  " + device.pathOf(path) + "\n";
  if (!preferences) return shown + "    (not there)\n";
  Table table({{"", Align::left}, {"", Align::left}});
  for (const auto& [key, value] : *preferences) {
    table.addRow({key, inShort(value)});
  }
  return shown + table.text();
}

}  // namespace

std::string showFiles(Device& device) {
  std::string text = heading("Analytics events (~ is com.norba)") +
                     linesOf(device, "var/spool/morvend/events.jsonl", "event", "payload");
  text += "\n" + heading("Structured logs of earlier days, submitted") + structuredLogsOf(device);
  text += "\n" + heading("The support service's logs, each moved one number up") +
          namesOf(device, "var/log/servita");
  text += "\n" + heading("What the daemon remembers") + records(device);
  const auto own = device.propertyList(preferencesPath("mobile", kDomain));
  const auto* payload = own ? own->array("TaskingPayload") : nullptr;
  if (payload != nullptr) {
    text += "\n" + heading("Preferences that the tasking set") + settingsOf(device, *payload);
  }
  return text;
}

}  // namespace demo
