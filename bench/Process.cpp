// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "bench/Process.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>

#include <chrono>
#include <cstdio>
#include <filesystem>
#include <stdexcept>

namespace bench {

std::string program(const char* name) {
  return std::filesystem::read_symlink("/proc/self/exe").parent_path() / name;
}

double run(const Arguments& arguments) {
  std::vector<char*> argv;
  for (const std::string& argument : arguments) argv.push_back(const_cast<char*>(argument.c_str()));
  argv.push_back(nullptr);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  for (const int fd : {1, 2}) {
    posix_spawn_file_actions_addopen(&actions, fd, "/dev/null", O_WRONLY, 0);
  }
  const auto start = std::chrono::steady_clock::now();
  pid_t pid = 0;
  int status = 0;
  if (::posix_spawnp(&pid, argv[0], &actions, nullptr, argv.data(), environ) != 0 ||
      ::waitpid(pid, &status, 0) != pid || status != 0) {
    throw std::runtime_error("can't run " + arguments[0]);
  }
  const std::chrono::duration<double, std::nano> taken = std::chrono::steady_clock::now() - start;
  posix_spawn_file_actions_destroy(&actions);
  return taken.count();
}

double peakKiB(Arguments arguments) {
  arguments.insert(arguments.begin(), program("peak_memory"));
  std::string command;
  for (const std::string& argument : arguments) command += "'" + argument + "' ";
  FILE* output = ::popen(command.c_str(), "r");
  double peak = 0;
  const bool read = output != nullptr && std::fscanf(output, "%lf", &peak) == 1;
  if (output == nullptr || ::pclose(output) != 0 || !read) {
    throw std::runtime_error("can't run " + command);
  }
  return peak;
}

}  // namespace bench
