#include "Cli/ServiceCalls.h"

#include <algorithm>
#include <cstdint>

#include "Cli/Failure.h"
#include "Cli/Values.h"

namespace cli {

namespace {

constexpr std::uint64_t OPTION_FORCE = 3;
constexpr std::uint64_t OPTION_UPDATE = 5;
constexpr std::uint64_t OPTION_TARGET_TYPES = 32768;

core::Argument textArgument(const std::string& name, const std::string& text) {
    return {name, core::CimValue::of(core::CimType::String, text)};
}

core::Argument referenceArgument(const std::string& name, const core::CimPath& path) {
    return {name, core::CimValue::of(core::CimType::Reference, path)};
}

/// The values are parallel to the options, value i belonging to option i: the one option that has a value
/// comes first.
void addOptions(std::vector<core::Argument>& arguments, const InstallChoice& choice) {
    std::vector<core::CimScalar> options;
    core::CimValue values = core::CimValue::null(core::CimType::String, true);
    if (!choice.types.empty()) {
        std::string joined;
        for (const std::string& type : choice.types)
            joined += (&type == &choice.types.front() ? "" : "+") + type;
        options.emplace_back(OPTION_TARGET_TYPES);
        values = core::CimValue::arrayOf(core::CimType::String, {joined});
    }
    options.emplace_back(OPTION_UPDATE);
    if (choice.force) options.emplace_back(OPTION_FORCE);
    arguments.push_back({"InstallOptions", core::CimValue::arrayOf(core::CimType::Uint16, options)});
    arguments.push_back({"InstallOptionsValues", std::move(values)});
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

core::CimPath jobOf(const core::MethodResult& result) {
    for (const core::Argument& output : result.outputs) {
        const core::CimScalar* value = output.value.scalar();
        if (core::sameName(output.name, "Job") && value != nullptr &&
            std::holds_alternative<core::CimPath>(*value)) {
            return std::get<core::CimPath>(*value);
        }
    }
    throw Failure(ExitStatus::Failed, "The service started an update and did not say which job it is.",
                  "Look at the jobs with \"quenxctl instances Quenx_ConcreteJob\".");
}

std::vector<std::string> supportedTypes(Management& management) {
    const auto instances = management.enumerateInstances("Quenx_SoftwareInstallationServiceCapabilities");
    if (instances.empty()) return {};
    return textsOf(instances.front(), "SupportedTargetTypes");
}

}  // namespace cli
