// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the services of an interactive command have to say.
#pragma once

#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "host/Host.h"
#include "host/process/StandardErrorLog.h"
#include "platform/SystemLog.h"

namespace tools {

// Only errors, each as one line of the command's own ("nandinfo: …") on standard error; unless the
// environment names a level with MORVEND_LOG: then everything from it on, in the form of the system
// log. Any thread may write.
class CommandLog final : public platform::SystemLog {
 public:
  explicit CommandLog(std::string command);

  // Says what was kept and never taken.
  ~CommandLog() override;

  // The host of the environment, with this log.
  host::HostOptions hostOptions();

  // Whether the environment has asked for the system log itself.
  bool isSystemLog() const { return systemLog_.has_value(); }

  // From now on errors are kept, until they are taken: for who says in one line of his own why his
  // work failed. The system log keeps nothing.
  void keep();
  std::vector<std::string> take();

 private:
  void write(platform::LogLevel level, std::string_view format, std::string_view message) override;
  void say(const std::string& line);

  const std::string command_;
  std::optional<host::StandardErrorLog> systemLog_;
  std::mutex mutex_;
  bool keeps_ = false;
  std::vector<std::string> kept_;
};

}  // namespace tools
