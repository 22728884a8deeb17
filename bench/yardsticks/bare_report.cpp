// The parts of a report, done bare in one program: the scan of two days' rows, Welford over the
// samples, the appending of the XML, one durable write. No whitelist, no rounding, no other
// service.
//
// bare_report DATABASE DAY OUTPUT

#include <fcntl.h>
#include <sqlite3.h>
#include <unistd.h>

#include <charconv>
#include <cstdlib>
#include <cstring>
#include <string>

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

}  // namespace

int main(int argc, char** argv) {
  if (argc != 4) return 2;
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
  sqlite3_close(database);
  const int file = open(argv[3], O_WRONLY | O_CREAT | O_TRUNC, 0600);
  const bool written = file >= 0 &&
                       write(file, xml.data(), xml.size()) == static_cast<ssize_t>(xml.size()) &&
                       fsync(file) == 0;
  return written ? 0 : 1;
}
