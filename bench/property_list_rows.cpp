// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The property-list codec beside bare expat, and beside a loop that appends the same pieces.
#include <expat.h>

#include <array>
#include <charconv>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "bench/Rows.h"
#include "plist/PropertyList.h"
#include "plist/Value.h"

namespace bench {

namespace {

using plist::Array;
using plist::Dictionary;
using plist::Value;

// A report's sections as plain rows; keys stand in their order, as the history delivers them.
struct Report {
  struct Distribution {
    std::string key;
    std::array<double, 4> figures;
    std::int32_t count;
  };
  struct Histogram {
    std::string key;
    std::vector<std::pair<std::string, std::uint64_t>> buckets;
  };
  std::vector<std::pair<std::string, std::int64_t>> scalars;
  std::vector<Distribution> distributions;
  std::vector<Histogram> histograms;
};

Report sampleReport() {
  Report report;
  std::uint64_t state = 1;
  const auto next = [&state] { return (state = state * 6364136223846793005u + 1) >> 33; };
  const auto real = [&next] { return static_cast<double>(next()) / 7000.0; };
  for (int i = 0; i < 5000; ++i) {
    report.scalars.emplace_back("com.norba.subsystem.counter" + std::to_string(10000 + i),
                                static_cast<std::int64_t>(next() >> (i % 31)));
  }
  for (int i = 0; i < 1000; ++i) {
    const std::string key = "com.norba.subsystem.latency" + std::to_string(1000 + i);
    report.distributions.push_back({key, {real(), real(), real(), real()}, 100});
    report.histograms.push_back({key,
                                 {{"(-inf, 10]", next() % 1000},
                                  {"(10, 100]", next() % 1000},
                                  {"(100, 1000]", next() % 1000},
                                  {"(1000, inf)", next() % 1000}}});
  }
  return report;
}

Value valueOf(const Report& report) {
  Dictionary scalars, distributions, histograms;
  for (const auto& [key, value] : report.scalars) scalars.set(key, value);
  for (const auto& [key, figures, count] : report.distributions) {
    distributions.set(key, Array{figures[0], figures[1], figures[2], figures[3], count});
  }
  for (const auto& [key, buckets] : report.histograms) {
    Dictionary histogram;
    for (const auto& [label, samples] : buckets) histogram.set(label, samples);
    histograms.set(key, std::move(histogram));
  }
  return Dictionary{{"PLScalars", std::move(scalars)},
                    {"PLDistributions", std::move(distributions)},
                    {"PLDistributionsHistogram", std::move(histograms)}};
}

template <typename T>
void line(std::string& out, std::size_t depth, std::string_view begin, T number,
          std::string_view end) {
  std::array<char, 32> digits;
  const auto last = std::to_chars(digits.data(), digits.data() + digits.size(), number);
  out.append(depth, '\t').append(begin).append(digits.data(), last.ptr).append(end);
}

void line(std::string& out, std::size_t depth, std::string_view text) {
  out.append(depth, '\t').append(text);
}

void keyLine(std::string& out, std::size_t depth, std::string_view key) {
  out.append(depth, '\t').append("<key>").append(key).append("</key>\n");
}

// The same document, out of the rows.
std::string appended(const Report& report) {
  std::string out = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<plist version=\"1.0\">\n<dict>\n";
  keyLine(out, 1, "PLScalars");
  line(out, 1, "<dict>\n");
  for (const auto& [key, value] : report.scalars) {
    keyLine(out, 2, key);
    line(out, 2, "<integer>", value, "</integer>\n");
  }
  line(out, 1, "</dict>\n");
  keyLine(out, 1, "PLDistributions");
  line(out, 1, "<dict>\n");
  for (const auto& [key, figures, count] : report.distributions) {
    keyLine(out, 2, key);
    line(out, 2, "<array>\n");
    for (const double figure : figures) line(out, 3, "<real>", figure, "</real>\n");
    line(out, 3, "<integer>", count, "</integer>\n");
    line(out, 2, "</array>\n");
  }
  line(out, 1, "</dict>\n");
  keyLine(out, 1, "PLDistributionsHistogram");
  line(out, 1, "<dict>\n");
  for (const auto& [key, buckets] : report.histograms) {
    keyLine(out, 2, key);
    line(out, 2, "<dict>\n");
    for (const auto& [label, samples] : buckets) {
      keyLine(out, 3, label);
      line(out, 3, "<integer>", samples, "</integer>\n");
    }
    line(out, 2, "</dict>\n");
  }
  line(out, 1, "</dict>\n");
  return out += "</dict>\n</plist>\n";
}

void parseBare(const std::string& document) {
  const XML_Parser parser = XML_ParserCreate(nullptr);
  XML_SetElementHandler(
      parser, [](void*, const char*, const char**) {}, [](void*, const char*) {});
  XML_SetCharacterDataHandler(parser, [](void*, const char*, int) {});
  keep(XML_Parse(parser, document.data(), static_cast<int>(document.size()), XML_TRUE));
  XML_ParserFree(parser);
}

}  // namespace

void addPropertyListRows(Table& table) {
  const Report report = sampleReport();
  const Value value = valueOf(report);
  const std::string document = appended(report);
  if (*plist::writeXML(value) != document) {
    std::fprintf(stderr, "the yardstick writes another property list\n");
    std::abort();
  }
  table.compare(
      "property list: write", "appending to a string", 1.4, 1,
      [&] { keep(plist::writeXML(value)); }, [&] { keep(appended(report)); }, 51);
  table.compare(
      "property list: read", "bare expat", 1.3, 1, [&] { keep(plist::read(document)); },
      [&] { parseBare(document); }, 51);
}

}  // namespace bench
