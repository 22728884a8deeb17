// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Runs a program and prints the most memory, in KiB, that it had at once. A process's figure begins
// with that of the one that started it, so that this one is kept small.
//
// peak_memory PROGRAM [ARGUMENT...]

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>

int main(int argc, char** argv) {
  if (argc < 2) return 2;
  const pid_t child = fork();
  if (child == 0) {
    const int nowhere = open("/dev/null", O_WRONLY);
    dup2(nowhere, STDOUT_FILENO);
    dup2(nowhere, STDERR_FILENO);
    execv(argv[1], argv + 1);
    _exit(127);
  }
  int status = 0;
  rusage usage{};
  if (wait4(child, &status, 0, &usage) != child || status != 0) return 1;
  std::printf("%ld\n", usage.ru_maxrss);
  return 0;
}
