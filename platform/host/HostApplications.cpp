#include "platform/host/HostApplications.h"

namespace platform::host {

void HostApplications::enumerateBundles(const std::function<void(BundleType type)>& handler) {
  const Array* bundles = file_.array();
  if (bundles == nullptr) return;
  for (const Value& element : *bundles) {
    const auto* bundle = element.as<Dictionary>();
    if (bundle == nullptr) continue;
    const std::string* type = bundle->text("Type");
    handler(type != nullptr && *type == "User" ? BundleType::user : BundleType::system);
  }
}

}  // namespace platform::host
