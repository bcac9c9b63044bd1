#include "tamber/crypto/LruCache.h"

#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

namespace Tamber {
namespace Crypto {
namespace {

TEST(LruCacheTest, EvictsTheLeastRecentlyUsedEntryWhenFull) {
  LruCache<int> cache(2);
  cache.Insert("a", 1);
  cache.Insert("b", 2);
  int value = 0;
  ASSERT_TRUE(cache.Find("a", value));  // "b" is now the oldest
  cache.Insert("c", 3);
  EXPECT_EQ(2u, cache.Size());
  EXPECT_FALSE(cache.Find("b", value));
  ASSERT_TRUE(cache.Find("a", value));
  EXPECT_EQ(1, value);
  ASSERT_TRUE(cache.Find("c", value));
  EXPECT_EQ(3, value);
}

TEST(LruCacheTest, ReplacesTheValueOfAKnownKey) {
  LruCache<int> cache(2);
  cache.Insert("a", 1);
  cache.Insert("a", 5);
  int value = 0;
  ASSERT_TRUE(cache.Find("a", value));
  EXPECT_EQ(5, value);
  EXPECT_EQ(1u, cache.Size());
}

TEST(LruCacheTest, KeysAreBytesNotCStrings) {
  LruCache<int> cache(4);
  cache.Insert(std::string("a\0b", 3), 1);
  int value = 0;
  EXPECT_FALSE(cache.Find("a", value));
  EXPECT_TRUE(cache.Find(std::string("a\0b", 3), value));
}

TEST(LruCacheTest, StaysBoundedUnderConcurrentUse) {
  LruCache<int> cache(8);
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&cache, t] {
      for (int i = 0; i < 2000; ++i) {
        std::string key = std::to_string((i * 7 + t) % 20);
        int value = 0;
        if (!cache.Find(key, value)) cache.Insert(key, i);
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(8u, cache.Size());
}

}  // namespace
}  // namespace Crypto
}  // namespace Tamber
