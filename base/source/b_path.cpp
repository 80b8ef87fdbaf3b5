#include "b_path.h"

#include "b_platform_system.h"

namespace base {
namespace {

bool isSeparator(char c) { return c == '/' || c == '\\'; }

std::string_view fileNameOf(std::string_view path) {
  std::size_t start = path.size();
  while (start > 0 && !isSeparator(path[start - 1])) --start;
  return path.substr(start);
}

// A part that a following ".." may remove: not "..", not a drive ("C:").
bool removable(std::string_view part) { return part != ".." && !(part.size() == 2 && part[1] == ':'); }

}  // namespace

base::string getExtension(std::string_view path, bool second) {
  const std::string_view name = fileNameOf(path);
  const std::size_t last = name.rfind('.');
  if (last == std::string_view::npos) return {};
  if (!second || last == 0) return base::string(name.substr(last + 1));
  const std::size_t before = name.rfind('.', last - 1);
  return base::string(name.substr(before == std::string_view::npos ? last + 1 : before + 1));
}

base::string getDirectory(std::string_view path) {
  const std::size_t length = path.size() - fileNameOf(path).size();
  if (length == 0) return {};
  const std::string_view directory = path.substr(0, length);
  const char separator = platform::pathSeparator();

  std::size_t leading = 0;
  while (leading < directory.size() && isSeparator(directory[leading])) ++leading;
  base::string result(std::min<std::size_t>(leading, 2), separator);

  base::vector<std::string_view> parts;
  for (std::size_t start = leading; start < directory.size();) {
    std::size_t end = start;
    while (end < directory.size() && !isSeparator(directory[end])) ++end;
    const std::string_view part = directory.substr(start, end - start);
    if (part == ".." && !parts.empty() && removable(parts.back())) {
      parts.pop_back();
    } else if (!part.empty()) {
      parts.push_back(part);
    }
    start = end + 1;
  }
  for (const std::string_view part : parts) {
    result += part;
    result += separator;
  }
  return result;
}

base::string getExecutablePath() { return platform::executablePath(); }

}  // namespace base
