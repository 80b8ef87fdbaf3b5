#pragma once

#include "b_api.h"
#include "b_name.h"
#include "b_stream.h"

#include <cstdint>
#include <string>
#include <string_view>

namespace base {

/// Progress of long work through the log: every change of the whole percentage goes to the
/// sinks' progress call (a front end draws a bar from it), and each tenth is also a debug
/// message in `category` ("Reading plugins: 40%"); the end is "...: done".
class BASE1_API Progress {
 public:
  Progress(name_id category, std::string_view what, std::uint64_t total);
  ~Progress();
  Progress(const Progress&) = delete;
  Progress& operator=(const Progress&) = delete;

  /// `done` of the total are done. Cheap when the percentage did not change.
  void at(std::uint64_t done) {
    if (done >= m_next) report(done);
  }

 private:
  void report(std::uint64_t done);

  name_id m_category;
  std::string m_what;
  std::uint64_t m_total;
  std::uint64_t m_next = 0;
  std::uint64_t m_logged = 0;
};

/// A stream that reads `source` and reports how far it has read, by position and size,
/// through a Progress named `what`. The source must know its size.
BASE1_API Stream progressStream(const Stream& source, std::string_view what);

}  // namespace base
