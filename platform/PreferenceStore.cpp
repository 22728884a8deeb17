// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "platform/PreferenceStore.h"

namespace platform {

namespace {

std::optional<plist::Number> numberOf(const std::optional<plist::Value>& value, bool* found) {
  const plist::Number* number = value ? value->as<plist::Number>() : nullptr;
  if (found != nullptr) *found = number != nullptr;
  return number ? std::optional(*number) : std::nullopt;
}

}  // namespace

std::int64_t PreferenceStore::QNSPreferencesGetIntegerValue(std::string_view key,
                                                            std::string_view domain, bool* found) {
  const auto number = numberOf(QNSPreferencesGetValue(key, domain), found);
  return number ? number->int64Value() : 0;
}

bool PreferenceStore::QNSPreferencesGetBooleanValue(std::string_view key, std::string_view domain,
                                                    bool* found) {
  const auto number = numberOf(QNSPreferencesGetValue(key, domain), found);
  return number && number->boolValue();
}

}  // namespace platform
