// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/process/StandardErrorLog.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <stdlib.h>

#include <array>
#include <string>

#include "host/files/FileDescriptor.h"

namespace {

using namespace platform;
using host::FileDescriptor;
using host::StandardErrorLog;

std::string readSome(int file) {
  std::array<char, 4096> bytes;
  const ssize_t length = ::read(file, bytes.data(), bytes.size());
  return {bytes.data(), length > 0 ? static_cast<std::size_t>(length) : 0};
}

TEST(StandardErrorLog, EveryLineOfAMessageHasItsPriority) {
  const struct {
    LogLevel level;
    const char *message, *written;
  } rows[] = {
      {LogLevel::error, "broken", "<3>broken\n"},
      {LogLevel::standard, "one\n", "<5>one\n"},
      {LogLevel::info, "one\ntwo\n", "<6>one\n<6>two\n"},
      {LogLevel::debug, "one\n\n", "<7>one\n<7>\n"},
      {LogLevel::standard, "", "<5>\n"},
  };
  int ends[2];
  ASSERT_EQ(::pipe(ends), 0);
  const FileDescriptor out(ends[0]), in(ends[1]);
  StandardErrorLog log(LogLevel::debug, in.get());
  for (const auto& row : rows) {
    log.log(row.level, "%s", row.message);
    EXPECT_EQ(readSome(out.get()), row.written) << row.message;
  }
}

// What a hostile whitelist or sender says once for each of its entries.
TEST(StandardErrorLog, AFloodIsCounted) {
  int ends[2];
  ASSERT_EQ(::pipe2(ends, O_NONBLOCK), 0);
  const FileDescriptor out(ends[0]), in(ends[1]);
  const auto flood = [](StandardErrorLog& log, int messages) {
    for (int i = 0; i < messages; ++i) log.log(LogLevel::error, "skipping %d", i);
  };
  std::string ten;
  for (int i = 0; i < 10; ++i) ten += "<3>skipping " + std::to_string(i) + "\n";
  const std::string counted = ten + "<3>1990 more messages like \"skipping 9\"\n";
  {
    StandardErrorLog log(LogLevel::debug, in.get());
    flood(log, 11);
    log.log(LogLevel::standard, "other");
    EXPECT_EQ(readSome(out.get()), ten + "<3>skipping 10\n<5>other\n");
    flood(log, 2000);
    log.log(LogLevel::debug, "other");
    EXPECT_EQ(readSome(out.get()), counted + "<7>other\n");
    std::string all;
    for (int i = 0; i < 20; ++i) {
      log.log(LogLevel::debug, "debug");
      log.log(LogLevel::standard, "%s", std::to_string(i).c_str());
      all += "<7>debug\n<5>" + std::to_string(i) + "\n";
    }
    EXPECT_EQ(readSome(out.get()), all);
    flood(log, 2000);
    EXPECT_EQ(readSome(out.get()), ten);
  }
  EXPECT_EQ(readSome(out.get()), counted.substr(ten.size()));
}

TEST(StandardErrorLog, ATerminalGetsTheMessageAlone) {
  const FileDescriptor terminal(::posix_openpt(O_RDWR | O_NOCTTY));
  ASSERT_TRUE(terminal && ::grantpt(terminal.get()) == 0 && ::unlockpt(terminal.get()) == 0);
  const FileDescriptor end(::open(::ptsname(terminal.get()), O_RDWR | O_NOCTTY));
  ASSERT_TRUE(end);
  StandardErrorLog log(LogLevel::standard, end.get());
  log.log(LogLevel::error, "%s", "one\ntwo\n");
  EXPECT_EQ(readSome(terminal.get()), "one\r\ntwo\r\n");
}

TEST(StandardErrorLog, WhatCantBeWrittenIsLost) {
  int ends[2];
  ASSERT_EQ(::pipe2(ends, O_NONBLOCK), 0);
  FileDescriptor out(ends[0]);
  const FileDescriptor in(ends[1]);
  StandardErrorLog log(LogLevel::standard, in.get());
  const std::string message(100'000, 'x');
  log.log(LogLevel::error, "%s", message.c_str());  // more than the pipe holds
  const auto previous = ::signal(SIGPIPE, SIG_IGN);
  out = FileDescriptor();
  log.log(LogLevel::error, "nobody reads this");
  ::signal(SIGPIPE, previous);
  StandardErrorLog(LogLevel::standard, -1).log(LogLevel::error, "nor this");
}

TEST(StandardErrorLog, AnUnknownLevelIsTheDefaultOne) {
  const struct {
    const char* name;
    LogLevel level;
  } rows[] = {{"debug", LogLevel::debug},      {"info", LogLevel::info},
              {"default", LogLevel::standard}, {"error", LogLevel::error},
              {"ERROR", LogLevel::standard},   {"", LogLevel::standard},
              {nullptr, LogLevel::standard}};
  for (const auto& row : rows) EXPECT_EQ(StandardErrorLog::levelNamed(row.name), row.level);
}

}  // namespace
