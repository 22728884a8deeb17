// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/outbox/ServitaLogFiles.h"

#include "host/files/Files.h"
#include "host/files/SystemError.h"

namespace host {

namespace {

constexpr char kFolder[] = "/var/log/servita";
constexpr std::string_view kSuffix = ".log";
constexpr int kOldest = 7;

}  // namespace

void ServitaLogFiles::rollServitaLogs() {
  const std::string path = root_.hostPath(kFolder);
  const auto report = [this](const base::Error& error) {
    log_.log(platform::LogLevel::error, "Could not roll %s", error.text.c_str());
  };
  const auto folder = root_.openFolder(kFolder, DeviceRoot::Missing::fails);
  if (!folder) {
    if (!isMissing(folder.error())) report(folder.error().at(path));
    return;
  }
  const auto lock = FileLock::take(folder->get(), {log_, path});
  if (!lock) return report(lock.error().at(path));
  const auto names = namesInFolder(folder->get());
  if (!names) return report(names.error().at(path));
  for (const std::string& log : *names) {
    if (log.size() <= kSuffix.size() || !log.ends_with(kSuffix)) continue;
    const auto rolled = rollOver(folder->get(), path, log, kOldest);
    if (!rolled) {
      report(rolled.error());
      continue;
    }
    for (const std::string& name : rolled->inTheWay) {
      report(notRegular().at(root_.hostPath(kFolder, name)));
    }
  }
}

}  // namespace host
