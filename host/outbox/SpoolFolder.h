// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The folder of submitted logs, var/spool/morvend/submitted, as one process has it to itself:
// opened under its lock, cleared of what a killed run left, with its contents known.
//
// A log is a regular file; its options, if any, lie beside it under its name and kOptionsSuffix,
// and come and go with it.
#pragma once

#include <sys/stat.h>

#include <cstdint>
#include <functional>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include "host/files/DeviceRoot.h"
#include "host/files/Files.h"
#include "platform/SystemLog.h"

namespace host {

class SpoolFolder {
 public:
  static constexpr char kPath[] = "/var/spool/morvend/submitted";
  static constexpr char kOptionsSuffix[] = ".options.plist";

  // What the folder may hold. Options count for the bytes.
  static constexpr std::size_t kMaxLogs = 1000;
  static constexpr std::uint64_t kMaxBytes = std::uint64_t{64} << 20;

  // Files that aren't logs yet are kept under these names.
  static constexpr char kUnfinishedLog[] = ".log.new";
  static constexpr char kUnfinishedOptions[] = ".options.new";

  // Opens the folder, made when it is missing, waiting for its lock. Both are borrowed.
  static base::Result<std::unique_ptr<SpoolFolder>> open(const DeviceRoot& root,
                                                         platform::SystemLog& log);

  int descriptor() const { return folder_.get(); }

  // Gives a new log of this size a name: `stem`, with "-2", "-3", … where the log's or its options'
  // name is taken, and `extension`. The oldest logs make room first, each with a line in the log.
  // `put` moves the files in and synchronises the folder; std::errc::file_exists asks for the next
  // name.
  using Put = std::function<base::Result<void>(const std::string& name)>;
  base::Result<void> place(const std::string& stem, const std::string& extension,
                           std::uint64_t bytes, const Put& put);

  // Removes what stands under a name, if anything does.
  void remove(const std::string& name);

 private:
  struct Log {
    std::string name;
    timespec modified;
    std::uint64_t bytes;
  };

  SpoolFolder(const DeviceRoot& root, platform::SystemLog& log, FileDescriptor folder,
              FileLock lock)
      : root_(root), log_(log), folder_(std::move(folder)), lock_(std::move(lock)) {}
  base::Result<void> lookAround();
  void makeRoom(std::uint64_t bytes);
  bool isFree(const std::string& name) const;

  const DeviceRoot& root_;
  platform::SystemLog& log_;
  const FileDescriptor folder_;
  const FileLock lock_;
  std::set<std::string> names_;
  std::vector<Log> logs_;  // newest first
  std::uint64_t bytes_ = 0;
};

}  // namespace host
