#include "file_input.h"

#include "scenetool_app.h"

#include <fmt/format.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>

namespace scenetool {

bool readWholeFile(const std::string& path, base::vector<std::uint8_t>& data, std::string& error) {
  std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(std::fopen(path.c_str(), "rb"), &std::fclose);
  if (!file) {
    error = std::strerror(errno);
    return false;
  }
  data.clear();
  std::uint8_t piece[1 << 16];
  for (std::size_t got; (got = std::fread(piece, 1, sizeof piece, file.get())) > 0;) {
    base::reserveForAppend(data, got);
    data.insert(data.end(), piece, piece + got);
  }
  if (std::ferror(file.get())) {
    error = std::strerror(errno);
    return false;
  }
  return true;
}

bool openInput(const std::string& path, base::vector<std::uint8_t>& data, base::Stream& stream) {
  std::string error;
  if (!readWholeFile(path, data, error)) {
    printError(fmt::format("{}: cannot read the file: {}", path, error));
    return false;
  }
  stream = base::memStream(data.data(), static_cast<std::int64_t>(data.size()), path);
  return true;
}

}  // namespace scenetool
