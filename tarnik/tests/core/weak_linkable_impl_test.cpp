#include <atomic>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/weak_linkable_impl.h>

namespace Tarnik::Testing {
namespace {

class Probe : public WeakLinkableImpl<ObjectImpl> {
 public:
  explicit Probe(int& destructions) : destructions_(destructions) {}
  void OnFirstRef() const noexcept override { ++firstRefs; }
  void OnLastRef() const noexcept override { ++lastRefs; }

  static inline std::atomic<int> firstRefs{0};
  static inline std::atomic<int> lastRefs{0};

 private:
  ~Probe() override { ++destructions_; }
  int& destructions_;
};

TEST(ObjectImplTest, IsDestroyedWithItsLastReferenceAndCallsTheHooks) {
  Probe::firstRefs = 0;
  Probe::lastRefs = 0;
  int destructions = 0;
  Ref<Probe> first = MakeRef<Probe>(destructions);
  EXPECT_EQ(first->RefCount(), 1);
  Ref<Probe> second = first;
  EXPECT_EQ(first->RefCount(), 2);
  first.reset();
  EXPECT_EQ(destructions, 0);
  second.reset();
  EXPECT_EQ(destructions, 1);
  EXPECT_EQ(Probe::firstRefs, 1);
  EXPECT_EQ(Probe::lastRefs, 1);
}

TEST(ObjectImplTest, ToStringNamesTheClass) {
  int destructions = 0;
  EXPECT_NE(MakeRef<Probe>(destructions)->ToString().find("Probe"), std::string::npos);
}

TEST(WeakLinkableImplTest, WeakReferenceFollowsTheObjectsLifetime) {
  int destructions = 0;
  Ref<Probe> object = MakeRef<Probe>(destructions);
  EXPECT_FALSE(object->HasLink());
  WeakRef weak;
  EXPECT_EQ(weak.Lock(), nullptr);
  object->AttachWeakRef(weak);
  EXPECT_TRUE(object->HasLink());
  EXPECT_EQ(weak.Lock().get(), static_cast<const Object*>(object.get()));
  EXPECT_EQ(object->RefCount(), 1);
  object.reset();
  EXPECT_EQ(destructions, 1);
  EXPECT_EQ(weak.Lock(), nullptr);
}

TEST(WeakLinkableImplTest, ConcurrentLockingNeverRevivesADyingObject) {
  for (int round = 0; round < 200; ++round) {
    int destructions = 0;
    Ref<Probe> object = MakeRef<Probe>(destructions);
    WeakRef weak;
    object->AttachWeakRef(weak);
    std::vector<std::thread> threads;
    for (int i = 0; i < 2; ++i) {
      threads.emplace_back([weak] {
        while (const auto locked = weak.Lock()) {
          EXPECT_GE(locked->RefCount(), 1);
        }
      });
    }
    object.reset();
    for (auto& thread : threads) {
      thread.join();
    }
    EXPECT_EQ(destructions, 1);
  }
}

TEST(CheckedCastTest, RefusesAnotherClassAndNull) {
  int destructions = 0;
  const Ref<Probe> object = MakeRef<Probe>(destructions);
  Object* base = object.get();
  EXPECT_EQ(CheckedCast<Probe>(base), object.get());
  class Other : public ObjectImpl {};
  EXPECT_THROW(CheckedCast<Other>(base), TypeMismatchException);
  EXPECT_THROW(CheckedCast<Probe>(static_cast<Object*>(nullptr)), TypeMismatchException);
}

}  // namespace
}  // namespace Tarnik::Testing
