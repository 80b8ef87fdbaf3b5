#include "b_alloc.h"
#include "b_name.h"

#include <cstring>
#include <mutex>
#include <shared_mutex>
#include <unordered_map>

namespace base {
namespace {

// Texts live in large chunks that are never freed, so a handle stays valid for the life
// of the process and interning a short text costs no allocation of its own.
class NameArena {
 public:
  const char* store(std::string_view text) {
    const std::size_t needed = text.size() + 1;
    if (needed > m_left) refill(needed);
    char* copy = m_next;
    std::memcpy(copy, text.data(), text.size());
    copy[text.size()] = '\0';
    m_next += needed;
    m_left -= needed;
    return copy;
  }

 private:
  static constexpr std::size_t chunkSize = 64 * 1024;

  void refill(std::size_t needed) {
    const std::size_t size = needed > chunkSize ? needed : chunkSize;
    m_next = static_cast<char*>(StdAllocPolicy::allocateBytes(size, __FILE__, __LINE__, "base::NameArena::refill"));
    m_left = size;
  }

  char* m_next = nullptr;
  std::size_t m_left = 0;
};

class InternTable final : public NameServer {
 public:
  name_id intern(std::string_view text) override {
    if (name_id found = find(text)) return found;
    std::unique_lock lock(m_mutex);
    auto it = m_names.find(text);
    if (it != m_names.end()) return &it->second;
    const char* stored = m_arena.store(text);
    const std::string_view key(stored, text.size());
    return &m_names.emplace(key, NameRecord{stored, text.size()}).first->second;
  }

  name_id find(std::string_view text) const override {
    std::shared_lock lock(m_mutex);
    auto it = m_names.find(text);
    return it == m_names.end() ? nullptr : &it->second;
  }

  std::size_t size() const override {
    std::shared_lock lock(m_mutex);
    return m_names.size();
  }

 private:
  mutable std::shared_mutex m_mutex;
  // Node-based, so a record's address (the handle) never moves on rehash.
  std::unordered_map<std::string_view, NameRecord> m_names;
  NameArena m_arena;
};

}  // namespace

NameServer::~NameServer() = default;

NameServer& nameServer() {
  // Never destroyed: handles must outlive every static object of every module.
  static InternTable* table = new InternTable;
  return *table;
}

}  // namespace base
