#include "b_refcnt.h"

#include <gtest/gtest.h>

#include <atomic>
#include <memory>
#include <thread>
#include <vector>

namespace {

struct Counted : base::RefCntAtomic {
  explicit Counted(std::atomic<int>* destroyed) : destroyed(destroyed) {}
  ~Counted() override { ++*destroyed; }
  std::atomic<int>* destroyed;
};

struct Local : base::RefCnt {
  explicit Local(int* destroyed) : destroyed(destroyed) {}
  ~Local() override { ++*destroyed; }
  int* destroyed;
};

// Runs `work` on `count` threads at once and waits for all of them.
template <class Work>
void inParallel(int count, Work work) {
  std::vector<std::thread> threads;
  for (int t = 0; t < count; ++t) threads.emplace_back(work);
  for (auto& thread : threads) thread.join();
}

// A weak reference reads null once the last strong one went, with either kind of count.
template <class Object, class Counter>
void expectWeakClearedOnLastRelease() {
  Counter destroyed = 0;
  base::weak_ref<Object> weak;
  {
    base::ref<Object> strong(new Object(&destroyed));
    weak.set(strong.get());
    EXPECT_TRUE(weak.visit([&](Object* target) { return target == strong.get(); }));
  }
  EXPECT_TRUE(weak.expired());
  EXPECT_EQ(destroyed, 1);
}

TEST(Ref, CountsFromZeroAndDestroysOnTheLastRelease) {
  std::atomic<int> destroyed = 0;
  auto* object = new Counted(&destroyed);
  EXPECT_EQ(object->refCount(), 0);
  {
    base::ref<Counted> first(object);
    base::ref<Counted> second = first;
    EXPECT_EQ(object->refCount(), 2);
    base::ref<Counted> moved = std::move(second);
    EXPECT_FALSE(second);
    EXPECT_EQ(object->refCount(), 2);
  }
  EXPECT_EQ(destroyed, 1);
}

TEST(Ref, SelfAssignmentKeepsTheObject) {
  std::atomic<int> destroyed = 0;
  base::ref<Counted> only(new Counted(&destroyed));
  auto& alias = only;
  only = alias;
  only = only.get();
  EXPECT_EQ(destroyed, 0);
  EXPECT_EQ(only->refCount(), 1);
}

TEST(WeakRef, ReadsNullAfterTheLastReleaseAndOutlivesItsTarget) {
  expectWeakClearedOnLastRelease<Counted, std::atomic<int>>();
  expectWeakClearedOnLastRelease<Local, int>();
}

TEST(WeakRef, HolderGoingFirstUnlinksItsNode) {
  std::atomic<int> destroyed = 0;
  base::ref<Counted> strong(new Counted(&destroyed));
  {
    base::weak_ref<Counted> a(strong.get());
    base::weak_ref<Counted> b(strong.get());
    base::weak_ref<Counted> c(strong.get());
  }
  // Releasing now must not touch the nodes of the holders that are gone (ASan would see it).
  base::weak_ref<Counted> survivor(strong.get());
  strong.reset();
  EXPECT_TRUE(survivor.expired());
}

TEST(WeakRef, ObjectDestroyedWithoutReleaseClearsItsWeakReferences) {
  std::atomic<int> destroyed = 0;
  base::weak_ref<Counted> weak;
  {
    Counted onTheStack(&destroyed);
    weak.set(&onTheStack);
  }
  EXPECT_TRUE(weak.expired());
}

TEST(RefCntAtomic, ConcurrentReferencesDestroyExactlyOnce) {
  std::atomic<int> destroyed = 0;
  base::ref<Counted> shared(new Counted(&destroyed));
  inParallel(4, [&shared] {
    for (int i = 0; i < 20000; ++i) base::ref<Counted> copy = shared;
  });
  EXPECT_EQ(shared->refCount(), 1);
  shared.reset();
  EXPECT_EQ(destroyed, 1);
}

TEST(WeakRef, RacingTheLastReleaseNeverSeesAFreedTarget) {
  // Holders attach, read and detach while other threads drop the last references; under
  // AddressSanitizer any read of a freed target or node fails the test.
  for (int round = 0; round < 200; ++round) {
    std::atomic<int> destroyed = 0;
    auto* object = new Counted(&destroyed);
    base::ref<Counted> a(object);
    base::ref<Counted> b(object);
    base::weak_ref<Counted> early(object);
    auto dropped = std::make_unique<base::weak_ref<Counted>>(object);
    std::atomic<int> started = 0;
    inParallel(4, [&] {
      const int role = started++;
      // Yielding: on two cores, four spinning threads would starve each other.
      while (started < 4) std::this_thread::yield();
      switch (role) {
        case 0:
          for (int i = 0; i < 50; ++i) early.visit([](Counted* target) { return target ? target->refCount() : -1; });
          break;
        case 1:  // a holder that goes while the target dies unlinks or finds itself cleared, never both
          dropped.reset();
          break;
        case 2:
          a.reset();
          break;
        default:
          b.reset();
      }
    });
    EXPECT_EQ(destroyed, 1);
    EXPECT_TRUE(early.expired());
  }
}

TEST(SpinLock, ExcludesUnderContention) {
  base::SpinLock lock;
  long counter = 0;
  inParallel(4, [&] {
    for (int i = 0; i < 20000; ++i) {
      lock.lock();
      ++counter;
      lock.unlock();
    }
  });
  EXPECT_EQ(counter, 80000);
}

}  // namespace
