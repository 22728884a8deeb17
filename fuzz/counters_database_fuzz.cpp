// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Counters databases that somebody made: a sound one of the store's, with or without what others
// add to it, of which an input changes some bytes, in the file or in its log.

#include <array>
#include <cstdint>
#include <optional>
#include <set>
#include <string>

#include "Input.h"
#include "MemoryFolder.h"
#include "base/UTF8.h"
#include "host/counters/CounterStore.h"
#include "host/counters/SQLite.h"
#include "host/files/DeviceRoot.h"
#include "platform/testing/RecordingLog.h"

namespace {

using namespace host;
using fuzz::require;

constexpr char kFolder[] = "var/mobile/Library/Pelloran";
constexpr char kName[] = "PLDataStore.sqlitedb";
constexpr std::int32_t kToday = 20000;
constexpr std::size_t kPage = 4096;
constexpr char kAdded[] =
    "CREATE INDEX added ON scalars(key); CREATE UNIQUE INDEX meddles ON scalars(value, key);"
    "CREATE VIEW shown AS SELECT key FROM scalars;"
    "CREATE TABLE others(a, b); INSERT INTO others VALUES(1, x'00');"
    "CREATE TRIGGER follows AFTER INSERT ON scalars BEGIN DELETE FROM scalars; END;"
    "CREATE INDEX computes ON packed(hex(samples)); ANALYZE";

struct SetClock final : platform::Clock {
  plist::Date now() override { return {kToday * 86400.0}; }
  std::int32_t secondsFromUTC(plist::Date) override { return 0; }
};

// The store over a folder, as a process has it.
struct Process {
  explicit Process(const std::filesystem::path& folder) : root(folder.string(), kNoPause) {}

