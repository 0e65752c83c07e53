// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationService.h"

#include <algorithm>

#include "Framework/Classes/RequestScope.h"
#include "Framework/Requests/PolicyDecision.h"
#include "Providers/SoftwareUpdate/MethodArguments.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/UpdateReport.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace {

using core::CimPropertyList;
using Id = core::ReasonId;

constexpr std::uint16_t kOperationalStatusOk = 2;

/// Options that nothing here can carry out; TargetTypes has a rule of its own: the identity method supplies
/// the target types itself, so it refuses them from the client, while InstallFromURI takes them.
constexpr std::uint16_t kRefusedOptions[] = {
    InstallOption::DeferReset, InstallOption::Install,    InstallOption::Repair,
    InstallOption::Reboot,     InstallOption::Password,   InstallOption::Uninstall,
    InstallOption::Log,        InstallOption::SilentMode, InstallOption::AdministrativeMode,
};

bool areOptionsAccepted(const std::vector<std::uint16_t>& options) {
    const auto isGiven = [&options](std::uint16_t option) {
        return Quenx_SoftwareInstallationService::IsValueDefined(option, options);
    };
    return isGiven(InstallOption::Update) &&
           std::none_of(std::begin(kRefusedOptions), std::end(kRefusedOptions), isGiven);
}

Quenx_ConcreteJobClass& jobRegistry() {
    core::CimClass* cimclass = utils::Singleton<ConcreteJobFactory>::getInstance()->getCimClass();
    QUENX_ASSERT_TEXT(cimclass != nullptr, __FILE__, __LINE__, "cimclass != __null");
    return static_cast<Quenx_ConcreteJobClass&>(*cimclass);
}

/// A VerifyJobResult, found without claiming the adapter.
int resultOfExamining(const UpdateOrder& order) {
    return resultOf([&]() -> int {
        examineImage(order);
        return VerifyJobResult::Success;
    });
}

/// Exactly one of Target and Collection may be given. Returns what the method returns at once, if anything.
std::optional<unsigned int> checkTargetAndCollection(const MethodArguments& in, const char* bothGiven) {
    const bool noCollection = in.isNull("Collection");
    const bool noSource = in.isNull("Source");
    const bool noTarget = in.isNull("Target");
    QUENX_DEBUG("Target:%d, Source:%d, Collection:%d", noTarget, noSource, noCollection);
    if (!noTarget && !noCollection) refuseArguments(bothGiven);
    if (noTarget && noCollection) refuseArguments("Neither Target nor Collection are defined");
    if (!noTarget) return std::nullopt;
    core::NotedCall::noteReason(Id::CollectionsNotSupported);
    return MethodReturn::CollectionNotSupported;
}

/// Completes the order and has the registry carry it out; onSuccess receives the job. Whatever the registry
/// or onSuccess throws is answered by "not enough memory".
template <class OnSuccess>
unsigned int carryOut(const MethodKind& kind, const core::CimPath* source, const core::CimPath& target,
                      UpdateOrder order, OnSuccess&& onSuccess) {
    const core::PolicyDecision decision;  // for callers that come without the request layer
    const auto refused = resolve(kind, source, target, order);
    UpdateReport::noteOrder(order, target);
    if (refused) return *refused;
    // Not within the try: a registry that is missing is a mistake in the program, and is to be seen as one.
    Quenx_ConcreteJobClass& registry = jobRegistry();
    const std::string targetText = target.toString();
    try {
        if (kind.createsJob && !UpdateReport::mayBegin()) return MethodReturn::UnspecifiedError;
        Quenx_ConcreteJob* job = nullptr;
        const int result = registry.verifyOrCreateNewJob(order.adapterName, order.uri, order.options,
                                                         order.values, job, kind.createsJob);
        const unsigned int returnValue = returnValueOf(kind, result, targetText);
        if (returnValue == MethodReturn::JobStarted || returnValue == MethodReturn::Completed) onSuccess(job);
        return returnValue;
    } catch (...) {
        core::NotedCall::noteReason(Id::NoMemory);
        QUENX_DEBUG("Allocation error occured for '%s'", targetText.c_str());
        return MethodReturn::InsufficientMemory;
    }
}

}  // namespace

