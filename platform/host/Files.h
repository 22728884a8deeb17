// What the host does with single files: read one whole, replace one whole, append a line.
//
// Functions that write return 0 or an error number. A name that is taken by anything but a regular
// file is refused with EINVAL; links are never followed. Files are made with mode 0600.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "platform/Result.h"
#include "platform/host/FileDescriptor.h"

namespace platform::host {

// The bytes of an open regular file, at most `maximum` of them. Anything else than a regular file
// is an error; the error is an error number's text.
Result<std::string> readRegularFile(int file, std::size_t maximum);

// Writes all the bytes, going on after short writes and signals.
int writeAll(int file, std::string_view bytes);

// Writes `name` beside, synchronises it and renames it over: the file is the old or the new one,
// whole, whatever happens. Callers serialise: two replacements of one name use one name beside.
int replaceFile(int folder, const std::string& name, std::string_view bytes);

// Appends one line, whose line feed the text already holds, to a file that holds lines; makes the
// file when it is missing. A line is in the file whole or not at all: what a failed write left is
// taken back, and a line that an earlier failure left unfinished is removed first.
int appendLine(int folder, const std::string& name, std::string_view line);

// An exclusive lock on an open file or folder, waiting for it; released at the end of the scope.
// The descriptor is borrowed.
class FileLock {
 public:
  explicit FileLock(int file);
  ~FileLock();
  FileLock(const FileLock&) = delete;
  FileLock& operator=(const FileLock&) = delete;

 private:
  int file_;
};

}  // namespace platform::host
