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
  std::atomic<int> destroyed = 0;
  base::weak_ref<Counted> weak;
  {
    base::ref<Counted> strong(new Counted(&destroyed));
    weak.set(strong.get());
    EXPECT_TRUE(weak.visit([&](Counted* target) { return target == strong.get(); }));
  }
  EXPECT_TRUE(weak.expired());
  EXPECT_EQ(destroyed, 1);
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

TEST(WeakRef, SingleThreadedCountClearsWeakReferencesToo) {
  int destroyed = 0;
  base::weak_ref<Local> weak;
  {
    base::ref<Local> strong(new Local(&destroyed));
    weak.set(strong.get());
    EXPECT_FALSE(weak.expired());
  }
  EXPECT_EQ(destroyed, 1);
  EXPECT_TRUE(weak.expired());
}

TEST(RefCntAtomic, ConcurrentReferencesDestroyExactlyOnce) {
  std::atomic<int> destroyed = 0;
  base::ref<Counted> shared(new Counted(&destroyed));
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&shared] {
      for (int i = 0; i < 20000; ++i) base::ref<Counted> copy = shared;
    });
  }
  for (auto& thread : threads) thread.join();
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
    std::atomic<bool> go = false;
    std::thread reader([&] {
      while (!go) {
      }
      for (int i = 0; i < 50; ++i) early.visit([](Counted* target) { return target ? target->refCount() : -1; });
    });
    // A holder that goes while the target dies unlinks or finds itself cleared, never both.
    std::thread holder([&] {
      while (!go) {
      }
      dropped.reset();
    });
    std::thread dropA([&] {
      while (!go) {
      }
      a.reset();
    });
    std::thread dropB([&] {
      while (!go) {
      }
      b.reset();
    });
    go = true;
    reader.join();
    holder.join();
    dropA.join();
    dropB.join();
    EXPECT_EQ(destroyed, 1);
    EXPECT_TRUE(early.expired());
  }
}

TEST(SpinLock, BackOffSteps) {
  using B = base::SpinLock::BackOff;
  EXPECT_EQ(base::SpinLock::backOffStep(0), B::spin);
  EXPECT_EQ(base::SpinLock::backOffStep(59), B::spin);
  EXPECT_EQ(base::SpinLock::backOffStep(60), B::yield);
  EXPECT_EQ(base::SpinLock::backOffStep(89), B::yield);
  EXPECT_EQ(base::SpinLock::backOffStep(90), B::sleep0);
  EXPECT_EQ(base::SpinLock::backOffStep(104), B::sleep0);
  EXPECT_EQ(base::SpinLock::backOffStep(105), B::sleep1);
  unsigned attempt = 105;
  base::SpinLock::backOff(attempt);
  EXPECT_EQ(attempt, 0u);
  base::SpinLock::backOff(attempt);
  EXPECT_EQ(attempt, 1u);
}

TEST(SpinLock, ExcludesUnderContention) {
  base::SpinLock lock;
  long counter = 0;
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&] {
      for (int i = 0; i < 20000; ++i) {
        lock.lock();
        ++counter;
        lock.unlock();
      }
    });
  }
  for (auto& thread : threads) thread.join();
  EXPECT_EQ(counter, 80000);
}

}  // namespace
