// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The module that a device root carries at the place of the crash-reporting support library. It
// acts on the preferences of the process that loads it, so that both see one state of every domain.

#include "platform/FaultwatchSupport.h"
#include "platform/PreferenceStore.h"

#define EXPORTED __attribute__((visibility("default")))

namespace {

platform::PreferenceStore* store = nullptr;

}  // namespace

extern "C" {

// Called by the host's library loader, before any of the functions is used.
EXPORTED void FaultwatchSupportUsePreferences(platform::PreferenceStore* preferences) {
  store = preferences;
}

EXPORTED std::int64_t QNSPreferencesGetIntegerValue(const char* key, const char* domain,
                                                    bool* found) {
  if (found != nullptr) *found = false;
  return store != nullptr ? store->QNSPreferencesGetIntegerValue(key, domain, found) : 0;
}

EXPORTED void QNSPreferencesSetValue(const char* key, const plist::Value* value,
                                     const char* domain) {
  if (store != nullptr) store->QNSPreferencesSetValue(key, value, domain);
}

}  // extern "C"
