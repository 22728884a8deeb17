#include "tools/demo/Screen.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>

namespace demo {

namespace {

constexpr std::size_t kUsualWidth = 80, kIndent = 2, kGap = 2;
constexpr std::size_t kNarrowestFirstColumn = 12;

bool continuesCharacter(char c) { return (static_cast<unsigned char>(c) & 0xC0) == 0x80; }

std::size_t columnsOf(std::string_view text) {
  return text.size() -
         static_cast<std::size_t>(std::count_if(text.begin(), text.end(), continuesCharacter));
}

// Where the character at a column begins.
std::size_t offsetOf(std::string_view text, std::size_t column) {
  std::size_t offset = 0;
  for (; offset < text.size(); ++offset) {
    if (continuesCharacter(text[offset])) continue;
    if (column-- == 0) break;
  }
  return offset;
}

}  // namespace

std::size_t screenWidth() {
  winsize size{};
  if (::ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) != 0 || size.ws_col == 0) return kUsualWidth;
  return std::clamp<std::size_t>(size.ws_col, 60, 160);
}

std::string heading(std::string_view text) {
  static const bool terminal = ::isatty(STDOUT_FILENO) == 1;
  std::string line(text);
  return terminal ? "\x1b[1m" + line + "\x1b[0m\n" : line + "\n";
}

std::string elided(std::string_view text, std::size_t width) {
  const std::size_t columns = columnsOf(text);
  if (columns <= width) return std::string(text);
  const std::size_t end = (width - 1) * 2 / 3;
  std::string shown(text.substr(0, offsetOf(text, width - 1 - end)));
  shown += "…";
  shown += text.substr(offsetOf(text, columns - end));
  return shown;
}

std::string shortKey(std::string_view key) {
  constexpr std::string_view kCommon = "com.norba.";
  return key.starts_with(kCommon) ? "~." + std::string(key.substr(kCommon.size()))
                                  : std::string(key);
}

std::string wrapped(const std::vector<std::string>& names) {
  const std::string indent(kIndent, ' ');
  std::string text, line = indent;
  for (const std::string& name : names) {
    if (line.size() > kIndent && line.size() + 1 + name.size() > screenWidth()) {
      text += line + '\n';
      line = indent;
    }
    if (line.size() > kIndent) line += ' ';
    line += name;
  }
  return line.size() > kIndent ? text + line + '\n' : text;
}

std::string bar(double share, std::size_t width) {
  static constexpr const char* kEighths[] = {"", "▏", "▎", "▍", "▌", "▋", "▊", "▉"};
  auto eighths = static_cast<std::size_t>(
      std::llround(std::clamp(share, 0.0, 1.0) * static_cast<double>(width * 8)));
  if (share > 0) eighths = std::max<std::size_t>(eighths, 1);
  std::string text;
  for (std::size_t i = 0; i < eighths / 8; ++i) text += "█";
  return text + kEighths[eighths % 8];
}

std::string skyline(std::span<const std::uint64_t> counts) {
  static constexpr const char* kHeights[] = {"▁", "▂", "▃", "▄", "▅", "▆", "▇", "█"};
  const std::uint64_t most = counts.empty() ? 0 : *std::max_element(counts.begin(), counts.end());
  std::string text;
  for (const std::uint64_t count : counts) {
    const double share = most == 0 ? 0 : static_cast<double>(count) / static_cast<double>(most);
    text += kHeights[std::llround(share * 7)];
  }
  return text;
}

std::vector<std::size_t> evenlySpread(std::size_t count, std::size_t most) {
  const std::size_t shown = std::min(count, most);
  std::vector<std::size_t> indices;
  for (std::size_t i = 0; i < shown; ++i) indices.push_back(i * count / shown);
  return indices;
}

Table::Table(std::vector<Column> columns) : columns_(std::move(columns)) {
  std::vector<std::string> titles;
  for (const Column& column : columns_) titles.emplace_back(column.title);
  if (std::any_of(titles.begin(), titles.end(), [](const auto& title) { return !title.empty(); })) {
    rows_.push_back(std::move(titles));
  }
}

std::string Table::text() const {
  std::vector<std::size_t> widths(columns_.size(), 0);
  for (const auto& row : rows_) {
    for (std::size_t i = 0; i < row.size(); ++i) {
      widths[i] = std::max(widths[i], columnsOf(row[i]));
    }
  }
  std::size_t others = kIndent;
  for (std::size_t i = 1; i < widths.size(); ++i) others += kGap + widths[i];
  const std::size_t screen = screenWidth();
  const std::size_t left = screen > others ? screen - others : 0;
  widths[0] = std::min(widths[0], std::max(left, kNarrowestFirstColumn));

  std::string lines;
  for (const auto& row : rows_) {
    std::string line(kIndent, ' ');
    for (std::size_t i = 0; i < row.size(); ++i) {
      const std::string cell = i == 0 ? elided(row[i], widths[i]) : row[i];
      const std::string padding(widths[i] - columnsOf(cell), ' ');
      if (i > 0) line.append(kGap, ' ');
      line += columns_[i].align == Align::right ? padding + cell : cell + padding;
    }
    line.erase(line.find_last_not_of(' ') + 1);
    lines += line + '\n';
  }
  return lines;
}

}  // namespace demo
