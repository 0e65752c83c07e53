// SPDX-License-Identifier: Apache-2.0
#include "Cli/ServiceCalls.h"

#include <algorithm>
#include <cstdint>

#include "Cli/Failure.h"
#include "Cli/Suggestion.h"
#include "Cli/Values.h"

namespace cli {

namespace {

constexpr std::uint16_t OPTION_FORCE = 3;
constexpr std::uint16_t OPTION_UPDATE = 5;
constexpr std::uint16_t OPTION_TARGET_TYPES = 32768;

core::Argument textArgument(const std::string& name, const std::string& text) {
    return {name, core::CimValue::of(core::CimType::String, text)};
}

core::Argument referenceArgument(const std::string& name, const core::CimPath& path) {
    return {name, core::CimValue::of(core::CimType::Reference, path)};
}

/// The values are parallel to the options, value i belonging to option i: the one option that has a value
/// comes first.
InstallOptions optionsOf(const InstallChoice& choice) {
    InstallOptions options;
    if (!choice.types.empty()) {
        std::string joined;
        for (const std::string& type : choice.types)
            joined += (&type == &choice.types.front() ? "" : "+") + type;
        options.codes.push_back(OPTION_TARGET_TYPES);
        options.values.push_back(std::move(joined));
    }
    options.codes.push_back(OPTION_UPDATE);
    if (choice.force) options.codes.push_back(OPTION_FORCE);
    return options;
}

void addOptions(std::vector<core::Argument>& arguments, const InstallChoice& choice) {
    const InstallOptions options = optionsOf(choice);
    std::vector<core::CimScalar> codes;
    for (const std::uint64_t code : options.codes)
        codes.emplace_back(code);
    core::CimValue values = core::CimValue::null(core::CimType::String, true);
    if (!options.values.empty()) {
        values =
            core::CimValue::arrayOf(core::CimType::String, {options.values.begin(), options.values.end()});
    }
    arguments.push_back({"InstallOptions", core::CimValue::arrayOf(core::CimType::Uint16, codes)});
    arguments.push_back({"InstallOptionsValues", std::move(values)});
}

/// The names of image types that the service knows, from its capabilities; none when it does not say.
std::vector<std::string> supportedTypes(Management& management) {
    const auto instances = management.enumerateInstances("Quenx_SoftwareInstallationServiceCapabilities");
    if (instances.empty()) return {};
    return textsOf(instances.front(), "SupportedTargetTypes");
}

core::MethodResult call(Management& management, const std::string& method,
                        const std::vector<core::Argument>& arguments) {
    return management.invokeMethod(findService(management), method, arguments);
}

}  // namespace

core::CimPath findService(Management& management) {
    const auto services = management.enumerateInstanceNames("Quenx_SoftwareInstallationService");
    if (services.empty()) {
        throw Failure(ExitStatus::Failed, "There is no software installation service.",
                      "Check that the provider libraries are those of this version (--providers).");
    }
    return services.front();
}

core::MethodResult installFromUri(Management& management, const std::string& uri, const core::CimPath& target,
                                  const InstallChoice& choice) {
    std::vector<core::Argument> arguments = {textArgument("URI", uri), referenceArgument("Target", target)};
    addOptions(arguments, choice);
    return call(management, "InstallFromURI", arguments);
}

core::MethodResult installFromIdentity(Management& management, const core::CimPath& identity,
                                       const core::CimPath& target, bool force) {
    std::vector<core::Argument> arguments = {referenceArgument("Source", identity),
                                             referenceArgument("Target", target)};
    addOptions(arguments, {{}, force});
    return call(management, "InstallFromSoftwareIdentity", arguments);
}

core::MethodResult checkIdentity(Management& management, const core::CimPath& identity,
                                 const core::CimPath& target) {
    return call(management, "CheckSoftwareIdentity",
                {referenceArgument("Source", identity), referenceArgument("Target", target)});
}

std::optional<std::uint32_t> checkUri(Management& management, const std::string& uri,
                                      const core::CimPath& target, const InstallChoice& choice) {
    return management.checkImage(findService(management), uri, target, optionsOf(choice));
}

core::CimPath jobOf(const core::MethodResult& result) {
    for (const core::Argument& output : result.outputs) {
        const core::CimScalar* value = output.value.scalar();
        if (core::sameName(output.name, "Job") && value != nullptr &&
            std::holds_alternative<core::CimPath>(*value)) {
            return std::get<core::CimPath>(*value);
        }
    }
    throw Failure(ExitStatus::Failed, "The service started an update but did not name its job.",
                  "\"quenxctl jobs\" lists the jobs of a server.");
}

void requireKnownTypes(Management& management, const std::vector<std::string>& types) {
    const std::vector<std::string> known = supportedTypes(management);
    if (known.empty()) return;
    for (const std::string& type : types) {
        if (type.empty() || std::find(known.begin(), known.end(), type) != known.end()) continue;
        throw Failure(ExitStatus::WrongUse, "There is no image type \"" + type + "\".",
                      didYouMean(type, known) + "The types are " + listText(known) + ".");
    }
}

}  // namespace cli
