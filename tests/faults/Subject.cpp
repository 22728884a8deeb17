// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the shim is tried on: calls in a folder that is named on the command line. The exit status
// says whether every one succeeded (0) or not (1).

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

#include <string>

namespace {

// Nine calls that count, and some that don't.
int calls(const std::string& root) {
  const std::string folder = root + "/folder";
  const std::string file = root + "/file", other = root + "/other";
  int failed = 0;
  const auto check = [&failed](long result) { failed += result < 0 ? 1 : 0; };
  check(::mkdir(folder.c_str(), 0700));
  const int made = ::open(file.c_str(), O_RDWR | O_CREAT, 0600);
  check(made);
  check(::write(made, "12345678", 8));
  iovec parts[] = {{const_cast<char*>("abcd"), 4}, {const_cast<char*>("ef"), 2}};
  check(::writev(made, parts, 2));
  check(::pwrite(made, "0", 1, 0));
  check(::fsync(made));
  check(::ftruncate(made, 20));
  check(::rename(file.c_str(), other.c_str()));
  int ends[2];
  check(::pipe(ends));
  check(::write(ends[1], "x", 1));
  check(::write(STDERR_FILENO, "x", 1));
  check(::open(other.c_str(), O_RDONLY));
  check(::rmdir(folder.c_str()));
  return failed;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) return 2;
  return calls(argv[1]) == 0 ? 0 : 1;
}
