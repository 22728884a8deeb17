// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/outbox/SubmissionSpool.h"

#include <fcntl.h>

#include <algorithm>
#include <optional>
#include <system_error>
#include <tuple>

#include "host/files/FileTime.h"
#include "host/files/Files.h"
#include "host/files/SystemError.h"
#include "host/outbox/SpoolFolder.h"
#include "plist/PropertyList.h"

namespace host {

namespace {

// Room for "-2", "-3", …; the spool's own bounds keep the number far below.
constexpr std::size_t kMaxStem = kMaxFileName -
                                 std::string_view(SpoolFolder::kOptionsSuffix).size() -
                                 std::string_view("-1000000000").size() - kMaxPendingPrefix;

// A file being written.
class OpenLog final : public platform::LogHandle {
 public:
  explicit OpenLog(const FileDescriptor& file) : file_(file) {}

  bool write(std::string_view bytes) override {
    if (outcome_ && bytes.size() > SpoolFolder::kMaxBytes - size_) outcome_ = systemError(EFBIG);
    if (outcome_) outcome_ = writeAll(file_.get(), bytes);
    if (outcome_) size_ += bytes.size();
    return static_cast<bool>(outcome_);
  }

  // Its size, once it is whole on disk; else what failed first.
  base::Result<std::uint64_t> finish() {
    if (!outcome_) return outcome_.error();
    if (::fsync(file_.get()) != 0) return systemError();
    return size_;
  }

 private:
  const FileDescriptor& file_;
  base::Result<void> outcome_;
  std::uint64_t size_ = 0;
};

// The size of what was written.
base::Result<std::uint64_t> writeUnfinished(const SpoolFolder& spool, const char* name,
                                            const platform::LogSubmission::Writer& writer) {
  const auto file = makeFile(spool.descriptor(), name);
  if (!file) return file.error();
  OpenLog log(*file);
  writer(log);
  return log.finish();
}

// Gives the unfinished files their names, the log last; takes them back when that fails. Names of
// logs that wait are brought to disk together, later.
base::Result<void> nameUnfinished(const SpoolFolder& spool, const std::string& name,
                                  bool withOptions, bool waits) {
  const int folder = spool.descriptor();
  const std::string optionsName = name + SpoolFolder::kOptionsSuffix;
  if (withOptions) {
    auto named = renameToFreeName(folder, spool.unfinishedOptions(), folder, optionsName);
    if (!named) return named;
  }
  auto named = renameToFreeName(folder, spool.unfinishedLog(), folder, name);
  if (named) {
    if (!waits) named = checked(::fsync(folder));
    if (named) return named;
    std::ignore = renameToFreeName(folder, name, folder, spool.unfinishedLog());
  }
  if (withOptions) {
    std::ignore = renameToFreeName(folder, optionsName, folder, spool.unfinishedOptions());
  }
  return named;
}

// Leaves the unfinished files behind when it fails.
base::Result<void> writeAndName(SpoolFolder& spool, const std::string& stem,
                                const std::optional<std::string>& options,
                                const platform::LogSubmission::Writer& writer,
                                const PendingRun& run) {
  auto size = writeUnfinished(spool, spool.unfinishedLog(), writer);
  if (!size) return size.error();
  if (options) {
    const auto more = writeUnfinished(spool, spool.unfinishedOptions(),
                                      [&](platform::LogHandle& file) { file.write(*options); });
    if (!more) return more.error();
    *size += *more;
  }
  return spool.place(stem, "", *size, [&](const std::string& name) {
    return nameUnfinished(spool, run.nameFor(name), options.has_value(), run.isOn());
  });
}

}  // namespace

bool SubmissionSpool::DiagnosticLogSubmissionEnabled() {
  const auto consent =
      preferences_.QNSPreferencesGetValue(platform::kConsentKey, platform::kConsentDomain);
  const auto* number = consent ? consent->as<plist::Number>() : nullptr;
  return number != nullptr && !number->isReal() && number->int64Value() == 1;
}

bool SubmissionSpool::QNSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                               const plist::Dictionary* options,
                                               const Writer& writer) {
  const std::string stem = std::string(logName) + "." + std::string(logType) + "." +
                           fileTime(clock_.now().secondsSince1970);
  const bool named = !logType.empty() && !logName.empty() && !logName.starts_with('.') &&
                     isPlainFileName(stem, kMaxStem);
  const auto attempt = [&] { return submit(stem, options, writer); };
  auto submitted = named ? root_.patience()(attempt) : base::Error{"not a file name"};
  while (!submitted && submitted.error().is(std::errc::no_space_on_device) && removeOldest()) {
    submitted = attempt();
  }
  submitted = std::move(submitted).at(root_.hostPath(SpoolFolder::kPath, stem));
  if (submitted) return true;
  log_.log(platform::LogLevel::error, "Could not submit %s", submitted.error().text.c_str());
  if (submitted_) submitted_ = submitted;
  return false;
}

base::Result<void> SubmissionSpool::submit(const std::string& stem,
                                           const plist::Dictionary* options, const Writer& writer) {
  std::optional<std::string> optionsText;
  if (options != nullptr) {
    auto text = plist::writeXML(*options);
    if (!text) return text.error();
    optionsText = *std::move(text);
  }
  // What waits is let go under the lock, by this run or by the next.
  using Unlocked = SpoolFolder::Unlocked;
  const auto spool =
      SpoolFolder::open(root_, log_, run_.isOn() ? Unlocked::allowed : Unlocked::refused);
  if (!spool) return spool.error();
  auto submitted = writeAndName(**spool, stem, optionsText, writer, run_);
  if (!submitted) {
    (*spool)->remove((*spool)->unfinishedLog());
    (*spool)->remove((*spool)->unfinishedOptions());
  }
  return submitted;
}

bool SubmissionSpool::removeOldest() {
  const auto spool = SpoolFolder::open(root_, log_);
  return spool && (*spool)->removeOldest();
}

base::Result<void> SubmissionSpool::synchronise() {
  const auto folder = root_.openFolder(SpoolFolder::kPath, DeviceRoot::Missing::fails);
  if (!folder) return unlessMissing(folder.error(), root_.hostPath(SpoolFolder::kPath));
  return checked(::fsync(folder->get())).at(root_.hostPath(SpoolFolder::kPath));
}

base::Result<void> SubmissionSpool::settle(const Leaves& leaves) {
  // The spool is looked through only where something waits.
  const auto folder = root_.openFolder(SpoolFolder::kPath, DeviceRoot::Missing::fails);
  if (!folder) return unlessMissing(folder.error(), root_.hostPath(SpoolFolder::kPath));
  const auto names = namesInFolder(folder->get());
  const auto waits = [](const std::string& name) { return parsePendingName(name).has_value(); };
  if (names && std::ranges::none_of(*names, waits)) return {};
  const auto spool = SpoolFolder::open(root_, log_);
  auto settled = spool ? (*spool)->settle(leaves) : spool.error();
  return std::move(settled).at(root_.hostPath(SpoolFolder::kPath));
}

}  // namespace host
