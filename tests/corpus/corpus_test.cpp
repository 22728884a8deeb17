// Replays the seeds of the fuzz targets, and every input that ever crashed one.
#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

// The fuzz targets as they are, each entry renamed after its file (see tests/CMakeLists.txt).
extern "C" {
using FuzzTarget = int(const std::uint8_t* bytes, std::size_t size);
FuzzTarget binary_property_list_fuzz, bus_message_fuzz, decoded_buffer_fuzz, defects_list_fuzz,
    ftl_statistics_fuzz, import_lines_fuzz, kernel_snapshot_fuzz, legacy_statistics_fuzz,
    msp_statistics_fuzz, registry_fuzz, telemetry_list_fuzz, validity_list_fuzz,
    xml_property_list_fuzz;
}

namespace {

struct Row {
  const char* name;
  FuzzTarget* function;
};

constexpr Row kTargets[] = {
    {"binary_property_list_fuzz", binary_property_list_fuzz},
    {"bus_message_fuzz", bus_message_fuzz},
    {"decoded_buffer_fuzz", decoded_buffer_fuzz},
    {"defects_list_fuzz", defects_list_fuzz},
    {"ftl_statistics_fuzz", ftl_statistics_fuzz},
    {"import_lines_fuzz", import_lines_fuzz},
    {"kernel_snapshot_fuzz", kernel_snapshot_fuzz},
    {"legacy_statistics_fuzz", legacy_statistics_fuzz},
    {"msp_statistics_fuzz", msp_statistics_fuzz},
    {"registry_fuzz", registry_fuzz},
    {"telemetry_list_fuzz", telemetry_list_fuzz},
    {"validity_list_fuzz", validity_list_fuzz},
    {"xml_property_list_fuzz", xml_property_list_fuzz},
};

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
