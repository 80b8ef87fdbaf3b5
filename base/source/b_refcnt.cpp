#include "b_refcnt.h"

namespace base {
namespace detail {

void WeakList::push(WeakNode& node, void* target) {
  node.target = target;
  node.next = head;
  head = &node;
}

void WeakList::unlink(WeakNode& node) {
  for (WeakNode** link = &head; *link; link = &(*link)->next) {
    if (*link == &node) {
      *link = node.next;
      break;
    }
  }
  node.target = nullptr;
  node.next = nullptr;
}

void WeakList::clear() {
  WeakNode* node = head;
  head = nullptr;
  while (node) {
    // Read the link first: once the guard is released the holder may free its node.
    WeakNode* next = node->next;
    node->guard.lock();
    node->target = nullptr;
    node->next = nullptr;
    node->guard.unlock();
    node = next;
  }
}

void LockedWeakList::attach(WeakNode& node, void* target) {
  lock.lock();
  list.push(node, target);
  lock.unlock();
}

void LockedWeakList::clear() {
  lock.lock();
  list.clear();
  lock.unlock();
}

void LockedWeakList::detach(WeakNode& node, LockedWeakList& (*listOf)(void* target)) {
  // Lock order is target, then node (the dying target's order). Holding the node's guard
  // keeps the target alive, so it is safe to try its lock; on contention let go and retry.
  unsigned attempt = 0;
  for (;;) {
    node.guard.lock();
    if (!node.target) {
      node.guard.unlock();
      return;
    }
    LockedWeakList& weak = listOf(node.target);
    if (weak.lock.try_lock()) {
      weak.list.unlink(node);
      weak.lock.unlock();
      node.guard.unlock();
      return;
    }
    node.guard.unlock();
    SpinLock::backOff(attempt);
  }
}

}  // namespace detail

// An object destroyed without its last release (one on the stack, say) still leaves no
// weak reference dangling.
RefCntAtomic::~RefCntAtomic() { m_weak.clear(); }

bool RefCntAtomic::release() {
  if (m_count.fetch_sub(1, std::memory_order_acq_rel) != 1) return false;
  m_weak.clear();
  releaseHook();
  return true;
}

void RefCntAtomic::releaseHook() { delete this; }

void RefCntAtomic::attachWeak(WeakNode& node) { m_weak.attach(node, this); }

void RefCntAtomic::detachWeak(WeakNode& node) {
  detail::LockedWeakList::detach(
      node, [](void* target) -> detail::LockedWeakList& { return static_cast<RefCntAtomic*>(target)->m_weak; });
}

RefCnt::~RefCnt() { m_weak.clear(); }

bool RefCnt::release() {
  if (--m_count != 0) return false;
  m_weak.clear();
  delete this;
  return true;
}

void RefCnt::detachWeak(WeakNode& node) {
  if (auto* target = static_cast<RefCnt*>(node.target)) target->m_weak.unlink(node);
}

}  // namespace base
