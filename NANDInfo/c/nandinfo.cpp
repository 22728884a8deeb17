// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/c/nandinfo.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <filesystem>
#include <memory>
#include <new>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>
#include <variant>
#include <vector>

#include "NANDInfo/c/Ask.h"
#include "NANDInfo/queries/BufferDecoders.h"
#include "NANDInfo/queries/Queries.h"
#include "base/UTF8.h"
#include "host/Host.h"
#include "plist/JSON.h"
#include "plist/Value.h"

// Never changed: any thread may ask by it.
struct nandinfo_device {
  std::string root;
};

namespace {

using NANDInfo::Reply;
using plist::Value;

// A nandinfo_value is a Value by another name: whoever frees one has the whole.
const Value* valueOf(const nandinfo_value* value) { return reinterpret_cast<const Value*>(value); }
const nandinfo_value* borrowed(const Value& value) {
  return reinterpret_cast<const nandinfo_value*>(&value);
}
template <typename T>
const T* contentOf(const nandinfo_value* value) {
  return value != nullptr ? valueOf(value)->as<T>() : nullptr;
}

int said(nandinfo_error* error, int code, std::string_view text) {
  if (error == nullptr) return code;
  std::size_t length = 0;
  while (length < text.size()) {
    const std::size_t step = std::max<std::size_t>(base::characterLength(text.substr(length)), 1);
    if (length + step >= sizeof error->text) break;
    length += step;
  }
  error->code = code;
  std::memcpy(error->text, text.data(), length);
  error->text[length] = '\0';
  return code;
}

// Does the work of a call, and lets nothing that is thrown across the border.
template <typename Work>
int guarded(nandinfo_error* error, Work work) {
  try {
    const Reply reply = work();
    return said(error, reply.code, reply.text);
  } catch (const std::bad_alloc&) {
    return said(error, NANDINFO_NO_MEMORY, "there is no memory left");
  } catch (const std::exception& fault) {
    return said(error, NANDINFO_INTERNAL, fault.what());
  } catch (...) {
    return said(error, NANDINFO_INTERNAL, "a fault of the library");
  }
}

// The same for a call that gives a value.
template <typename Work>
int guardedValue(nandinfo_value** value, nandinfo_error* error, bool isCalledRightly, Work work) {
  if (value != nullptr) *value = nullptr;
  return guarded(error, [&]() -> Reply {
    if (value == nullptr || !isCalledRightly) return {NANDINFO_USAGE, "an argument is missing"};
    Reply reply = work();
    if (reply.value) {
      *value = reinterpret_cast<nandinfo_value*>(new Value(*std::move(reply.value)));
    }
    return reply;
  });
}

std::vector<std::string> namesOfQueries() {
  std::vector<std::string> names;
  for (const auto& query : NANDInfo::queries()) names.push_back(nameOf(query));
  return names;
}

}  // namespace

const char* nandinfo_version() { return MORVEND_VERSION; }

int nandinfo_api() { return NANDINFO_API; }

const char* nandinfo_name(size_t index, const char** description) {
  const auto queries = NANDInfo::queries();
  const bool isThere = index < queries.size();
  if (description != nullptr) *description = isThere ? queries[index].description : nullptr;
  if (!isThere) return nullptr;
  try {
    static const std::vector<std::string> names = namesOfQueries();
    return names[index].c_str();
  } catch (...) {
    return nullptr;
  }
}

const char* nandinfo_kind(size_t index, const char** description) {
  const auto decoders = NANDInfo::bufferDecoders();
  const bool isThere = index < decoders.size();
  if (description != nullptr) *description = isThere ? decoders[index].description : nullptr;
  return isThere ? decoders[index].kind : nullptr;
}

int nandinfo_open(const char* root, nandinfo_device** device, nandinfo_error* error) {
  if (device != nullptr) *device = nullptr;
  return guarded(error, [&]() -> Reply {
    if (device == nullptr) return {NANDINFO_USAGE, "an argument is missing"};
    auto opened = std::make_unique<nandinfo_device>();
    opened->root = root != nullptr ? root : host::HostOptions::fromEnvironment().root;
    // Wherever the process goes later. What can't be made absolute isn't there.
    std::error_code problem;
    const auto absolute = std::filesystem::absolute(opened->root, problem);
    if (!problem) opened->root = absolute.string();
    Reply reply = NANDInfo::look(opened->root);
    if (reply.code == NANDINFO_OK) *device = opened.release();
    return reply;
  });
}

