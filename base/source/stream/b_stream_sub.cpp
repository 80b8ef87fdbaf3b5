#include "b_exception.h"
#include "b_stream.h"

#include <algorithm>

namespace base {
namespace {

// A window onto a parent stream. It reads at the parent's position, so it keeps no position
// of its own; setPosition moves the parent.
class SubStreamWorker final : public StreamWorker {
 public:
  SubStreamWorker(const Stream& parent, std::int64_t offset, std::int64_t length, std::string_view name)
      : StreamWorker(capsSubStream, name.empty() ? std::string_view(parent.name()) : name),
        m_parent(parent),
        m_offset(offset),
        m_length(length) {
    m_parent.setPosition(m_offset, seekBegin);
  }

  const std::uint8_t* getMemory(std::int64_t* offset, std::int64_t* size) override {
    std::int64_t parentOffset = 0;
    std::int64_t parentSize = 0;
    const std::uint8_t* block = m_parent.worker()->getMemory(&parentOffset, &parentSize);
    if (!block || m_offset + m_length > parentSize) return nullptr;
    if (offset) *offset = parentOffset + m_offset;
    if (size) *size = m_length;
    return block;
  }
  std::uint32_t read(void* buffer, std::uint32_t count) override {
    const std::int64_t left = std::max<std::int64_t>(m_length - getPosition(), 0);
    return m_parent.read(buffer, static_cast<std::uint32_t>(std::min<std::int64_t>(count, left)));
  }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t origin) override {
    if (origin > seekEnd) return getPosition();
    std::int64_t target = offset;
    if (origin == seekCurrent) target += getPosition();
    if (origin == seekEnd) target += m_length;
    m_parent.setPosition(m_offset + std::clamp<std::int64_t>(target, 0, m_length), seekBegin);
    return getPosition();
  }
  std::int64_t getPosition() override { return m_parent.getPosition() - m_offset; }
  std::int64_t getSize() override { return m_length; }
  bool isEOF() override { return getPosition() >= m_length; }
  void close() override {
    m_parent.reset();
    StreamWorker::close();
  }

 private:
  Stream m_parent;
  std::int64_t m_offset;
  std::int64_t m_length;
};

}  // namespace

Stream subStream(const Stream& parent, std::int64_t offset, std::int64_t length, std::string_view name) {
  // The window reads at the parent's position, so the parent must be able to move there.
  if (!parent.has(capPosition)) raise<unsupported_interface>("base::subStream", "Stream::setPosition");
  offset = std::max<std::int64_t>(offset, 0);
  std::int64_t window = std::max<std::int64_t>(length, 0);
  if (parent.has(capSize)) {
    const std::int64_t parentSize = parent.getSize();
    if (offset > parentSize) raise<exception>("base::subStream", "empty substream of '" + parent.name() + "'!");
    window = std::min(window, parentSize - offset);
  }
  Stream stream = Stream::adopt(new SubStreamWorker(parent, offset, window, name));
  stream.tag = parent.tag;
  return stream;
}

}  // namespace base
