// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The journal beside the counters database: changes that the database refused for now.
//
// A folder beside the database holds a file for each batch of them. A batch appears whole or not at
// all, and is on disk then; no lock is needed to leave one, since whoever holds it may be the one
// that is stuck. Whoever writes to the database next, with the store's lock held, records what
// waits, each batch once: the transaction that records it records its name too, so that a kill
// before its file is gone doesn't record it again. Batches are recorded in the order of their
// names, in which each comes after those that were there when it was kept.
#pragma once

#include <cstddef>
#include <functional>
#include <optional>
#include <span>
#include <string>
#include <utility>

#include "base/Result.h"
#include "host/counters/CounterChange.h"
#include "host/counters/SQLite.h"
#include "host/files/FileDescriptor.h"
#include "platform/SystemLog.h"

namespace host {

// What may wait: more is refused.
inline constexpr std::size_t kMaxWaitingBatches = 1000;
inline constexpr std::size_t kMaxWaitingBytes = std::size_t{8} << 20;

// Makes the table of the names of batches that are recorded and not yet removed.
inline constexpr char kWaitingTable[] =
    "CREATE TABLE IF NOT EXISTS waiting_recorded(batch TEXT PRIMARY KEY NOT NULL) STRICT";

// Leaves a batch in the journal of the database in an open folder; it is on disk then.
base::Result<void> keepWaiting(int folder, std::span<const CounterChange> changes);

class WaitingChanges {
 public:
  // The journal of the database in an open folder, whose path is given for the log; none if there
  // is none. What stands in its place and is no folder is an error.
  static base::Result<std::optional<WaitingChanges>> open(int folder, const std::string& path);

  // Records what waits, and then removes it; `synchronise` brings to disk what the connection has
  // committed. What is no batch is set aside beside the database, which is logged.
  base::Result<void> recordAll(sqlite::Connection& connection,
                               const std::function<base::Result<void>()>& synchronise,
                               platform::SystemLog& log);

 private:
  WaitingChanges(int folder, FileDescriptor journal, std::string path)
      : folder_(folder), journal_(std::move(journal)), path_(std::move(path)) {}

  base::Result<bool> recordBatch(sqlite::Connection& connection, const std::string& name);
  void setAside(const std::string& name, platform::SystemLog& log);
  void removeStale(const std::string& name);

  int folder_;  // borrowed
  FileDescriptor journal_;
  std::string path_;
};

}  // namespace host
