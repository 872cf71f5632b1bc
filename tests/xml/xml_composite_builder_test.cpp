#include "xml/builders.h"

#include <gmock/gmock.h>

#include <stdexcept>
#include <thread>

#include "support/vtable_slot.h"
#include "xml/built_xml.h"

namespace SsoClient {
namespace {

TEST(XMLCompositeBuilderTest, WithoutChildrenItBuildsExactlyItsRoot) {
  const XMLCompositeBuilder builder(MakeTextElementBuilder("a", "E", "text", {{"b", "c"}}));
  EXPECT_EQ(Testing::BuiltXml(builder), R"(<a:E b="c">text</a:E>)");
}

TEST(XMLCompositeBuilderTest, ChildrenFollowTheRootsOwnInTheOrderOfTheirAddition) {
  XMLCompositeBuilder builder(MakeTextElementBuilder("", "Root", "text"));
  builder.Add(MakeTextElementBuilder("", "Second", "2"))
      .Add(MakeTextElementBuilder("", "First", "1"));
  EXPECT_EQ(Testing::BuiltXml(builder), "<Root>text<Second>2</Second><First>1</First></Root>");
}

TEST(XMLCompositeBuilderTest, AddingNothingLeavesTheChildrenAndReturnsTheComposite) {
  XMLCompositeBuilder builder(MakeElementBuilder("", "Root"));
  builder.Add(MakeTextElementBuilder("", "A", "1"));
  const auto before = Testing::BuiltXml(builder);
  EXPECT_EQ(&builder.Add(nullptr), &builder);
  EXPECT_EQ(Testing::BuiltXml(builder), before);
  EXPECT_EQ(&builder.Add(MakeTextElementBuilder("", "B", "2")), &builder);
  EXPECT_EQ(Testing::BuiltXml(builder), "<Root><A>1</A><B>2</B></Root>");
}

TEST(XMLCompositeBuilderTest, SharesItsRootAndChildrenWithOtherParents) {
  const auto shared = MakeCompositeBuilder("", "Shared");
  XMLCompositeBuilder first(shared);
  first.Add(MakeTextElementBuilder("", "A", "1"));
  XMLCompositeBuilder second(MakeElementBuilder("", "Parent"));
  second.Add(shared).Add(shared);
  shared->Add(MakeTextElementBuilder("", "B", "2"));
  EXPECT_EQ(Testing::BuiltXml(first), "<Shared><B>2</B><A>1</A></Shared>");
  EXPECT_EQ(Testing::BuiltXml(second),
            "<Parent><Shared><B>2</B></Shared><Shared><B>2</B></Shared></Parent>");
}

TEST(XMLCompositeBuilderTest, MayBeBuiltAnyNumberOfTimes) {
  XMLCompositeBuilder builder(MakeElementBuilder("", "Root"));
  builder.Add(MakeTextElementBuilder("", "A", "1"));
  const auto first = Testing::Built(builder);
  const auto second = Testing::Built(builder);
  EXPECT_NE(first, second);
  EXPECT_EQ(Testing::XmlText(first.get()), Testing::XmlText(second.get()));
}

class FailingBuilder final : public XMLBaseBuilder {
 public:
  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>&) const override {
    throw std::runtime_error("no element today");
  }
};

TEST(XMLCompositeBuilderTest, FailuresOfAChildPassUnchangedAndLeaveAPart) {
  XMLCompositeBuilder builder(MakeElementBuilder("", "Root"));
  builder.Add(MakeElementBuilder("", "First"))
      .Add(std::make_shared<FailingBuilder>())
      .Add(MakeElementBuilder("", "Last"));
  Tarnik::Ref<Tarnik::Xml::ElementNode> out;
  try {
    builder.Build(out);
    FAIL();
  } catch (const std::runtime_error& error) {
    EXPECT_STREQ(error.what(), "no element today");
  }
  EXPECT_EQ(Testing::XmlText(out.get()), "<Root><First/></Root>");
}

/// Keeps what the output held before each build.
class WatchingBuilder final : public XMLBaseBuilder {
 public:
  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override {
    before.push_back(out);
    Tarnik::Xml::CreateElementNode("", "E", out);
  }

  mutable std::vector<Tarnik::Ref<Tarnik::Xml::ElementNode>> before;
};

TEST(XMLCompositeBuilderTest, BuildsItsRootIntoTheOutputAndEachChildIntoAFreshReference) {
  const auto watching = std::make_shared<WatchingBuilder>();
  XMLCompositeBuilder builder(watching);
  builder.Add(watching).Add(watching);
  Tarnik::Ref<Tarnik::Xml::ElementNode> out;
  Tarnik::Xml::CreateElementNode("", "Old", out);
  const auto old = out;
  builder.Build(out);
  EXPECT_THAT(watching->before, testing::ElementsAre(old, nullptr, nullptr));
  EXPECT_EQ(Testing::XmlText(out.get()), "<E><E/><E/></E>");
}

TEST(XMLCompositeBuilderTest, ManyThreadsMayBuildOneTree) {
  XMLCompositeBuilder builder(MakeElementBuilder("a", "Root", {{"b", "c"}}));
  builder.Add(MakeTextElementBuilder("a", "E", "text"));
  constexpr int kBuilds = 100;
  std::vector<std::vector<std::string>> built(4);
  std::vector<std::thread> threads;
  for (auto& texts : built) {
    threads.emplace_back([&builder, &texts] {
      for (int i = 0; i < kBuilds; ++i) {
        texts.push_back(Testing::BuiltXml(builder));
      }
    });
  }
  for (auto& thread : threads) {
    thread.join();
  }
  const std::vector<std::string> expected(kBuilds, R"(<a:Root b="c"><a:E>text</a:E></a:Root>)");
  EXPECT_THAT(built, testing::Each(expected));
}

TEST(XMLBaseBuilderTest, BuildStandsFirstAndTheDestructorFollows) {
  const auto builder = MakeTextElementBuilder("a", "E", "text");
  using BuildFunction = void(const void*, Tarnik::Ref<Tarnik::Xml::ElementNode>&);
  Tarnik::Ref<Tarnik::Xml::ElementNode> out;
  TestSupport::VtableSlot<BuildFunction>(builder.get(), 0)(builder.get(), out);
  EXPECT_EQ(Testing::XmlText(out.get()), "<a:E>text</a:E>");

  class Counting final : public XMLBaseBuilder {
   public:
    explicit Counting(int& deaths) : deaths_(deaths) {}
    ~Counting() override { ++deaths_; }
    void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>&) const override {}

   private:
    int& deaths_;
  };
  int deaths = 0;
  auto* counting = new Counting(deaths);
  TestSupport::VtableSlot<void(const void*)>(counting, 2)(counting);  // 1: complete, 2: deleting
  EXPECT_EQ(deaths, 1);
}

}  // namespace
}  // namespace SsoClient
