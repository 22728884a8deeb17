// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The folder of submitted logs, var/spool/morvend/submitted, as one process has it to itself:
// opened under its lock, cleared of what a killed run left, with its contents known. Logs that wait
// can be put there without the lock, too.
//
// A log is a regular file; its options, if any, lie beside it under its name and kOptionsSuffix,
// and come and go with it.
#pragma once

#include <sys/stat.h>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "host/files/DeviceRoot.h"
#include "host/files/Files.h"
#include "host/files/Pending.h"
#include "host/outbox/LineFiles.h"
#include "platform/SystemLog.h"

namespace host {

class SpoolFolder {
 public:
  static constexpr char kPath[] = "/var/spool/morvend/submitted";
  static constexpr char kOptionsSuffix[] = ".options.plist";

  // What the folder may hold, with what waits. Options count for the bytes. A quarter is kept from
  // structured logs: they can't push out all others.
  static constexpr std::size_t kMaxLogs = 1000, kMaxStructuredLogs = 750;
  static constexpr std::uint64_t kMaxBytes = std::uint64_t{64} << 20;
  static constexpr std::uint64_t kMaxStructuredBytes = std::uint64_t{48} << 20;
  static constexpr char kStructured[] = "structured-";  // what their names begin with

  // Files that aren't logs yet are kept under these names; without the lock, under others.
  static constexpr char kUnfinishedLog[] = ".log.new";
  static constexpr char kUnfinishedOptions[] = ".options.new";
  static constexpr char kUnlockedLog[] = ".log.new-unlocked";
  static constexpr char kUnlockedOptions[] = ".options.new-unlocked";

  // Opens the folder, made when it is missing, waiting for its lock. `unlocked` allows what is then
  // opened without, with an error line, when somebody holds it for too long: nothing is removed
  // from there, and what is put there has to wait. Root and log are borrowed.
  enum class Unlocked { refused, allowed };
  static base::Result<std::unique_ptr<SpoolFolder>> open(const DeviceRoot& root,
                                                         platform::SystemLog& log,
                                                         Unlocked unlocked = Unlocked::refused);

  int descriptor() const { return folder_.get(); }
  const char* unfinishedLog() const { return lock_ ? kUnfinishedLog : kUnlockedLog; }
  const char* unfinishedOptions() const { return lock_ ? kUnfinishedOptions : kUnlockedOptions; }

  // Gives a new log of this size a name: `stem`, with "-2", "-3", … where the log's or its options'
  // name is taken, and `extension`. The oldest logs make room first, each with a line in the log.
  // `put` moves the files in and synchronises the folder; std::errc::file_exists asks for the next
  // name.
  using Put = std::function<base::Result<void>(const std::string& name)>;
  base::Result<void> place(const std::string& stem, const std::string& extension,
                           std::uint64_t bytes, const Put& put);

  // Removes what stands under a name, if anything does.
  void remove(const std::string& name);

  // Removes the oldest structured log or, where there is none, the oldest log, for the sake of one
  // that the disk has no room for, with a line in the log. False when there is none.
  bool removeOldest();

  // Gives the logs that wait their names where `leaves` says so of their run's day, and removes the
  // others. A log comes with its options, or not at all. The first failure.
  base::Result<void> settle(const Leaves& leaves);

 private:
  struct Log {
    std::string name;
    timespec modified;
    std::uint64_t bytes;
  };

  SpoolFolder(const DeviceRoot& root, platform::SystemLog& log, FileDescriptor folder,
              std::optional<FileLock> lock)
      : root_(root), log_(log), folder_(std::move(folder)), lock_(std::move(lock)) {}
  base::Result<void> lookAround();
  void makeRoom(const std::string& stem, std::uint64_t bytes);
  bool remove(std::vector<Log>::iterator log, const char* why);
  base::Result<void> publish(const std::vector<std::string>& names, const std::string& waiting,
                             const PendingName& pending);
  static bool isStructured(const Log& log);
  bool isFree(const std::string& name) const;

  const DeviceRoot& root_;
  platform::SystemLog& log_;
  const FileDescriptor folder_;
  const std::optional<FileLock> lock_;
  std::set<std::string> names_;
  std::vector<Log> logs_;  // newest first
  std::uint64_t bytes_ = 0;
};

}  // namespace host
