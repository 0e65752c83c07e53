// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include "Support/Environment.h"
#include "Support/NetlinkGuard.h"
#include "Support/SyslogCapture.h"

namespace {

/// Every test begins with an empty log.
class LogCleaner : public ::testing::EmptyTestEventListener {
    void OnTestStart(const ::testing::TestInfo&) override { test::SyslogCapture::clear(); }
};

}  // namespace

int main(int argc, char** argv) {
    test::forbidGenericNetlink();
    ::testing::InitGoogleTest(&argc, argv);
    const test::ChosenEnvironment environment;
    ::testing::UnitTest::GetInstance()->listeners().Append(new LogCleaner);
    return RUN_ALL_TESTS();
}
