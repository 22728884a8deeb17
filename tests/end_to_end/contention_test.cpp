// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Locks that somebody holds and never gives back, and programs that run at once.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sqlite3.h>
#include <sys/file.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>
#include <string>
#include <thread>
#include <vector>

#include "base/Text.h"
#include "end_to_end/Damage.h"
#include "end_to_end/Device.h"

namespace end_to_end {
namespace {

// A process that takes a lock and is stopped then.
class StoppedHolder {
 public:
  enum class Lock { file, database };

  StoppedHolder(const std::filesystem::path& path, Lock lock) : process_(::fork()) {
    if (process_ == 0) {
      const bool held = lock == Lock::file ? holdFile(path) : holdDatabase(path);
      if (!held) ::_exit(1);
      ::raise(SIGSTOP);
      for (;;) ::pause();
    }
    int status = 0;
    EXPECT_EQ(::waitpid(process_, &status, WUNTRACED), process_);
    EXPECT_TRUE(WIFSTOPPED(status)) << path;
  }
  ~StoppedHolder() {
    ::kill(process_, SIGKILL);
    ::waitpid(process_, nullptr, 0);
  }
  StoppedHolder(const StoppedHolder&) = delete;
  StoppedHolder& operator=(const StoppedHolder&) = delete;

 private:
  static bool holdFile(const std::filesystem::path& path) {
    return ::flock(::open(path.c_str(), O_RDONLY | O_CLOEXEC), LOCK_EX | LOCK_NB) == 0;
  }
  static bool holdDatabase(const std::filesystem::path& path) {
    sqlite3* database = nullptr;
    return sqlite3_open(path.c_str(), &database) == SQLITE_OK &&
           sqlite3_exec(database, "PRAGMA locking_mode = EXCLUSIVE; BEGIN EXCLUSIVE", nullptr,
                        nullptr, nullptr) == SQLITE_OK;
  }

  const pid_t process_;
};

TEST(Contention, CompletesTheDayWhoeverHoldsALock) {
  if (!faults::available()) GTEST_SKIP() << faults::kUnavailable;
  Device filled;
  filled.fill();
  filled.root().write("var/run/morvend.lock", "");
  filled.root().write("var/spool/morvend/events.jsonl", "");
  for (const char* user : {"guest", "mobile", "__quenset__"}) {
    std::filesystem::create_directories(filled.root() / "var/preferences" / user);
  }
  std::filesystem::create_directories(filled.root() / kSubmitted);
  Device device, clean;
  clean.become(filled);
  clean.run("morvend", {"-d"});
  // What the run goes on without, and says so: only a database that nobody may read costs a report.
  constexpr char kReport[] =
      "0 instead of 1 daily logs; 0 instead of 1 options; 2 instead of 3 events; ";
  constexpr char kFolder[] = "var/mobile/Library/Pelloran";
  for (const std::string path :
       {support::kCountersDatabase, kFolder, "var/run/morvend.lock", "var/preferences/mobile",
        "var/preferences/__quenset__", "var/preferences/guest", "var/spool/morvend", kSubmitted,
        "var/spool/morvend/structured", "var/spool/morvend/events.jsonl", "var/log/servita"}) {
    Figures figures("lock on " + path);
    const bool isDatabase = path == support::kCountersDatabase;
    device.become(filled);
    faults::Outcome waited;
    {
      using Lock = StoppedHolder::Lock;
      const StoppedHolder holder(device.root() / path, isDatabase ? Lock::database : Lock::file);
      waited = device.run("morvend", {"-d"}, {.kind = "", .hurry = true});
    }
    EXPECT_EQ(waited.status, 0) << path;
    EXPECT_EQ(isDatabase, waited.standardError.find("<3>the report of day") != std::string::npos);
    const bool late = device.dailyLogs().size() != 1;
    const auto next = device.run("morvend", {"-d"});
    figures.count(damageOf(filled, clean, device,
                           isDatabase || path == kFolder ? Usage::left : Usage::counted),
                  late, waited.standardError + "then\n" + next.standardError,
                  isDatabase ? kReport : "");
  }
}

// As if one had come after the other, whichever two run at once, and however their calls come to
// lie.
TEST(Contention, LeavesWhatOneAfterTheOtherWould) {
  using Command = std::vector<std::string>;
  const Command run{"morvend", "-d"}, add{"pelloran", "add", "k", "5"},
      import{"pelloran", "import", "lines"}, extract{"nandinfo", "extract"},
      dump{"nandinfo", "dump"};
  const std::vector<Command> pairs[] = {{run, run},         {add, add},     {import, import},
                                        {extract, extract}, {dump, dump},   {run, add},
                                        {run, import},      {run, extract}, {run, dump}};
  constexpr int kAtOnce = 4;  // of each of the two
  constexpr std::size_t kRounds = 20;
  Device filled;
  filled.fill();
  const std::string lines = filled.root() / "lines";
  filled.root().write("lines", "{\"add\": \"k\", \"value\": 7}\n{\"set\": \"l\", \"value\": 1}\n");
  const auto call = [&lines](const Device& device, const Command& command) {
    faults::Strings arguments(command.begin() + 1, command.end());
    if (arguments.back() == "lines") arguments.back() = lines;
    return device.run(command[0], std::move(arguments));
  };
  for (const auto& pair : pairs) {
    Device device, clean;
    clean.become(filled);
    for (int i = 0; i < kAtOnce; ++i) {
      for (const Command& command : pair) call(clean, command);
    }
    call(clean, run);
    std::string kind = "at once:";
    for (const Command& command : pair) kind += " " + command[0] + " " + command[1];
    Figures figures(kind);
    for (std::size_t round = 0; round < kRounds; ++round) {
      device.become(filled);
      std::vector<faults::Outcome> outcomes(pair.size() * kAtOnce);
      std::vector<std::thread> programs;
      for (std::size_t i = 0; i < outcomes.size(); ++i) {
        programs.emplace_back([&, i] { outcomes[i] = call(device, pair[i % pair.size()]); });
      }
      for (auto& program : programs) program.join();
      std::string said;
      for (const auto& outcome : outcomes) {
        EXPECT_EQ(outcome.status, 0) << outcome.standardError;
        said += outcome.standardError;
      }
      const auto next = call(device, run);
      figures.count(damageOf(filled, clean, device), false, said + next.standardError);
    }
  }
}

}  // namespace
}  // namespace end_to_end
