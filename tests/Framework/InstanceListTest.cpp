// SPDX-License-Identifier: Apache-2.0
#include "Framework/Classes/InstanceList.h"

#include <gtest/gtest.h>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/RequestScope.h"
#include "Support/TestModel.h"
#include "Support/Together.h"

namespace {

using test::Gadget;

class InstanceListTest : public ::testing::Test {
  protected:
    void SetUp() override { ASSERT_EQ(Gadget::living, 0); }
    void TearDown() override { EXPECT_EQ(Gadget::living, 0); }

    static std::vector<std::string> ids(core::InstanceList::Iterator iterator) {
        std::vector<std::string> found;
        for (auto* each = iterator.first(); each != nullptr; each = iterator.next()) {
            found.push_back(dynamic_cast<Gadget*>(each)->ID.get());
        }
        return found;
    }
};

TEST_F(InstanceListTest, KeepsWhatAnIteratorWalks) {
    core::InstanceList list;
    list.add(new Gadget("a"));
    list.add(new Gadget("b"));
    auto iterator = list.getElements(false);
    list.clear();
    list.add(new Gadget("c"));
    EXPECT_EQ(Gadget::living, 3);
    EXPECT_EQ(ids(iterator), (std::vector<std::string>{"a", "b"}));  // the copy is transferred, and dies here
    EXPECT_EQ(Gadget::living, 1);
    EXPECT_THROW(static_cast<void>(iterator.first()), utils::Exception);
}

TEST_F(InstanceListTest, DropsADeletedInstanceAtOnce) {
    core::InstanceList list;
    core::InstanceList built;
    auto* first = new Gadget("first");
    built.add(first);
    built.add(new Gadget("second"));
    list.publish(built);  // which makes them the list's own
    auto before = list.getElements(false);
    first->setDeleted(true);
    first->setDeleted(true);
    EXPECT_EQ(list.size(), 1U);
    EXPECT_EQ(ids(before), std::vector<std::string>{"second"});
}

TEST_F(InstanceListTest, OwnsWhatIsAddedThroughItsBase) {
    core::InstanceList list;
    utils::SafeList<core::CimInstance*>& base = list;
    list.add(new Gadget("a"));
    base.add(new Gadget("b"));
    EXPECT_EQ(ids(list.getElements(false)), (std::vector<std::string>{"a", "b"}));
    base.clear();
    EXPECT_EQ(Gadget::living, 0);
    EXPECT_EQ(ids(list.getElements(false)), std::vector<std::string>());
}

TEST_F(InstanceListTest, FindsByTheKeysOfTheMoment) {
    core::InstanceList list;
    for (unsigned int i = 0; i < 100; ++i)
        list.add(new Gadget("many", i));
    auto* gadget = new Gadget("a", 1);
    list.add(gadget);
    const auto find = [&](const char* path) { return list.find(core::CimPath(std::string(path))); };
    EXPECT_EQ(find("TEST_gadget.number=1,id=\"a\""), gadget);
    for (const char* other : {"Test_Gadget.ID=\"A\",Number=1", "Test_Link.ID=\"a\",Number=1", "!"})
        EXPECT_EQ(find(other), nullptr) << other;
    gadget->ID = "b";
    EXPECT_EQ(find("Test_Gadget.ID=\"a\",Number=1"), nullptr);
    EXPECT_EQ(find("Test_Gadget.ID=\"b\",Number=1"), gadget);
    gadget->setDeleted(true);
    EXPECT_EQ(Gadget::living, 100) << "the index keeps nothing";
    EXPECT_EQ(find("Test_Gadget.ID=\"b\",Number=1"), nullptr);
}

struct Slow : Gadget {
    Slow() : Gadget("slow") { setDestructionWaits(); }
};

void destroyOne() {
    core::InstanceList list;
    list.add(new Slow);
    list.clear();
    core::drainReaper([] {});
}

TEST_F(InstanceListTest, MayBeUsedByAnyThreadAtOnce) {
    for (int round = 0; round < 10; ++round) {
        auto list = std::make_unique<core::InstanceList>();
        core::InstanceList other;
        for (const char* id : {"early", "late"})
            list->add(new Gadget(id));
        auto kept = list->getElements(false);
        core::CimInstance* const early = kept.first();
        core::CimInstance* const late = kept.next();
        test::together({
            [&] { list->add(new Gadget("new")); },
            [&] { list->add(new Slow); },
            [&] { early->setDeleted(true); },
            [&] { list->publish(other); },
            [&] { list->clear(); },
            [&] { list->size(); },
            [&] { ids(list->getElements(false)); },
            [&] { other.add(new Gadget("other")); },
            destroyOne,
            destroyOne,
            [] { core::isReaperBusy(); },
        });
        test::together({[&] { list.reset(); }, [&] { late->setDeleted(true); }});
    }
    core::drainReaper([] {});
}

TEST(CimBrokerTest, LetsAgentsComeAndGoWhileTheyAreUsed) {
    const auto come = [] {
        for (int i = 0; i < 20; ++i)
            test::GadgetAgent().add("a");
    };
    const auto use = [] {
        for (int i = 0; i < 200; ++i) {
            const core::RequestScope scope;
            for (core::CimInstance* each :
                 core::InstanceRange(core::GetCimBroker()->getInstances("test_GADGET", "")))
                EXPECT_EQ(each->getPath()->getClassName(), "Test_Gadget");
        }
    };
    test::together({come, come, use, use});
    EXPECT_EQ(test::Gadget::living, 0);
}

}  // namespace
