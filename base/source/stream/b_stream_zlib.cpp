#include "b_exception.h"
#include "b_stream.h"

#include <fmt/format.h>
#include <zlib.h>

#include <algorithm>
#include <array>

namespace base {
namespace {

constexpr Bytef gzipFirstByte = 0x1f;

// Decompresses gzip or zlib data while it is read. The size of the result is unknown until
// the end, so the stream offers neither a size nor positions; data that ends early or does
// not decode throws, naming the stream.
class StreamZlibWorker final : public StreamWorker {
 public:
  StreamZlibWorker(const Stream& source, std::string_view name)
      : StreamWorker(capRead | capSource, name.empty() ? std::string_view(source.name()) : name), m_source(source) {
    m_source.flags = 0;
    // 15 window bits plus 32: the header says whether the data is gzip or zlib.
    if (const int result = inflateInit2(&m_inflate, 15 + 32); result != Z_OK) fail(result, "cannot start decoding");
    m_ready = true;
  }
  ~StreamZlibWorker() override {
    if (m_ready) inflateEnd(&m_inflate);
  }

  std::uint32_t read(void* buffer, std::uint32_t count) override {
    m_inflate.next_out = static_cast<Bytef*>(buffer);
    m_inflate.avail_out = count;
    while (m_inflate.avail_out > 0 && !m_finished) inflateSome();
    return count - m_inflate.avail_out;
  }
  bool isEOF() override { return m_finished; }
  Stream getSource() override { return m_source; }
  void close() override {
    m_source.reset();
    StreamWorker::close();
  }

 private:
  void inflateSome() {
    if (m_inflate.avail_in == 0 && !refill()) {
      if (m_inflate.total_in == 0 && m_inflate.total_out == 0) {
        m_finished = true;  // an empty file decodes to nothing
        return;
      }
      fail(Z_BUF_ERROR, "the compressed data ends early");
    }
    const int result = inflate(&m_inflate, Z_NO_FLUSH);
    if (result == Z_STREAM_END) {
      // Concatenated gzip members read as one stream, as gzip itself reads them; bytes after
      // the last member that start no other (padding) are ignored, as gzip ignores them.
      if ((m_inflate.avail_in == 0 && !refill()) || m_inflate.next_in[0] != gzipFirstByte) {
        m_finished = true;
        return;
      }
      inflateReset(&m_inflate);
      return;
    }
    if (result == Z_NEED_DICT) fail(Z_DATA_ERROR, "the compressed data needs a preset dictionary");
    if (result != Z_OK && result != Z_BUF_ERROR) fail(result, "the compressed data is corrupt");
  }

  bool refill() {
    const std::uint32_t got = m_source.read(m_input.data(), static_cast<std::uint32_t>(m_input.size()));
    m_inflate.next_in = m_input.data();
    m_inflate.avail_in = got;
    return got > 0;
  }

  [[noreturn]] void fail(int code, std::string_view what) {
    raise<zlib_exception>("base::StreamZlibWorker::read",
                          fmt::format("{}: {} (after {} bytes)", name(), what, m_inflate.total_out), code);
  }

  Stream m_source;
  z_stream m_inflate{};
  bool m_ready = false;
  bool m_finished = false;
  std::array<Bytef, 64 * 1024> m_input{};
};

}  // namespace

Stream inflateStream(const Stream& source, std::string_view name) {
  Stream stream = Stream::adopt(new StreamZlibWorker(source, name));
  stream.tag = source.tag;
  return stream;
}

}  // namespace base
