// SPDX-License-Identifier: Apache-2.0
#include <gmock/gmock.h>

#include "Framework/Model/CimError.h"
#include "Framework/Model/CimPropertyList.h"
#include "Support/TestModel.h"
#include "Support/Together.h"

namespace {

TEST(CimPropertyTest, ChecksAllOfAModificationFirst) {
    test::Gadget gadget("x");
    core::CimPropertyString::CheckMinLengthListener shortest(2);
    core::CimPropertyString::CheckMaxLengthListener longest(5);
    gadget.Caption.addListener(&shortest);
    gadget.Caption.addListener(&longest);
    using enum core::CimType;
    const auto modify = [&](const char* name, core::CimType type, const core::CimScalar& value) {
        core::CimPropertyList requested;
        requested.add("Codes", core::CimValue::arrayOf(Uint16, {std::uint64_t{9}}));
        requested.add(name, core::CimValue::of(type, value));
        return gadget.modifyInstance(requested);
    };

    const std::tuple<const char*, core::CimType, core::CimScalar, const char*> refused[] = {
        {"Caption", String, "123456", "Caption would have 6 characters; it takes at most 5"},
        {"Caption", String, "x", "Caption would have 1 characters; it takes at least 2"},
        {"Caption", Uint32, std::uint64_t{3}, "Caption takes a value of type string, not of type uint32"},
        {"Codes", Uint16, std::uint64_t{3}, "Codes takes a value of type uint16[], not of type uint16"},
        {"ID", String, "key", "ID is a key and cannot be changed"},
        {"Nothing", String, "there", "Test_Gadget has no property Nothing"},
        {"Real", Real32, 0.5, "Real: no property holds values of type real32"},
    };
    for (const auto& [name, type, value, said] : refused) {
        const std::function<void()> attempt = [&, n = name, t = type, v = value] { modify(n, t, v); };
        EXPECT_THAT(attempt, ::testing::ThrowsMessage<core::CimError>(::testing::StrEq(said)));
    }
    EXPECT_TRUE(gadget.Codes.IsNull());
    EXPECT_EQ(gadget.Caption.get(), "Gadget x");

    for (const char* asLongAsAllowed : {"12345", "12"})
        EXPECT_EQ(modify("Caption", String, asLongAsAllowed), 0U);
    EXPECT_EQ(modify("caption", String, "fits"), 0U);
    EXPECT_EQ(gadget.Caption.get(), "fits");
    EXPECT_EQ(gadget.Codes.get(), std::vector<unsigned short>{9});
    const auto tooLarge = core::CimValue::arrayOf(Uint32, {std::uint64_t{65536}});
    EXPECT_THAT([&] { gadget.Codes.setValue(tooLarge); },
                ::testing::ThrowsMessage<core::CimError>(
                    ::testing::StrEq("Codes takes a value of type uint16[], not of type uint32[]")));
}

TEST(CimPropertyTest, MayBeUsedByAnyThreadAtOnce) {
    for (int round = 0; round < 10; ++round) {
        test::Gadget gadget("a");
        test::Gadget other("b");
        test::Link link;
        core::CimPropertyList requested;
        requested.add("Caption", core::CimValue::of(core::CimType::String, std::string("requested")));
        const auto readDeclaration = [] { core::declarationsOf(test::Gadget::classInfo); };
        test::together({
            [&] { gadget.ID = "c"; },
            [&] { gadget.Number = 7; },
            [&] { gadget.getPath(); },
            [&] { gadget.getKeys(); },
            [&] { gadget.getProperties(); },
            [&] { gadget.modifyInstance(requested); },
            [&] { EXPECT_EQ(core::CimPath::of(gadget).getKeys().size(), 2U); },
            [&] { core::CimPath::of(other).isSameObjectAs(gadget); },
            [&] { gadget.Caption = other.Caption; },
            [&] { gadget.Caption.setNull(); },
            [&] { gadget.Caption.IsNull(); },
            [&] { gadget.Caption.get(); },
            [&] { gadget.Caption.toString(); },
            [&] { gadget.Codes.push_back(7); },
            [&] {
                gadget.Codes = {8, 9};
            },
            [&] { gadget.Codes.get(); },
            [&] { link.From.assign(&gadget); },
            [&] { link.From.getPath(); },
            readDeclaration,
            readDeclaration,
        });
    }
}

TEST(CimPropertyTest, RefersToATargetThatHasGone) {
    core::InstanceList list;
    auto* target = new test::Gadget("t");
    list.add(target);
    const test::Link link(*target, *target);
    list.clear();
    EXPECT_EQ(link.From.getPath().toString(), "Test_Gadget.ID=\"t\",Number=0");
}

}  // namespace
