#include "b_stream.h"

#include "b_exception.h"
#include "b_log.h"

#include <fmt/format.h>

#include <algorithm>
#include <limits>

namespace base {
namespace {

constexpr std::uint32_t copyPiece = 0x40000;

// The capability words are part of the workers' contract: their values never change.
static_assert(capsNull == 799 && capsMemory == 127 && capsMemoryView == 109 && capsSubStream == 45);
static_assert(capsReadWrite == 31 && capsReadOnly == 13 && capsBufferedRead == 261 && capsBufferedWrite == 258);

// The null stream: swallows writes, answers reads with the full count and is always at
// its end.
class NullStreamWorker final : public StreamWorker {
 public:
  NullStreamWorker() : StreamWorker(capsNull, "null") {}
  std::uint32_t read(void*, std::uint32_t count) override { return count; }
  std::uint32_t write(const void*, std::uint32_t count) override { return count; }
  bool isEOF() override { return true; }
  Stream getSource() override { return self(); }
  Stream reopen() override { return self(); }
};

[[noreturn]] void throwShortRead(const Stream& stream, std::uint64_t wanted, std::uint64_t got) {
  raise<exception>("base::Stream::read",
                   fmt::format("stream '{}': trying to read {} bytes, read {} bytes", stream.name(), wanted, got));
}

// Copies what is left of `from` into `to` in 256 KiB pieces and puts `from` back where it
// was. A short read is the end of the data unless the size said more was there.
void copyRest(Stream& from, Stream& to, const char* function, const char* interfaceName) {
  if (!from.has(capRead) || !to.has(capWrite)) raise<unsupported_interface>(function, interfaceName);
  const bool canPosition = from.has(capPosition);
  const std::int64_t start = canPosition ? from.getPosition() : 0;
  std::uint64_t piece = copyPiece;
  std::int64_t expected = -1;
  if (from.has(capSize)) {
    const std::int64_t size = from.getSize();
    if (size == 0) return;
    if (size <= copyPiece) piece = static_cast<std::uint64_t>(size);
    if (canPosition) expected = std::max<std::int64_t>(size - start, 0);
  }
  base::vector<std::uint8_t> buffer(piece);
  std::uint64_t total = 0;
  try {
    for (;;) {
      const std::uint32_t got = from.worker()->read(buffer.data(), static_cast<std::uint32_t>(piece));
      to.write(buffer.data(), got);
      total += got;
      if (got < piece) break;
    }
  } catch (...) {
    if (canPosition) from.setPosition(start, seekBegin);
    throw;
  }
  if (canPosition) from.setPosition(start, seekBegin);
  if ((from.flags & throwOnShortRead) && expected >= 0 && total < static_cast<std::uint64_t>(expected)) {
    throwShortRead(from, static_cast<std::uint64_t>(expected), total);
  }
}

// An in-memory source is written from its block without a copy, from its current position
// on, like any other source, and is left after the last byte copied.
bool copyFromMemory(Stream& destination, Stream& source, std::int64_t maximum) {
  std::int64_t offset = 0;
  std::int64_t size = 0;
  const std::uint8_t* data = source.worker()->getMemory(&offset, &size);
  const std::int64_t start = source.has(capPosition) ? std::clamp<std::int64_t>(source.getPosition(), 0, size) : 0;
  std::int64_t count = size - start;
  if (maximum > 0) count = std::min(count, maximum);
  std::int64_t done = 0;
  // Writes take 32-bit counts: larger blocks go in as few calls as that allows.
  while (done < count) {
    const auto piece = static_cast<std::uint32_t>(std::min<std::int64_t>(count - done, 0x80000000));
    const std::uint32_t written = destination.write(data + offset + start + done, piece);
    done += written;
    if (written < piece) break;
  }
  if (source.has(capPosition)) source.setPosition(start + done, seekBegin);
  return done == count;
}

}  // namespace

StreamWorker::StreamWorker(std::uint32_t capabilities, std::string_view name)
    : m_capabilities(capabilities), m_name(name) {}

StreamWorker::~StreamWorker() = default;

const std::uint8_t* StreamWorker::getMemory(std::int64_t*, std::int64_t*) { return nullptr; }
std::uint32_t StreamWorker::read(void*, std::uint32_t) { return 0; }
std::uint32_t StreamWorker::write(const void*, std::uint32_t) { return 0; }
std::int64_t StreamWorker::setPosition(std::int64_t, std::uint32_t) { return 0; }
std::int64_t StreamWorker::getPosition() { return 0; }
std::int64_t StreamWorker::getSize() { return 0; }
void StreamWorker::setSize(std::int64_t) {}
bool StreamWorker::isEOF() { return true; }
void StreamWorker::flush() {}
void StreamWorker::close() { m_capabilities = 0; }
Stream StreamWorker::getSource() { return Stream(); }
Stream StreamWorker::reopen() { return Stream(); }

Stream StreamWorker::self() {
  addRef();
  return Stream::adopt(this);
}

void StreamWorker::release() noexcept {
  if (m_count.fetch_sub(1, std::memory_order_acq_rel) != 1) return;
  try {
    close();
  } catch (const std::exception& error) {
    log().message(logIO, logError, "{}", error.what());
  } catch (...) {
    log().message(logIO, logError, "Unhandled exception while closing '{}'!", m_name);
  }
  m_hasher.reset();
  delete this;
}

Stream Stream::adopt(StreamWorker* worker) {
  Stream stream;
  stream.m_worker = worker;
  return stream;
}

Stream::Stream(const Stream& other) : tag(other.tag), flags(other.flags), m_worker(other.m_worker) {
  if (m_worker) m_worker->addRef();
}

Stream::Stream(Stream&& other) noexcept
    : tag(other.tag), flags(other.flags), m_worker(std::exchange(other.m_worker, nullptr)) {}

Stream& Stream::operator=(const Stream& other) {
  if (other.m_worker) other.m_worker->addRef();
  if (m_worker) m_worker->release();
  m_worker = other.m_worker;
  tag = other.tag;
  flags = other.flags;
  return *this;
}

Stream& Stream::operator=(Stream&& other) noexcept {
  if (this != &other) {
    if (m_worker) m_worker->release();
    m_worker = std::exchange(other.m_worker, nullptr);
    tag = other.tag;
    flags = other.flags;
  }
  return *this;
}

Stream::~Stream() { reset(); }

void Stream::reset() {
  if (StreamWorker* worker = std::exchange(m_worker, nullptr)) worker->release();
}

const base::string& Stream::name() const {
  static const base::string none;
  return m_worker ? m_worker->name() : none;
}

std::uint32_t Stream::read(void* buffer, std::uint32_t count) {
  const std::uint32_t got = m_worker ? m_worker->read(buffer, count) : 0;
  if (got < count && (flags & throwOnShortRead)) throwShortRead(*this, count, got);
  return got;
}

std::uint32_t Stream::write(const void* buffer, std::uint32_t count) {
  const std::uint32_t written = m_worker ? m_worker->write(buffer, count) : 0;
  if (written < count && (flags & throwOnShortWrite)) {
    raise<exception>("base::Stream::write",
                     fmt::format("stream '{}': trying to write {} bytes, written {} bytes", name(), count, written));
  }
  return written;
}

std::uint64_t Stream::skip(std::uint64_t count) {
  std::uint64_t passed = 0;
  if (has(capPosition)) {
    std::uint64_t allowed = std::min<std::uint64_t>(count, std::numeric_limits<std::int64_t>::max());
    const std::int64_t start = getPosition();
    // A seek may run past the end silently; the size says how far the data goes.
    if (has(capSize)) allowed = std::min<std::uint64_t>(allowed, std::max<std::int64_t>(getSize() - start, 0));
    passed = static_cast<std::uint64_t>(setPosition(static_cast<std::int64_t>(allowed), seekCurrent) - start);
  } else if (m_worker) {
    std::uint8_t discard[1024];
    while (passed < count) {
      const auto piece = static_cast<std::uint32_t>(std::min<std::uint64_t>(count - passed, sizeof discard));
      const std::uint32_t got = m_worker->read(discard, piece);
      passed += got;
      if (got < piece) break;
    }
  }
  if (passed < count && (flags & throwOnSkipPastEnd)) {
    raise<exception>("base::Stream::skip", fmt::format("stream '{}': seeking pass the end of stream!", name()));
  }
  return passed;
}

Stream& Stream::operator>>(Stream& destination) {
  copyRest(*this, destination, "base::Stream::operator >>", "Stream::read->write");
  return *this;
}

Stream& Stream::operator<<(Stream& source) {
  copyRest(source, *this, "base::Stream::operator <<", "Stream::write->read");
  return *this;
}

Stream Stream::clone() const {
  if (!has(capReopen)) raise<unsupported_interface>("base::Stream::clone", "Stream::reopen");
  Stream copy = m_worker->reopen();
  copy.tag = tag;
  copy.flags = flags;
  if (Hash* hasher = m_worker->hasher(); hasher && copy && copy.worker() != m_worker) {
    std::unique_ptr<Hash> fresh = hasher->clone();
    fresh->reset();
    copy.worker()->setHasher(std::move(fresh));
  }
  return copy;
}

bool copyStream(Stream& destination, Stream& source, std::int64_t maximum) {
  if (!source.has(capRead)) return false;
  if (source.has(capInMemory)) return copyFromMemory(destination, source, maximum);
  base::vector<std::uint8_t> buffer(copyPiece);
  std::int64_t left = maximum;
  for (;;) {
    const auto piece = static_cast<std::uint32_t>(maximum > 0 ? std::min<std::int64_t>(left, copyPiece) : copyPiece);
    // The last piece is short by nature: that is the end of the data, not a failure,
    // unless a maximum asked for more.
    const std::uint32_t got = source.worker()->read(buffer.data(), piece);
    if (maximum > 0 && got < piece && (source.flags & throwOnShortRead)) throwShortRead(source, piece, got);
    if (destination.write(buffer.data(), got) < got) return false;
    if (got < copyPiece || source.isEOF()) return true;
    left -= got;
    if (maximum > 0 && left <= 0) return true;
  }
}

void readLines(Stream& stream, base::vector<base::string>& lines) {
  if (!stream.has(capRead)) return;
  base::vector<std::uint8_t> buffer(copyPiece);
  base::string line;
  auto isBlank = [](std::uint8_t c) {
    return c == ' ' || c == '\t' || c == '\r' || c == '\n' || c == '\v' || c == '\f';
  };
  // The blanks after a line break are skipped even where a piece ends among them, so that
  // a line never depends on where the pieces fall.
  bool afterBreak = false;
  for (;;) {
    const std::uint32_t got = stream.worker()->read(buffer.data(), copyPiece);
    for (std::uint32_t i = 0; i < got; ++i) {
      const std::uint8_t c = buffer[i];
      if (afterBreak && isBlank(c)) continue;
      afterBreak = c == '\r' || c == '\n';
      if (!afterBreak) {
        line.push_back(static_cast<char>(c));
        continue;
      }
      if (!line.empty()) base::append(lines, std::move(line));
      line.clear();
    }
    if (got < copyPiece || stream.isEOF()) break;
  }
  if (!line.empty()) base::append(lines, std::move(line));
}

Stream nullStream() { return Stream::adopt(new NullStreamWorker); }

}  // namespace base