  static constexpr auto kNoPause = [](std::chrono::milliseconds) {};
  DeviceRoot root;
  SetClock clock;
  platform::fakes::RecordingLog log{platform::LogLevel::error};
  int damaged = 0;
  CounterStore store{root,    clock, log, [] { return "/var/mobile"; }, [this] { ++damaged; },
                     kNoPause};
};

struct Files {
  std::string database, log;
};

Files read(const std::filesystem::path& folder) {
  const auto path = folder / kFolder / kName;
  return {fuzz::readFile(path), fuzz::readFile(path.string() + "-wal")};
}

// A sound database: settled, with a log, and with what others added.
std::array<Files, 3> soundOnes() {
  const fuzz::MemoryFolder folder("");
  Process process(folder.path);
  for (std::int32_t day = kToday - 3; day <= kToday; ++day) {
    for (const char* key : {"a", "a.b", "b\xC3\xA9"}) {
      require(bool(process.store.set(key, day, day)), "it is recorded");
      for (int i = 0; i < 3; ++i) require(bool(process.store.push(key, i, day, i)), "it is, too");
    }
    if (day == kToday - 1) process.store.PLClientCheckpoint();
  }
  require(process.store.addValuesAndKeep({}, "name", "text"), "it is kept");
  std::array<Files, 3> made;
  made[1] = read(folder.path);
  require(bool(process.store.settle()), "it is settled");
  made[0] = read(folder.path);
  {
    auto connection = sqlite::Connection::open(
        folder.path / kFolder / kName, sqlite::Connection::Access::readWrite, Process::kNoPause);
    require(connection && (*connection)->execute(kAdded), "others add to it");
    require(bool((*connection)->checkpoint(sqlite::Connection::Checkpoint::truncate)),
            "in its file");
  }
  made[2] = read(folder.path);
  return made;
}

// Changes a file as the input says: at the beginning or the end of one of its pages, where SQLite
// keeps what matters.
void change(std::string& file, fuzz::Input& input) {
  const unsigned how = input.number<std::uint8_t>();
  const std::size_t page = input.number<std::uint8_t>() * kPage,
                    within = input.number<std::uint8_t>();
  const std::size_t place = how % 2 == 0 ? page + within : page + kPage - 1 - within;
  const auto bytes = fuzz::textOf(input.bytes(how >> 4));
  if (file.empty()) return;
  const std::size_t begin = place % file.size();
  if ((how & 12) == 12) return file.resize(begin);
  file.replace(begin, std::min(bytes.size(), file.size() - begin), bytes);
}

using Rows = std::set<std::string>;

// All that can be read, until reading fails; none then.
std::optional<Rows> rows(CounterStore& store) {
  Rows found;
  const auto history = store.history();
  std::int32_t last = INT32_MIN;
  const auto note = [&](std::string_view key, std::int32_t day) {
    require(base::isWritable(key), "keys can be written");
    require(day >= 0 && day <= kToday + 1, "days are those that were asked for");
    last = day;
  };
  auto outcome = history->scalarsForKeyPrefix(
      "", 0, kToday + 1, [&](std::string_view key, std::int32_t day, std::int64_t value, bool&) {
        note(key, day);
        found.insert(std::string(key) + " " + std::to_string(day) + " " + std::to_string(value));
      });
  if (!outcome) return std::nullopt;
  outcome = history->distributionsForKeyPrefix(
      "", 0, kToday + 1,
      [&](std::string_view key, std::int32_t day,
          platform::PLHistoryDistributionEnumerator& samples, bool&) {
        note(key, day);
        std::size_t count = 0;
        auto block = samples.getNextValues();
        for (; block && !block->values.empty(); block = samples.getNextValues()) {
          require(block->values.size() == block->secondsInDayOffsets.size(), "values have times");
          count += block->values.size();
        }
        found.insert(std::string(key) + " " + std::to_string(day) + " #" + std::to_string(count));
      });
  if (!outcome) return std::nullopt;
  return found;
}

void checkFolder(const std::filesystem::path& folder, bool damaged) {
  static const std::set<std::string> kNames{"",         "-wal",     "-shm",
                                            "-journal", ".corrupt", ".corrupt-wal"};
  bool aside = false;
  for (const auto& entry : std::filesystem::directory_iterator(folder / kFolder)) {
    const std::string name = entry.path().filename();
    require(name.starts_with(kName) && kNames.contains(name.substr(sizeof kName - 1)),
            "no other file comes about");
    aside = aside || name.ends_with(".corrupt");
  }
  require(aside == damaged, "what was damaged is set aside");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  static const auto& sound = *new std::array<Files, 3>(soundOnes());
  static const fuzz::MemoryFolder folder(kFolder);
  static const Rows& whole = *new Rows([] {
    fuzz::writeFile(folder.path / kFolder / kName, sound[0].database);
    Process process(folder.path);
    return *rows(process.store);
  }());
  fuzz::Input input(bytes, size);
  Files files = sound[input.number<std::uint8_t>() % sound.size()];
  const bool changes = !input.empty();
  for (int left = 16; left > 0 && !input.empty(); --left) {
    change(input.number<std::uint8_t>() % 3 == 2 ? files.log : files.database, input);
  }
  for (const auto& entry : std::filesystem::directory_iterator(folder.path / kFolder)) {
    std::filesystem::remove_all(entry.path());
  }
  fuzz::writeFile(folder.path / kFolder / kName, files.database);
  if (!files.log.empty())
    fuzz::writeFile(folder.path / kFolder / (std::string(kName) + "-wal"), files.log);

  Process process(folder.path);
  const auto before = rows(process.store);
  require(changes || (before && *before == whole), "what is sound is read whole");
  // What reading found damaged is set aside now: from here on there is a new one.
  const bool fresh = process.damaged > 0;
  const bool recorded = static_cast<bool>(process.store.set("fuzz", 42, kToday)) &&
                        static_cast<bool>(process.store.push("fuzz", 1.5, kToday, 1));
  const auto after = rows(process.store);
  const std::string row = "fuzz " + std::to_string(kToday);
  if (!changes || fresh) {
    require(recorded && after && after->contains(row + " 42") && after->contains(row + " #1"),
            "a sound database takes what comes");
  }
  require(changes || after->size() == whole.size() + 2, "and loses nothing");
  process.store.PLClientCheckpoint();
  const auto packed = rows(process.store);
  require(!(fresh || !changes) || packed == after, "packing changes nothing");
  std::ignore = process.store.keptText("name");
  std::ignore = process.store.settle();
  require(process.damaged <= 2, "a new one is not damaged again");
  checkFolder(folder.path, process.damaged > 0);
  return 0;
}
