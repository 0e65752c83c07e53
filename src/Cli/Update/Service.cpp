// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/Service.h"

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/RequestScope.h"
#include "Framework/Model/CimInstance.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/Schema/ValueMaps.h"

namespace cli {

namespace {

core::CimPath findService(core::CimOperations& operations) try {
    const auto services = operations.enumerateInstanceNames("Quenx_SoftwareInstallationService");
    if (services.empty()) {
        throw CommandError(ExitStatus::Failed, "There is no software installation service.",
                           "Check that the provider libraries are those of this version (--providers).");
    }
    return services.front();
} catch (const NoAnswer& error) {
    // No update was asked for yet, so this must not read as one that may have begun.
    throw CommandError(error.status(), error.what(), error.advice());
}

/// What the methods take as InstallOptions and InstallOptionsValues. The values are parallel to the codes,
/// value i belonging to code i: the one code that has a value comes first.
struct InstallCodes {
    std::vector<std::uint16_t> codes;
    std::vector<std::string> values;

    explicit InstallCodes(const Candidate& candidate) {
        if (!candidate.identity.isValid() && !candidate.types.empty()) {
            codes.push_back(InstallOption::TargetTypes);
            values.push_back(joined(candidate.types, {&InstallOption::kTargetTypeSeparator, 1}));
        }
        codes.push_back(InstallOption::Update);  // the service requires it
        if (candidate.force) codes.push_back(InstallOption::ForceInstallation);
    }
};

core::Argument reference(const std::string& name, const core::CimPath& path) {
    return {name, core::CimValue::of(core::CimType::Reference, path)};
}

}  // namespace

core::MethodResult startUpdate(core::CimOperations& operations, const Candidate& candidate) {
    using core::CimType;
    using core::CimValue;
    const InstallCodes options(candidate);
    std::vector<core::CimScalar> codes;
    for (const std::uint64_t code : options.codes)
        codes.emplace_back(code);
    const CimValue values =
        options.values.empty()
            ? CimValue::null(CimType::String, true)
            : CimValue::arrayOf(CimType::String, {options.values.begin(), options.values.end()});
    const bool hasIdentity = candidate.identity.isValid();
    const core::Argument image = hasIdentity
                                     ? reference("Source", candidate.identity)
                                     : core::Argument{"URI", CimValue::of(CimType::String, candidate.uri)};
    return operations.invokeMethod(findService(operations),
                                   hasIdentity ? "InstallFromSoftwareIdentity" : "InstallFromURI",
                                   {image,
                                    reference("Target", candidate.adapter.path),
                                    {"InstallOptions", CimValue::arrayOf(CimType::Uint16, codes)},
                                    {"InstallOptionsValues", values}});
}

core::CimPath jobOf(const core::MethodResult& result) {
    // A server may give further outputs, and references among them.
    const core::Argument* job = core::findByName(result.outputs, "Job");
    const auto* path = job == nullptr ? nullptr : job->value.get<core::CimPath>();
    if (path != nullptr) return *path;
    throw CommandError(ExitStatus::Unknown, "The service started an update but did not name its job.",
                       "\"quenxctl jobs\" lists the jobs of a server.");
}

std::optional<std::uint32_t> verifyOnly(const Connection& connection, const Candidate& candidate) {
    core::CimPath service = findService(*connection.operations);
    if (candidate.identity.isValid()) {
        return connection.operations
            ->invokeMethod(
                service, "CheckSoftwareIdentity",
                {reference("Source", candidate.identity), reference("Target", candidate.adapter.path)})
            .returnValue;
    }
    if (!connection.isInProcess) return std::nullopt;
    // No method of the model does this; the service's own interface in this process does.
    const core::RequestScope scope;
    auto* check = dynamic_cast<update::ImageCheck*>(core::GetCimBroker()->getInstanceByPath(service));
    if (check == nullptr) return std::nullopt;
    const InstallCodes options(candidate);
    return check->checkImage(candidate.uri, candidate.adapter.path, options.codes, options.values);
}

}  // namespace cli
