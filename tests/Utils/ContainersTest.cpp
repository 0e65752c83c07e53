// SPDX-License-Identifier: Apache-2.0
#include "Utils/Containers.h"

#include <gtest/gtest.h>

#include <vector>

#include "Support/SyslogCapture.h"

namespace {

/// Tells its deletion.
struct Element {
    ~Element() { deleted.push_back(this); }
    static inline std::vector<const void*> deleted;
};

using List = utils::SafeList<Element*>;

struct SafeListTest : ::testing::Test {
    Element one, two;
    List list;
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

TEST_F(SafeListTest, IteratesOverNoListAsOverAnEmptyOne) {
    List::Iterator iterator(std::make_unique<List::SimpleIteratorImplementation>(nullptr));
    EXPECT_EQ(iterator.size(), 0U);
    EXPECT_EQ(iterator.first(), nullptr);
    EXPECT_EQ(iterator.next(), nullptr);
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
    auto owning = std::make_unique<List>(true);
    const std::vector<Element*> elements{new Element, nullptr, new Element};
    Element::deleted.clear();
    for (Element* const each : elements)
        owning->add(each);
    owning->clear();
    EXPECT_EQ(Element::deleted, (std::vector<const void*>{elements[0], elements[2]}));
    owning->add(new Element);
    owning.reset();
    EXPECT_EQ(Element::deleted.size(), 3U);
}
