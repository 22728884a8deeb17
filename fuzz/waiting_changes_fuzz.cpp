// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The journal beside the counters database: batches as they are kept, each recorded once, and
// files that are none.

#include <fcntl.h>

#include <array>
#include <cstdint>
#include <limits>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "Input.h"
#include "MemoryFolder.h"
#include "base/ByteWriter.h"
#include "base/UTF8.h"
#include "host/counters/CounterSchema.h"
#include "host/counters/SQLite.h"
#include "host/counters/WaitingChanges.h"
#include "host/files/FileDescriptor.h"
#include "platform/testing/RecordingLog.h"

namespace {

using namespace host;
using fuzz::require;
using Scalars = std::map<std::pair<std::int64_t, std::string>, std::int64_t>;  // by day and key
using sqlite::Connection;

const std::string kJournal = "PLDataStore.sqlitedb.waiting", kAside = kJournal + ".corrupt";

// An empty database in a folder of its own.
struct Database {
  Database() : folder("") {
    const auto path = folder.path / "PLDataStore.sqlitedb";
    fuzz::writeFile(path, "");
    descriptor = FileDescriptor(::open(folder.path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    auto opened = Connection::open(path, Connection::Access::readWrite, [](auto) {});
    require(descriptor && opened && verifySchema(**opened, DatabaseUse::create), "it opens");
    connection = std::move(*opened);
  }

  void clear() {
    std::filesystem::remove_all(folder.path / kJournal);
    std::filesystem::remove(folder.path / kAside);
    require(bool(connection->execute("DELETE FROM scalars; DELETE FROM staged; "
                                     "DROP TABLE IF EXISTS waiting_recorded")),
            "it is emptied");
    if (connection->pagesInLog() > 200) {
      require(bool(connection->checkpoint(Connection::Checkpoint::truncate)), "its log, too");
    }
  }

  // Whether there was a journal, and all of it is recorded.
  bool record(bool onDisk = true) {
    auto waiting = WaitingChanges::open(descriptor.get(), "here");
    require(bool(waiting), "a journal opens");
    if (!*waiting) return false;
    const auto synchronise = [onDisk]() -> base::Result<void> {
      if (onDisk) return {};
      return base::Error{"not on disk"};
    };
    return static_cast<bool>((*waiting)->recordAll(*connection, synchronise, log));
  }

  Scalars scalars() {
    Scalars found;
    sqlite::Statement rows(*connection, "SELECT day, key, value FROM scalars");
    require(bool(rows.forEach([&] {
              const std::string key(rows.column(1).bytes());
              require(base::isWritable(key), "keys can be written");
              found[{rows.column(0).integer(), key}] = rows.column(2).integer();
              return true;
            })),
            "it is read");
    return found;
  }
  std::size_t samples() {
    sqlite::Statement count(*connection, "SELECT count(*) FROM staged");
    require(*count.step(), "it is counted");
    return static_cast<std::size_t>(count.column(0).integer());
  }

  fuzz::MemoryFolder folder;
  FileDescriptor descriptor;
  std::unique_ptr<Connection> connection;
  platform::fakes::RecordingLog log;
};

std::int64_t sum(std::int64_t value, std::int64_t more) {
  std::int64_t result;
  if (!__builtin_add_overflow(value, more, &result)) return result;
  return more > 0 ? std::numeric_limits<std::int64_t>::max()
                  : std::numeric_limits<std::int64_t>::min();
}

// Batches that are kept; killed after they were recorded, and recorded again.
void checkBatches(Database& database, fuzz::Input& input) {
  Scalars expected;
  std::size_t samples = 0;
  for (int batches = 0; batches < 4 && !input.empty(); ++batches) {
    std::vector<CounterChange> changes;
    for (unsigned left = input.number<std::uint8_t>() % 16; left > 0 && !input.empty(); --left) {
      const unsigned head = input.number<std::uint8_t>();
      CounterChange change{.kind = static_cast<CounterChange::Kind>(head % 3),
                           .key = fuzz::textOf(input.bytes(head >> 2 & 3)),
                           .day = static_cast<std::int32_t>(input.number<std::uint8_t>())};
      const auto amount = static_cast<std::int64_t>(input.number<std::uint64_t>());
      std::string room;
      auto& value = expected[{change.day, std::string(base::writable(change.key, room))}];
      if (change.kind == CounterChange::Kind::push) {
        change.sample = static_cast<double>(amount);
        ++samples;
        if (value == 0) value = 0;
      } else {
        change.amount = amount;
        value = change.kind == CounterChange::Kind::set ? amount : sum(value, amount);
      }
      changes.push_back(change);
    }
    require(bool(keepWaiting(database.descriptor.get(), changes)), "a batch is kept");
  }
  const bool any = std::filesystem::exists(database.folder.path / kJournal);
  require(!database.record(false), "what isn't on disk isn't recorded for good");
  require(database.record() == any, "what was kept is recorded");
  auto found = database.scalars();
  // A key that was only pushed has no scalar.
  for (const auto& [place, value] : expected) found.try_emplace(place, 0);
  require(found == expected, "the scalars are what the changes come to");
  require(database.samples() == samples, "each sample is there once");
  require(!database.record(), "nothing waits any more");
  require(!std::filesystem::exists(database.folder.path / kAside), "nothing is set aside");
}

// A file that somebody left: all of it is recorded, or nothing, and then it is set aside.
void checkFile(Database& database, fuzz::Input& input, bool hasHeader) {
  constexpr std::array kNames = {"0000000000000001-00000000000000aa", "0000000000000001",
                                 ".0000000000000001-00000000000000aa.new-1", "x\n",
                                 "000000000000000g-00000000000000aa"};
  const char* const name = kNames[input.number<std::uint8_t>() % kNames.size()];
  const auto body = fuzz::textOf(input.rest());
  std::string bytes;
  if (hasHeader) {
    bytes = "PLWaits1";
    base::appendLittleEndian(bytes, std::uint64_t{body.size()});
  }
  bytes += body;
  const auto journal = database.folder.path / kJournal;
  std::filesystem::create_directory(journal);
  fuzz::writeFile(journal / name, bytes);
  require(database.record(), "a foreign file is no failure");
  const bool aside = std::filesystem::exists(database.folder.path / kAside);
  const std::size_t rows = database.scalars().size() + database.samples();
  require(rows <= body.size() / 21, "a change has its bytes");
  require(!aside || rows == 0, "what is no batch is not recorded");
  require(!aside || fuzz::readFile(database.folder.path / kAside) == bytes, "and kept as it is");
  const bool unfinished = name[0] == '.';
  require(unfinished || !std::filesystem::exists(journal) || std::filesystem::is_empty(journal),
          "it is in the way of nobody");
  require(aside || unfinished || name == kNames[0], "a batch has a batch's name");
  const auto scalars = database.scalars();
  database.record();
  require(database.scalars() == scalars, "nothing is recorded again");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  static Database database;
  database.clear();
  database.log.clear();
  fuzz::Input input(bytes, size);
  switch (const unsigned kind = input.number<std::uint8_t>(); kind % 4) {
    case 0:
      checkFile(database, input, false);
      break;
    case 1:
      checkFile(database, input, true);
      break;
    default:
      checkBatches(database, input);
  }
  return 0;
}
