// SPDX-License-Identifier: Apache-2.0
#include "Utils/Containers.h"

#include <gtest/gtest.h>

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
    List list{false};
};

}  // namespace

TEST_F(SafeListTest, IteratesOverWhatIsAddedAndAcrossAClear) {
    List::Iterator iterator = list.getElements();
    EXPECT_EQ(iterator.first(), nullptr);
    list.add(&one);
    list.add(&one);
    EXPECT_EQ(iterator.first(), &one);
    list.add(&two);
    EXPECT_EQ(iterator.next(), &one);
    EXPECT_EQ(iterator.next(), &two);
    list.add(&two);  // too late
    EXPECT_EQ(iterator.next(), nullptr);
    EXPECT_EQ(iterator.first(), &one);
    list.clear();
    EXPECT_EQ(iterator.next(), nullptr);
    list.add(&two);
    EXPECT_EQ(iterator.next(), nullptr);
    EXPECT_EQ(iterator.first(), &two);
}

TEST_F(SafeListTest, TransfersAnIteratorThatIsCopied) {
    const test::LogLevelGuard guard(1);
    list.add(&one);
    list.add(&two);
    List::Iterator source = list.getElements();
    source.first();
    List::Iterator copy = source;
    EXPECT_EQ(copy.next(), &two);
    EXPECT_THROW(source.next(), utils::Exception);
    EXPECT_THROW(source.first(), utils::Exception);
    EXPECT_THROW(source.size(), utils::Exception);
    std::vector<std::string> assertions;
    for (const char* line : {"147", "156", "164"})  // log readers know these
        assertions.push_back("src/Utils/Containers.h:" + std::string(line) +
                             ": Assertion failed: 'implementation != __null'");
    EXPECT_EQ(test::SyslogCapture::messages("error"), assertions);
    source = copy;
    List::Iterator& alias = source;
    source = alias;
    EXPECT_EQ(source.size(), 2U);
    EXPECT_THROW(copy.first(), utils::Exception);
}

TEST_F(SafeListTest, DeletesFrontToBackAndSkipsNullWhenOwning) {
    {
        List owning(true);
        for (int id : {1, 2})
            owning.add(new Element(deleted, id));
        owning.add(nullptr);
        owning.clear();
        EXPECT_EQ(deleted, (std::vector<int>{1, 2}));
        owning.add(new Element(deleted, 3));
    }
    EXPECT_EQ(deleted, (std::vector<int>{1, 2, 3}));
}
