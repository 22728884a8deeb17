// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/preferences/PreferenceFiles.h"

#include <filesystem>

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "HostServices.h"
#include "platform/PreferenceStore.h"
#include "plist/PropertyList.h"

namespace host {
namespace {

constexpr char kDomain[] = "com.example";
constexpr char kFile[] = "var/preferences/mobile/com.example.plist";
constexpr char kKept[] = "var/preferences/mobile/com.example.plist.corrupt";

struct PreferenceFilesTest : testing::Test, support::HostServices {
  std::optional<plist::Dictionary> stored(const char* file = kFile) {
    auto value = plist::read(folder.read(file));
    return value ? std::optional(*value->as<plist::Dictionary>()) : std::nullopt;
  }
  // Reads the file as empty with this one line, and puts it aside when it is written.
  void expectPutAside(const std::string& line) {
    log.clear();
    PreferenceFiles files(root, log);
    EXPECT_EQ(files.QNSPreferencesGetValue("key", kDomain), std::nullopt);
    EXPECT_EQ(files.QNSPreferencesGetValue("list", kDomain), std::nullopt);
    const plist::Value value(1);
    files.QNSPreferencesSetValue("new", &value, kDomain);
    files.QNSPreferencesSynchronize(kDomain);
    EXPECT_EQ(folder.read(kFile), xml({{"new", 1}}));
    EXPECT_EQ(log.count(line), 1);
    EXPECT_EQ(log.lines().size(), 1u);
  }
};

void set(platform::PreferenceStore& store, const char* key, const plist::Value& value) {
  store.QNSPreferencesSetValue(key, &value, kDomain);
}

TEST_F(PreferenceFilesTest, WritesAreSeenAtOnceAndStoredWhenSynchronised) {
  folder.write(kFile, xml({{"kept", 1}, {"removed", 2}, {"changed", 3}}));
  {
    PreferenceFiles files(root, log);
    set(files, "changed", true);
    set(files, "new", "text");
    files.QNSPreferencesSetValue("removed", nullptr, kDomain);
    EXPECT_EQ(files.QNSPreferencesGetIntegerValue("kept", kDomain), 1);
    EXPECT_EQ(files.QNSPreferencesGetValue("new", kDomain), plist::Value("text"));
    EXPECT_EQ(files.QNSPreferencesGetValue("removed", kDomain), std::nullopt);
    EXPECT_EQ(stored()->size(), 3u);
    files.QNSPreferencesSynchronize(kDomain);
    EXPECT_EQ(folder.read(kFile), xml({{"kept", 1}, {"changed", true}, {"new", "text"}}));
    set(files, "late", 4);
    EXPECT_EQ(stored()->find("late"), nullptr);
  }
  EXPECT_EQ(stored()->find("late")->as<plist::Number>()->int64Value(), 4);
  EXPECT_TRUE(log.lines().empty());
}

TEST_F(PreferenceFilesTest, ChangesOfOthersAreSeenAndKept) {
  PreferenceFiles mine(root, log), others(root, log);
  set(mine, "mine", 1);
  mine.QNSPreferencesSynchronize(kDomain);
  set(others, "theirs", 2);
  EXPECT_EQ(mine.QNSPreferencesGetValue("theirs", kDomain), std::nullopt);
  others.QNSPreferencesSynchronize(kDomain);
  EXPECT_EQ(mine.QNSPreferencesGetIntegerValue("theirs", kDomain), 2);
  others.QNSPreferencesSetValue("theirs", nullptr, kDomain);
  others.QNSPreferencesSynchronize(kDomain);
  EXPECT_EQ(mine.QNSPreferencesGetValue("theirs", kDomain), std::nullopt);
  std::filesystem::remove_all(folder / "var");
  EXPECT_EQ(mine.QNSPreferencesGetValue("mine", kDomain), std::nullopt);
}

TEST_F(PreferenceFilesTest, WhatIsStoredAlreadyIsNotWrittenAgainUnlessItsTypeDiffers) {
  folder.write(kFile, xml({{"key", 1}}));
  PreferenceFiles files(root, log);
  const auto identity = [this] {
    struct stat status {};
    EXPECT_EQ(::stat((folder / kFile).c_str(), &status), 0);
    return status.st_ino;
  };
  const auto before = identity();
  set(files, "key", 1);
  files.QNSPreferencesSetValue("absent", nullptr, kDomain);
  files.QNSPreferencesSynchronize(kDomain);
  EXPECT_EQ(identity(), before);
  set(files, "key", true);
  files.QNSPreferencesSynchronize(kDomain);
  EXPECT_NE(identity(), before);
  EXPECT_EQ(stored()->number("key")->type(), plist::Number::Type::boolean);
  files.deletePreference("key", "nobody", kDomain);
  EXPECT_FALSE(std::filesystem::exists(folder / "var/preferences/nobody"));
}

TEST_F(PreferenceFilesTest, TwoProcessesLoseNoneOfEachOthersKeysAndAdditions) {
  constexpr int kRounds = 25;
  const auto work = [this](const char* prefix) {
    for (int i = 0; i < kRounds; ++i) {
      PreferenceFiles files(root, log);
      set(files, (prefix + std::to_string(i)).c_str(), i);
      files.QNSPreferencesSynchronize(kDomain);
      files.addToInteger("count", kDomain, 1);
    }
  };
  const pid_t child = ::fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    work("child");
    ::_exit(0);
  }
  work("parent");
  int status = -1;
  ASSERT_EQ(::waitpid(child, &status, 0), child);
  ASSERT_EQ(status, 0);
  EXPECT_EQ(stored()->size(), 2u * kRounds + 1);
  EXPECT_EQ(stored()->number("count")->int64Value(), 2 * kRounds);
}

TEST_F(PreferenceFilesTest, AdditionsSaturateAndBeginAtZero) {
  folder.write(kFile, xml({{"full", INT64_MAX}, {"text", "7"}}));
  PreferenceFiles files(root, log);
  set(files, "pending", 40);
  for (const char* key : {"full", "text", "pending", "new"}) files.addToInteger(key, kDomain, 2);
  EXPECT_EQ(folder.read(kFile),
            xml({{"full", INT64_MAX}, {"text", 2}, {"pending", 42}, {"new", 2}}));
}

TEST_F(PreferenceFilesTest, AFileCutAnywhereReadsAsEmptyIsKeptAndSaidOnce) {
  const std::string whole = xml({{"key", 1}, {"list", plist::Array{true}}});
  const std::size_t end = whole.rfind('>');
  for (std::size_t size = 0; size <= end; ++size) {
    SCOPED_TRACE(size);
    folder.write(kFile, whole.substr(0, size));
    expectPutAside("error: Could not read " + root.hostPath(kFile) + ": ");
    EXPECT_EQ(folder.read(kKept), whole.substr(0, size));
  }
}

TEST_F(PreferenceFilesTest, WhatIsNoPreferenceFileIsPutAside) {
  for (const support::Kind kind : {support::Kind::fifo, support::Kind::folder}) {
    support::put(kind, folder / kFile, folder / "target");
    expectPutAside("not a regular file");
    std::filesystem::remove_all(folder / "var/preferences");
  }
  folder.write(kFile, *plist::writeXML(plist::Array{1}));
  expectPutAside("the top level is not a dictionary");
  folder.write(kFile, xml({{"key", 1}}));
  std::filesystem::resize_file(folder / kFile, plist::kMaxSize + 1);
  expectPutAside("larger than 16 MiB");
}

TEST_F(PreferenceFilesTest, LinksAreFollowedToWhatIsReadAndRefusedWhereItIsWritten) {
  const std::string otherName = "other name";
  for (const std::string& link : {std::string(kFile), std::string("var/preferences/mobile"),
                                  std::string("var/preferences"), std::string("var"), otherName}) {
    log.clear();
    folder.write(kFile, xml({{"key", 1}}));
    if (link == otherName) {
      std::filesystem::create_hard_link(folder / kFile, folder / link);
    } else {
      std::filesystem::rename(folder / link, folder / "elsewhere");
      const auto parent = (folder / link).parent_path();
      std::filesystem::create_symlink(std::filesystem::relative(folder / "elsewhere", parent),
                                      folder / link);
    }
    PreferenceFiles files(root, log);
    EXPECT_EQ(files.QNSPreferencesGetIntegerValue("key", kDomain), 1) << link;
    set(files, "new", 1);
    files.QNSPreferencesSynchronize(kDomain);
    EXPECT_EQ(folder.read(kFile), xml({{"key", 1}})) << link;
    EXPECT_EQ(log.count("error: Could not write " + root.hostPath(kFile) + ": "), 1);
    EXPECT_EQ(log.lines().size(), 1u);
    std::filesystem::remove(folder / link);
    std::filesystem::remove_all(folder / "elsewhere");
  }
}

TEST_F(PreferenceFilesTest, AFailedWriteIsSaidOnceStaysVisibleAndIsTriedAgain) {
  folder.write("var/preferences/mobile", "in the way");
  {
    PreferenceFiles files(root, log);
    set(files, "key", 1);
    files.QNSPreferencesSynchronize(kDomain);
    files.QNSPreferencesSynchronize(kDomain);
    EXPECT_EQ(log.count("error: Could not write " + root.hostPath(kFile) + ": "), 1);
    EXPECT_EQ(files.QNSPreferencesGetIntegerValue("key", kDomain), 1);
    std::filesystem::remove(folder / "var/preferences/mobile");
  }
  EXPECT_EQ(folder.read(kFile), xml({{"key", 1}}));
}

TEST_F(PreferenceFilesTest, AbsentAndUnreadableAreNotTheSame) {
  PreferenceFiles files(root, log);
  EXPECT_TRUE(files.readValue("key", kDomain));
  folder.write(kFile, "damaged");
  EXPECT_TRUE(files.readValue("key", kDomain)) << "it is kept aside, and reads as empty";
  std::filesystem::remove_all(folder / "var");
  folder.write("var/preferences/mobile", "in the way");
  EXPECT_TRUE(files.readValue("key", kDomain));
  std::filesystem::remove(folder / "var/preferences/mobile");
  std::filesystem::create_directory(folder / "var/preferences/mobile");
  std::filesystem::create_symlink("com.example.plist", folder / kFile);
  const auto read = files.readValue("key", kDomain);
  ASSERT_FALSE(read);
  EXPECT_TRUE(read.error().text.starts_with(root.hostPath(kFile) + ": "));
}

TEST_F(PreferenceFilesTest, HeldWritesAreOneForEachDomain) {
  const plist::Value value(1);
  PreferenceFiles files(root, log);
  files.holdWrites();
  for (int i = 0; i < 3; ++i) {
    files.setPreference(std::to_string(i), &value, kDomain, true);
    files.setPreference(std::to_string(i), "root", kDomain, &value);
  }
  files.deletePreference("1", "root", kDomain);
  EXPECT_FALSE(std::filesystem::exists(folder / "var"));
  files.writeHeld();
  EXPECT_EQ(stored("var/preferences/__quenset__/com.example.plist")->size(), 3u);
  EXPECT_EQ(stored("var/preferences/root/com.example.plist")->size(), 2u);
  files.deletePreference("0", "root", kDomain);
  EXPECT_EQ(stored("var/preferences/root/com.example.plist")->size(), 1u) << "at once again";
}

// A value that a run has taken and set back: whenever the process ends, what was added meanwhile is
// in the file, and the value is told once.
TEST_F(PreferenceFilesTest, AnAdditionDoesntLetGoWhatIsHeldBack) {
  for (const bool leaves : {true, false}) {
    folder.write(kFile, xml({{"count", 3}}));
    PreferenceFiles files(root, log);
    const auto count = [&] { return stored()->number("count")->int64Value(); };
    files.hold(kDomain);
    set(files, "count", 0);
    files.QNSPreferencesSynchronize(kDomain);
    EXPECT_EQ(count(), 3);
    files.addToInteger("count", kDomain, 1);
    EXPECT_EQ(count(), 4);
    EXPECT_EQ(files.QNSPreferencesGetIntegerValue("count", kDomain), 1);
    if (leaves) {
      EXPECT_TRUE(files.release(kDomain));
    } else {
      files.drop(kDomain);
    }
    EXPECT_TRUE(files.flushAll());
    EXPECT_EQ(count(), leaves ? 1 : 4);
    EXPECT_EQ(files.QNSPreferencesGetIntegerValue("count", kDomain), count());
  }
}

TEST_F(PreferenceFilesTest, AValueThatWouldMakeTheFileUnreadableIsRefused) {
  folder.write(kFile, xml({{"key", 1}}));
  plist::Value deep("leaf");
  for (int depth = 0; depth < plist::kMaxDepth; ++depth) deep = plist::Array{std::move(deep)};
  for (const plist::Value& value : {plist::Value(std::string(plist::kMaxSize, 'x')), deep}) {
    PreferenceFiles files(root, log);
    set(files, "new", value);
    files.QNSPreferencesSynchronize(kDomain);
    EXPECT_EQ(folder.read(kFile), xml({{"key", 1}}));
  }
  EXPECT_EQ(log.count("error: Could not write"), 2);
}

TEST_F(PreferenceFilesTest, NamesThatAreNoFileNamesAreRefused) {
  PreferenceFiles files(root, log);
  const plist::Value value(1);
  int refused = 0;
  for (const std::string& name :
       {std::string(), std::string("."), std::string(".."), std::string("../mobile"),
        std::string("a/b"), std::string("a\0b", 3), std::string(256, 'x')}) {
    files.setPreference("key", name, kDomain, &value);
    files.setPreference("key", "mobile", name, &value);
    files.QNSPreferencesSetValue("key", &value, name);
    EXPECT_EQ(files.getPreference("key", name), std::nullopt);
    EXPECT_EQ(log.count("error: Refused preferences"), refused += 4);
  }
  EXPECT_TRUE(files.flushAll());
  EXPECT_FALSE(std::filesystem::exists(folder / "var"));
  files.setPreference("key", "mobile", std::string(241, 'x'), &value);
  EXPECT_TRUE(std::filesystem::exists(
      folder / ("var/preferences/mobile/" + std::string(241, 'x') + ".plist")));
}

TEST_F(PreferenceFilesTest, EachViewHasItsUser) {
  constexpr char kAnalytics[] = "var/preferences/__quenset__/com.norba.Varnhollow.plist";
  folder.write(kAnalytics, xml({{"LogBlocklist", plist::Array{"b", 7, "a"}}}));
  PreferenceFiles files(root, log);
  EXPECT_EQ(files.logBlocklist(), (std::vector<std::string>{"b", "a"}));
  const plist::Value value(1);
  files.setPreference("key", &value, "com.norba.Varnhollow", true);
  EXPECT_EQ(stored(kAnalytics)->size(), 2u);
  files.setPreference("key", "root", kDomain, &value);
  EXPECT_EQ(stored("var/preferences/root/com.example.plist")->size(), 1u);
  files.deletePreference("key", "root", kDomain);
  EXPECT_EQ(stored("var/preferences/root/com.example.plist")->size(), 0u);
}

}  // namespace
}  // namespace host
