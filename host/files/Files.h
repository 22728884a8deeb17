// What the host does with single files: read one whole, replace one whole, append a line; and with
// their names.
//
// Functions that write return 0 or an error number. A name that is taken by anything but a regular
// file is refused with EINVAL; links are never followed. A file that has other names is replaced or
// renamed under this one, but not written to (EMLINK). Files are made with mode 0600.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "base/Result.h"
#include "host/files/FileDescriptor.h"

namespace host {

// What an error number of these functions says: "not a regular file" for EINVAL, "a file with
// several names" for EMLINK, for ELOOP that links are in the way, else the system's text.
const char* errorText(int error);

// The bytes of an open regular file, at most `maximum` of them. Anything else than a regular file
// is an error; the error is an error number's text.
base::Result<std::string> readRegularFile(int file, std::size_t maximum);

// The names in an open folder, "." and ".." left out, in bytewise order. 0 or an error number.
int namesInFolder(int folder, std::vector<std::string>& names);

// The longest name that a file can have, in bytes.
inline constexpr std::size_t kLongestFileName = 255;

// Whether a text from elsewhere can be a file's name, or part of one, that stays in its folder: not
// empty, "." or "..", without "/" and NUL, and no longer than `longest`.
bool isPlainFileName(std::string_view name, std::size_t longest);

// A text from elsewhere as it may stand in one line of the log: cut when it is long, with "?" for
// control characters.
std::string shownText(std::string_view text);

// Writes all the bytes, going on after short writes and signals.
int writeAll(int file, std::string_view bytes);

// Writes `name` beside, synchronises it and renames it over: the file is the old or the new one,
// whole, whatever happens. Callers serialise: two replacements of one name use one name beside.
int replaceFile(int folder, const std::string& name, std::string_view bytes);

// Renames a file, within a folder or from one to another; EEXIST when the new name is taken, by
// whatever it is.
int renameToFreeName(int fromFolder, const std::string& from, int toFolder, const std::string& to);

// Whether a name in an open folder is a link.
bool isLink(int folder, const std::string& name);

struct RolledOver {
  int error = 0;
  std::string at;                     // what the error is about, or whose content went; or neither
  std::vector<std::string> inTheWay;  // numbers that were passed over: not regular files
};

// Renames a file to <name>.1, that to <name>.2, and so on up to the first number that is free;
// where none is, the content of the last one goes. `oldest` is the last number. A kill leaves at
// most a free number.
RolledOver rollOver(int folder, const std::string& name, int oldest);

// Appends lines, whose line feeds the text already holds, to a file that holds lines; makes the
// file when it is missing. A line is in the file whole or not at all: what a failed write left is
// taken back, all of this call's lines, and a line that an earlier failure left unfinished is
// removed first.
int appendLines(int folder, const std::string& name, std::string_view lines);

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

}  // namespace host
