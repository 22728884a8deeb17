// A value, or the text that says why there is none.
#pragma once

#include <optional>
#include <string>
#include <utility>

namespace base {

template <typename T>
struct Result {
  std::optional<T> value;
  std::string error;  // empty when there is a value

  static Result failure(std::string text) { return {std::nullopt, std::move(text)}; }
  static Result success(T v) { return {std::move(v), {}}; }

  explicit operator bool() const { return value.has_value(); }
  T& operator*() { return *value; }
  const T& operator*() const { return *value; }
  T* operator->() { return &*value; }
  const T* operator->() const { return &*value; }
};

}  // namespace base
