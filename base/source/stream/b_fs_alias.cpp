#include "b_exception.h"
#include "b_fs.h"
#include "b_log.h"

#include <fmt/format.h>

#include <algorithm>

namespace base::fs {
namespace {
// More replacements than any sane table needs; an alias that reappears later in its own
// text (not at its start) grows the path without end and is stopped by this.
constexpr int maximumExpansions = 256;
}  // namespace

void AliasTable::set(std::string_view name, std::string_view text) {
  std::lock_guard lock(m_lock);
  if (text.empty()) {
    if (auto found = m_aliases.find(name); found != m_aliases.end()) m_aliases.erase(found);
    return;
  }
  m_aliases.insert_or_assign(base::string(name), base::string(text));
}

void AliasTable::clear() {
  std::lock_guard lock(m_lock);
  m_aliases.clear();
}

base::string AliasTable::expand(std::string_view path) const {
  std::lock_guard lock(m_lock);
  base::string result(path);
  // The aliases replaced at the current position since it last moved: meeting one of them
  // again there means a cycle.
  base::vector<const base::string*> atPosition;
  int expansions = 0;
  for (std::size_t position = 0;;) {
    const std::size_t colon = result.find(':', position);
    if (colon == base::string::npos) return result;
    const std::string_view name = std::string_view(result).substr(position, colon - position);
    const auto alias = name.size() < 2 ? m_aliases.end() : m_aliases.find(name);
    if (alias == m_aliases.end()) {
      position = colon + 1;
      atPosition.clear();
      continue;
    }
    if (std::find(atPosition.begin(), atPosition.end(), &alias->first) != atPosition.end() ||
        ++expansions > maximumExpansions) {
      raise<invalid_argument>("base::fs::AliasTable::expand", fmt::format("alias '{}' expands into itself in '{}'",
                                                                          clipped(alias->first), clipped(path)));
    }
    atPosition.push_back(&alias->first);
    result.replace(position, colon + 1 - position, alias->second);
  }
}

}  // namespace base::fs
