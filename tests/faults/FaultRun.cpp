// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "faults/FaultRun.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <fstream>
#include <stdexcept>

#include "support/TemporaryFolder.h"

namespace faults {

namespace {

std::vector<char*> pointers(Strings& texts) {
  std::vector<char*> all;
  for (std::string& text : texts) all.push_back(text.data());
  all.push_back(nullptr);
  return all;
}

std::string readToEnd(int file) {
  std::string text;
  std::array<char, 4096> block;
  for (;;) {
    const ssize_t got = ::read(file, block.data(), block.size());
    if (got < 0 && errno == EINTR) continue;
    if (got <= 0) return text;
    text.append(block.data(), static_cast<std::size_t>(got));
  }
}

// Standard error goes through a pipe; its end is the end of the program and of what it started.
Outcome start(Strings argv, Strings environment) {
  for (char** variable = environ; *variable != nullptr; ++variable) {
    environment.emplace_back(*variable);
  }
  int ends[2];
  if (::pipe2(ends, O_CLOEXEC) != 0) throw std::runtime_error("pipe2 failed");
  posix_spawn_file_actions_t actions;
  ::posix_spawn_file_actions_init(&actions);
  ::posix_spawn_file_actions_adddup2(&actions, ends[1], STDERR_FILENO);
  pid_t child = 0;
  const int error = ::posix_spawn(&child, argv[0].c_str(), &actions, nullptr, pointers(argv).data(),
                                  pointers(environment).data());
  ::posix_spawn_file_actions_destroy(&actions);
  ::close(ends[1]);
  Outcome outcome{-1, 0, error == 0 ? readToEnd(ends[0]) : ""};
  ::close(ends[0]);
  if (error != 0) throw std::runtime_error("could not run " + argv[0]);
  int status = 0;
  while (::waitpid(child, &status, 0) < 0 && errno == EINTR) {
  }
  if (WIFEXITED(status)) outcome.status = WEXITSTATUS(status);
  if (WIFSIGNALED(status)) outcome.signal = WTERMSIG(status);
  return outcome;
}

}  // namespace

#ifdef FAULT_SHIM
bool available() { return true; }
#else
#define FAULT_SHIM ""
bool available() { return false; }
#endif

Outcome run(const Strings& argv, const Strings& environment, const Fault& fault) {
  Strings all = environment;
  all.push_back(std::string("LD_PRELOAD=") + FAULT_SHIM);
  if (!fault.kind.empty()) {
    all.push_back("MORVEND_FAULT_AT=" + std::to_string(fault.at));
    all.push_back("MORVEND_FAULT_KIND=" + fault.kind);
  }
  if (fault.onward) all.push_back("MORVEND_FAULT_ONWARD=1");
  if (fault.hurry) all.push_back("MORVEND_FAULT_HURRY=1");
  return start(argv, all);
}

std::size_t count(const Strings& argv, const Strings& environment, const std::string& kind) {
  const support::TemporaryFolder folder;
  Strings all = environment;
  all.push_back("MORVEND_FAULT_COUNT=" + (folder / "count").string());
  run(argv, all, {.kind = kind});
  std::size_t number = 0;
  std::ifstream(folder / "count") >> number;
  return number;
}

}  // namespace faults
