// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/Service.h"

#include <algorithm>

#include "Cli/Connection/ServerControl.h"
#include "Framework/Classes/RequestScope.h"
#include "Framework/Requests/Audit.h"
#include "Framework/Requests/UpdateSink.h"
#include "Logind/Inhibitor.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/Schema/ValueMaps.h"
#include "Utils/Utils.h"

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

    InstallCodes(const Candidate& candidate, const std::vector<std::string>& types) {
        if (!types.empty()) {
            codes.push_back(InstallOption::TargetTypes);
            values.push_back(joined(types, {&InstallOption::kTargetTypeSeparator, 1}));
        }
        codes.push_back(InstallOption::Update);  // the service requires it
        if (candidate.force) codes.push_back(InstallOption::ForceInstallation);
    }
};

core::Argument reference(const std::string& name, const core::CimPath& path) {
    return {name, core::CimValue::of(core::CimType::Reference, path)};
}

core::Argument imageOf(const Candidate& candidate) {
    if (candidate.identity.isValid()) return reference("Source", candidate.identity);
    return {"URI", core::CimValue::of(core::CimType::String, candidate.uri)};
}

/// A call of the service, as the methods take it.
struct ServiceCall {
    core::CimPath service;
    std::string method;
    std::vector<core::Argument> arguments;

    /// In this process nobody else knows who asks, so the audit line is written here. A server writes its
    /// own.
    void audit(const Connection& connection, const std::string& outcome, const core::NotedCall& noted) const {
        if (connection.isInProcess)
            core::audit({core::CallerScope::current(), method, service.toString(), outcome, noted.notes()},
                        arguments);
    }

    core::MethodResult run(const Connection& connection) const try {
        const core::NotedCall noted;
        try {
            core::MethodResult result = connection.operations->invokeMethod(service, method, arguments);
            audit(connection, core::outcomeOf(result), noted);
            return result;
        } catch (const core::CimError& error) {
            audit(connection, core::outcomeOf(error.status(), error.what()), noted);
            throw;
        }
    } catch (const core::CimError&) {
        throw;
    } catch (const CommandError&) {
        throw;
    } catch (const std::exception& error) {
        // Memory may end after the service was called, and before its answer is read.
        throw NoAnswer(ExitStatus::Failed,
                       std::string("The service's answer was lost: ") + error.what() + ".", kAskLog);
    }
};

}  // namespace

void auditOwn(const std::string& operation, const std::string& target, const std::string& outcome) {
    core::audit({core::CallerScope::current(), operation, target, outcome});
}

core::MethodResult startUpdate(const Connection& connection, const Candidate& candidate) {
    using core::CimType;
    using core::CimValue;
    if (connection.isInProcess) logind::loadLibrary();
    // The method for an identity asks the inventory for its types.
    const bool isNamedById = candidate.identity.isValid();
    const InstallCodes options(candidate, isNamedById ? std::vector<std::string>() : candidate.types);
    std::vector<core::CimScalar> codes;
    for (const std::uint64_t code : options.codes)
        codes.emplace_back(code);
    const CimValue values =
        options.values.empty()
            ? CimValue::null(CimType::String, true)
            : CimValue::arrayOf(CimType::String, {options.values.begin(), options.values.end()});
    const ServiceCall call{findService(*connection.operations),
                           isNamedById ? "InstallFromSoftwareIdentity" : "InstallFromURI",
                           {imageOf(candidate),
                            reference("Target", candidate.adapter.path),
                            {"InstallOptions", CimValue::arrayOf(CimType::Uint16, codes)},
                            {"InstallOptionsValues", values}}};
    return call.run(connection);
}

core::CimPath jobOf(const core::CimOperations& operations, const core::MethodResult& result) {
    // A server may give further outputs, and references among them.
    const core::Argument* job = core::findByName(result.outputs, "Job");
    const auto* path = job == nullptr ? nullptr : job->value.get<core::CimPath>();
    if (path != nullptr) {
        const std::string& place = path->getNamespace();
        // In this namespace the same path may be another job.
        if (place.empty() || core::sameName(place, utils::trimOf(operations.getNamespace(), "/")))
            return *path;
        throw CommandError(
            ExitStatus::Unknown,
            "The service started an update, but its job is in another namespace, " + place + ".",
            "\"quenxctl jobs\" lists it with that --namespace.");
    }
    throw CommandError(ExitStatus::Unknown, "The service started an update but did not name its job.",
                       "\"quenxctl jobs\" lists the jobs of a server.");
}

std::optional<std::uint32_t> verifyOnly(const Connection& connection, const Candidate& candidate) {
    // No method of the model does this. The service's own interface does, here or behind quenx-cimd's paths.
    const InstallCodes options(candidate, candidate.types);
    if (connection.control != nullptr)
        return connection.control->checkImage(candidate.uri, candidate.adapter.path.toString(), options.codes,
                                              options.values);
    if (!connection.isInProcess) return std::nullopt;
    const core::RequestScope scope;
    const ServiceCall call{findService(*connection.operations),
                           "CheckImage",
                           {imageOf(candidate), reference("Target", candidate.adapter.path)}};
    core::CimPath service = call.service;
    update::ImageCheck* check = update::findImageCheck(service);
    if (check == nullptr) return std::nullopt;
    const core::NotedCall noted;
    const unsigned int returned =
        check->checkImage(candidate.uri, candidate.adapter.path, options.codes, options.values);
    call.audit(connection, core::outcomeOf(core::MethodResult{returned, {}}), noted);
    return returned;
}

std::optional<std::vector<update::ImageTrust>> readTrust(const Connection& connection,
                                                         const std::vector<std::string>& uris) try {
    std::optional<std::vector<update::ImageTrust>> told;
    if (connection.control != nullptr) told = connection.control->trustOf(uris);
    if (connection.isInProcess) {
        const core::RequestScope scope;
        core::CimPath service = findService(*connection.operations);
        update::ImageCheck* check = update::findImageCheck(service);
        if (check == nullptr) return std::nullopt;
        told.emplace();
        for (const std::string& uri : uris)
            told->push_back(check->trustOf(uri));
    }
    const bool isAsked = told && std::ranges::any_of(*told, &update::ImageTrust::isAsked);
    return isAsked ? told : std::nullopt;
} catch (const core::CimError&) {
    // What is beside the matter must not stand in its way.
    return std::nullopt;
}

std::uint32_t checkIdentity(const Connection& connection, const Candidate& candidate) {
    const ServiceCall call{findService(*connection.operations),
                           "CheckSoftwareIdentity",
                           {imageOf(candidate), reference("Target", candidate.adapter.path)}};
    return call.run(connection).returnValue;
}

}  // namespace cli
