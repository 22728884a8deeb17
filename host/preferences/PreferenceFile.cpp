// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/preferences/PreferenceFile.h"

#include <fcntl.h>

#include <limits>
#include <system_error>
#include <utility>

#include "host/files/Files.h"
#include "host/files/SystemError.h"
#include "plist/PropertyList.h"

namespace host {

namespace {

// What is kept of a file between reads.
constexpr std::size_t kMaxStored = std::size_t{8} << 20;

bool sameFile(const struct stat& a, const struct stat& b) {
  return a.st_dev == b.st_dev && a.st_ino == b.st_ino && a.st_size == b.st_size &&
         a.st_mtim.tv_sec == b.st_mtim.tv_sec && a.st_mtim.tv_nsec == b.st_mtim.tv_nsec;
}

std::int64_t saturatingSum(std::int64_t a, std::int64_t b) {
  std::int64_t sum = 0;
  if (!__builtin_add_overflow(a, b, &sum)) return sum;
  using Limits = std::numeric_limits<std::int64_t>;
  return b > 0 ? Limits::max() : Limits::min();
}

}  // namespace

PreferenceFile::PreferenceFile(const DeviceRoot& root, platform::SystemLog& log,
                               std::string_view user, std::string_view domain)
    : root_(root),
      log_(log),
      folder_("/var/preferences/" + std::string(user)),
      name_(std::string(domain) + ".plist") {}

base::Result<std::optional<plist::Value>> PreferenceFile::value(std::string_view key) {
  if (const plist::Value* value = set_.find(key)) return *value;
  if (removed_.contains(key)) return std::nullopt;
  load(false);
  // Where a folder should be and is none, there is certainly no file.
  if (state_ == State::unreadable && !readError_->is(std::errc::not_a_directory)) {
    return readError_->at(path());
  }
  const plist::Value* stored = stored_.find(key);
  std::optional<plist::Value> value = stored != nullptr ? std::optional(*stored) : std::nullopt;
  if (isLarge_) takeStored();
  return value;
}

void PreferenceFile::change(std::string_view key, const plist::Value* value) {
  if (value != nullptr) {
    removed_.erase(std::string(key));
    set_.set(key, *value);
  } else {
    set_.remove(key);
    removed_.emplace(key);
  }
}

void PreferenceFile::flush() {
  if (!held_ && (!set_.empty() || !removed_.empty())) write(nullptr);
}

base::Result<void> PreferenceFile::written() const {
  return base::Result<void>(written_).at(path());
}

void PreferenceFile::add(std::string_view key, std::int64_t delta) {
  const auto addition = [key, delta](plist::Dictionary& values) {
    const plist::Number* number = values.number(key);
    values.set(key, saturatingSum(number != nullptr ? number->int64Value() : 0, delta));
  };
  write(addition);
  if (held_ && set_.find(key) != nullptr) addition(set_);
}

// Reading

void PreferenceFile::load(bool evenIfUnchanged) {
  const auto file = root_.openForReading(folder_ + "/" + name_);
  if (!file) {
    const bool isSocket = file.error().is(std::errc::no_such_device_or_address);
    if (isSocket) return fail(State::broken, notRegular());
    if (!isMissing(file.error())) return fail(State::unreadable, file.error());
    state_ = State::absent;
    stored_ = {};
    return;
  }
  struct stat status;
  const auto looked = root_.patience()([&] { return checked(::fstat(file->get(), &status)); });
  if (!looked) return fail(State::unreadable, looked.error());
  const bool known =
      (state_ == State::whole || state_ == State::broken) && sameFile(status, status_);
  if (known && !evenIfUnchanged) return;
  if (!known) readError_.reset();
  status_ = status;
  if (!S_ISREG(status.st_mode)) return fail(State::broken, notRegular());
  if (static_cast<std::size_t>(status_.st_size) > plist::kMaxSize) {
    return fail(State::broken, {"larger than 16 MiB"});
  }
  const auto bytes =
      root_.patience()([&] { return readRegularFile(file->get(), plist::kMaxSize); });
  if (!bytes) return fail(State::unreadable, bytes.error());
  auto value = plist::read(*bytes);
  if (!value) return fail(State::broken, value.error());
  auto* dictionary = value->as<plist::Dictionary>();
  if (dictionary == nullptr) return fail(State::broken, {"the top level is not a dictionary"});
  state_ = State::whole;
  isLarge_ = plist::memoryOf(*value) > kMaxStored;
  stored_ = std::move(*dictionary);
}

// What was read, to be read anew when it is asked for.
plist::Dictionary PreferenceFile::takeStored() {
  if (state_ == State::whole) state_ = State::absent;
  return std::exchange(stored_, {});
}

void PreferenceFile::fail(State state, const base::Error& why) {
  state_ = state;
  stored_ = {};
  if (readError_ && why.text == readError_->text) return;
  readError_ = why;
  log_.log(platform::LogLevel::error, "Could not read %s: %s; it reads as empty%s", path().c_str(),
           why.text.c_str(),
           state == State::broken ? " and is kept as .corrupt when it is replaced" : "");
}

// Writing

void PreferenceFile::forgetChanges() {
  set_ = {};
  removed_.clear();
}

void PreferenceFile::write(const Edit& edit) {
  auto merged = merge(edit);
  if (merged) {
    if (!held_) forgetChanges();
  } else if (written_ || merged.error().text != written_.error().text) {
    log_.log(platform::LogLevel::error, "Could not write %s: %s", path().c_str(),
             merged.error().text.c_str());
  }
  written_ = std::move(merged);
}

base::Result<void> PreferenceFile::merge(const Edit& edit) {
  const bool adds = edit != nullptr || !set_.empty();
  const auto folder =
      root_.openFolder(folder_, adds ? DeviceRoot::Missing::create : DeviceRoot::Missing::fails);
  if (!folder && isMissing(folder.error()) && !adds) return {};
  if (!folder) return folder.error();
  const auto lock = FileLock::take(folder->get(), {log_, root_.hostPath(folder_)});
  if (!lock) return lock.error().at("its folder");
  auto free = root_.patience()([&] { return refuseLinks(folder->get(), name_); });
  if (!free) return free;
  // Another process's writing may leave all that is compared as it was.
  load(true);
  if (state_ == State::unreadable) return *readError_;

  // Compared as they are written: values of two types may be equal. What was read is changed where
  // it is, and read anew if it is asked for again.
  const State was = state_;
  plist::Value all = takeStored();
  const auto before = plist::writeXML(all);
  auto& merged = *all.as<plist::Dictionary>();
  if (!held_) {
    for (const std::string& key : removed_) merged.remove(key);
    for (const plist::Dictionary::Entry& entry : set_) merged.set(entry.key, entry.value);
  }
  if (edit != nullptr) edit(merged);
  const auto after = plist::writeXML(all);
  if (!after) return after.error();
  if (before && *before == *after) {
    stored_ = std::move(merged);
    state_ = was;
    return {};
  }
  if (after->size() > plist::kMaxSize) return base::Error{"it would be larger than 16 MiB"};

  if (was == State::broken) {
    auto kept =
        root_.patience()([&] { return keepBeside(folder->get(), name_, name_ + ".corrupt"); });
    if (!kept) return std::move(kept).at("it can't be kept as .corrupt");
  }
  return root_.patience()([&] { return replaceFile(folder->get(), name_, *after); });
}

}  // namespace host