Quenx_SoftwareInstallationService::Quenx_SoftwareInstallationService() {
    // By the virtual members, so that a derived class can replace a method.
    addMethod("InstallFromSoftwareIdentity", &Quenx_SoftwareInstallationService::reportFromSoftwareIdentity);
    addMethod("InstallFromURI", &Quenx_SoftwareInstallationService::reportFromUri);
    addMethod("CheckSoftwareIdentity", &Quenx_SoftwareInstallationService::CheckSoftwareIdentity);
}

bool Quenx_SoftwareInstallationService::IsValueDefined(std::uint16_t value,
                                                       const std::vector<std::uint16_t>& values) {
    return std::find(values.begin(), values.end(), value) != values.end();
}

unsigned int Quenx_SoftwareInstallationService::reportFromUri(CimPropertyList& in, CimPropertyList& out,
                                                              core::CimInstance*& job) {
    return reported([&] { return InstallFromURI(in, out, job); });
}

unsigned int Quenx_SoftwareInstallationService::reportFromSoftwareIdentity(CimPropertyList& in,
                                                                           CimPropertyList& out,
                                                                           core::CimInstance*& job) {
    return reported([&] { return InstallFromSoftwareIdentity(in, out, job); });
}

unsigned int Quenx_SoftwareInstallationService::InstallFromURI(CimPropertyList& in, CimPropertyList&,
                                                               core::CimInstance*& job) {
    const utils::TimeStamp timing("Quenx_SoftwareInstallationService::InstallFromURI");
    const core::RequestScope scope;  // for callers that come without the request layer
    const MethodArguments arguments(in);
    arguments.requirePresent({"URI", "Target", "InstallOptions", "InstallOptionsValues"});
    arguments.requireNotNull({"URI", "Target", "InstallOptions"});
    const core::CimPath target = arguments.path("Target");
    UpdateOrder order{{},
                      arguments.text("URI"),
                      arguments.codes("InstallOptions"),
                      arguments.texts("InstallOptionsValues")};
    UpdateReport::noteOrder(order, target);
    if (!areOptionsAccepted(order.options)) {
        core::NotedCall::noteReason(Id::OptionsNotSupported);
        return MethodReturn::InvalidParameter;
    }
    return carryOut(kInstalling, nullptr, target, std::move(order),
                    [&job](Quenx_ConcreteJob* created) { job = created; });
}

unsigned int Quenx_SoftwareInstallationService::InstallFromSoftwareIdentity(CimPropertyList& in,
                                                                            CimPropertyList&,
                                                                            core::CimInstance*& job) {
    const utils::TimeStamp timing("Quenx_SoftwareInstallationService::InstallFromSoftwareIdentity");
    const core::RequestScope scope;  // for callers that come without the request layer
    const MethodArguments arguments(in);
    arguments.requirePresent({"InstallOptions", "InstallOptionsValues", "Source", "Target", "Collection"});
    QUENX_DEBUG("All arguments are defined");
    if (const auto refused = checkTargetAndCollection(arguments, "Target and Collection are defined"))
        return *refused;
    arguments.requireNotNull({"InstallOptions", "Source", "Target"});
    const core::CimPath source = arguments.path("Source");
    const core::CimPath target = arguments.path("Target");
    UpdateOrder order{{}, {}, arguments.codes("InstallOptions"), arguments.texts("InstallOptionsValues")};
    UpdateReport::noteOrder(order, target);
    QUENX_DEBUG("Starting arguments verification success");
    if (!areOptionsAccepted(order.options) || IsValueDefined(InstallOption::TargetTypes, order.options)) {
        QUENX_DEBUG("One of value of InstallOptions value is not supported");
        core::NotedCall::noteReason(Id::OptionsNotSupported);
        return MethodReturn::InvalidParameter;
    }
    return carryOut(kInstalling, &source, target, std::move(order),
                    [&job](Quenx_ConcreteJob* created) { job = created; });
}

