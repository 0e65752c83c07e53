// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/Reasons.h"

#include <gtest/gtest.h>

#include <fstream>
#include <set>
#include <sstream>
#include <string_view>

namespace {

using core::Reason;
using core::ReasonId;

/// The table as docs/messages.md shows it.
std::string page() {
    std::string text =
        "# Reasons of refusals and failures\n\n"
        "Each refusal and each failure of an update has an id that stays the same from release to release. "
        "It is in\n"
        "`--json` (`reasonId`), in the [history](history.md), in the [audit "
        "trail](object-manager.md#the-audit-trail) and in\n"
        "the served log entries (`ReasonID`). The texts there may say more: they name files, adapters and "
        "versions.\n\n"
        "The return value is that of the method which installs; the error code is that of the job. An id "
        "that has neither\n"
        "stands for a call that ends with a CIM status, or for an update that never ended.\n\n"
        "| id | what happened | what to do | return value | error code |\n|---|---|---|---|---|\n";
    const auto number = [](const auto& value) { return value ? std::to_string(*value) : ""; };
    for (const Reason& reason : core::allReasons())
        text += "| " + core::reasonCode(reason.id) + " | " + reason.text + " | " + reason.advice + " | " +
                number(reason.returnValue) + " | " + number(reason.errorCode) + " |\n";
    return text;
}

TEST(ReasonsTest, NamesEachCauseOnce) {
    std::set<std::string_view> texts;
    std::set<std::uint32_t> errorCodes;
    unsigned last = 0;
    for (const Reason& reason : core::allReasons()) {
        const auto number = static_cast<unsigned>(reason.id);
        EXPECT_GT(number, last) << reason.text;
        last = number;
        EXPECT_TRUE(texts.insert(reason.text).second) << reason.text;
        EXPECT_TRUE(std::string_view(reason.text).ends_with('.') &&
                    std::string_view(reason.advice).ends_with('.'))
            << reason.text;
        EXPECT_FALSE(reason.returnValue && reason.errorCode) << reason.text;
        const bool isNew = !reason.errorCode || errorCodes.insert(*reason.errorCode).second;
        EXPECT_TRUE(isNew) << reason.text;
    }
}

TEST(ReasonsTest, CodesHaveFourDigits) {
    EXPECT_EQ(core::reasonCode(ReasonId::OptionsNotSupported), "QX-0102");
    EXPECT_EQ(core::reasonCode(ReasonId::None), "");
    for (const char* code : {"QX-0102", "QX-9999"})
        EXPECT_EQ(core::reasonCode(core::parseReasonCode(code)), code);
    for (const char* other : {"", "0102", "QX-", "QX-99999", "QX-01x"})
        EXPECT_EQ(core::parseReasonCode(other), ReasonId::None) << other;
    EXPECT_EQ(core::reasonOfErrorCode(5), ReasonId::FlashBusy);
    constexpr std::uint32_t kNoSpace = 28;  // a device's own number
    EXPECT_EQ(core::reasonOfErrorCode(kNoSpace), ReasonId::FlashFailed);
}

TEST(ReasonsTest, ThePageShowsTheTable) {
    std::ofstream(QUENX_MADE_PAGE) << page();
    std::stringstream committed;
    committed << std::ifstream(QUENX_MESSAGES_PAGE).rdbuf();
    EXPECT_EQ(committed.str(), page()) << "Copy " QUENX_MADE_PAGE " to docs, and commit it.";
}

}  // namespace
