// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/Card.h"

#include "Cli/Display/Output.h"
#include "Cli/Display/Terminal.h"
#include "Cli/Update/Service.h"
#include "MidAPI/ma.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

/// The rest of the line, or the variable, that begins with this; empty where there is none.
std::string valueOf(const std::string& text, char separator, std::string_view beginning) {
    for (const std::string& line : utils::split(text, separator))
        if (line.starts_with(beginning)) return utils::trim(line.substr(beginning.size()));
    return {};
}

std::string caller() {
    return findCaller([](const std::string& path) { return os::readSystemText(path).value_or(""); });
}

std::string outcomeText(const ma::Activation& activation) {
    switch (activation.status) {
        case ma::Activation::Done:
            return "done";
        case ma::Activation::WouldDisrupt:
            return "denied: " + activation.text;
        // An audit is about what was done, not about what came of it.
        case ma::Activation::NotBack:
        case ma::Activation::StillPending:
            return "done: the card was reset, but " + activation.text;
        case ma::Activation::Unknown:
            return "unknown: " + activation.text;
        default:
            return "failed: " + activation.text;
    }
}

}  // namespace

std::string findCaller(const std::function<std::string(const std::string& path)>& read) {
    // The client's address and port, then the server's. "sudo" takes it out of the environment of what it
    // starts, and has it itself.
    constexpr std::string_view kVariable = "SSH_CONNECTION=";
    constexpr int kMostAncestors = 64;
    std::string process = "self";
    for (int step = 0; step < kMostAncestors && !process.empty() && process != "0"; ++step) {
        const std::string folder = "/proc/" + process;
        const std::string ends = valueOf(read(folder + "/environ"), '\0', kVariable);
        if (!ends.empty()) return ends.substr(0, ends.find(' '));
        process = valueOf(read(folder + "/status"), '\n', "PPid:");
    }
    return {};
}

ma::CardUse readCard(const Connection& connection, const std::string& adapter) {
    return connection.isInProcess ? ma::getCardUse(adapter, caller()) : ma::CardUse();
}

Json cardJson(const ma::CardUse& card) {
    return {{"functions", card.functions},
            {"interfaces", card.interfaces},
            {"bonds", card.bonds},
            {"bridges", card.bridges},
            {"losses", card.losses}};
}

void printCard(std::ostream& out, const ma::CardUse& card) {
    Rows rows;
    const auto add = [&rows](const char* what, const std::vector<std::string>& names) {
        if (!names.empty()) rows.push_back({std::string("  ") + what, joined(names)});
    };
    add("functions", card.functions);
    add("interfaces", card.interfaces);
    add("bonds", card.bonds);
    add("bridges", card.bridges);
    if (!rows.empty()) out << "On this card:\n";
    printPairs(out, rows);
}

ma::Activation activateFirmware(const std::string& adapter, bool mayDisrupt) {
    auto activation = ma::activate(adapter, {.mayDisrupt = mayDisrupt, .caller = caller()});
    auditOwn("ActivateFirmware", adapter, outcomeText(activation));
    return activation;
}

std::string resetAdvice(const std::string& adapter, const std::string& resetNeeded) {
    if (resetNeeded == "reload")
        return "It takes effect after a reset: \"quenxctl activate --target " + adapter +
               "\" does that while the machine runs.";
    if (resetNeeded == "reboot") return "It takes effect when the machine has been restarted.";
    if (resetNeeded == "power cycle")
        return "It takes effect when the machine has been without power for a moment.";
    if (resetNeeded == "unknown")
        return "It may take effect only after a reset, which the adapter does not tell: restart the machine.";
    return {};
}

}  // namespace cli
