// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/CounterOptions.h"

#include <utility>

namespace report {

using plist::Number;
using plist::Value;

Intervals::Intervals(std::vector<Number> bounds) : bounds_(std::move(bounds)), ascending_(true) {
  values_.reserve(bounds_.size());
  for (const Number& bound : bounds_) {
    const double value = bound.doubleValue();
    if (!(values_.empty() ? value == value : values_.back() <= value)) ascending_ = false;
    values_.push_back(value);
  }
}

namespace {

bool readUnsigned(const Value* value, std::optional<std::uint64_t>& option) {
  if (value == nullptr) return true;
  const Number* number = value->as<Number>();
  if (number == nullptr) return false;
  if (number->type() != Number::Type::uint64 && !(number->doubleValue() >= 0)) return false;
  option = number->uint64Value();
  return true;
}

bool readIntervals(const Value* value, std::optional<Intervals>& option) {
  if (value == nullptr) return true;
  const auto* array = value->as<plist::Array>();
  if (array == nullptr) return false;
  std::vector<Number> bounds;
  bounds.reserve(array->size());
  for (const Value& element : *array) {
    const Number* number = element.as<Number>();
    if (number == nullptr) return false;
    bounds.push_back(*number);
  }
  option.emplace(std::move(bounds));
  return true;
}

}  // namespace

std::optional<CounterOptions> parseCounterOptions(const Value& entry) {
  const auto* dictionary = entry.as<plist::Dictionary>();
  if (dictionary == nullptr) return std::nullopt;
  CounterOptions options;
  const bool usable = readUnsigned(dictionary->find("bucket_interval"), options.bucketInterval) &&
                      readUnsigned(dictionary->find("sig_fig"), options.significantFigures) &&
                      readIntervals(dictionary->find("intervals"), options.intervals);
  return usable ? std::optional(std::move(options)) : std::nullopt;
}

}  // namespace report
