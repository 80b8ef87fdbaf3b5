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

}  // namespace detail

// An object destroyed without its last release (one on the stack, say) still leaves no
// weak reference dangling.
RefCntAtomic::~RefCntAtomic() {
  m_lock.lock();
  m_weak.clear();
  m_lock.unlock();
}

bool RefCntAtomic::release() {
  if (m_count.fetch_sub(1, std::memory_order_acq_rel) != 1) return false;
  m_lock.lock();
  m_weak.clear();
  m_lock.unlock();
  releaseHook();
  return true;
}

void RefCntAtomic::releaseHook() { delete this; }

void RefCntAtomic::attachWeak(WeakNode& node) {
  m_lock.lock();
  m_weak.push(node, this);
  m_lock.unlock();
}

void RefCntAtomic::detachWeak(WeakNode& node) {
  // Lock order is target, then node (the dying target's order). Holding the node's guard
  // keeps the target alive, so it is safe to try its lock; on contention let go and retry.
  unsigned attempt = 0;
  for (;;) {
    node.guard.lock();
    auto* target = static_cast<RefCntAtomic*>(node.target);
    if (!target) {
      node.guard.unlock();
      return;
    }
    if (target->m_lock.try_lock()) {
      target->m_weak.unlink(node);
      target->m_lock.unlock();
      node.guard.unlock();
      return;
    }
    node.guard.unlock();
    SpinLock::backOff(attempt);
  }
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
