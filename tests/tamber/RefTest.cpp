#include "tamber/Ref.h"

#include <gtest/gtest.h>

#include <thread>
#include <vector>

namespace {

using Tamber::Ref;

// Counts the references it holds and its destruction; the counting itself stays Object's.
class Tracked : public Tamber::Object {
 public:
  explicit Tracked(int& destroyed) : _destroyed(destroyed) {}
  void AddRef() const override {
    ++references;
    Object::AddRef();
  }
  void Release() const override {
    --references;
    Object::Release();
  }
  mutable std::atomic<int> references{0};

 protected:
  ~Tracked() override { ++_destroyed; }

 private:
  int& _destroyed;
};

class DerivedTracked : public Tracked {
 public:
  using Tracked::Tracked;
};

TEST(RefTest, LastReleaseDeletesOnce) {
  int destroyed = 0;
  Tracked* object = new Tracked(destroyed);
  {
    Ref<Tracked> first(object);
    EXPECT_EQ(object->references, 1);
    {
      Ref<Tracked> second(first);
      EXPECT_EQ(object->references, 2);
    }
    EXPECT_EQ(object->references, 1);
    EXPECT_EQ(destroyed, 0);
  }
  EXPECT_EQ(destroyed, 1);
}

TEST(RefTest, MoveTransfersWithoutCounting) {
  int destroyed = 0;
  Ref<Tracked> source(new Tracked(destroyed));
  Tracked* object = source.get();
  Ref<Tracked> target(std::move(source));
  EXPECT_FALSE(source);
  EXPECT_EQ(target.get(), object);
  EXPECT_EQ(object->references, 1);
  Ref<Tracked> assigned;
  assigned = std::move(target);
  EXPECT_FALSE(target);
  EXPECT_EQ(object->references, 1);
  assigned.reset();
  EXPECT_EQ(destroyed, 1);
}

TEST(RefTest, ConvertsToBaseAndConst) {
  int destroyed = 0;
  Ref<DerivedTracked> derived(new DerivedTracked(destroyed));
  Tracked* object = derived.get();
  Ref<Tracked> base(derived);
  Ref<const Tamber::Object> constObject(derived);
  EXPECT_EQ(object->references, 3);
  EXPECT_TRUE(base == derived);
  Ref<Tracked> moved(std::move(derived));
  EXPECT_FALSE(derived);
  EXPECT_EQ(object->references, 3);
  base.reset();
  moved.reset();
  EXPECT_EQ(destroyed, 0);
  constObject.reset();
  EXPECT_EQ(destroyed, 1);
}

TEST(RefTest, AssignmentReleasesThePreviousObject) {
  int destroyedFirst = 0;
  int destroyedSecond = 0;
  Ref<Tracked> ref(new Tracked(destroyedFirst));
  Ref<Tracked> other(new Tracked(destroyedSecond));
  ref = other;
  EXPECT_EQ(destroyedFirst, 1);
  EXPECT_EQ(other->references, 2);
  ref = new Tracked(destroyedFirst);
  EXPECT_EQ(other->references, 1);
  ref = nullptr;
  EXPECT_EQ(destroyedFirst, 2);
  other = nullptr;
  EXPECT_EQ(destroyedSecond, 1);
}

TEST(RefTest, SelfAssignmentKeepsTheObject) {
  int destroyed = 0;
  Ref<Tracked> ref(new Tracked(destroyed));
  Ref<Tracked>& alias = ref;
  ref = alias;
  ref = std::move(alias);
  ASSERT_TRUE(ref);
  EXPECT_EQ(ref->references, 1);
  EXPECT_EQ(destroyed, 0);
}

TEST(RefTest, DetachHandsOverTheReference) {
  int destroyed = 0;
  Ref<Tracked> ref(new Tracked(destroyed));
  Tracked* object = ref.detach();
  EXPECT_FALSE(ref);
  EXPECT_EQ(object->references, 1);
  EXPECT_EQ(destroyed, 0);
  object->Release();
  EXPECT_EQ(destroyed, 1);
}

TEST(RefTest, ComparesByIdentity) {
  int destroyed = 0;
  Ref<Tracked> a(new Tracked(destroyed));
  Ref<Tracked> b(new Tracked(destroyed));
  Ref<const Tracked> alsoA(a);
  EXPECT_TRUE(a == alsoA);
  EXPECT_TRUE(a != b);
  EXPECT_TRUE(Ref<Tracked>() == Ref<Tracked>(nullptr));
}

TEST(RefTest, CountsCorrectlyAcrossThreads) {
  int destroyed = 0;
  Ref<Tracked> shared(new Tracked(destroyed));
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&shared] {
      for (int i = 0; i < 20000; ++i) {
        Ref<Tracked> copy(shared);
        Ref<Tamber::Object> base(copy);
      }
    });
  }
  for (auto& thread : threads) thread.join();
  EXPECT_EQ(shared->references, 1);
  EXPECT_EQ(destroyed, 0);
  shared.reset();
  EXPECT_EQ(destroyed, 1);
}

}  // namespace
