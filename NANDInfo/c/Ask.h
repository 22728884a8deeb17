// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the C interface's calls do, in terms of C++.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "NANDInfo/c/nandinfo.h"
#include "NANDInfo/queries/DecodedBuffer.h"
#include "plist/Value.h"

namespace NANDInfo {

// What a call gives: of NANDINFO_OK and so on, why, and the result.
struct Reply {
  int code = NANDINFO_OK;
  std::string text = {};
  std::optional<plist::Value> value = {};
};

// Whether the device root is there.
Reply look(const std::string& root);

// Asks the device root by the name of a query. The root is assembled anew for each call, so that no
// answer is an old one; the process's own streams, signals and tables are left alone, and the first
// error message is this call's own.
Reply collect(const std::string& root, std::string_view name, const nandinfo_options* options);

Reply decode(std::string_view kind, Bytes bytes, const nandinfo_options* options);

}  // namespace NANDInfo
