// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Where the counters database lies, and one connection to it.
//
// Every process that opens the database, writes to it or checkpoints it holds the store's lock: a
// lock on the folder that the database lies in. So no two connections write or checkpoint at once,
// and a database that is found damaged is set aside by one process while the others notice, the
// next time they hold the lock, that the file is another.
#pragma once

#include <sys/types.h>

#include <functional>
#include <memory>
#include <optional>
#include <span>
#include <string>

#include "base/Result.h"
#include "host/counters/CounterChange.h"
#include "host/counters/CounterSchema.h"
#include "host/counters/SQLite.h"
#include "host/files/DeviceRoot.h"
#include "host/files/FileLock.h"
#include "platform/SystemLog.h"

namespace host {

class WaitingChanges;

// What the connections of one store share.
struct CounterPlace {
  const DeviceRoot& root;
  platform::SystemLog& log;
  // The device path of the home folder; none: there is no database.
  std::function<std::optional<std::string>()> home;
  // Called once for each database that was set aside, with the store's lock held.
  std::function<void()> foundDamaged;
  // How who waits passes the time.
  sqlite::Pause pause = LockWait::sleepFor;
};

// What fails and may pass is tried again, three times in some seconds, and the store's lock is
// waited for within its limit. Once that was of no use, nothing is waited for until something
// succeeds.
class CounterDatabase {
 public:
  // Nothing is opened before it is needed. The place is borrowed. Links to the database are
  // followed, within the device root, only for who does nothing but read; what is found through
  // them is left as it is, damage included.
  CounterDatabase(const CounterPlace& place, DeviceRoot::Links links);
  ~CounterDatabase();

  // Runs the work on a connection for reading, once at most. With no database there is nothing to
  // be done, and the work isn't run; but without a home folder that is a failure. Damage is said by
  // the error, and kPassing what may go well another time. What waits in the journal is recorded
  // before, where that can be done.
  using Work = std::function<base::Result<void>(sqlite::Connection&)>;
  base::Result<void> read(const Work& work);

  // Runs the work, which writes, with the lock held, after what waits in the journal was recorded;
  // once more, on a new database, when the first turns out to be damaged, which is logged. The work
  // must neither use this object nor open another connection to the database. What was written
  // survives the process, and the loss of power too if it is to be on disk.
  enum class Missing { create, skip };
  enum class Kept { bySystem, onDisk };
  base::Result<void> write(Missing missing, const Work& work, Kept kept = Kept::bySystem);

  // Whether a write that failed so is one for the journal: the database refuses it for now.
  static bool refusedForNow(const base::Error& error);
  // Leaves changes in the journal; they are on disk then.
  base::Result<void> keepWaiting(std::span<const CounterChange> changes);

  // Brings everything into the database file and closes it; nothing stands beside it then, unless
  // another connection is open.
  base::Result<void> settle();

 private:
  struct Identity {
    dev_t device = 0;
    ino_t inode = 0;  // 0: there is no file
    nlink_t names = 0;
    bool operator==(const Identity&) const = default;
  };
  using Use = DatabaseUse;

  base::Result<void> patiently(const std::function<base::Result<void>()>& attempt);
  base::Result<FileLock> lock();
  base::Result<void> readOnce(const Work& work);
  base::Result<void> connectToRead();
  base::Error failedToRead(const base::Error& why);
  base::Result<void> writeOnce(Missing missing, const Work& work, Kept kept);
  base::Result<void> recordWaiting(WaitingChanges& waiting);
  bool mayBeWritten() const;
  base::Result<void> synchronise();
  base::Result<bool> openFolder(DeviceRoot::Missing missing);
  base::Result<void> follow(const std::string& folder);
  base::Result<Identity> identity() const;
  base::Result<void> create();
  base::Result<void> connect(Use use);
  base::Result<void> openAs(Use use, const std::string& path, sqlite::Connection::Access access);
  std::optional<base::Error> setAside(const base::Error& why);
  std::string path() const;

  const CounterPlace& place_;
  const DeviceRoot::Links links_;
  std::string folderPath_;  // of the host, for messages
  FileDescriptor folder_;
  std::string name_;  // in the folder; not the usual one when a link led there
  bool linked_ = false;
  Identity opened_;
  std::unique_ptr<sqlite::Connection> connection_;
  bool patient_ = true;
};

}  // namespace host
