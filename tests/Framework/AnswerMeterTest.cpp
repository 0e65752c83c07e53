// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/AnswerMeter.h"

#include <gtest/gtest.h>

#include "Framework/Requests/CimOperations.h"

namespace {

using core::bytesOf;
using core::CimPath;
using core::CimType;
using core::CimValue;

TEST(AnswerMeterTest, CountsWhatValuesHaveOnTheHeap) {
    // The longest that the object itself holds, and one more.
    const std::string inside(std::string().capacity(), 'x');
    const std::string text = inside + "x";
    const std::size_t heap = text.size() + 1;
    EXPECT_EQ(bytesOf(CimPath()), sizeof(CimPath));
    EXPECT_EQ(bytesOf(CimPath(inside, {})), sizeof(CimPath));
    CimPath path(text, {});
    EXPECT_EQ(bytesOf(path), sizeof(CimPath) + heap);
    path.setNamespace(text);
    path.setHost(text);
    path = CimPath(path);  // with no room to spare
    EXPECT_EQ(bytesOf(path), sizeof(CimPath) + 3 * heap);
    const std::vector<core::CimKey> keys{{text, text}, {"short", CimPath(text, {})}};
    EXPECT_EQ(bytesOf(CimPath("Short", keys)), sizeof(CimPath) + 2 * sizeof(core::CimKey) + 3 * heap);

    const auto bytesWith = [](const CimValue& value, const std::string& name, const std::string& reference) {
        return bytesOf(core::InstanceValue{CimPath(), {{name, value, false, reference}}}) -
               sizeof(core::InstanceValue) - sizeof(core::PropertyValue);
    };
    EXPECT_EQ(bytesWith(CimValue::null(CimType::String), "", ""), 0U);
    EXPECT_EQ(bytesWith(CimValue::of(CimType::Uint8, std::uint64_t{5}), text, text), 2 * heap);
    EXPECT_EQ(bytesWith(CimValue::of(CimType::String, text), "", ""), heap);
    EXPECT_EQ(bytesWith(CimValue::arrayOf(CimType::String, {text, inside, text}), "", ""),
              3 * sizeof(core::CimScalar) + 2 * heap);
    EXPECT_EQ(bytesOf(core::InstanceValue{path, {}}) - sizeof(core::InstanceValue), 3 * heap);
}

}  // namespace
