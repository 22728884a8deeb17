#include "host/outbox/SubmissionSpool.h"

#include <fcntl.h>

#include <cerrno>

#include "host/files/FileTime.h"
#include "host/files/Files.h"
#include "host/outbox/SpoolFolder.h"
#include "plist/PropertyList.h"

namespace host {

namespace {

// Room for "-2", "-3", …; the spool's own bounds keep the number far below.
constexpr std::size_t kLongestStem = kLongestFileName -
                                     std::string_view(SpoolFolder::kOptionsSuffix).size() -
                                     std::string_view("-1000000000").size();

// A file being written; what fails first stays its error.
class OpenLog final : public platform::LogHandle {
 public:
  OpenLog(int folder, const char* name)
      : file_(::openat(folder, name, O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600)),
        error_(file_ ? 0 : errno) {}

  bool write(std::string_view bytes) override {
    if (error_ == 0 && bytes.size() > SpoolFolder::kMaximumBytes - size_) error_ = EFBIG;
    if (error_ == 0) error_ = writeAll(file_.get(), bytes);
    if (error_ == 0) size_ += bytes.size();
    return error_ == 0;
  }

  // 0, or why the file isn't whole on disk.
  int finish() {
    if (error_ == 0 && ::fsync(file_.get()) != 0) error_ = errno;
    return error_;
  }

  std::uint64_t size() const { return size_; }

 private:
  FileDescriptor file_;
  int error_;
  std::uint64_t size_ = 0;
};

// Adds what was written to `size`.
int writeUnfinished(const SpoolFolder& spool, const char* name,
                    const platform::LogSubmission::Writer& writer, std::uint64_t& size) {
  OpenLog file(spool.descriptor(), name);
  writer(file);
  size += file.size();
  return file.finish();
}

// Gives the unfinished files their names, the log last; takes them back when that fails.
int publish(int folder, const std::string& name, bool withOptions) {
  const std::string optionsName = name + SpoolFolder::kOptionsSuffix;
  if (withOptions) {
    const int error =
        renameToFreeName(folder, SpoolFolder::kUnfinishedOptions, folder, optionsName);
    if (error != 0) return error;
  }
  int error = renameToFreeName(folder, SpoolFolder::kUnfinishedLog, folder, name);
  if (error == 0) {
    if (::fsync(folder) == 0) return 0;
    error = errno;
    renameToFreeName(folder, name, folder, SpoolFolder::kUnfinishedLog);
  }
  if (withOptions) renameToFreeName(folder, optionsName, folder, SpoolFolder::kUnfinishedOptions);
  return error;
}

}  // namespace

bool SubmissionSpool::DiagnosticLogSubmissionEnabled() {
  return preferences_.QNSPreferencesGetBooleanValue("DiagnosticLogSubmissionEnabled",
                                                    "com.norba.quenset");
}

bool SubmissionSpool::QNSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                               const plist::Dictionary* options,
                                               const Writer& writer) {
  const std::string stem = std::string(logName) + "." + std::string(logType) + "." +
                           fileTime(clock_.now().secondsSince1970);
  const auto fail = [&](const char* why) {
    const std::string what = root_.hostPath(SpoolFolder::kPath, stem) + ": " + why;
    log_.log(platform::LogLevel::error, "Could not submit %s", what.c_str());
    if (unsubmitted_.empty()) unsubmitted_ = what;
    return false;
  };
  if (logType.empty() || logName.empty() || logName.starts_with('.') ||
      !isPlainFileName(stem, kLongestStem)) {
    return fail("not a file name");
  }
  std::optional<std::string> optionsText;
  if (options != nullptr) {
    auto text = plist::writeXML(*options);
    if (!text) return fail(text.error().text.c_str());
    optionsText = std::move(*text);
  }
  SpoolFolder spool(root_, log_);
  int error = spool.error();
  if (error == 0) error = submit(spool, stem, optionsText ? &*optionsText : nullptr, writer);
  return error == 0 || fail(errorText(error));
}

int SubmissionSpool::submit(SpoolFolder& spool, const std::string& stem, const std::string* options,
                            const Writer& writer) {
  std::uint64_t size = 0;
  int error = writeUnfinished(spool, SpoolFolder::kUnfinishedLog, writer, size);
  if (error == 0 && options != nullptr) {
    error = writeUnfinished(
        spool, SpoolFolder::kUnfinishedOptions,
        [options](platform::LogHandle& file) { file.write(*options); }, size);
  }
  if (error == 0) {
    error = spool.place(stem, "", size, [&spool, options](const std::string& name) {
      return publish(spool.descriptor(), name, options != nullptr);
    });
  }
  if (error != 0) {
    spool.remove(SpoolFolder::kUnfinishedLog);
    spool.remove(SpoolFolder::kUnfinishedOptions);
  }
  return error;
}

}  // namespace host
