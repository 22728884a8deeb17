// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the host does with single files: read one whole, replace one whole, append a line; and with
// their names.
//
// A name that is taken by anything but a regular file is refused (notRegular), a link too, and so
// is a file that has other names (severalNames): it is renamed under this one, but neither written
// to nor replaced. Files are made with mode 0600.
#pragma once

#include <cstddef>
#include <cstdint>
#include <limits>
#include <string>
#include <string_view>
#include <vector>

#include "base/Result.h"
#include "host/files/FileDescriptor.h"
#include "host/files/FileLock.h"

namespace host {

// The bytes of an open regular file, at most `maximum` of them. Anything else than a regular file
// is an error.
base::Result<std::string> readRegularFile(int file, std::size_t maximum);

// The names in an open folder, "." and ".." left out, in bytewise order. More than `maximum` are an
// error.
base::Result<std::vector<std::string>> namesInFolder(
    int folder, std::size_t maximum = std::numeric_limits<std::size_t>::max());

// The longest name that a file can have, in bytes.
inline constexpr std::size_t kMaxFileName = 255;

// Whether a text from elsewhere can be a file's name, or part of one, that stays in its folder: not
// empty, "." or "..", without "/" and NUL, and no longer than `longest`.
bool isPlainFileName(std::string_view name, std::size_t longest);

// A text from elsewhere as it may stand in one line of the log: cut when it is long, with "?" for
// control characters.
std::string shownText(std::string_view text);

// Writes all the bytes, going on after short writes and signals.
base::Result<void> writeAll(int file, std::string_view bytes);

// Refuses a name that is a link, or of a file that has other names; nothing else. For who is to
// write to it.
base::Result<void> refuseLinks(int folder, const std::string& name);

// Makes a file that isn't there yet, or a folder, in an open folder to whose owner it then belongs:
// the file is open for writing.
base::Result<FileDescriptor> makeFile(int folder, const std::string& name);
base::Result<void> makeFolder(int folder, const std::string& name);

// How many names beside a file are tried, for what is to stand there for a while or be kept: in the
// way of each may be something that is not ours.
inline constexpr int kMaxNamesBeside = 8;

// Writes `name` beside, synchronises it and renames it over: the file is the old or the new one,
// whole, whatever happens. It is written as .<name>.new, .<name>.new-2, and so on: what can't be
// removed from there is passed by. Callers serialise: two replacements of one name use one name
// beside.
base::Result<void> replaceFile(int folder, const std::string& name, std::string_view bytes);

// The same for a file that others may read, too.
base::Result<void> replaceReadableFile(int folder, const std::string& name, std::string_view bytes);

// Renames a file to `kept`, over a file that has that name; where something else has it, to
// <kept>-2, and so on.
base::Result<void> keepBeside(int folder, const std::string& name, const std::string& kept);

// Renames a file, within a folder or from one to another; std::errc::file_exists when the new name
// is taken, by whatever it is.
base::Result<void> renameToFreeName(int fromFolder, const std::string& from, int toFolder,
                                    const std::string& to);

// Whether a name in an open folder is a link.
bool isLink(int folder, const std::string& name);

struct RolledOver {
  std::string dropped;                // whose content went; or empty
  std::vector<std::string> inTheWay;  // numbers that were passed over: not regular files
};

// Renames a file to <name>.1, that to <name>.2, and so on up to the first number that is free;
// where none is, the content of the last one goes. `oldest` is the last number, `path` the folder's
// path for the error. A kill leaves at most a free number.
base::Result<RolledOver> rollOver(int folder, const std::string& path, const std::string& name,
                                  int oldest);

// Opens a file that holds lines for reading and appending; makes it when it is missing.
base::Result<FileDescriptor> openLines(int folder, const std::string& name);

// Removes a line that an earlier failure left unfinished at the end of an open file; the size
// without it.
base::Result<std::uint64_t> cutUnfinishedLine(int file);

// Appends lines, whose line feeds the text already holds, to a file that holds lines; makes the
// file when it is missing. A line is in the file whole or not at all: what a failed write left is
// taken back, all of this call's lines, and a line that an earlier failure left unfinished is
// removed first. The file is locked meanwhile.
base::Result<void> appendLines(int folder, const std::string& name, std::string_view lines,
                               const LockWait& wait);

}  // namespace host
