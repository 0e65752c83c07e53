// SPDX-License-Identifier: Apache-2.0
// sfcb: a section a class, and a repository that is made anew from everything that is staged.
#include <algorithm>
#include <array>
#include <utility>

#include "Cli/Display/Messages.h"
#include "Cli/Registration/Registration.h"

namespace cli {

namespace {

constexpr const char* kRegister = "quenx-sfcb.reg";

const char* word(ProviderType type) {
    constexpr std::array kWords = {"instance", "association", "method", "indication"};
    return kWords[static_cast<std::size_t>(type)];
}

std::string providerLine() {
    return joined({"   provider:", kProviderName}, " ");
}

/// One group, so that one process has all jobs and claims; it must not be unloaded, since they end with it.
std::string section(const RegisteredClass& registered, const std::vector<std::string>& namespaces) {
    std::vector<std::string> types;
    for (const ProviderType type : registered.types)
        types.emplace_back(word(type));
    const std::string name(kProviderName);
    std::string text = "[" + registered.name + "]\n" + providerLine() + "\n   location: " + kProviderLibrary +
                       "\n   type: " + joined(types, " ") + "\n   namespace: " + joined(namespaces, " ") +
                       "\n   group: " + name + "\n   unload: never\n";
    // sfcb asks once for each association, and says in no other way which one it is about.
    if (std::ranges::find(registered.types, ProviderType::Association) != registered.types.end())
        text += "   parameters: " + registered.name + "\n";
    return text;
}

/// A register has no comment that all versions take, so it is known by its classes, and by its provider where
/// they are the standard's; one to which somebody has added another's is not replaced.
bool isOwnRegister(const std::string& text) {
    const std::string own = std::string("[") + kProviderName + "_";
    const auto lines = utils::split(text, '\n');
    const auto isOwnOrNone = [&](std::size_t i) {
        if (!utils::trim(lines[i]).starts_with('[') || lines[i].starts_with(own)) return true;
        return lines[i].starts_with("[CIM_") && i + 1 < lines.size() && lines[i + 1] == providerLine();
    };
    std::size_t known = 0;
    while (known < lines.size() && isOwnOrNone(known))
        ++known;
    return text.starts_with(own) && known == lines.size();
}

/// A repository has those of the standard's classes alone that somebody's are below, and the standard's
/// indications may be above nobody's yet.
RegistrationFile indicationsMof(const Registered& registered) {
    std::string text = headLine("//", "brings the standard's indications into the repository.");
    for (const RegisteredClass& each : registered.indications) {
        const std::string name = each.name.substr(each.name.find('_'));
        text += "\n[ Indication ]\nclass " + (kProviderName + name) + " : " + each.name + " {\n};\n";
    }
    return {"quenx-sfcb-indications.mof", text, isWrittenHere};
}

/// Adds the commands of the staging tool; the register goes with the first namespace.
void addStaging(std::vector<std::string>& commands, const char* tool, const Registered& registered) {
    bool isFirst = true;
    for (const std::string& name : registered.namespaces) {
        std::vector<std::string> words = {tool, "-n", name};
        if (std::exchange(isFirst, false)) words.insert(words.end(), {"-r", kRegister});
        words.insert(words.end(), {registered.mof.name, indicationsMof(registered).name});
        commands.push_back(joined(words, " "));
    }
    commands.emplace_back("sfcbrepos -f");
}

constexpr const char* kRestart = "Restart sfcb, when none of its providers is at work.";

}  // namespace

Registration sfcbRegistration(const Registered& registered) {
    std::string text;
    for (const auto* classes : {&registered.classes, &registered.indications})
        for (const RegisteredClass& each : *classes)
            text += section(each, registered.namespaces);
    std::vector<std::string> steps = {
        "Have libQuenx_Cmpi.so in a folder that providerDirs of sfcb.cfg names."};
    addStaging(steps, "sfcbstage", registered);
    steps.emplace_back(kRestart);
    return {{{kRegister, text, isOwnRegister}, registered.mof, indicationsMof(registered)}, steps};
}

Registration sfcbRemoval(const Registered& registered) {
    constexpr const char* kName = "quenx-sfcb-remove.sh";
    std::vector<std::string> lines = {"set -e"};
    addStaging(lines, "sfcbunstage", registered);
    const std::string text =
        "#!/bin/sh\n" +
        headLine("#", "takes its classes and their registration out of sfcb. It may be repeated.") +
        joined(lines, "\n") + "\n";
    return {{{kName, text, isWrittenHere}}, {joined({"sh", kName}, " "), kRestart}};
}

}  // namespace cli
