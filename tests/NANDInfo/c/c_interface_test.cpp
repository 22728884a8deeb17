// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The C interface as a C program meets it, over device roots on disk.
#include <gtest/gtest.h>

#include <algorithm>
#include <csignal>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <nlohmann/json.hpp>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/c/nandinfo.h"
#include "support/ControllerRoot.h"

namespace {

using nlohmann::ordered_json;

// What a call gave; the JSON is null without a value.
struct Got {
  int code;
  std::string text;
  ordered_json json;
};

// The value by the functions that look into it, one after the other.
ordered_json walked(const nandinfo_value* value) {
  switch (nandinfo_type(value)) {
    case NANDINFO_BOOLEAN:
      return nandinfo_integer(value) != 0;
    case NANDINFO_INTEGER:
      return nandinfo_integer(value);
    case NANDINFO_UNSIGNED:
      return nandinfo_unsigned(value);
    case NANDINFO_REAL:
      return nandinfo_real(value);
    case NANDINFO_TEXT:
      return nandinfo_text(value);
    case NANDINFO_ARRAY:
    case NANDINFO_DICTIONARY: {
      const bool isArray = nandinfo_type(value) == NANDINFO_ARRAY;
      ordered_json whole = isArray ? ordered_json::array() : ordered_json::object();
      const char* key = nullptr;
      for (std::size_t i = 0; i <= nandinfo_count(value); ++i) {
        const nandinfo_value* part = nandinfo_at(value, i, &key);
        EXPECT_EQ(part == nullptr, i == nandinfo_count(value));
        EXPECT_EQ(key != nullptr, part != nullptr && !isArray);
        if (part == nullptr) break;
        if (key != nullptr) {
          EXPECT_EQ(nandinfo_find(value, key), part);
        }
        isArray ? whole.push_back(walked(part)) : void(whole[key] = walked(part));
      }
      return whole;
    }
    default:
      ADD_FAILURE() << nandinfo_type(value);
      return nullptr;
  }
}

template <typename Call>
Got got(Call call) {
  nandinfo_value* value = nullptr;
  nandinfo_error error;
  std::memset(&error, 'x', sizeof error);
  const int code = call(&value, &error);
  EXPECT_EQ(code, error.code);
  char *line = nandinfo_json(value, 0), *lines = nandinfo_json(value, 1);
  const Got result{code, error.text, ordered_json::parse(line)};
  EXPECT_EQ(ordered_json::parse(lines), result.json);
  if (value != nullptr) {
    EXPECT_EQ(walked(value), result.json) << line;
  }
  nandinfo_free_text(line);
  nandinfo_free_text(lines);
  nandinfo_free(value);
  return result;
}

Got collect(nandinfo_device* device, const char* name, const nandinfo_options* options = nullptr) {
  return got([&](auto... out) { return nandinfo_collect(device, name, options, out...); });
}

Got decode(const char* kind, std::string_view bytes, const nandinfo_options* options = nullptr) {
  return got([&](auto... out) {
    return nandinfo_decode(kind, bytes.data(), bytes.size(), options, out...);
  });
}

// A device that answers, with none of its own files in the way of another's.
struct Device {
  Device() { support::writeController(root); }
  ~Device() { nandinfo_close(device); }
  nandinfo_device* open() {
    EXPECT_EQ(nandinfo_open(root.path().c_str(), &device, nullptr), NANDINFO_OK);
    return device;
  }
  support::TemporaryFolder root;
  nandinfo_device* device = nullptr;
};

nandinfo_options optionsFor(const std::string& name) {
  nandinfo_options options = {};
  options.size = sizeof options;
  if (name.starts_with("ean ")) options.code = name == "ean image-size" ? "dBIC" : "ifw1";
  return options;
}

std::map<std::string, std::string> filesBelow(const std::filesystem::path& root) {
  std::map<std::string, std::string> files;
  for (const auto& entry : std::filesystem::recursive_directory_iterator(root)) {
    std::ostringstream bytes;
    if (entry.is_regular_file()) bytes << std::ifstream(entry.path()).rdbuf();
    files[entry.path()] = bytes.str();
  }
  return files;
}

// A type that is lost between the value and its functions; a name that writes, speaks or ends the
// process.
TEST(CInterface, EveryNameGivesItsValueAndLeavesEverythingAsItIs) {
  Device device;
  device.open();
  const auto before = filesBelow(device.root.path());
  std::signal(SIGPIPE, SIG_DFL);
  testing::internal::CaptureStdout();
  testing::internal::CaptureStderr();
  std::map<std::string, Got> all;
  const char *name = nullptr, *description = nullptr;
  for (std::size_t i = 0; (name = nandinfo_name(i, &description)) != nullptr; ++i) {
    EXPECT_GT(std::strlen(description), 10u);
    const nandinfo_options options = optionsFor(name);
    all.emplace(name, collect(device.device, name, &options));
  }
  EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  EXPECT_EQ(std::signal(SIGPIPE, SIG_DFL), SIG_DFL);
  EXPECT_EQ(filesBelow(device.root.path()), before);
  EXPECT_GE(all.size(), 16u);
  for (const auto& [known, result] : all) {
    EXPECT_EQ(result.code, NANDINFO_OK) << known << ": " << result.text;
    EXPECT_FALSE(result.json.is_null()) << known;
  }
  EXPECT_EQ(all.at("ean image-size").json, 4096);
  EXPECT_EQ(all.at("ean update-count").json, std::uint64_t{1} << 63);
  EXPECT_EQ(all.at("disk").json["TLM_UserCapacity_MB"], 131072);
}

// An error of one call in another one's result, or in the process's; a failure without its reason.
TEST(CInterface, EachCallHasItsOwnErrors) {
  Device good, cut, none;
  cut.root.write("device/statistics", "1234567");
  cut.root.write("device/properties.plist", "no property list");
  std::filesystem::remove(none.root / "device/registry.plist");
  none.root.write("device/kernel.plist", "no property list");
  const auto right = collect(good.open(), "ftl");
  EXPECT_EQ(right.json["TLM_APIErrorMessage"], "NA") << right.json;
  const struct {
    Device& device;
    const char* name;
    int code;
    const char* text;
  } rows[] = {
      {none, "ftl", NANDINFO_NO_CONTROLLER, "no storage controller found"},
      {none, "daily", NANDINFO_NO_CONTROLLER, "kernel.plist"},
      {cut, "ftl", NANDINFO_FAILED, ""},
      {cut, "disk", NANDINFO_OK, "properties.plist"},
      {good, "ftlx", NANDINFO_USAGE, "there is no name 'ftlx'"},
      {good, "health  servita", NANDINFO_USAGE, "there is no name"},
      {good, "ean image-size", NANDINFO_USAGE, "ean image-size: it takes a code"},
      {good, nullptr, NANDINFO_USAGE, "an argument is missing"},
  };
  for (const auto& [device, name, code, text] : rows) {
    const auto wrong = collect(device.device != nullptr ? device.device : device.open(), name);
    EXPECT_EQ(wrong.code, code) << wrong.text;
    EXPECT_NE(wrong.text.find(text), std::string::npos) << wrong.text;
    EXPECT_FALSE(wrong.text.empty());
    EXPECT_EQ(collect(good.device, "ftl").json, right.json);
  }
  EXPECT_STREQ(NANDInfo::GetAPIErrorMessage(), "NA");

  // A text that is longer than there is room, cut between two characters; then a root that went.
  nandinfo_device* device = good.device;
  nandinfo_error error;
  std::string path = "/x";
  while (path.size() < 700) path += "\xC3\xA4";
  EXPECT_EQ(nandinfo_open(path.c_str(), &device, &error), NANDINFO_NO_DEVICE);
  EXPECT_EQ(device, nullptr);
  const std::size_t length = std::strlen(error.text);
  EXPECT_TRUE(length == 507 || (length == 506 && error.text[505] == '\xA4')) << error.text;
  std::filesystem::remove_all(good.root.path());
  EXPECT_EQ(collect(good.device, "disk").code, NANDINFO_NO_DEVICE);
  EXPECT_EQ(nandinfo_open("", &device, nullptr), NANDINFO_NO_DEVICE);
  EXPECT_EQ(nandinfo_open("/", nullptr, nullptr), NANDINFO_USAGE);
}

// An option that is passed over in silence, or read beyond its structure.
TEST(CInterface, OptionsAreCheckedBySizeAndName) {
  Device device;
  device.open();
  struct Later : nandinfo_options {
    std::uint64_t added = 0;
  } later;
  const auto with = [&later](auto change) {
    static_cast<nandinfo_options&>(later) = {};
    later.size = sizeof(nandinfo_options);
    later.added = 0;
    change(later);
    return &later;
  };
  const auto flags = [&with](std::uint32_t bits) {
    return with([bits](Later& options) { options.flags = bits; });
  };
  constexpr std::size_t kSize = sizeof(nandinfo_options);
  const auto sized = [&](std::size_t size, std::uint64_t added) {
    return collect(device.device, "disk", with([=](Later& options) {
                     options.size = size;
                     options.added = added;
                   }));
  };
  EXPECT_EQ(sized(kSize, 1).code, NANDINFO_OK) << "what lies beyond isn't read";
  EXPECT_EQ(sized(kSize + 8, 0).code, NANDINFO_OK);
  for (const std::size_t size : {std::size_t{0}, kSize - 1, kSize + 8, SIZE_MAX}) {
    EXPECT_EQ(sized(size, 1).code, NANDINFO_USAGE) << size;
  }
  const struct {
    const char* name;
    std::uint32_t bits;
    const char* text;  // null: it is taken
  } rows[] = {
      {"ftl", NANDINFO_ROUND, nullptr},
      {"ftl", NANDINFO_ALL | NANDINFO_STAT_KEYS, nullptr},
      {"ftl", NANDINFO_ALL | NANDINFO_ROUND, "ALL isn't rounded"},
      {"ftl", NANDINFO_STAT_KEYS, "STAT_KEYS goes with ALL only"},
      {"ftl", NANDINFO_HISTORY, "it doesn't take HISTORY"},
      {"disk", NANDINFO_ROUND, "it doesn't take ROUND"},
      {"ftl", 0x80000000, "the flags 0x80000000 are unknown"},
      {"magazine", NANDINFO_HISTORY | NANDINFO_DYNAMIC, "HISTORY goes alone"},
  };
  for (const auto& [name, bits, text] : rows) {
    const auto result = collect(device.device, name, flags(bits));
    EXPECT_EQ(result.code, text != nullptr ? NANDINFO_USAGE : NANDINFO_OK) << result.text;
    EXPECT_EQ(result.text, text != nullptr ? std::string(name) + ": " + text : "");
  }
  const auto rounded = collect(device.device, "ftl", flags(NANDINFO_ROUND)).json;
  EXPECT_NE(rounded, collect(device.device, "ftl").json);
  const auto keys = collect(device.device, "ftl", flags(NANDINFO_ALL | NANDINFO_STAT_KEYS)).json;
  EXPECT_TRUE(keys.contains("Stat_11") || keys.contains("Stat_12")) << keys;
  EXPECT_EQ(collect(device.device, "disk", with([](Later& options) { options.hours = 1; })).code,
            NANDINFO_USAGE);
  EXPECT_EQ(collect(device.device, "disk", with([](Later& options) { options.code = ""; })).code,
            NANDINFO_USAGE);
}

// A buffer of every kind, and one of another kind.
TEST(CInterface, BuffersAreDecodedByTheirKind) {
  const auto statistics = support::everyFTLCounter(), msp = support::everyMSPCounter(0);
  const std::string zeros(4096 + 32, '\0');
  const auto text = [](const support::Bytes& bytes) {
    return std::string_view(reinterpret_cast<const char*>(bytes.data()), bytes.size());
  };
  nandinfo_options layout = {};
  layout.size = sizeof layout;
  layout.layout = "1y";
  const struct {
    const char* kind;
    std::string_view bytes;
    const nandinfo_options* options;
    int code;
  } rows[] = {
      {"ftl", text(statistics), nullptr, NANDINFO_OK},
      {"ftl-stat", text(statistics), nullptr, NANDINFO_OK},
      {"legacy", text(statistics), nullptr, NANDINFO_OK},
      {"msp", text(msp), nullptr, NANDINFO_OK},
      {"counters", zeros, &layout, NANDINFO_OK},
      {"telemetry", zeros, &layout, NANDINFO_OK},
      {"telemetry", std::string_view(zeros).substr(1), &layout, NANDINFO_FAILED},
      {"telemetry", zeros, nullptr, NANDINFO_USAGE},
      {"ftl", zeros, &layout, NANDINFO_USAGE},
      {"ftl", "a text", nullptr, NANDINFO_FAILED},
      {"ftl", {}, nullptr, NANDINFO_FAILED},
      {"msp", text(statistics), nullptr, NANDINFO_FAILED},
      {"validity", "12", nullptr, NANDINFO_FAILED},
      {"defects", "12", nullptr, NANDINFO_FAILED},
      {"snapshot", zeros, nullptr, NANDINFO_FAILED},
      {"other", "", nullptr, NANDINFO_USAGE},
  };
  std::size_t kinds = 0;
  while (nandinfo_kind(kinds, nullptr) != nullptr) {
    const char* kind = nandinfo_kind(kinds++, nullptr);
    EXPECT_TRUE(std::ranges::any_of(rows, [kind](const auto& row) {
      return std::string_view(row.kind) == kind;
    })) << kind;
  }
  for (const auto& [kind, bytes, options, code] : rows) {
    const auto result = decode(kind, bytes, options);
    EXPECT_EQ(result.code, code) << kind << ": " << result.text;
    EXPECT_EQ(result.text.empty(), code == NANDINFO_OK) << kind << ": " << result.text;
    if (result.json.is_object()) {
      EXPECT_EQ(result.json["ok"], code == NANDINFO_OK);
    }
  }
  EXPECT_EQ(nandinfo_decode("ftl", nullptr, 1, nullptr, nullptr, nullptr), NANDINFO_USAGE);
}

// Results of two threads that mix: devices that answer otherwise, and one of them from two threads.
TEST(CInterface, ThreadsDontMeet) {
  Device good, cut;
  cut.root.write("device/statistics", "1234567");
  nandinfo_device* const devices[] = {good.open(), cut.open(), good.device};
  const char* const names[] = {"ftl", "info", "health", "msp"};
  std::vector<std::vector<Got>> alone(std::size(devices)), together(std::size(devices));
  const auto ask = [&](std::vector<Got>& results, nandinfo_device* device) {
    for (const char* name : names) results.push_back(collect(device, name));
  };
  for (std::size_t i = 0; i < std::size(devices); ++i) ask(alone[i], devices[i]);
  EXPECT_NE(alone[0][0].json, alone[1][0].json);
  for (int round = 0; round < 5; ++round) {
    std::vector<std::jthread> threads;
    for (std::size_t i = 0; i < std::size(devices); ++i) {
      together[i].clear();
      threads.emplace_back([&, i] { ask(together[i], devices[i]); });
    }
    threads.clear();
    for (std::size_t i = 0; i < std::size(devices); ++i) {
      for (std::size_t j = 0; j < std::size(names); ++j) {
        EXPECT_EQ(together[i][j].code, alone[i][j].code) << names[j];
        EXPECT_EQ(together[i][j].text, alone[i][j].text);
        EXPECT_EQ(together[i][j].json, alone[i][j].json) << names[j];
      }
    }
  }
}

// A null pointer as a value: every function has an answer.
TEST(CInterface, NothingIsAValueOfNoType) {
  std::size_t size = 1;
  EXPECT_EQ(nandinfo_type(nullptr), NANDINFO_NONE);
  EXPECT_EQ(nandinfo_integer(nullptr), 0);
  EXPECT_EQ(nandinfo_real(nullptr), 0);
  EXPECT_EQ(nandinfo_text(nullptr), nullptr);
  EXPECT_EQ(nandinfo_data(nullptr, &size), nullptr);
  EXPECT_EQ(size + nandinfo_count(nullptr), 0u);
  EXPECT_EQ(nandinfo_find(nullptr, "a"), nandinfo_at(nullptr, 0, nullptr));
  nandinfo_free(nullptr);
  nandinfo_close(nullptr);
  EXPECT_EQ(nandinfo_api(), NANDINFO_API);
  EXPECT_EQ(nandinfo_collect(nullptr, "disk", nullptr, nullptr, nullptr), NANDINFO_USAGE);
}

}  // namespace
