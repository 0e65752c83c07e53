// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/Audit.h"

#include <gtest/gtest.h>

#include <stdexcept>

namespace {

using core::Argument;
using core::CimType;
using core::CimValue;

Argument argument(const std::string& name, const std::string& value) {
    return {name, CimValue::of(CimType::String, value)};
}

core::AuditEvent eventOf(const std::string& principal, const std::string& address) {
    core::AuditEvent event;
    event.caller.principal = principal;
    event.caller.address = address;
    return event;
}

TEST(AuditTest, NamesWhoDidWhatAndHowItEnded) {
    core::AuditEvent event = eventOf("alice", "192.0.2.1");
    event.operation = "InstallFromURI";
    event.target = "the service";
    event.outcome = "returned 0";
    const std::string begin =
        "[audit] user=\"alice\" address=\"192.0.2.1\" operation=\"InstallFromURI\" target=\"the service\" ";
    EXPECT_EQ(core::auditLine(event, {}), begin + "arguments=\"\" outcome=\"returned 0\"");
    event.notes.sha256 = "abc";
    event.notes.reason = core::ReasonId::ImageDamaged;
    EXPECT_EQ(
        core::auditLine(event, {argument("URI", "file:///a b"),
                                {"None", CimValue::null(CimType::String)},
                                {"InstallOptions",
                                 CimValue::arrayOf(CimType::Uint16, {std::uint64_t{5}, std::uint64_t{3}})}}),
        begin +
            "arguments=\"URI='file:///a b' InstallOptions='5,3'\" outcome=\"returned 0\" sha256=\"abc\" "
            "reason=\"QX-0301\"");
}

// Else a client could make one line look like two, or push its outcome out of what the log keeps.
TEST(AuditTest, LetsNoValueForgeOrFillALine) {
    core::AuditEvent event = eventOf("a\" outcome=\"done", "b\nc");
    EXPECT_EQ(core::auditLine(event, {argument("n'", "v' x='")}),
              "[audit] user=\"a\\\" outcome=\\\"done\" address=\"b\\x0ac\" operation=\"\" target=\"\" "
              "arguments=\"n\\'='v\\' x=\\''\" outcome=\"\"");
    const auto cut = [](const std::string& line, const std::string& field) {
        const std::size_t from = line.find(" " + field + "=\"") + field.size() + 3;
        return line.find('"', from) - from;
    };
    const std::string longText(3000, 'x');
    event = eventOf(longText, longText);
    event.operation = event.target = event.outcome = longText;
    event.notes.sha256 = longText;
    const std::string line = core::auditLine(event, {});
    const std::size_t names = cut(line, "user");
    EXPECT_EQ(names, std::string("\\...").size() + 64);
    EXPECT_EQ(cut(line, "address") + cut(line, "operation") + cut(line, "sha256"), 3 * names);
    EXPECT_EQ(cut(line, "target"), names + 256 - 64);
    EXPECT_EQ(cut(line, "outcome"), cut(line, "target"));
    event.target = std::string(256, 'x');
    EXPECT_EQ(cut(core::auditLine(event, {}), "target"), 256U);
    // 400 bytes of arguments in all, and the blanks between them.
    EXPECT_EQ(cut(core::auditLine(
                      event, {argument("a", std::string(196, 'x')), argument("b", std::string(196, 'x'))}),
                  "arguments"),
              401U);
    EXPECT_EQ(cut(core::auditLine(
                      event, {argument("a", std::string(196, 'x')), argument("b", std::string(197, 'x'))}),
                  "arguments"),
              200U + 5);
}

TEST(AuditTest, TellsOutcomes) {
    core::MethodResult result;
    result.returnValue = 4096;
    result.outputs = {
        argument("Text", "x"),
        {"Job", CimValue::of(CimType::Reference, core::CimPath("Quenx_ConcreteJob.InstanceID=\"1\""))}};
    EXPECT_EQ(core::outcomeOf(result), "returned 4096, Job=Quenx_ConcreteJob.InstanceID=\"1\"");
    EXPECT_EQ(core::outcomeOf(core::CimStatus::AccessDenied, "not you"), "denied: not you");
    EXPECT_EQ(core::outcomeOf(core::CimStatus::NotFound, "none"), "failed: none (CIM status 6)");
    EXPECT_EQ(core::shownText(std::runtime_error(std::string(2000, 'x'))), std::string(2000, 'x'));
    EXPECT_LT(core::shownText(std::runtime_error(std::string(9000, 'x'))).size(), 2010U);
}

}  // namespace
