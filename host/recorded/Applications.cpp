// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/Applications.h"

#include <functional>
#include <string>

namespace host::recorded {

void Applications::enumerateBundles(const std::function<void(BundleType type)>& handler) {
  const plist::Array* bundles = file_.array();
  if (bundles == nullptr) return;
  for (const plist::Value& element : *bundles) {
    const auto* bundle = element.as<plist::Dictionary>();
    if (bundle == nullptr) continue;
    const std::string* type = bundle->text("Type");
    handler(type != nullptr && *type == "User" ? BundleType::user : BundleType::system);
  }
}

}  // namespace host::recorded
