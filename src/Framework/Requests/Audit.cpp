// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/Audit.h"

#include <algorithm>
#include <string_view>

#include "Utils/Log.h"
#include "Utils/Utils.h"

namespace core {

namespace {

// What a line needs at most: syslog daemons cut longer ones, and the outcome stands at the end.
constexpr std::size_t kNameLimit = 64;
constexpr std::size_t kTextLimit = 256;
constexpr std::size_t kArgumentsLimit = 400;

/// " name="value"", with the value cut.
std::string field(const char* name, const std::string& value, std::size_t limit) {
    return std::string(" ") + name + "=\"" + utils::escapeForLog(value, limit) + '"';
}

/// "URI='file:///new.rom' InstallOptions='5'": a quote inside is escaped, so that no value can pose as two.
std::string argumentsText(const std::vector<Argument>& arguments) {
    std::string text;
    for (const Argument& argument : arguments) {
        if (argument.value.isNull()) continue;
        const std::string next = utils::escapeForLog(argument.name, kNameLimit) + "='" +
                                 utils::escapeForLog(valueText(argument.value, kTextLimit), kTextLimit) +
                                 '\'';
        if (text.size() + next.size() > kArgumentsLimit) return text + " \\...";
        text += (text.empty() ? "" : " ") + next;
    }
    return text;
}

}  // namespace

std::string outcomeOf(const MethodResult& result) {
    std::string text = "returned " + std::to_string(result.returnValue);
    for (const Argument& output : result.outputs) {
        if (output.value.type == CimType::Reference)
            text += ", " + output.name + "=" + valueText(output.value, kTextLimit);
    }
    return text;
}

std::string outcomeOf(CimStatus status, const std::string& description) {
    if (status == CimStatus::AccessDenied) return "denied: " + description;
    return "failed: " + description + " (CIM status " + std::to_string(static_cast<int>(status)) + ")";
}

std::string shownText(const std::exception& error) {
    constexpr std::size_t kMost = 2000;
    return utils::shortened(error.what(), kMost);
}

std::string auditLine(const AuditEvent& event, const std::vector<Argument>& arguments) {
    std::string line = "[audit]" + field("user", event.caller.principal, kNameLimit) +
                       field("address", event.caller.address, kNameLimit) +
                       field("operation", event.operation, kNameLimit) +
                       field("target", event.target, kTextLimit) + " arguments=\"" +
                       argumentsText(arguments) + '"' + field("outcome", event.outcome, kTextLimit);
    if (!event.notes.sha256.empty()) line += field("sha256", event.notes.sha256, kNameLimit);
    if (event.notes.reason != ReasonId::None)
        line += field("reason", reasonCode(event.notes.reason), kNameLimit);
    return line;
}

void audit(const AuditEvent& event, const std::vector<Argument>& arguments) noexcept {
    try {
        utils::writeAuditLog(auditLine(event, arguments));
    } catch (...) {
        // Without memory there is no line; the caller's work goes on.
    }
}

}  // namespace core
