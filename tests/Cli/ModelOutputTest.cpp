// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <filesystem>
#include <nlohmann/json.hpp>

#include "Cli/ImageUri.h"
#include "Cli/Json.h"
#include "Cli/Values.h"

namespace {

using core::CimType;
using core::CimValue;

TEST(ImageUri, PathsBecomeUrisAndNothingIsEncoded) {
    const std::string here = std::filesystem::current_path().string();
    const struct {
        const char* image;
        std::string uri;
    } rows[] = {
        {"/a b%20c:d::e", "file:///a b%20c:d::e"},
        {"x.rom", "file://" + here + "/x.rom"},
        {"a:b.rom", "file://" + here + "/a:b.rom"},
        {"FILE:///x", "FILE:///x"},
        {"file:/x", "file:/x"},
        {"://x", "file://" + here + "/://x"},
    };
    for (const auto& row : rows)
        EXPECT_EQ(cli::imageUri(row.image), row.uri);
    EXPECT_EQ(cli::localPath("FILE:///a::b"), "/a::b");
}

TEST(ModelOutput, ValuesAsTextAndAsJson) {
    const struct {
        CimValue value;
        std::string text;
        std::string json;
    } rows[] = {
        {CimValue::null(CimType::String), "NULL", "null"},
        {CimValue::of(CimType::Boolean, true), "TRUE", "true"},
        {CimValue::of(CimType::Uint64, std::uint64_t{18446744073709551615U}), "18446744073709551615",
         "18446744073709551615"},
        {CimValue::of(CimType::Sint8, std::int64_t{-5}), "-5", "-5"},
        {CimValue::of(CimType::String, std::string("a\"\\\n")), "\"a\\\"\\\\\\x0a\"", "\"a\\\"\\\\\\n\""},
        {CimValue::arrayOf(CimType::Uint16, {std::uint64_t{5}, std::uint64_t{3}}), "{5, 3}", "[5,3]"},
        {CimValue::arrayOf(CimType::String, {}), "{}", "[]"},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(cli::displayText(row.value), row.text);
        EXPECT_EQ(cli::toJson(row.value).dump(), row.json);
    }
}

TEST(ModelOutput, BytesThatAreNoTextDoNotSpoilTheDocument) {
    std::ostringstream out;
    cli::printJson(out, {{"name", "a\xff"}});
    EXPECT_EQ(nlohmann::json::parse(out.str())["name"], "a\xEF\xBF\xBD");
}

}  // namespace
