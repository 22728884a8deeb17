// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/Applications.h"

#include <cstddef>
#include <functional>
#include <string>
#include <string_view>
#include <unordered_set>

#include "host/machine/SourceFiles.h"

namespace host::machine {

namespace {

constexpr std::size_t kMaxEntries = 20'000;  // files and folders together
constexpr std::size_t kMaxUsers = 1'000;
constexpr std::size_t kMaxEntry = std::size_t{256} << 10;  // bytes
constexpr int kMaxDepth = 4;                               // of folders in folders

// Whether an entry is an application that is to be seen, by the keys of its main group.
bool isShown(std::string_view lines) {
  bool inGroup = false, isApplication = false, isHidden = false;
  while (!lines.empty()) {
    std::string_view line = takeUntil(lines, '\n');
    while (!line.empty() && (line.back() == ' ' || line.back() == '\r')) line.remove_suffix(1);
    if (line.starts_with('[')) {
      if (inGroup) break;
      inGroup = line == "[Desktop Entry]";
    } else if (inGroup) {
      std::string_view key = takeUntil(line, '=');
      key = takeWord(key);
      const std::string_view value = takeWord(line);
      if (key == "Type") isApplication = value == "Application";
      if (key == "NoDisplay" || key == "Hidden") isHidden = isHidden || value == "true";
    }
  }
  return isApplication && !isHidden;
}

class Search {
 public:
  using BundleType = platform::InstalledApplications::BundleType;

  Search(const DeviceRoot& files, const std::function<void(BundleType)>& handler)
      : files_(files), handler_(handler) {}

  // Of a folder and those in it. The identifier of an entry is its path in the outermost folder,
  // with "-" for "/"; `prefix` is what it begins with.
  void folder(const std::string& path, BundleType type, const std::string& prefix = "",
              int depth = 0) {
    for (const std::string& name : sourceNames(files_, path)) {
      if (++visited_ > kMaxEntries) return;
      if (!name.ends_with(".desktop")) {
        if (depth < kMaxDepth) folder(path + "/" + name, type, prefix + name + "-", depth + 1);
        continue;
      }
      if (!identifiers_.insert(prefix + name).second) continue;
      const auto entry = sourceText(files_, path + "/" + name, kMaxEntry);
      if (entry && isShown(*entry)) handler_(type);
    }
  }

 private:
  const DeviceRoot& files_;
  const std::function<void(BundleType)>& handler_;
  std::unordered_set<std::string> identifiers_;
  std::size_t visited_ = 0;
};

}  // namespace

void Applications::enumerateBundles(const std::function<void(BundleType)>& handler) {
  constexpr char kBelowData[] = "/share/applications";
  Search search(files_, handler);
  for (const char* folder : {"/usr/local", "/usr"}) {
    search.folder(std::string(folder) + kBelowData, BundleType::system);
  }
  for (const char* folder :
       {"/var/lib/flatpak/exports/share/applications", "/var/lib/snapd/desktop/applications"}) {
    search.folder(folder, BundleType::user);
  }
  std::size_t users = 0;
  for (const std::string& user : sourceNames(files_, "/home")) {
    if (++users > kMaxUsers) return;
    const std::string data = "/home/" + user + "/.local/share";
    search.folder(data + "/applications", BundleType::user);
    search.folder(data + "/flatpak/exports/share/applications", BundleType::user);
  }
}

}  // namespace host::machine
