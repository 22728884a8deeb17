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
#include <string>

#include "host/files/DeviceRoot.h"
#include "platform/SystemLog.h"

namespace host {

namespace sqlite {
class Connection;
struct Failure;
}  // namespace sqlite

// What the connections of one store share.
struct CounterPlace {
  const DeviceRoot& root;
  platform::SystemLog& log;
  // The device path of the home folder; none: there is no database.
  std::function<std::optional<std::string>()> home;
  // Called once for each database that was set aside, with the store's lock held.
  std::function<void()> foundDamaged;
};

class CounterDatabase {
 public:
  // Nothing is opened before it is needed. The place is borrowed. Links to the database are
  // followed, within the device root, only for who does nothing but read; what is found through
  // them is left as it is, damage included.
  CounterDatabase(const CounterPlace& place, DeviceRoot::Links links);
  ~CounterDatabase();

  // Runs the work on a connection for reading. True when it could be done; with no database there
  // is nothing to be done, and the work isn't run. A failure is logged; no home folder is one.
  using Work = std::function<void(sqlite::Connection&)>;
  bool read(const Work& work);

  // Runs the work, which writes, with the lock held; once more, on a new database, when the first
  // turns out to be damaged. Returns the empty text, or what went wrong and where. The work must
  // neither use this object nor open another connection to the database.
  enum class Missing { create, skip };
  std::string write(Missing missing, const Work& work);

  // Brings everything into the database file and closes it; nothing stands beside it then, unless
  // another connection is open. Returns as `write` does.
  std::string settle();

 private:
  struct Identity {
    dev_t device = 0;
    ino_t inode = 0;  // 0: there is no file
    nlink_t names = 0;
    bool operator==(const Identity&) const = default;
  };
  enum class Use { read, write, create };

  bool openFolder(DeviceRoot::Missing missing, std::string& error);
  std::string follow(const std::string& folder);
  std::optional<Identity> identity() const;
  std::string create();
  sqlite::Failure connect(Use use);
  void verify(Use use);
  void setAside(const std::string& why);
  std::string located(const std::string& text) const;

  const CounterPlace& place_;
  const DeviceRoot::Links links_;
  std::string folderPath_;  // of the host, for messages
  FileDescriptor folder_;
  std::string name_;  // in the folder; not the usual one when a link led there
  bool linked_ = false;
  Identity opened_;
  std::unique_ptr<sqlite::Connection> connection_;
};

}  // namespace host
