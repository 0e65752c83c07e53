// SPDX-License-Identifier: Apache-2.0
#include "Cli/Registration/Registration.h"

#include <algorithm>
#include <array>
#include <string_view>

#include "Cli/Display/Messages.h"
#include "Cli/Display/Mof.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

struct Manager {
    const char* name;
    Registration (*registration)(const Registered& registered);
    Registration (*removal)(const Registered& registered);
};

constexpr std::array kManagers = {
    Manager{"sfcb", sfcbRegistration, sfcbRemoval},
    Manager{"pegasus", pegasusRegistration, pegasusRemoval},
};

const Manager& requireManager(const std::string& name) {
    const auto found =
        std::ranges::find_if(kManagers, [&](const Manager& manager) { return manager.name == name; });
    if (found != kManagers.end()) return *found;
    std::vector<std::string> names;
    for (const Manager& manager : kManagers)
        names.push_back(manager.name);
    throw CommandError(ExitStatus::WrongUse, "There is no registration for \"" + name + "\".",
                       didYouMean(name, names) + "--for takes " + joined(names, " or ") + ".");
}

bool isIdentifier(std::string_view text) {
    const auto belongs = [](char c) { return utils::isLetter(c) || utils::isDigit(c) || c == '_'; };
    return !text.empty() && !utils::isDigit(text.front()) && std::ranges::all_of(text, belongs);
}

/// Object managers make folders of them, and read them between blanks and quotes.
void requireNamespace(const std::string& name) {
    if (std::ranges::all_of(utils::split(name, '/'), isIdentifier)) return;
    throw CommandError(
        ExitStatus::WrongUse, "\"" + name + "\" is no namespace.",
        "Write it as root/cimv2: names of letters, digits and underscores that do not begin with "
        "a digit, with slashes between them.");
}

std::vector<std::string> namespacesFor(const RegistrationOptions& options, const std::string& own) {
    std::vector<std::string> names = options.namespaces;
    if (names.empty()) names.emplace_back(utils::trimOf(own, "/"));
    std::vector<std::string> different;
    for (const std::string& name : names) {
        requireNamespace(name);
        const auto isSame = [&](const std::string& other) { return core::sameName(name, other); };
        if (std::ranges::none_of(different, isSame)) different.push_back(name);
    }
    return different;
}

/// Classes of the standard come with the object manager. A name begins with that of its schema (DSP0004 5.1).
bool isStandard(const core::ClassChain& chain) {
    return utils::lowerCase(chain.front()->name).starts_with("cim_");
}

std::vector<ProviderType> typesOf(const core::ClassChain& chain) {
    std::vector<ProviderType> types = {ProviderType::Instance};
    if (core::isAssociation(chain)) types.push_back(ProviderType::Association);
    const auto hasMethods = [](const auto& declaration) { return !declaration->methods.empty(); };
    if (std::ranges::any_of(chain, hasMethods)) types.push_back(ProviderType::Method);
    return types;
}

/// Clients' filters are for these by name, so subclasses of them would not do.
std::vector<RegisteredClass> indicationClasses() {
    std::vector<RegisteredClass> classes;
    for (const char* const name : {"CIM_InstCreation", "CIM_InstModification", "CIM_InstDeletion"})
        classes.push_back({name, {ProviderType::Indication}});
    return classes;
}

constexpr const char* kWritten = " Written by quenxctl: ";

}  // namespace

std::string headLine(const std::string& comment, const std::string& what) {
    return comment + kWritten + what + "\n";
}

bool isWrittenHere(const std::string& text) {
    // In a script behind the line that names the shell.
    const std::size_t start = text.starts_with("#!") ? text.find('\n') + 1 : 0;
    const std::size_t end = text.find('\n', start);
    return std::string_view(text).substr(start, end - start).find(kWritten) != std::string_view::npos;
}

Registration registrationFor(const RegistrationOptions& options, core::CimOperations& operations) {
    const Manager& manager = requireManager(options.manager);
    std::vector<core::ClassChain> classes = operations.enumerateClasses("", true);
    std::erase_if(classes, isStandard);
    Registered registered{.classes = {},
                          .indications = indicationClasses(),
                          .namespaces = namespacesFor(options, operations.getNamespace()),
                          .mof = {"quenx-classes.mof", "", isWrittenHere}};
    std::string& mof = registered.mof.text;
    mof = headLine("//", "the classes to be served. Their superclasses are those of the standard schema.");
    if (options.withQualifiers) mof += "\n" + qualifiersMof();
    for (const core::ClassChain& chain : inMofOrder(classes)) {
        mof += "\n" + classMof(*chain.front());
        registered.classes.push_back({chain.front()->name, typesOf(chain)});
    }
    return (options.isRemoval ? manager.removal : manager.registration)(registered);
}

}  // namespace cli
