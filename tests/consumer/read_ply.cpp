// Reads the PLY file named on the command line through the installed reader and prints
// the number of values it was given.
#include "b_stream.h"
#include "ply_parser.h"

#include <cstdio>
#include <fstream>
#include <iterator>
#include <string>

namespace {

struct Counter {
  std::size_t values = 0;
  bool plyElement(const ply::Element&) { return true; }
  void beginInstance(std::uint32_t) {}
  void plyProperty(const ply::Element&, const ply::Property&, const ply::ValueArray& array) { values += array.size(); }
};

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) return 2;
  std::ifstream file(argv[1], std::ios::binary);
  const std::string data((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
  base::Stream stream = base::memStream(data.data(), static_cast<std::int64_t>(data.size()));
  ply::Header header;
  Counter counter;
  if (ply::readFile(header, stream, counter) != ply::ReadResult::complete) return 1;
  std::printf("%zu values\n", counter.values);
  return 0;
}
