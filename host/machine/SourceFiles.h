// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Reads the files of the kernel and of the system that the services of this machine answer from.
//
// They are read below a folder, as another machine's would be; links lead nowhere outside it. What
// they hold is input like any other: each is read within bounds, and what isn't there or can't be
// read is none.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "host/files/DeviceRoot.h"

namespace host::machine {

inline constexpr std::size_t kMaxSource = std::size_t{64} << 10;  // bytes of a file
inline constexpr std::size_t kMaxNames = 10'000;                  // in a folder
inline constexpr std::size_t kMaxDevices = 1024;                  // of a kind

// The bytes of a regular file, those of the kernel included, whose size nobody knows before. A file
// that is longer than `maximum` is none.
std::optional<std::string> sourceText(const DeviceRoot& files, std::string_view path,
                                      std::size_t maximum = kMaxSource);

// The file's first line, without blanks and NULs at its ends; none when nothing is left.
std::optional<std::string> sourceLine(const DeviceRoot& files, std::string_view path);

// The number in the file's first line.
std::optional<std::uint64_t> sourceCount(const DeviceRoot& files, std::string_view path);

// The names in a folder in bytewise order; none in one that isn't there, or holds more than
// kMaxNames.
std::vector<std::string> sourceNames(const DeviceRoot& files, std::string_view path);

// The devices of a kind, each a folder in this one: its path, and its name as it may be part of a
// key, of 64 characters at most. No more than kMaxDevices.
struct SourceDevice {
  std::string path, name;
};
std::vector<SourceDevice> sourceDevices(const DeviceRoot& files, const std::string& path);

// The driver of the device with that path, as a part of a key; empty without one.
std::string driverOf(const DeviceRoot& files, const std::string& device);

// A name of the kernel's as it may be part of a key.
std::string inKey(std::string_view name);

// Takes what stands before the separator, and the separator, off the text's front; the next word of
// a line, which is empty at its end.
std::string_view takeUntil(std::string_view& text, char separator);
std::string_view takeWord(std::string_view& line);

// The number that a word is, in decimal or, after 0x, hexadecimal; one that 64 bits don't hold
// saturates.
std::optional<std::uint64_t> countIn(std::string_view word);

// The number after a name, in a text of lines "<name> <number>"; the first of that name.
std::optional<std::uint64_t> countNamed(const std::optional<std::string>& text,
                                        std::string_view name);

// The value of a shell-like assignment, NAME=value, one on a line: in quotes or bare, with
// backslash escapes. The last one of a name holds; empty when there is none.
std::string assignedValue(std::string_view lines, std::string_view name);

}  // namespace host::machine
