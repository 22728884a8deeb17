// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/counters/WaitingChanges.h"

#include <fcntl.h>
#include <sys/random.h>
#include <sys/stat.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <ctime>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

#include "base/ByteReader.h"
#include "base/ByteWriter.h"
#include "base/Text.h"
#include "host/files/Files.h"
#include "host/files/SystemError.h"

namespace host {

using base::Error;
using base::Result;
using sqlite::Connection;
using sqlite::Statement;

namespace {

constexpr char kFolder[] = "PLDataStore.sqlitedb.waiting";
constexpr char kAside[] = "PLDataStore.sqlitedb.waiting.corrupt";
constexpr std::string_view kFormat = "PLWaits1";

// A number in the order of the batches, and one by chance: 16 digits each.
constexpr std::size_t kNumberDigits = 16;
constexpr std::size_t kNameLength = 2 * kNumberDigits + 1;
constexpr std::time_t kSecondsUntilStale = 3600;

bool isBatchName(std::string_view name) {
  return name.size() == kNameLength && name[kNumberDigits] == '-' &&
         name.find_first_not_of("0123456789abcdef-") == name.npos;
}

// What replaceFile() writes before it is the batch.
bool isUnfinished(std::string_view name) {
  return name.starts_with('.') && isBatchName(name.substr(1, kNameLength)) &&
         name.substr(1 + kNameLength).starts_with(".new");
}

Result<FileDescriptor> openJournal(int folder) {
  auto journal = opened(::openat(folder, kFolder, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  const bool other = !journal && (journal.error().is(std::errc::not_a_directory) ||
                                  journal.error().is(std::errc::too_many_symbolic_link_levels));
  if (other) return Error{"the journal beside it is not a folder"};
  return journal;
}

std::string encoded(std::span<const CounterChange> changes) {
  std::string bytes;
  for (const CounterChange& change : changes) {
    const bool pushes = change.kind == CounterChange::Kind::push;
    base::appendLittleEndian(bytes, static_cast<std::uint8_t>(change.kind));
    base::appendLittleEndian(bytes, change.day);
    base::appendLittleEndian(bytes, change.seconds);
    base::appendLittleEndian(bytes,
                             pushes ? std::bit_cast<std::int64_t>(change.sample) : change.amount);
    base::appendLittleEndian(bytes, static_cast<std::uint32_t>(change.key.size()));
    bytes += change.key;
    if (bytes.size() > kMaxWaitingBytes) break;  // which is refused
  }
  std::string batch(kFormat);
  base::appendLittleEndian(batch, std::uint64_t{bytes.size()});
  return batch + bytes;
}

// Hands each change of a batch to `use`, until that fails; an error says that it is no batch.
Result<void> forEachChange(std::string_view batch,
                           const std::function<Result<void>(const CounterChange&)>& use) {
  const Error foreign{"not a batch of changes", sqlite::kDamaged};
  if (!batch.starts_with(kFormat)) return foreign;
  base::ByteReader reader(std::as_bytes(std::span(batch.substr(kFormat.size()))));
  const auto size = reader.read<std::uint64_t>();
  if (!size || *size != reader.rest().size()) return foreign;
  while (!reader.rest().empty()) {
    const auto kind = reader.read<std::uint8_t>();
    const auto day = reader.read<std::uint32_t>(), seconds = reader.read<std::uint32_t>();
    const auto value = reader.read<std::uint64_t>();
    const auto length = reader.read<std::uint32_t>();
    const auto key = length ? reader.take(*length) : std::nullopt;
    if (!value || !key || *kind > static_cast<std::uint8_t>(CounterChange::Kind::push))
      return foreign;
    CounterChange change{
        .kind = static_cast<CounterChange::Kind>(*kind),
        .key = {reinterpret_cast<const char*>(key->data()), key->size()},
        .day = static_cast<std::int32_t>(*day),
        .amount = static_cast<std::int64_t>(*value),
        .seconds = static_cast<std::int32_t>(*seconds),
    };
    if (change.kind == CounterChange::Kind::push) change.sample = std::bit_cast<double>(*value);
    if (std::isnan(change.sample)) return foreign;
    if (auto used = use(change); !used) return used;
  }
  return {};
}

// The name of the next batch, if there is room for it.
Result<std::string> nameForBatch(int journal, std::size_t size) {
  const auto names = namesInFolder(journal);
  if (!names) return names.error();
  std::uint64_t last = 0, held = size;
  for (const std::string& name : *names) {
    if (isBatchName(name))
      last = std::max<std::uint64_t>(last, std::strtoull(name.c_str(), nullptr, 16));
    struct stat status;
    if (::fstatat(journal, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0) {
      held += static_cast<std::uint64_t>(status.st_size);
    }
  }
  if (names->size() >= kMaxWaitingBatches || held > kMaxWaitingBytes) {
    return Error{"too much waits beside it already"};
  }
  std::uint64_t chance = 0;
  if (::getrandom(&chance, sizeof chance, 0) != sizeof chance) return systemError();
  const unsigned long long next = last + 1;
  return base::format("%016llx-%016llx", next, static_cast<unsigned long long>(chance));
}

Result<void> keep(int folder, std::string_view batch) {
  const auto made = makeFolder(folder, kFolder);
  if (!made && !made.error().is(std::errc::file_exists)) return made.error();
  const auto journal = openJournal(folder);
  if (!journal) return journal.error();
  const auto name = nameForBatch(journal->get(), batch.size());
  if (!name) return name.error();
  return replaceFile(journal->get(), *name, batch).and_then([folder] {
    return checked(::fsync(folder));
  });
}

}  // namespace

Result<void> keepWaiting(int folder, std::span<const CounterChange> changes) {
  const std::string batch = encoded(changes);
  // The journal is removed when it is empty, and is made again then.
  for (int tries = 3;; --tries) {
    auto kept = keep(folder, batch);
    if (kept || tries == 0 || !isMissing(kept.error())) return kept;
  }
}

Result<std::optional<WaitingChanges>> WaitingChanges::open(int folder, const std::string& path) {
  auto journal = openJournal(folder);
  if (journal) return std::optional(WaitingChanges(folder, *std::move(journal), path));
  if (isMissing(journal.error())) return std::optional<WaitingChanges>();
  return journal.error();
}

Result<void> WaitingChanges::recordAll(Connection& connection,
                                       const std::function<Result<void>()>& synchronise,
                                       platform::SystemLog& log) {
  auto names = namesInFolder(journal_.get());
  if (!names) return names.error();
  std::erase_if(*names, [this](const std::string& name) {
    if (!isUnfinished(name)) return false;
    removeStale(name);
    return true;
  });
  names->resize(std::min(names->size(), kMaxWaitingBatches));
  std::vector<std::string> recorded;
  sqlite::Transaction transaction(connection);
  auto done = transaction.begin(sqlite::Transaction::Kind::write).and_then([&connection] {
    return connection.execute(kWaitingTable);
  });
  for (const std::string& name : *names) {
    if (!done) return done;
    const auto sound = recordBatch(connection, name);
    if (!sound) return sound.error();
    if (*sound)
      recorded.push_back(name);
    else
      setAside(name, log);
  }
  if (done) done = transaction.commit();
  if (done) done = synchronise();
  if (!done) return done;
  for (const std::string& name : recorded) {
    if (::unlinkat(journal_.get(), name.c_str(), 0) != 0) return {};
  }
  // What can't be removed now is known to be recorded until it can.
  if (::fsync(journal_.get()) != 0) return {};
  ::unlinkat(folder_, kFolder, AT_REMOVEDIR);
  return connection.execute("DROP TABLE waiting_recorded");
}

// False when it is no batch; one that is recorded already is passed over.
Result<bool> WaitingChanges::recordBatch(Connection& connection, const std::string& name) {
  if (!isBatchName(name)) return false;
  const auto file = opened(::openat(journal_.get(), name.c_str(),
                                    O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
  struct stat status;
  if (!file && !file.error().is(std::errc::too_many_symbolic_link_levels)) return file.error();
  if (file && ::fstat(file->get(), &status) != 0) return systemError();
  if (!file || !S_ISREG(status.st_mode) || status.st_nlink > 1 ||
      static_cast<std::uint64_t>(status.st_size) > kMaxWaitingBytes) {
    return false;
  }
  const auto batch = readRegularFile(file->get(), kMaxWaitingBytes);
  if (!batch) return batch.error();
  if (!forEachChange(*batch, [](const CounterChange&) { return Result<void>(); })) return false;
  bool before = false;
  const auto marked = Statement(connection, "SELECT 1 FROM waiting_recorded WHERE batch = ?", name)
                          .forEach([&before] {
                            before = true;
                            return false;
                          });
  if (!marked) return marked.error();
  if (before) return true;
  const auto recorded = Statement(connection, "INSERT INTO waiting_recorded(batch) VALUES(?)", name)
                            .run()
                            .and_then([&] {
                              return forEachChange(*batch, [&](const CounterChange& change) {
                                return record(connection, change);
                              });
                            });
  if (!recorded) return recorded.error();
  return true;
}

void WaitingChanges::setAside(const std::string& name, platform::SystemLog& log) {
  const bool moved = ::renameat(journal_.get(), name.c_str(), folder_, kAside) == 0;
  const std::string outcome = moved ? std::string("it is set aside as ") + kAside
                                    : "it can't be set aside: " + systemError().text;
  log.log(platform::LogLevel::error, "%s/%s/%s: not a batch of changes; %s", path_.c_str(), kFolder,
          shownText(name).c_str(), outcome.c_str());
}

// What a killed process left, and nobody is writing any more.
void WaitingChanges::removeStale(const std::string& name) {
  struct stat status;
  if (::fstatat(journal_.get(), name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0 &&
      status.st_mtime < std::time(nullptr) - kSecondsUntilStale) {
    ::unlinkat(journal_.get(), name.c_str(), 0);
  }
}

}  // namespace host
