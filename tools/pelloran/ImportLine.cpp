// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/pelloran/ImportLine.h"

#include <nlohmann/json.hpp>
#include <optional>
#include <utility>
#include <variant>

#include "base/CivilDate.h"
#include "base/Convert.h"
#include "tools/pelloran/Arguments.h"

namespace pelloran {

using base::Error;
using base::Result;
using host::CounterChange;

namespace {

using Scalar = std::variant<std::monostate, std::int64_t, double, std::string>;

// Collects the fields of one flat object. Each handler yields false to end the parsing.
class Fields : public nlohmann::json_sax<nlohmann::json> {
 public:
  std::string error;
  std::optional<CounterChange::Kind> kind;
  Scalar target, value, day, seconds;

  bool start_object(std::size_t) override {
    return std::exchange(inside_, true) ? wrongType() : true;
  }
  bool end_object() override { return true; }
  bool start_array(std::size_t) override { return wrongType(); }
  bool end_array() override { return true; }
  bool null() override { return wrongType(); }
  bool boolean(bool b) override { return take(std::int64_t{b}); }
  bool binary(binary_t&) override { return wrongType(); }
  bool number_integer(number_integer_t number) override { return take(number); }
  bool number_unsigned(number_unsigned_t number) override {
    if (number > static_cast<std::uint64_t>(INT64_MAX)) return take(static_cast<double>(number));
    return take(static_cast<std::int64_t>(number));
  }
  bool number_float(number_float_t number, const string_t&) override { return take(number); }
  bool string(string_t& text) override { return take(std::move(text)); }

  bool key(string_t& name) override {
    field_ = name;
    constexpr std::pair<std::string_view, CounterChange::Kind> operations[] = {
        {"set", CounterChange::Kind::set},
        {"add", CounterChange::Kind::add},
        {"push", CounterChange::Kind::push}};
    for (const auto& [operation, itsKind] : operations) {
      if (name != operation) continue;
      if (kind) return fail("there is more than one of set, add and push");
      kind = itsKind;
      return next(target);
    }
    if (name == "value") return next(value);
    if (name == "day") return next(day);
    if (name == "seconds") return next(seconds);
    return fail("unknown field " + shown(name));
  }

  bool parse_error(std::size_t position, const std::string&,
                   const nlohmann::json::exception&) override {
    return fail("not a JSON object, at byte " + std::to_string(position));
  }

 private:
  bool fail(std::string text) {
    if (error.empty()) error = std::move(text);
    return false;
  }
  bool next(Scalar& field) {
    if (!std::holds_alternative<std::monostate>(field))
      return fail(shown(field_) + " is there twice");
    taken_ = &field;
    return true;
  }
  template <typename T>
  bool take(T&& scalar) {
    if (taken_ == nullptr) return wrongType();
    *std::exchange(taken_, nullptr) = std::forward<T>(scalar);
    return true;
  }
  bool wrongType() {
    return fail(field_.empty() ? "not a JSON object"
                               : shown(field_) + " is neither number nor text");
  }
  static std::string shown(const std::string& name) { return nlohmann::json(name).dump(); }

  bool inside_ = false;
  std::string field_;
  Scalar* taken_ = nullptr;
};

Result<std::int64_t> integerFrom(const Scalar& scalar) {
  if (const auto* integer = std::get_if<std::int64_t>(&scalar)) {
    return *integer;
  }
  if (const auto* real = std::get_if<double>(&scalar)) return integral(*real);
  return Error{"not a number"};
}

Result<double> realFrom(const Scalar& scalar) {
  if (const auto* integer = std::get_if<std::int64_t>(&scalar)) {
    return static_cast<double>(*integer);
  }
  if (const auto* real = std::get_if<double>(&scalar)) return *real;
  return Error{"not a number"};
}

Result<std::int32_t> dayFrom(const Scalar& scalar, std::int32_t today) {
  if (const auto* text = std::get_if<std::string>(&scalar)) return parseDay(*text, today);
  return integerFrom(scalar).and_then(dayOf);
}

Result<std::int32_t> secondsFrom(const Scalar& scalar) {
  return integerFrom(scalar).and_then(secondInDay);
}

}  // namespace

Moment momentOf(plist::Date now) {
  const base::CivilTime time = base::civilFromSeconds(now.secondsSince1970);
  return {base::dayNumber(now.secondsSince1970), time.hour * 3600 + time.minute * 60 + time.second};
}

Result<ImportLine> parseImportLine(std::string_view line, Moment now) {
  Fields fields;
  if (!nlohmann::json::sax_parse(line.begin(), line.end(), &fields)) {
    return Error{fields.error};
  }
  if (!fields.kind) return Error{"there is none of set, add and push"};
  auto* key = std::get_if<std::string>(&fields.target);
  if (key == nullptr) return Error{"the key is not a text"};
  if (auto sound = checkKey(*key); !sound) return sound.error();

  CounterChange change{.kind = *fields.kind, .key = {}, .day = now.day, .seconds = now.second};
  if (change.kind == CounterChange::Kind::push) {
    const auto sample = realFrom(fields.value);
    if (!sample) return sample.error().at("\"value\"");
    change.sample = *sample;
  } else {
    const auto amount = integerFrom(fields.value);
    if (!amount) return amount.error().at("\"value\"");
    change.amount = *amount;
  }
  if (fields.day.index() != 0) {
    const auto day = dayFrom(fields.day, now.day);
    if (!day) return day.error().at("\"day\"");
    change.day = *day;
  }
  if (fields.seconds.index() != 0) {
    const auto seconds = secondsFrom(fields.seconds);
    if (!seconds) return seconds.error().at("\"seconds\"");
    change.seconds = *seconds;
  }
  return ImportLine{std::move(*key), change};
}

}  // namespace pelloran
