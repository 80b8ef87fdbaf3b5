#include "b_progress.h"

#include "b_log.h"

#include <algorithm>

namespace base {

Progress::Progress(name_id category, std::string_view what, std::uint64_t total)
    : m_category(category), m_what(what), m_total(total) {}

Progress::~Progress() {
  log().progress(m_category, m_what, m_total, m_total);
  log().message(m_category, logDebug, "{}: done", m_what);
}

void Progress::report(std::uint64_t done) {
  const std::uint64_t percent = m_total ? std::min<std::uint64_t>(100, done * 100 / m_total) : 100;
  // The next report is due at the next whole percent.
  m_next = m_total ? (m_total * (percent + 1) + 99) / 100 : ~std::uint64_t(0);
  log().progress(m_category, m_what, done, m_total);
  if (percent / 10 > m_logged / 10 || done == 0) {
    m_logged = percent;
    log().message(m_category, logDebug, "{}: {}%", m_what, percent);
  }
}

namespace {

// The stream whose position tells how far a read has come: the source itself, or, for data
// without a size (a gzip file's), the sized stream that the data is decoded from.
Stream measuredStream(const Stream& source) {
  if (source.has(capSize | capPosition) || !source.has(capSource)) return source;
  Stream inner = source.worker()->getSource();
  return inner.has(capSize | capPosition) ? inner : source;
}

// Reads through to the source and reports the position after each read.
class ProgressWorker final : public StreamWorker {
 public:
  ProgressWorker(const Stream& source, std::string_view what)
      : StreamWorker(source.worker()->capabilities() & ~(capMemory | capInMemory | capWrite | capSetSize),
                     source.name()),
        m_source(source),
        m_measured(measuredStream(source)),
        m_progress(logIO, what, static_cast<std::uint64_t>(m_measured.getSize())) {}

  std::uint32_t read(void* buffer, std::uint32_t count) override {
    const std::uint32_t got = m_source.read(buffer, count);
    m_progress.at(static_cast<std::uint64_t>(m_measured.getPosition()));
    return got;
  }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t origin) override {
    return m_source.setPosition(offset, origin);
  }
  std::int64_t getPosition() override { return m_source.getPosition(); }
  std::int64_t getSize() override { return m_source.getSize(); }
  bool isEOF() override { return m_source.isEOF(); }
  Stream getSource() override { return m_source; }
  Stream reopen() override { return m_source.clone(); }

 private:
  Stream m_source;
  Stream m_measured;
  Progress m_progress;
};

}  // namespace

Stream progressStream(const Stream& source, std::string_view what) {
  return Stream::adopt(new ProgressWorker(source, what));
}

}  // namespace base
