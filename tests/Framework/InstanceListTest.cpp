#include "Framework/InstanceList.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <atomic>
#include <cstdlib>
#include <thread>

#include "Framework/CimAgent.h"
#include "Framework/RequestScope.h"
#include "Framework/Retirement.h"
#include "Support/TestModel.h"

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

TEST_F(InstanceListTest, AnIteratorHoldsWhatItWalks) {
    core::InstanceList list;
    list.add(new Gadget("a"));
    list.add(new Gadget("b"));
    auto iterator = list.getElements(false);
    EXPECT_EQ(iterator.first(), list.getStlList().front());
    list.clear();
    list.add(new Gadget("c"));
    EXPECT_EQ(Gadget::living, 3);
    EXPECT_EQ(ids(iterator), (std::vector<std::string>{"a", "b"}));  // the copy is transferred, and dies here
    EXPECT_EQ(Gadget::living, 1);
    EXPECT_THROW(static_cast<void>(iterator.first()), utils::Exception);
}

TEST_F(InstanceListTest, AScopeHoldsPlainPointers) {
    core::InstanceList list;
    {
        const core::RequestScope scope;
        auto* added = new Gadget("added");
        {
            const core::RequestScope inner;
            list.add(added);
            list.add(new Gadget("other"));
            EXPECT_EQ(ids(list.getElements(false)).size(), 2U);
        }
        list.clear();
        EXPECT_EQ(added->ID.get(), "added");
        EXPECT_EQ(Gadget::living, 2);
    }
    EXPECT_EQ(Gadget::living, 0);
}

TEST_F(InstanceListTest, ADeletedInstanceIsGoneAtOnce) {
    core::InstanceList list;
    auto* first = new Gadget("first");
    list.add(first);
    list.add(new Gadget("second"));
    auto before = list.getElements(false);
    first->setDeleted(false);
    EXPECT_EQ(list.size(), 2U);
    first->setDeleted(true);
    first->setDeleted(true);
    EXPECT_EQ(list.size(), 1U);
    EXPECT_EQ(ids(list.getElements(false)), std::vector<std::string>{"second"});
    EXPECT_EQ(ids(before), std::vector<std::string>{"second"});
}

TEST_F(InstanceListTest, PublishingReplacesInOneStep) {
    core::InstanceList list;
    std::atomic<bool> stop{false};
    std::atomic<int> torn{0};
    const auto rebuild = [&] {
        while (!stop) {
            core::InstanceList rebuilt;
            for (int i = 0; i < 5; ++i)
                rebuilt.add(new Gadget("r"));
            list.publish(rebuilt);
        }
    };
    const auto read = [&] {
        for (int i = 0; i < 500; ++i) {
            const auto size = ids(list.getElements(false)).size();
            if (size != 0 && size != 5) ++torn;
        }
        stop = true;
    };
    std::thread one(rebuild);
    std::thread two(rebuild);
    std::thread reader(read);
    one.join();
    two.join();
    reader.join();
    EXPECT_EQ(torn, 0);
    EXPECT_EQ(list.size(), 5U);
    // A published instance belongs to the list that took it over.
    auto iterator = list.getElements(false);
    iterator.first()->setDeleted(true);
    EXPECT_EQ(list.size(), 4U);
}

TEST_F(InstanceListTest, SlowDestructorsRunElsewhere) {
    struct Slow : Gadget {
        explicit Slow(std::thread::id& where) : Gadget("slow"), m_where(where) { setDestructionWaits(); }
        ~Slow() override { m_where = std::this_thread::get_id(); }
        std::thread::id& m_where;
    };
    std::thread::id where;
    core::InstanceList list;
    list.add(new Slow(where));
    list.clear();
    core::drainRetired();
    EXPECT_NE(where, std::thread::id());
    EXPECT_NE(where, std::this_thread::get_id());
}

TEST_F(InstanceListTest, InstancesCanBeRetiredUntilTheProcessHasEnded) {
    struct Slow : Gadget {
        Slow() : Gadget("slow") { setDestructionWaits(); }
    };
    static const auto retireOne = [] {
        core::InstanceList list;
        list.add(new Slow);
        list.clear();
        core::drainRetired();
    };
    // As an agent that is still loaded when the process ends. A process of its own: threads survive no fork.
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            alarm(60);
            const core::CimAgent agent("exit");
            std::atexit([] {
                retireOne();
                retireOne();
                if (Gadget::living != 0) _exit(1);
            });
            retireOne();
            std::exit(0);
        },
        testing::ExitedWithCode(0), "");
}

}  // namespace
