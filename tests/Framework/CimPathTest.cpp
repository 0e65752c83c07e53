// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimValue.h"

#include <gtest/gtest.h>

namespace {

using core::CimPath;

TEST(CimPathTest, ReadsBackTheTextThatItWrites) {
    for (const char* text : {
             "root/cimv2:Quenx_Thing",
             "root/cimv2:Quenx_Thing.Name=\"a:b.c,d=e\",Number=5,Flag=TRUE,Low=-7",
             "Quenx_Thing.A=1500.0,B=1.0e+300,C=-0.25",
             "//host/root/cimv2:Quenx_Thing.Name=\"with \\\"quotes\\\" and \\\\ backslash\"",
             "Link.From=\"root/cimv2:Thing.Name=\\\"x\\\"\",To=\"Thing.Name=\\\"y\\\"\"",
         }) {
        const CimPath path{std::string(text)};
        EXPECT_TRUE(path.isValid()) << text;
        EXPECT_EQ(path.toString(), text);
    }
}

TEST(CimPathTest, KeepsATextThatDoesNotParseAndNamesNothing) {
    for (const std::string& text :
         {std::string(), std::string("."), std::string("1Class"), std::string("Class."),
          std::string("Class.Key="), std::string("Class.Key=\"open"), std::string("Class.Key=\"end\\"),
          std::string("Class.Key=\"a\"x"), std::string("Class.Key=\"a\","), std::string("Class.A=1,a=2"),
          std::string("//host"), std::string("Class.Key=word"), std::string("a b:c d.e=\"f\""),
          std::string("Class.K=\"a\0b\"\0", 15)}) {
        const CimPath path(text);
        EXPECT_FALSE(path.isValid()) << text;
        EXPECT_EQ(path.toString(), text);
        EXPECT_FALSE(path.isSameObjectAs(path)) << text;
    }
}

TEST(CimPathTest, ComparesNamesWithoutCaseAndValuesByType) {
    struct Row {
        const char* left;
        const char* right;
        bool same;
    };
    for (const Row& row : {
             Row{"root/cimv2:Thing.Name=\"a\",No=5", "ROOT/CIMV2:THING.no=5,NAME=\"a\"", true},
             Row{"Thing.Name=\"a\"", "Thing.Name=\"A\"", false},
             Row{"Thing.No=5", "Thing.No=\"5\"", false},
             Row{"Thing.No=5", "Thing.No=0x5", true},
             Row{"Thing.No=1.5e3", "Thing.No=1500.0", true},
             Row{"Thing.No=5", "Thing.No=5,More=1", false},
             Row{"Thing.Name=\"a\"", "root/x:Thing.Name=\"a\"", true},
             Row{"root/y:Thing.Name=\"a\"", "root/x:Thing.Name=\"a\"", false},
             Row{"//h/root/x:Thing.Name=\"a\"", "//other/root/x:Thing.Name=\"a\"", true},
             Row{"Thing.Flag=true", "Thing.Flag=TRUE", true},
         }) {
        const CimPath left{std::string(row.left)};
        const CimPath right{std::string(row.right)};
        EXPECT_EQ(left.isSameObjectAs(right), row.same) << row.left << " / " << row.right;
        EXPECT_EQ(right.isSameObjectAs(left), row.same) << row.left << " / " << row.right;
    }
    // A reference as a value, and the same as the quoted text that a path holds.
    const CimPath value("Link", {{"From", core::CimScalar(CimPath(std::string("Thing.Name=\"x\"")))}});
    EXPECT_TRUE(value.isSameObjectAs(CimPath(std::string("LINK.from=\"root/x:thing.NAME=\\\"x\\\"\""))));
    EXPECT_FALSE(value.isSameObjectAs(CimPath(std::string("Link.From=\"Thing.Name=\\\"y\\\"\""))));
}

}  // namespace
