// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/c/Ask.h"

#include <algorithm>
#include <mutex>
#include <utility>
#include <vector>

#include "NANDInfo/Controller.h"
#include "NANDInfo/c/Options.h"
#include "NANDInfo/controller/APIErrorScope.h"
#include "NANDInfo/interface/Exporters.h"
#include "NANDInfo/queries/BufferDecoders.h"
#include "NANDInfo/queries/ControllerWatch.h"
#include "NANDInfo/queries/Outcome.h"
#include "NANDInfo/queries/Queries.h"
#include "base/Text.h"
#include "host/Host.h"
#include "platform/StandardStreams.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

namespace {

// Errors, as the reasons of a failure.
class KeptLog final : public platform::SystemLog {
 public:
  KeptLog() : SystemLog(platform::LogLevel::error) {}

  std::vector<std::string> take() {
    const std::lock_guard lock(mutex_);
    return std::exchange(errors_, {});
  }

 private:
  void write(platform::LogLevel, std::string_view, std::string_view message) override {
    if (message.ends_with('\n')) message.remove_suffix(1);
    const std::lock_guard lock(mutex_);
    errors_.emplace_back(message);
  }

  std::mutex mutex_;
  std::vector<std::string> errors_;
};

// The process's streams are its own.
class NoStreams final : public platform::StandardStreams {
 public:
  void writeError(std::string_view) override {}
  void writeOutput(std::string_view) override {}
};

host::HostOptions optionsOf(const std::string& root, KeptLog& log) {
  return {.root = root, .ignoresBrokenPipes = false, .log = &log};
}

// The services with streams and a table of drivers of their own.
struct Apart : Services {
  platform::StandardStreams& streams;
};
Services apart(const Services& services, NoStreams& streams, ExporterTable& table) {
  Services own(Apart{services, streams});
  own.exporters = table.data();
  return own;
}

Reply usage(std::string_view name, const base::Error& error) {
  return {NANDINFO_USAGE, error.at(name).text};
}

Reply unknown(const char* what, std::string_view name) {
  return {NANDINFO_USAGE,
          base::format("there is no %s '%.*s'", what,
                       static_cast<int>(std::min<std::size_t>(name.size(), 100)), name.data())};
}

Reply replyOf(Outcome outcome, const std::vector<std::string>& reasons) {
  if (const auto why = failureOf(outcome)) {
    return {NANDINFO_FAILED, withReasons(*why, reasons), std::move(outcome.value)};
  }
  std::string remarks;
  for (const std::string& reason : reasons) remarks += (remarks.empty() ? "" : "; ") + reason;
  return {NANDINFO_OK, std::move(remarks), std::move(outcome.value)};
}

}  // namespace

Reply look(const std::string& root) {
  const auto there = host::DeviceRoot(root).isThere();
  return there ? Reply() : Reply{NANDINFO_NO_DEVICE, there.error().text};
}

Reply collect(const std::string& root, std::string_view name, const nandinfo_options* options) {
  const auto known = queries();
  const auto query = std::find_if(known.begin(), known.end(),
                                  [name](const Query& row) { return nameOf(row) == name; });
  if (query == known.end()) return unknown("name", name);
  const auto read = readOptions(options, query->takes);
  if (!read) return usage(name, read.error());
  const APIErrorScope firstMessage;
  KeptLog log;
  const host::Host host(optionsOf(root, log));
  if (const auto there = host.root().isThere(); !there) {
    return {NANDINFO_NO_DEVICE, there.error().text};
  }
  NoStreams streams;
  ExporterTable table = freshExporters();
  ControllerWatch watch(apart(host.services(), streams, table), ControllerWatch::DirectTexts::kept);
  auto answer = query->ask(watch.services(), *read);
  const std::string problem = query->needs == Needs::answer ? watch.problem() : "";
  std::vector<std::string> reasons = log.take();
  if (!problem.empty()) return {NANDINFO_NO_CONTROLLER, withReasons(problem, reasons)};
  reasons.insert(reasons.end(), watch.texts().begin(), watch.texts().end());
  return replyOf(answer ? Outcome(*std::move(answer)) : Outcome(), reasons);
}

Reply decode(std::string_view kind, Bytes bytes, const nandinfo_options* options) {
  const auto known = bufferDecoders();
  const auto decoder = std::find_if(known.begin(), known.end(),
                                    [kind](const BufferDecoder& row) { return row.kind == kind; });
  if (decoder == known.end()) return unknown("kind", kind);
  const auto read = readOptions(options, decoder->takes);
  if (!read) return usage(kind, read.error());
  if (bytes.size() > kMaxBuffer) return {NANDINFO_FAILED, "longer than 16 MiB"};
  const APIErrorScope firstMessage;
  return replyOf(decoder->decode(bytes, *read), {});
}

}  // namespace NANDInfo
