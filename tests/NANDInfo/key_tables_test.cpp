#include "NANDInfo/KeyTables.h"

#include <gtest/gtest.h>

#include <string>

#include "support/Fingerprint.h"

namespace NANDInfo {
namespace {

// One wrong letter, key or number of elements changes the fingerprint.
TEST(FTLKeyTable, HasEveryKeyOnceAndFindsIt) {
  std::string text;
  for (const auto& [key, elements, name] : FTLKeyTable()) {
    text += std::to_string(key) + " " + name + " " + std::to_string(elements) + "\n";
  }
  EXPECT_EQ(support::fingerprint(text), 0x74ec7726eb57a8eeu);
  auto row = FTLKeyTable().begin();
  for (std::uint32_t key = 0; key <= 70000; ++key) {
    const bool listed = row != FTLKeyTable().end() && row->key == key;
    ASSERT_EQ(findFTLKey(key), listed ? &*row++ : nullptr) << key;
  }
  EXPECT_EQ(findFTLKey(0xFFFFFFFF), nullptr);
}

TEST(MSPTagTable, HasEveryTagOnceAndFindsIt) {
  std::string text;
  for (const auto& [tag, width, elements, name] : MSPTagTable()) {
    text += std::to_string(tag) + " " + name + " " + std::to_string(width) + " " +
            std::to_string(elements) + "\n";
  }
  EXPECT_EQ(support::fingerprint(text), 0xc5f9033f38f37a47u);
  auto row = MSPTagTable().begin();
  for (std::uint32_t tag = 0; tag <= 70000; ++tag) {
    const bool listed = row != MSPTagTable().end() && row->tag == tag;
    ASSERT_EQ(findMSPTag(tag), listed ? &*row++ : nullptr) << tag;
  }
}

}  // namespace
}  // namespace NANDInfo
