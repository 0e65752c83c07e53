#include "Utils/Containers.h"

#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "Support/SyslogCapture.h"

namespace {

struct Element {
    explicit Element(std::vector<int>& log, int id) : m_deleted(log), m_id(id) {}
    virtual ~Element() { m_deleted.push_back(m_id); }
    std::vector<int>& m_deleted;
    const int m_id;
};

using List = utils::SafeList<Element*>;

struct SafeListTest : ::testing::Test {
    std::vector<int> deleted;
    Element one{deleted, 1};
    Element two{deleted, 2};
    Element three{deleted, 3};
    List list{false};
};

template <typename Operation>
std::string failureOf(Operation operation) {
    const test::LogLevelGuard guard(0);
    try {
        operation();
    } catch (const utils::Exception& failure) {
        return failure.what();
    }
    return {};
}

std::string assertionAt(int line) {
    return "SMASHv2:src/Utils/Containers.h:" + std::to_string(line) +
           ": Assertion failed: 'implementation != __null'";
}

}  // namespace

TEST_F(SafeListTest, WalksInOrderAndStaysAtTheEnd) {
    List::Iterator iterator = list.getElements();
    EXPECT_EQ(iterator.first(), nullptr);
    list.add(&one);
    list.add(&two);
    EXPECT_EQ(iterator.size(), 2U);
    EXPECT_EQ(iterator.first(), &one);
    list.add(&three);
    EXPECT_EQ(iterator.next(), &two);
    EXPECT_EQ(iterator.next(), &three);
    list.add(&two);
    EXPECT_EQ(iterator.next(), nullptr);
    EXPECT_EQ(iterator.next(), nullptr);
    EXPECT_EQ(iterator.first(), &one);
}

TEST_F(SafeListTest, AnIteratorOutlivesAClear) {
    list.add(&one);
    list.add(&two);
    List::Iterator iterator = list.getElements();
    iterator.first();
    list.clear();
    EXPECT_EQ(iterator.next(), nullptr);
    list.add(&three);
    EXPECT_EQ(iterator.next(), nullptr);
    EXPECT_EQ(iterator.first(), &three);
}

TEST_F(SafeListTest, CopyingAnIteratorTransfersIt) {
    list.add(&one);
    list.add(&two);
    List::Iterator source = list.getElements();
    source.first();
    List::Iterator copy = source;
    EXPECT_EQ(copy.next(), &two);
    EXPECT_EQ(failureOf([&] { source.next(); }), assertionAt(147));
    EXPECT_EQ(failureOf([&] { source.first(); }), assertionAt(156));
    EXPECT_EQ(failureOf([&] { source.size(); }), assertionAt(164));
    source = copy;
    EXPECT_EQ(source.first(), &one);
    EXPECT_EQ(failureOf([&] { copy.first(); }), assertionAt(156));
    List::Iterator& alias = source;
    source = alias;
    EXPECT_EQ(source.size(), 2U);
}

TEST_F(SafeListTest, ClonesStartOverAndANullListIsEmpty) {
    list.add(&one);
    list.add(&two);
    List::SimpleIteratorImplementation advanced(&list);
    advanced.next();
    const auto clone = advanced.clone();
    EXPECT_EQ(clone->next(), &one);
    EXPECT_EQ(advanced.next(), &two);

    List::Iterator none(std::make_unique<List::SimpleIteratorImplementation>(nullptr));
    EXPECT_EQ(none.first(), nullptr);
    EXPECT_EQ(none.next(), nullptr);
    EXPECT_EQ(none.size(), 0U);
}

TEST_F(SafeListTest, AnOwningListDeletesFrontToBackAndSkipsNull) {
    {
        List owning(true);
        for (int id : {1, 2})
            owning.add(new Element(deleted, id));
        owning.add(nullptr);
        owning.clear();
        EXPECT_EQ(deleted, (std::vector<int>{1, 2}));
        EXPECT_EQ(owning.size(), 0U);
        owning.add(new Element(deleted, 3));
    }
    EXPECT_EQ(deleted, (std::vector<int>{1, 2, 3}));
    {
        List borrowing(false);
        borrowing.add(&one);
    }
    EXPECT_EQ(deleted.size(), 3U);
}

TEST_F(SafeListTest, ManyThreadsAddWalkAndClear) {
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            for (int round = 0; round < 500; ++round) {
                list.add(&one);
                List::Iterator iterator = list.getElements();
                for (Element* element = iterator.first(); element != nullptr; element = iterator.next()) {
                    ASSERT_EQ(element, &one);
                }
                if (round % 50 == 0) list.clear();
            }
        });
    }
    for (std::thread& thread : threads)
        thread.join();
    list.clear();
    EXPECT_EQ(list.size(), 0U);
}
