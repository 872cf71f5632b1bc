#include <tarnik/core/weak_linkable_impl.h>

#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

#include <tarnik/core/checked_cast.h>

namespace Tarnik {
namespace {

class Probe : public WeakLinkableImpl<ObjectImpl> {
 public:
  explicit Probe(int& deaths) : deaths_(deaths) {}
  void OnFirstRef() const noexcept override { ++firstRefs; }
  void OnLastRef() const noexcept override { ++lastRefs; }

  static inline std::atomic<int> firstRefs{0};
  static inline std::atomic<int> lastRefs{0};

 private:
  ~Probe() override { ++deaths_; }
  int& deaths_;
};

TEST(ObjectImplTest, DiesWithItsLastReferenceAndTellsOfIt) {
  Probe::firstRefs = 0;
  Probe::lastRefs = 0;
  int deaths = 0;
  Ref<Probe> first = MakeRef<Probe>(deaths);
  EXPECT_EQ(first->RefCount(), 1);
  Ref<Probe> second = first;
  EXPECT_EQ(first->RefCount(), 2);
  first.reset();
  EXPECT_EQ(deaths, 0);
  second.reset();
  EXPECT_EQ(deaths, 1);
  EXPECT_EQ(Probe::firstRefs, 1);
  EXPECT_EQ(Probe::lastRefs, 1);
}

TEST(ObjectImplTest, ToStringNamesTheClass) {
  int deaths = 0;
  EXPECT_NE(MakeRef<Probe>(deaths)->ToString().find("Probe"), std::string::npos);
}

TEST(WeakLinkableImplTest, WeakReferenceFollowsTheObjectsLife) {
  int deaths = 0;
  Ref<Probe> object = MakeRef<Probe>(deaths);
  EXPECT_FALSE(object->HasLink());
  WeakRef weak;
  EXPECT_EQ(weak.Lock(), nullptr);
  object->AttachWeakRef(weak);
  EXPECT_TRUE(object->HasLink());
  EXPECT_EQ(weak.Lock().get(), static_cast<const Object*>(object.get()));
  EXPECT_EQ(object->RefCount(), 1);
  object.reset();
  EXPECT_EQ(deaths, 1);
  EXPECT_EQ(weak.Lock(), nullptr);
}

TEST(WeakLinkableImplTest, ConcurrentLockingNeverRevivesADyingObject) {
  for (int round = 0; round < 200; ++round) {
    int deaths = 0;
    Ref<Probe> object = MakeRef<Probe>(deaths);
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
    EXPECT_EQ(deaths, 1);
  }
}

TEST(CheckedCastTest, RefusesAnotherClassAndNull) {
  int deaths = 0;
  const Ref<Probe> object = MakeRef<Probe>(deaths);
  Object* base = object.get();
  EXPECT_EQ(CheckedCast<Probe>(base), object.get());
  class Other : public ObjectImpl {};
  EXPECT_THROW(CheckedCast<Other>(base), TypeMismatchException);
  EXPECT_THROW(CheckedCast<Probe>(static_cast<Object*>(nullptr)), TypeMismatchException);
}

}  // namespace
}  // namespace Tarnik
