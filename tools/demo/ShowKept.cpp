// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/demo/ShowKept.h"

#include "base/Text.h"
#include "tools/common/Table.h"
#include "tools/common/TerminalText.h"
#include "tools/demo/Screen.h"

namespace demo {

using base::format;
using plist::Array;
using plist::Dictionary;
using plist::Value;
using tools::Table;

namespace {

constexpr char kDomain[] = "com.norba.pellorand.morvend";

std::string preferencesPath(const std::string& user, const std::string& domain) {
  return "var/preferences/" + user + "/" + domain + ".plist";
}

std::string namesOf(Device& device, const std::string& folder) {
  std::string names;
  for (const std::string& name : device.namesIn(folder)) names += " " + tools::printable(name);
  return "  " + device.pathOf(folder) + "\n   " + names + "\n";
}

// Each setting of the tasking that was applied, as it is in its file now.
std::string settingsOf(Device& device, const Array& payload) {
  Table table({{}, {}}, kIndent);
  for (const Value& element : payload) {
    const auto* item = element.as<Dictionary>();
    const std::string* user = item != nullptr ? item->text("User") : nullptr;
    const std::string* domain = item != nullptr ? item->text("Domain") : nullptr;
    const std::string* key = item != nullptr ? item->text("Key") : nullptr;
    if (user == nullptr || domain == nullptr || key == nullptr) continue;
    const auto preferences = device.propertyList(preferencesPath(*user, *domain));
    table.addRow(
        {"  " + *user + "/" + *domain + ".plist",
         *key + " = " + plist::description(preferences ? preferences->find(*key) : nullptr)});
  }
  return "  " + device.pathOf("var/preferences") + "\n" + table.text();
}

std::string inShort(const Value& value) {
  if (const auto* array = value.as<Array>()) return format("%zu settings", array->size());
  const auto* dictionary = value.as<Dictionary>();
  if (dictionary == nullptr) return plist::description(value);
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
  Table table({{}, {}}, kIndent);
  for (const auto& [key, value] : *preferences) {
    table.addRow({key, inShort(value)});
  }
  return shown + table.text();
}

}  // namespace

std::string showKept(Device& device) {
  std::string text = heading("What the daemon remembers") + records(device);
  const auto own = device.propertyList(preferencesPath("mobile", kDomain));
  const auto* payload = own ? own->array("TaskingPayload") : nullptr;
  if (payload != nullptr) {
    text += "\n" + heading("Preferences that the tasking set") + settingsOf(device, *payload);
  }
  return text + "\n" + heading("The support service's logs, each moved one number up") +
         namesOf(device, "var/log/servita");
}

}  // namespace demo
