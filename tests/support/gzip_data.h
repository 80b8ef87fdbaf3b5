#pragma once

#include <zlib.h>

#include <stdexcept>
#include <string>
#include <string_view>

namespace testing_support {

/// `data` as one gzip member, as the gzip tool writes it.
inline std::string gzipped(std::string_view data) {
  z_stream deflater{};
  // 15 window bits plus 16: a gzip header and trailer around the deflate data.
  if (deflateInit2(&deflater, Z_BEST_SPEED, Z_DEFLATED, 15 + 16, 8, Z_DEFAULT_STRATEGY) != Z_OK) {
    throw std::runtime_error("deflateInit2 failed");
  }
  std::string out(deflateBound(&deflater, static_cast<uLong>(data.size())) + 32, '\0');
  deflater.next_in = reinterpret_cast<Bytef*>(const_cast<char*>(data.data()));
  deflater.avail_in = static_cast<uInt>(data.size());
  deflater.next_out = reinterpret_cast<Bytef*>(out.data());
  deflater.avail_out = static_cast<uInt>(out.size());
  const int result = deflate(&deflater, Z_FINISH);
  out.resize(deflater.total_out);
  deflateEnd(&deflater);
  if (result != Z_STREAM_END) throw std::runtime_error("deflate did not finish");
  return out;
}

}  // namespace testing_support
