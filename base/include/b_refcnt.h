#pragma once

#include "b_alloc.h"
#include "b_api.h"
#include "b_spin_lock.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <type_traits>
#include <utility>

namespace base {

/// A weak reference's node, owned by its holder and linked into the target's weak list.
/// `target` becomes null when the target dies. `guard` is held while the holder reads the
/// target and while the dying target nulls it, so a holder never sees a freed target.
struct WeakNode {
  void* target = nullptr;
  WeakNode* next = nullptr;
  SpinLock guard;
};

namespace detail {
/// The weak-reference list of one counted object. The owner provides the locking.
struct BASE1_API WeakList {
  WeakNode* head = nullptr;

  void push(WeakNode& node, void* target);
  void unlink(WeakNode& node);
  /// Nulls every node's target under the node's guard and empties the list.
  void clear();
};

/// A weak list with the spin lock that guards it: what every weak_ref target keeps.
struct BASE1_API LockedWeakList {
  SpinLock lock;
  WeakList list;

  /// Links `node` to `target`, whose list this is; the caller knows the target is alive.
  void attach(WeakNode& node, void* target);
  /// Nulls every weak reference, under the lock.
  void clear();
  /// Unlinks a holder's node, safely against a concurrent death of its target; `listOf`
  /// gives the list of the target that the node points at.
  static void detach(WeakNode& node, LockedWeakList& (*listOf)(void* target));
};
}  // namespace detail

/// Intrusive, thread-safe reference count. A new object's count is 0 until its first
/// reference. When the last reference goes, weak references are nulled under the spin lock,
/// then the release hook runs; by default it deletes the object through its destructor and
/// gives the memory back to the host allocator.
class BASE1_API RefCntAtomic : public HostAllocated {
public:
  /// The class whose weak list a weak_ref of a derived class uses.
  using WeakBase = RefCntAtomic;

  RefCntAtomic() = default;
  // A copy is a new object: it starts with no references of its own.
  RefCntAtomic(const RefCntAtomic&) {}
  RefCntAtomic& operator=(const RefCntAtomic&) { return *this; }
  virtual ~RefCntAtomic();

  void addRef() noexcept { m_count.fetch_add(1, std::memory_order_relaxed); }
  /// Drops one reference; true when that destroyed the object.
  bool release();
  std::int32_t refCount() const noexcept { return m_count.load(std::memory_order_relaxed); }

  /// Links a weak reference's node to this object; the caller knows the object is alive.
  void attachWeak(WeakNode& node);
  /// Unlinks a holder's node, safely against a concurrent last release.
  static void detachWeak(WeakNode& node);

protected:
  virtual void releaseHook();

private:
  std::atomic<std::int32_t> m_count{0};
  detail::LockedWeakList m_weak;
};

/// The same scheme for objects used by one thread: a plain count and no lock.
class BASE1_API RefCnt : public HostAllocated {
public:
  using WeakBase = RefCnt;

  RefCnt() = default;
  RefCnt(const RefCnt&) {}
  RefCnt& operator=(const RefCnt&) { return *this; }
  virtual ~RefCnt();

  void addRef() noexcept { ++m_count; }
  bool release();
  std::int32_t refCount() const noexcept { return m_count; }

  void attachWeak(WeakNode& node) { m_weak.push(node, this); }
  static void detachWeak(WeakNode& node);

private:
  std::int32_t m_count = 0;
  detail::WeakList m_weak;
};

/// What ref<T> and weak_ref<T> need of T.
template <class T>
concept IRefCnt = requires(T& object, WeakNode& node) {
  object.addRef();
  { object.release() } -> std::convertible_to<bool>;
  object.attachWeak(node);
  T::detachWeak(node);
};

/// A counted reference. Made from a raw pointer it adds a reference; assignment takes the new
/// reference before dropping the old one.
template <class T>
class ref {
public:
  ref() noexcept = default;
  ref(std::nullptr_t) noexcept {}
  ref(T* object) noexcept : m_object(object) {
    if (m_object) m_object->addRef();
  }
  ref(const ref& other) noexcept : ref(other.m_object) {}
  ref(ref&& other) noexcept : m_object(std::exchange(other.m_object, nullptr)) {}
  template <class U>
    requires std::is_convertible_v<U*, T*>
  ref(const ref<U>& other) noexcept : ref(other.get()) {}
  ~ref() { reset(); }

  ref& operator=(const ref& other) noexcept {
    assign(other.m_object);
    return *this;
  }
  ref& operator=(ref&& other) noexcept {
    if (this != &other) {
      reset();
      m_object = std::exchange(other.m_object, nullptr);
    }
    return *this;
  }
  ref& operator=(T* object) noexcept {
    assign(object);
    return *this;
  }

  void reset() noexcept {
    if (T* old = std::exchange(m_object, nullptr)) old->release();
  }

  T* get() const noexcept { return m_object; }
  T* operator->() const noexcept { return m_object; }
  T& operator*() const noexcept { return *m_object; }
  explicit operator bool() const noexcept { return m_object != nullptr; }
  friend bool operator==(const ref& a, const ref& b) noexcept { return a.m_object == b.m_object; }

private:
  void assign(T* object) noexcept {
    if (object) object->addRef();
    if (T* old = std::exchange(m_object, object)) old->release();
  }

  T* m_object = nullptr;
};

/// A reference that does not keep its target alive and reads null once the target died.
/// It never becomes a strong reference: the target is only seen inside `visit`, under the
/// node's guard, which a dying target waits for before it is destroyed.
template <class T>
class weak_ref {
public:
  weak_ref() = default;
  explicit weak_ref(T* target) { set(target); }
  weak_ref(const weak_ref&) = delete;
  weak_ref& operator=(const weak_ref&) = delete;
  ~weak_ref() { set(nullptr); }

  /// Points at `target` (alive, as the caller knows), or at nothing.
  void set(T* target) {
    T::detachWeak(m_node);
    if (target) target->attachWeak(m_node);
  }

  /// Calls `f` with the target, or with null once it died. `f` must not take references to
  /// the target or change its weak references.
  template <class F>
  decltype(auto) visit(F&& f) const {
    m_node.guard.lock();
    struct Unlock {
      SpinLock& lock;
      ~Unlock() { lock.unlock(); }
    } unlock{m_node.guard};
    return f(static_cast<T*>(static_cast<typename T::WeakBase*>(m_node.target)));
  }

  bool expired() const {
    return visit([](T* target) { return target == nullptr; });
  }

private:
  // The node stores the address of T's weak base (`T::WeakBase`, the class that owns the
  // weak list); the cast back goes through that base.
  mutable WeakNode m_node;
};

}  // namespace base
