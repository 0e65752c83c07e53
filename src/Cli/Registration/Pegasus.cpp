// SPDX-License-Identifier: Apache-2.0
// OpenPegasus: instances that tell of the module, the provider in it, and what that can do for each class.
#include <array>

#include "Cli/Display/Messages.h"
#include "Cli/Registration/Registration.h"

namespace cli {

namespace {

constexpr const char* kModule = "QuenxModule";
constexpr const char* kProviders = "quenx-pegasus.mof";

std::string number(ProviderType type) {
    constexpr std::array kNumbers = {"2", "3", "5", "4"};
    return kNumbers[static_cast<std::size_t>(type)];
}

std::string array(const std::vector<std::string>& items) {
    return "{ " + joined(items) + " }";
}

struct Property {
    const char* name;
    std::string value;  ///< as MOF has it
};

std::string instance(const char* className, const std::vector<Property>& properties) {
    std::string text = std::string("\ninstance of ") + className + " {\n";
    for (const Property& property : properties)
        text += std::string("    ") + property.name + " = " + property.value + ";\n";
    return text + "};\n";
}

/// The group and the user make one process of it, with all jobs and claims, and not one for each user.
std::string moduleText() {
    return instance("PG_ProviderModule", {{"Name", utils::quoted(kModule)},
                                          {"Vendor", utils::quoted(kProviderName)},
                                          {"Version", utils::quoted(QUENX_VERSION)},
                                          {"InterfaceType", "\"CMPI\""},
                                          {"InterfaceVersion", "\"2.0.0\""},
                                          {"Location", utils::quoted(kProviderLibrary)},
                                          {"ModuleGroupName", utils::quoted(kProviderName)},
                                          {"UserContext", "4"}}) +
           instance("PG_Provider",
                    {{"ProviderModuleName", utils::quoted(kModule)}, {"Name", utils::quoted(kProviderName)}});
}

std::string capabilities(const RegisteredClass& registered, const std::vector<std::string>& namespaces) {
    std::vector<std::string> types;
    for (const ProviderType type : registered.types)
        types.push_back(number(type));
    std::vector<std::string> places;
    for (const std::string& name : namespaces)
        places.push_back(utils::quoted(name));
    return instance("PG_ProviderCapabilities", {{"ProviderModuleName", utils::quoted(kModule)},
                                                {"ProviderName", utils::quoted(kProviderName)},
                                                {"CapabilityID", utils::quoted(registered.name)},
                                                {"ClassName", utils::quoted(registered.name)},
                                                {"Namespaces", array(places)},
                                                {"ProviderType", array(types)},
                                                {"SupportedProperties", "NULL"},
                                                {"SupportedMethods", "NULL"}});
}

/// Subclasses first. A class that is not there is no failure; one that cannot be deleted is.
std::string deletions(const Registered& registered) {
    std::vector<std::string> names;
    for (auto each = registered.classes.rbegin(); each != registered.classes.rend(); ++each)
        names.push_back(each->name);
    return "for namespace in " + joined(registered.namespaces, " ") +
           "; do\n"
           "    for class in \\\n        " +
           joined(names, " \\\n        ") +
           "\n"
           "    do\n"
           "        if cimcli gc \"$class\" -n \"$namespace\" >/dev/null 2>&1; then\n"
           "            cimcli dc \"$class\" -n \"$namespace\"\n"
           "        fi\n"
           "    done\n"
           "done\n";
}

}  // namespace

Registration pegasusRegistration(const Registered& registered) {
    std::string text = headLine("//", "the registration, for the interop namespace of the object manager.");
    text += moduleText();
    for (const auto* classes : {&registered.classes, &registered.indications})
        for (const RegisteredClass& each : *classes)
            text += capabilities(each, registered.namespaces);
    std::vector<std::string> steps = {
        "Have libQuenx_Cmpi.so in the provider directory (providerDir of the configuration).",
        "Where an earlier version is registered, remove that first (--remove)."};
    for (const std::string& name : registered.namespaces)
        steps.push_back("cimmof -n " + name + " " + registered.mof.name);
    steps.push_back(joined(
        {"cimmof -n root/PG_InterOp", kProviders, "   (or its interop namespace, if that has another name)"},
        " "));
    return {{registered.mof, {kProviders, text, isWrittenHere}}, steps};
}

Registration pegasusRemoval(const Registered& registered) {
    constexpr const char* kName = "quenx-pegasus-remove.sh";
    const std::string name(kModule);
    const std::string text =
        "#!/bin/sh\n" +
        headLine("#", "takes its registration and classes out of OpenPegasus. It may be repeated.") +
        "set -e\n"
        "modules=$(cimprovider -l) || {\n"
        "    echo \"The object manager does not answer. Start it, and run this again.\" >&2\n"
        "    exit 1\n"
        "}\n"
        "if printf '%s\\n' \"$modules\" | grep -qw " +
        name + "; then\n    cimprovider -d -m " + name +
        " || :  # it may be disabled already\n    cimprovider -r -m " + name + "\nfi\n" +
        deletions(registered);
    return {{{kName, text, isWrittenHere}},
            {joined({"sh", kName, "   (while the object manager runs)"}, " ")}};
}

}  // namespace cli