void nandinfo_close(nandinfo_device* device) { delete device; }

int nandinfo_collect(nandinfo_device* device, const char* name, const nandinfo_options* options,
                     nandinfo_value** value, nandinfo_error* error) {
  return guardedValue(value, error, device != nullptr && name != nullptr,
                      [&] { return NANDInfo::collect(device->root, name, options); });
}

int nandinfo_decode(const char* kind, const void* bytes, size_t size,
                    const nandinfo_options* options, nandinfo_value** value,
                    nandinfo_error* error) {
  return guardedValue(value, error, kind != nullptr && (bytes != nullptr || size == 0), [&] {
    return NANDInfo::decode(kind, {static_cast<const std::byte*>(bytes), size}, options);
  });
}

void nandinfo_free(nandinfo_value* value) { delete reinterpret_cast<Value*>(value); }

int nandinfo_type(const nandinfo_value* value) {
  if (value == nullptr) return NANDINFO_NONE;
  if (const auto* number = contentOf<plist::Number>(value)) {
    using Type = plist::Number::Type;
    if (number->type() == Type::boolean) return NANDINFO_BOOLEAN;
    if (number->isReal()) return NANDINFO_REAL;
    return number->type() == Type::uint64 ? NANDINFO_UNSIGNED : NANDINFO_INTEGER;
  }
  // In the order of the variant.
  constexpr int kTypes[] = {NANDINFO_NONE,       NANDINFO_TEXT, NANDINFO_ARRAY,
                            NANDINFO_DICTIONARY, NANDINFO_DATE, NANDINFO_DATA};
  static_assert(std::size(kTypes) == std::variant_size_v<Value::Variant>);
  return kTypes[valueOf(value)->variant().index()];
}

int64_t nandinfo_integer(const nandinfo_value* value) {
  const auto* number = contentOf<plist::Number>(value);
  return number != nullptr ? number->int64Value() : 0;
}

uint64_t nandinfo_unsigned(const nandinfo_value* value) {
  const auto* number = contentOf<plist::Number>(value);
  return number != nullptr ? number->uint64Value() : 0;
}

double nandinfo_real(const nandinfo_value* value) {
  if (const auto* date = contentOf<plist::Date>(value)) return date->secondsSince1970;
  const auto* number = contentOf<plist::Number>(value);
  return number != nullptr ? number->doubleValue() : 0;
}

const char* nandinfo_text(const nandinfo_value* value) {
  const auto* text = contentOf<std::string>(value);
  return text != nullptr ? text->c_str() : nullptr;
}

const void* nandinfo_data(const nandinfo_value* value, size_t* size) {
  const auto* data = contentOf<plist::Data>(value);
  if (size != nullptr) *size = data != nullptr ? data->size() : 0;
  return data != nullptr ? data->data() : nullptr;
}

size_t nandinfo_count(const nandinfo_value* value) {
  if (const auto* array = contentOf<plist::Array>(value)) return array->size();
  const auto* dictionary = contentOf<plist::Dictionary>(value);
  return dictionary != nullptr ? dictionary->size() : 0;
}

const nandinfo_value* nandinfo_at(const nandinfo_value* value, size_t index, const char** key) {
  if (key != nullptr) *key = nullptr;
  if (index >= nandinfo_count(value)) return nullptr;
  if (const auto* array = contentOf<plist::Array>(value)) return borrowed((*array)[index]);
  const auto& entry = contentOf<plist::Dictionary>(value)->begin()[index];
  if (key != nullptr) *key = entry.key.c_str();
  return borrowed(entry.value);
}

const nandinfo_value* nandinfo_find(const nandinfo_value* value, const char* key) {
  const auto* dictionary = contentOf<plist::Dictionary>(value);
  const Value* found = dictionary != nullptr && key != nullptr ? dictionary->find(key) : nullptr;
  return found != nullptr ? borrowed(*found) : nullptr;
}

char* nandinfo_json(const nandinfo_value* value, int indented) {
  try {
    std::string json;
    if (value == nullptr) {
      json = "null";
    } else if (indented != 0) {
      plist::appendIndentedJSON(json, *valueOf(value));
    } else {
      plist::appendJSON(json, *valueOf(value));
    }
    auto* const text = static_cast<char*>(std::malloc(json.size() + 1));
    if (text != nullptr) std::memcpy(text, json.c_str(), json.size() + 1);
    return text;
  } catch (...) {
    return nullptr;
  }
}

void nandinfo_free_text(char* text) { std::free(text); }
