// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/Kernel.h"

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "base/ByteWriter.h"

namespace host::recorded {

platform::Kernel::ReadResult Kernel::deliver(const plist::Value& value,
                                             std::span<std::byte> buffer) {
  if (const auto* number = value.as<plist::Number>()) {
    const auto bytes = base::littleEndianBytes(number->uint64Value());
    return delivered(std::as_bytes(std::span(bytes).first(std::min(bytes.size(), buffer.size()))),
                     buffer);
  }
  if (const auto* data = value.as<plist::Data>()) {
    return delivered(std::as_bytes(std::span(data->data(), data->size())), buffer);
  }
  if (const auto* text = value.as<std::string>()) return delivered(*text, buffer);
  const auto* dictionary = value.as<plist::Dictionary>();
  const plist::Number* error = dictionary != nullptr ? dictionary->number("Error") : nullptr;
  const std::int64_t code = error != nullptr ? error->int64Value() : 0;
  return failed(code > 0 && code <= INT32_MAX ? static_cast<int>(code) : EIO);
}

platform::Kernel::ReadResult Kernel::sysctlbyname(std::string_view name,
                                                  std::span<std::byte> buffer) {
  if (name == "kern.next_ecc_event") {
    if (const auto event = events_.next(buffer)) return *event;
  }
  const plist::Value* value = deviceValue(name);
  return value != nullptr ? deliver(*value, buffer) : failed(ENOENT);
}

const plist::Value* Kernel::deviceValue(std::string_view name) {
  const plist::Dictionary* values = values_.dictionary();
  return values != nullptr ? values->find(name) : nullptr;
}

std::uint64_t Kernel::pageSize() {
  const plist::Value* given = deviceValue("hw.pagesize");
  const plist::Number* size = given != nullptr ? given->as<plist::Number>() : nullptr;
  return size != nullptr ? size->uint64Value() : HostKernel::pageSize();
}

}  // namespace host::recorded
