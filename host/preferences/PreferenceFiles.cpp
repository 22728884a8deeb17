// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/preferences/PreferenceFiles.h"

#include <cstdint>
#include <optional>
#include <set>
#include <tuple>
#include <utility>

#include "host/files/Files.h"

namespace host {

namespace {

constexpr std::string_view kSystemUser = "mobile";
constexpr std::string_view kAnalyticsUser = "__quenset__";
constexpr std::string_view kAnalyticsDomain = "com.norba.Varnhollow";

constexpr std::size_t kMaxDomain = kMaxFileName - std::string_view(".plist.corrupt").size();

}  // namespace

PreferenceFiles::~PreferenceFiles() { std::ignore = flushAll(); }

base::Result<void> PreferenceFiles::flushAll() {
  const std::scoped_lock lock(mutex_);
  base::Result<void> written;
  for (auto& [name, file] : files_) {
    file.flush();
    if (written) written = file.written();
  }
  return written;
}

// The file of a domain, or null when there can't be one. The mutex is held.
PreferenceFile* PreferenceFiles::file(std::string_view user, std::string_view domain) {
  std::string name = std::string(user) + "/" + std::string(domain);
  if (const auto known = files_.find(name); known != files_.end()) return &known->second;
  if (!isPlainFileName(user, kMaxFileName) || !isPlainFileName(domain, kMaxDomain)) {
    log_.log(platform::LogLevel::error,
             "Refused preferences of user \"%s\", domain \"%s\": not a file name",
             shownText(user).c_str(), shownText(domain).c_str());
    return nullptr;
  }
  return &files_
              .emplace(std::piecewise_construct, std::forward_as_tuple(std::move(name)),
                       std::forward_as_tuple(root_, log_, user, domain))
              .first->second;
}

base::Result<std::optional<plist::Value>> PreferenceFiles::read(std::string_view user,
                                                                std::string_view domain,
                                                                std::string_view key) {
  const std::scoped_lock lock(mutex_);
  PreferenceFile* known = file(user, domain);
  if (known == nullptr) return std::nullopt;
  return known->value(key);
}

std::optional<plist::Value> PreferenceFiles::get(std::string_view user, std::string_view domain,
                                                 std::string_view key) {
  return read(user, domain, key).orNone().value_or(std::nullopt);
}

void PreferenceFiles::set(std::string_view user, std::string_view domain, std::string_view key,
                          const plist::Value* value, bool synchronize) {
  const std::scoped_lock lock(mutex_);
  PreferenceFile* known = file(user, domain);
  if (known == nullptr) return;
  known->change(key, value);
  if (!synchronize) return;
  if (holding_) {
    held_.push_back(known);
  } else {
    known->flush();
  }
}

void PreferenceFiles::holdWrites() {
  const std::scoped_lock lock(mutex_);
  holding_ = true;
}

void PreferenceFiles::writeHeld() {
  const std::scoped_lock lock(mutex_);
  holding_ = false;
  std::set<PreferenceFile*> tried;
  for (PreferenceFile* file : std::exchange(held_, {})) {
    if (tried.insert(file).second) file->flush();
  }
}

void PreferenceFiles::hold(std::string_view domain) {
  const std::scoped_lock lock(mutex_);
  if (PreferenceFile* known = file(kSystemUser, domain)) known->hold();
}

base::Result<void> PreferenceFiles::release(std::string_view domain) {
  const std::scoped_lock lock(mutex_);
  PreferenceFile* known = file(kSystemUser, domain);
  if (known == nullptr) return base::Error{"no such domain"};
  known->release();
  return known->written();
}

void PreferenceFiles::drop(std::string_view domain) {
  const std::scoped_lock lock(mutex_);
  if (PreferenceFile* known = file(kSystemUser, domain)) known->drop();
}

void PreferenceFiles::addToInteger(std::string_view key, std::string_view domain,
                                   std::int64_t delta) {
  const std::scoped_lock lock(mutex_);
  if (PreferenceFile* known = file(kSystemUser, domain)) known->add(key, delta);
}

std::optional<plist::Value> PreferenceFiles::QNSPreferencesGetValue(std::string_view key,
                                                                    std::string_view domain) {
  return get(kSystemUser, domain, key);
}

base::Result<std::optional<plist::Value>> PreferenceFiles::readValue(std::string_view key,
                                                                     std::string_view domain) {
  return read(kSystemUser, domain, key);
}

void PreferenceFiles::QNSPreferencesSetValue(std::string_view key, const plist::Value* value,
                                             std::string_view domain) {
  set(kSystemUser, domain, key, value, false);
}

void PreferenceFiles::QNSPreferencesSynchronize(std::string_view domain) {
  const std::scoped_lock lock(mutex_);
  if (PreferenceFile* known = file(kSystemUser, domain)) known->flush();
}

std::optional<plist::Value> PreferenceFiles::getPreference(std::string_view key,
                                                           std::string_view domain) {
  return get(kAnalyticsUser, domain, key);
}

void PreferenceFiles::setPreference(std::string_view key, const plist::Value* value,
                                    std::string_view domain, bool synchronize) {
  set(kAnalyticsUser, domain, key, value, synchronize);
}

std::vector<std::string> PreferenceFiles::logBlocklist() {
  const auto value = get(kAnalyticsUser, kAnalyticsDomain, "LogBlocklist");
  const plist::Array* list = value ? value->as<plist::Array>() : nullptr;
  std::vector<std::string> bugTypes;
  if (list == nullptr) return bugTypes;
  for (const plist::Value& element : *list) {
    if (const auto* text = element.as<std::string>()) bugTypes.push_back(*text);
  }
  return bugTypes;
}

void PreferenceFiles::setPreference(std::string_view key, std::string_view user,
                                    std::string_view domain, const plist::Value* value) {
  set(user, domain, key, value, true);
}

void PreferenceFiles::deletePreference(std::string_view key, std::string_view user,
                                       std::string_view domain) {
  set(user, domain, key, nullptr, true);
}

}  // namespace host