unsigned int Quenx_SoftwareInstallationService::CheckSoftwareIdentity(CimPropertyList& in,
                                                                      CimPropertyList& out,
                                                                      core::CimInstance*&) {
    constexpr const char* kCharacteristics = "InstallCharacteristics";
    constexpr std::uint16_t kCharacteristic = 7;
    const utils::TimeStamp timing("Quenx_SoftwareInstallationService::CheckSoftwareIdentity");
    const core::RequestScope scope;  // for callers that come without the request layer
    const MethodArguments arguments(in);
    const MethodArguments results(out);
    arguments.requirePresent({"Source", "Target", "Collection"});
    results.requirePresent({kCharacteristics});
    QUENX_DEBUG("All arguments are defined");
    if (const auto refused = checkTargetAndCollection(arguments, "Both Target and Collection are defined"))
        return *refused;
    arguments.requireNotNull({"Source", "Target"});
    const core::CimPath source = arguments.path("Source");
    const core::CimPath target = arguments.path("Target");
    const std::vector<std::uint16_t> characteristics = results.codes(kCharacteristics);
    QUENX_DEBUG("Starting arguments verification success");
    if (!characteristics.empty()) {
        QUENX_DEBUG(
            "InstallCharacterisitcs argument is an output method's argument. Any input value is not "
            "supported.");
        core::NotedCall::noteReason(Id::ArgumentsWrong);
        return MethodReturn::InvalidParameter;
    }
    return carryOut(kChecking, &source, target, {},
                    [&](Quenx_ConcreteJob*) { results.setCodes(kCharacteristics, {kCharacteristic}); });
}

unsigned int Quenx_SoftwareInstallationService::checkImage(const std::string& uri,
                                                           const core::CimPath& target,
                                                           const std::vector<std::uint16_t>& options,
                                                           const std::vector<std::string>& values) {
    const utils::TimeStamp timing("Quenx_SoftwareInstallationService::checkImage");
    const core::RequestScope scope;  // for callers that come without the request layer
    const core::PolicyDecision decision(core::PolicyDecision::Aim::Look);
    if (!areOptionsAccepted(options)) {
        core::NotedCall::noteReason(Id::OptionsNotSupported);
        return MethodReturn::InvalidParameter;
    }
    UpdateOrder order{{}, uri, options, values};
    if (const auto refused = resolve(kChecking, nullptr, target, order)) return *refused;
    return returnValueOf(kChecking, resultOfExamining(order), target.toString());
}

update::ImageTrust Quenx_SoftwareInstallationService::trustOf(const std::string& uri) {
    const core::PolicyDecision decision(core::PolicyDecision::Aim::Look);
    return examineTrust(uri);
}

std::string Quenx_SoftwareInstallationService::claimedAdapter() const {
    return Quenx_ConcreteJob::m_servicedAdapter.get();
}

update::Claim Quenx_SoftwareInstallationService::claim() const {
    return AdapterClaim::current(Quenx_ConcreteJob::m_servicedAdapter);
}

update::ClaimRelease Quenx_SoftwareInstallationService::releaseClaim(const std::string& adapter) {
    const core::PolicyDecision decision;
    return AdapterClaim::releaseLeft(Quenx_ConcreteJob::m_servicedAdapter, adapter);
}

void Quenx_SoftwareInstallationService::refresh() {
    // Asked before the lock, since the system may take its time.
    const std::string hostname = os::getHostname();
    const core::RecursiveLocker lock(getMutex());
    Caption = "Ethernet Firmware Update";
    Description = "Firmware Update Service for Tarvel(R) Ethernet Adapters";
    setNull(ElementName, InstanceID, Generation, InstallDate, StatusDescriptions, Status, HealthState,
            PrimaryStatus, DetailedStatus, OperatingStatus, CommunicationStatus, EnabledState,
            OtherEnabledState, RequestedState, EnabledDefault, TimeOfLastStateChange,
            AvailableRequestedStates, TransitioningToState, StartMode, Started);
    OperationalStatus = {kOperationalStatusOk};
    SystemCreationClassName = getCreationClassName();
    SystemName = hostname;
    CreationClassName = getClassName();
    Name = fmt("Quenx:%s", getUniqId().c_str());
    PrimaryOwnerName = "Tarvel Corporation";
    PrimaryOwnerContact = "https://www.tarvel.example";
}

Quenx_SoftwareInstallationServiceClass::Quenx_SoftwareInstallationServiceClass()
    : SingletonClass("SoftwareInstallationService::getInstances", __FILE__, __LINE__) {}
