// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Runs a program in a sandbox that refuses openat2, as systemd's RestrictSUIDSGID= does:
// without_openat2 PROGRAM [ARGUMENT...]
#include <errno.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <stddef.h>
#include <stdio.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <unistd.h>

int main(int argc, char** argv) {
  struct sock_filter rules[] = {
      BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(struct seccomp_data, nr)),
      BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_openat2, 0, 1),
      BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | ENOSYS),
      BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
  };
  struct sock_fprog filter = {sizeof rules / sizeof rules[0], rules};
  if (argc < 2) return 2;
  if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 ||
      prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &filter) != 0 ||
      syscall(SYS_openat2, -1, "", 0, 0) != -1 || errno != ENOSYS) {
    perror("without_openat2");
    return 1;
  }
  execv(argv[1], argv + 1);
  perror(argv[1]);
  return 1;
}
