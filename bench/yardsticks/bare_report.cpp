// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The parts of a report, done bare in one program: the scan of two days' rows, Welford over the
// samples, the appending of the XML, one durable write. No whitelist, no rounding, no other
// service.
//
// With a storage controller's buffers also what its counters need: reading and walking each buffer
// once, with two zeroed allocations and a number's text for each field of the statistics and a
// number's text for each word of the lists, one transaction for the counters' rows, and a durable
// write of each text.
//
// bare_report DATABASE DAY OUTPUT [STATISTICS LIST...]

#include <fcntl.h>
#include <sqlite3.h>
#include <unistd.h>

#include <charconv>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

namespace {

template <typename Number>
void appendElement(std::string& xml, const char* open, Number number, const char* close) {
  char digits[40];
  const auto end = std::to_chars(digits, digits + sizeof digits, number);
  xml += open;
  xml.append(digits, end.ptr);
  xml += close;
}

sqlite3_stmt* scan(sqlite3* database, const char* sql, int day) {
  sqlite3_stmt* statement = nullptr;
  if (sqlite3_prepare_v2(database, sql, -1, &statement, nullptr) != SQLITE_OK) std::exit(1);
  sqlite3_bind_int(statement, 1, day - 1);
  sqlite3_bind_int(statement, 2, day);
  return statement;
}

void appendKey(std::string& xml, sqlite3_stmt* statement) {
  xml += "\t\t<key>";
  xml.append(reinterpret_cast<const char*>(sqlite3_column_text(statement, 1)),
             static_cast<std::size_t>(sqlite3_column_bytes(statement, 1)));
  xml += "</key>\n";
}

std::string read(const char* path) {
  const int file = open(path, O_RDONLY);
  const off_t size = lseek(file, 0, SEEK_END);
  std::string bytes(size > 0 ? static_cast<std::size_t>(size) : 0, '\0');
  if (pread(file, bytes.data(), bytes.size(), 0) != size) std::exit(1);
  close(file);
  return bytes;
}

void write(const std::string& path, const std::string& text) {
  const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
  const bool written =
      file >= 0 && ::write(file, text.data(), text.size()) == static_cast<ssize_t>(text.size()) &&
      fsync(file) == 0;
  if (!written) std::exit(1);
  close(file);
}

template <typename Number>
Number numberAt(const std::string& bytes, std::size_t at) {
  Number number;
  std::memcpy(&number, bytes.data() + at, sizeof number);
  return number;
}

// What a field is to a parser: a name and a value, each with its text.
struct Field {
  char name[100], text[100];
};

std::vector<std::uint64_t> walkStatistics(const std::string& bytes, std::string& text) {
  std::vector<std::uint64_t> values;
  std::vector<void*> allocated;
  for (std::size_t at = 0; at + 8 <= bytes.size();) {
    const auto count = numberAt<std::uint32_t>(bytes, at + 4);
    at += 8;
    for (std::uint32_t i = 0; i < count && at + 8 <= bytes.size(); ++i, at += 8) {
      values.push_back(numberAt<std::uint64_t>(bytes, at));
      allocated.push_back(std::calloc(1, sizeof(Field)));
      allocated.push_back(std::calloc(1, sizeof(Field)));
      appendElement(text, "com.example.storage:", values.back(), ";");
    }
  }
  for (void* memory : allocated) std::free(memory);
  return values;
}

void addStorage(sqlite3* database, int today, const std::string& output, char** buffer,
                char** end) {
  std::string log, lists;
  const auto values = walkStatistics(read(*buffer), log);
  while (++buffer < end) {
    const std::string bytes = read(*buffer);
    for (std::size_t at = 0; at + 4 <= bytes.size(); at += 4) {
      const auto word = numberAt<std::uint32_t>(bytes, at);
      if (word != 0) appendElement(lists, "\"readStage\": ", word, ", ");
    }
  }
  sqlite3_exec(database, "BEGIN IMMEDIATE", nullptr, nullptr, nullptr);
  sqlite3_stmt* row = nullptr;
  if (sqlite3_prepare_v2(database, "REPLACE INTO scalars(day, key, value) VALUES(?, ?, ?)", -1,
                         &row, nullptr) != SQLITE_OK) {
    std::exit(1);
  }
  for (std::size_t i = 0; i < values.size(); ++i) {
    const std::string key = "com.example.storage" + std::to_string(i);
    sqlite3_bind_int(row, 1, today);
    sqlite3_bind_text(row, 2, key.c_str(), -1, SQLITE_STATIC);
    sqlite3_bind_int64(row, 3, static_cast<sqlite3_int64>(values[i]));
    sqlite3_step(row);
    sqlite3_reset(row);
  }
  sqlite3_finalize(row);
  sqlite3_exec(database, "COMMIT", nullptr, nullptr, nullptr);
  write(output + ".log", log);
  write(output + ".lists", lists);
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 4) return 2;
  const int day = std::atoi(argv[2]);
  sqlite3* database = nullptr;
  if (sqlite3_open_v2(argv[1], &database, SQLITE_OPEN_READWRITE, nullptr) != SQLITE_OK) return 1;
  std::string xml;
  sqlite3_stmt* rows = scan(database,
                            "SELECT day, key, value FROM scalars WHERE day BETWEEN ? AND ? "
                            "ORDER BY day, key",
                            day);
  while (sqlite3_step(rows) == SQLITE_ROW) {
    const auto value = sqlite3_column_int64(rows, 2);
    if (sqlite3_column_int(rows, 0) != day) continue;
    appendKey(xml, rows);
    appendElement(xml, "\t\t<integer>", value, "</integer>\n");
  }
  sqlite3_finalize(rows);
  rows =
      scan(database,
           "SELECT day, key, samples FROM packed WHERE day BETWEEN ? AND ? ORDER BY day, key", day);
  while (sqlite3_step(rows) == SQLITE_ROW) {
    const auto* bytes = static_cast<const char*>(sqlite3_column_blob(rows, 2));
    const int size = sqlite3_column_bytes(rows, 2);
    double minimum = 0, maximum = 0, mean = 0, squares = 0;
    int count = 0;
    for (int at = 0; at + 12 <= size; at += 12) {
      double x;
      std::memcpy(&x, bytes + at, sizeof x);
      if (count == 0) minimum = maximum = x;
      if (x < minimum) minimum = x;
      if (x > maximum) maximum = x;
      ++count;
      const double delta = x - mean;
      mean += delta / count;
      squares += delta * (x - mean);
    }
    if (sqlite3_column_int(rows, 0) != day) continue;
    appendKey(xml, rows);
    xml += "\t\t<array>\n";
    for (const double figure : {minimum, maximum, mean, squares}) {
      appendElement(xml, "\t\t\t<real>", figure, "</real>\n");
    }
    appendElement(xml, "\t\t\t<integer>", count, "</integer>\n\t\t</array>\n");
  }
  sqlite3_finalize(rows);
  if (argc > 4) addStorage(database, day + 1, argv[3], argv + 4, argv + argc);
  sqlite3_close(database);
  write(argv[3], xml);
  return 0;
}
