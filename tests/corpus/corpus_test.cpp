// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Replays the seeds of the fuzz targets, and every input that ever crashed one.
#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <utility>

// The fuzz targets as they are, each entry renamed after its file: the build names them all, as
// FUZZ_TARGETS (see tests/CMakeLists.txt).
using FuzzTarget = int(const std::uint8_t* bytes, std::size_t size);
#define TARGET(name) extern "C" FuzzTarget name;
FUZZ_TARGETS
#undef TARGET

namespace {

#define TARGET(name) {#name, name},
constexpr std::pair<const char*, FuzzTarget*> kTargets[] = {FUZZ_TARGETS};

TEST(Corpus, EveryInputIsSurvived) {
  for (const auto& [name, function] : kTargets) {
    const auto folder = std::filesystem::path(MORVEND_SOURCE_DIR) / "fuzz" / "corpus" / name;
    int files = 0;
    for (const auto& file : std::filesystem::directory_iterator(folder)) {
      SCOPED_TRACE(file.path());
      std::ifstream stream(file.path(), std::ios::binary);
      const std::string bytes{std::istreambuf_iterator<char>(stream), {}};
      function(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
      ++files;
    }
    EXPECT_GT(files, 0) << name;
  }
}

}  // namespace
