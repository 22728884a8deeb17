// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The one way to fail: a function that can fail returns a Result, which nobody may overlook.
//
// Who fails says why and hands that back; who stops handing it on logs it, or shows it. Nobody does
// both.
#pragma once

#include <concepts>
#include <optional>
#include <string>
#include <string_view>
#include <system_error>
#include <type_traits>
#include <utility>
#include <variant>

namespace base {

// Why something couldn't be done.
struct [[nodiscard]] Error {
  std::string text;     // where and why, as one reads it; where alone is left to who knows it
  std::errc what = {};  // what the system calls it, for who acts on that; none: it said nothing

  bool is(std::errc it) const { return what == it; }

  // The same with the place where it happened (a path, a line) before it: "<place>: <text>".
  Error at(std::string_view place) const { return {std::string(place) + ": " + text, what}; }
};

// A value, or the error that says why there is none. Made of either; the interface is that of
// std::expected, which is not to be had yet.
template <typename T>
class [[nodiscard]] Result {
 public:
  Result(Error error) : content_(std::in_place_index<1>, std::move(error)) {}
  template <typename From = T>
  requires(std::convertible_to<From, T> && !std::same_as<std::remove_cvref_t<From>, Result>)
      Result(From&& value)
      : content_(std::in_place_index<0>, std::forward<From>(value)) {}

  explicit operator bool() const { return content_.index() == 0; }

  // Of a success only.
  T& operator*() & { return *std::get_if<0>(&content_); }
  const T& operator*() const& { return *std::get_if<0>(&content_); }
  T&& operator*() && { return std::move(**this); }
  T* operator->() { return &**this; }
  const T* operator->() const { return &**this; }

  // Of a failure only.
  const Error& error() const { return *std::get_if<1>(&content_); }

  // The value where the reason why there is none is of no interest.
  std::optional<T> orNone() && {
    return *this ? std::optional<T>(*std::move(*this)) : std::nullopt;
  }

  // What the next step makes of the value: a Result of its own. After a failure there is no next
  // step, and the error goes on as it is.
  template <typename Next>
  auto and_then(Next next) && -> std::invoke_result_t<Next, T> {
    if (!*this) return error();
    return next(*std::move(*this));
  }

  // A failure with the place where it happened before it.
  Result at(std::string_view place) && {
    if (!*this) return error().at(place);
    return std::move(*this);
  }

 private:
  std::variant<T, Error> content_;
};

// For what is done for its effect: a success has nothing to say, a failure says why.
template <>
class [[nodiscard]] Result<void> {
 public:
  Result() = default;
  Result(Error error) : error_(std::move(error)) {}

  explicit operator bool() const { return !error_; }
  const Error& error() const { return *error_; }

  template <typename Next>
  auto and_then(Next next) && -> std::invoke_result_t<Next> {
    if (!*this) return error();
    return next();
  }

  Result at(std::string_view place) && {
    if (!*this) return error().at(place);
    return {};
  }

 private:
  std::optional<Error> error_;
};

}  // namespace base
