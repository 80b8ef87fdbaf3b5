#include "b_name.h"

#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

namespace {

TEST(NameServer, EqualWholeTextsGiveTheIdenticalHandle) {
  std::string first = "positions";
  std::string second = "positions";
  base::name_id a = base::intern(first);
  EXPECT_EQ(a, base::intern(second.c_str()));
  EXPECT_NE(a, base::intern("position"));
  EXPECT_EQ(base::text(a), "positions");
  EXPECT_EQ(a->text[a->length], '\0');

  // An embedded NUL does not end the text.
  const std::string withNul("ab\0cd", 5);
  EXPECT_NE(base::intern(withNul), base::intern("ab"));
  EXPECT_EQ(base::text(base::intern(withNul)), withNul);

  // "" is a valid handle of its own; only the null handle means "not set".
  base::name_id empty = base::intern("");
  ASSERT_NE(empty, nullptr);
  EXPECT_EQ(empty, base::intern(std::string_view()));
  EXPECT_EQ(base::text(empty), "");
  EXPECT_EQ(base::text(nullptr), "");
}

TEST(NameServer, FindDoesNotInsert) {
  const std::size_t before = base::nameServer().size();
  EXPECT_EQ(base::nameServer().find("never interned anywhere 8f3a"), nullptr);
  EXPECT_EQ(base::nameServer().size(), before);
}

TEST(NameServer, ConcurrentInterningLosesNothingAndAgrees) {
  constexpr int threadCount = 8;
  constexpr int namesPerThread = 2000;
  // Every thread interns the shared names in a different order, plus names of its own.
  auto sharedName = [](int t, int i) { return "shared-" + std::to_string((i * 7919 + t * 131) % namesPerThread); };
  const std::size_t before = base::nameServer().size();
  std::vector<std::vector<base::name_id>> seen(threadCount);
  std::vector<std::thread> threads;
  for (int t = 0; t < threadCount; ++t) {
    threads.emplace_back([t, &seen, &sharedName] {
      for (int i = 0; i < namesPerThread; ++i) {
        seen[t].push_back(base::intern(sharedName(t, i)));
        base::intern("own-" + std::to_string(t) + "-" + std::to_string(i));
      }
    });
  }
  for (std::thread& thread : threads) thread.join();

  EXPECT_EQ(base::nameServer().size(), before + namesPerThread + threadCount * namesPerThread);
  for (int t = 0; t < threadCount; ++t) {
    for (int i = 0; i < namesPerThread; ++i) EXPECT_EQ(seen[t][i], base::nameServer().find(sharedName(t, i)));
  }
}

}  // namespace
