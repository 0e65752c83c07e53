// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationService.h"

#include <algorithm>
#include <optional>

#include "Framework/Classes/RequestScope.h"
#include "Providers/SoftwareUpdate/ImageVerification.h"
#include "Providers/SoftwareUpdate/MethodArguments.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace {

using core::CimPropertyList;

constexpr std::uint16_t kOperationalStatusOk = 2;

/// What the registry is asked to do.
struct Order {
    std::string adapterName;
    std::string uri;
    std::vector<std::uint16_t> options;
    std::vector<std::string> values;
};

/// Options that nothing here can carry out. The identity method supplies the target types itself, so it
/// refuses them from the client, while InstallFromURI takes them.
constexpr std::uint16_t kRefusedOptions[] = {2, 4, 6, 7, 8, 9, 10, 11, 12};

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
int examine(const Order& order) {
    try {
        examineImage(order.adapterName, order.uri, order.options, order.values);
        return VerifyJobResult::Success;
    } catch (...) {
        return verifyJobResultOfCurrentException();
    }
}

/// Exactly one of Target and Collection may be given. Returns what the method returns at once, if anything.
std::optional<unsigned int> checkTargetAndCollection(const MethodTraits& method, const MethodArguments& in) {
    const bool noCollection = in.isNull("Collection");
    const bool noSource = in.isNull("Source");
    const bool noTarget = in.isNull("Target");
    QUENX_DEBUG("Target:%d, Source:%d, Collection:%d", noTarget, noSource, noCollection);
    if (!noTarget && !noCollection) throw utils::EUnspecifiedError(method.bothGiven);
    if (noTarget && noCollection) throw utils::EUnspecifiedError("Neither Target nor Collection are defined");
    if (noTarget) return MethodReturn::CollectionNotSupported;
    return std::nullopt;
}

/// Completes the order from the Target, and from the Source where there is one. Returns what the method
/// returns at once, if anything.
std::optional<unsigned int> resolve(const MethodTraits& method, const core::CimPath* source,
                                    const core::CimPath& target, Order& order) {
    if (source != nullptr) {
        ResolvedSource image = resolveSource(method, *source);
        if (image.returnValue != 0) return image.returnValue;
        order.uri = std::move(image.uri);
        order.options.insert(order.options.begin(), InstallOption::TargetTypes);
        order.values.insert(order.values.begin(), std::move(image.targetTypes));
    }
    ResolvedTarget adapter = resolveTarget(method, target);
    if (adapter.returnValue != 0) return adapter.returnValue;
    order.adapterName = std::move(adapter.adapterName);
    return std::nullopt;
}

/// The same, and an answer too where an instance of another provider throws: its failures never leave a
/// method.
std::optional<unsigned int> resolveSafely(const MethodTraits& method, const core::CimPath* source,
                                          const core::CimPath& target, Order& order) {
    try {
        return resolve(method, source, target, order);
    } catch (...) {
        QUENX_DEBUG("Unspecified Error for '%s'", target.toString().c_str());
        return MethodReturn::UnspecifiedError;
    }
}

bool isSuccess(unsigned int returnValue) {
    return returnValue == MethodReturn::JobStarted || returnValue == MethodReturn::Completed;
}

/// Completes the order and has the registry carry it out; onSuccess receives the job. Whatever the registry
/// or onSuccess throws is answered by "not enough memory".
template <class OnSuccess>
unsigned int carryOut(const MethodTraits& method, const core::CimPath* source, const core::CimPath& target,
                      Order order, OnSuccess&& onSuccess) {
    if (const auto refused = resolveSafely(method, source, target, order)) return *refused;
    // Not within the try: a registry that is missing is a mistake in the program, and is to be seen as one.
    Quenx_ConcreteJobClass& registry = jobRegistry();
    const std::string targetText = target.toString();
    try {
        Quenx_ConcreteJob* job = nullptr;
        const int result = registry.verifyOrCreateNewJob(order.adapterName, order.uri, order.options,
                                                         order.values, job, method.createsJob);
        const unsigned int returnValue = returnValueOf(method, result, targetText);
        if (isSuccess(returnValue)) onSuccess(job);
        return returnValue;
    } catch (...) {
        QUENX_DEBUG("Allocation error occured for '%s'", targetText.c_str());
        return MethodReturn::InsufficientMemory;
    }
}

}  // namespace

constinit const core::CimClassInfo Quenx_SoftwareInstallationService::classInfo{
    "Quenx_SoftwareInstallationService", &CIM_SoftwareInstallationService::classInfo, false, {}, nullptr};

Quenx_SoftwareInstallationService::Quenx_SoftwareInstallationService() {
    // By the virtual members, so that a derived class can replace a method.
    addMethod("InstallFromSoftwareIdentity", &Quenx_SoftwareInstallationService::InstallFromSoftwareIdentity);
    addMethod("InstallFromURI", &Quenx_SoftwareInstallationService::InstallFromURI);
    addMethod("CheckSoftwareIdentity", &Quenx_SoftwareInstallationService::CheckSoftwareIdentity);
}

Quenx_SoftwareInstallationService::~Quenx_SoftwareInstallationService() = default;

std::string Quenx_SoftwareInstallationService::getClassName() const {
    return classInfo.name;
}

bool Quenx_SoftwareInstallationService::IsValueDefined(std::uint16_t value,
                                                       const std::vector<std::uint16_t>& values) {
    return std::find(values.begin(), values.end(), value) != values.end();
}

unsigned int Quenx_SoftwareInstallationService::InstallFromURI(CimPropertyList& in, CimPropertyList&,
                                                               core::CimInstance*& job) {
    const utils::TimeStamp timing(kInstallFromUri.name);
    const core::RequestScope scope;
    const MethodArguments arguments(in);
    arguments.requirePresent({"URI", "Target", "InstallOptions", "InstallOptionsValues"});
    arguments.requireNotNull({"URI", "Target", "InstallOptions"});
    const core::CimPath target = arguments.path("Target");
    Order order{{},
                arguments.text("URI"),
                arguments.codes("InstallOptions"),
                arguments.texts("InstallOptionsValues")};
    if (!areOptionsAccepted(order.options)) return MethodReturn::InvalidParameter;
    return carryOut(kInstallFromUri, nullptr, target, std::move(order),
                    [&job](Quenx_ConcreteJob* created) { job = created; });
}

unsigned int Quenx_SoftwareInstallationService::InstallFromSoftwareIdentity(CimPropertyList& in,
                                                                            CimPropertyList&,
                                                                            core::CimInstance*& job) {
    const MethodTraits& method = kInstallFromSoftwareIdentity;
    const utils::TimeStamp timing(method.name);
    const core::RequestScope scope;
    const MethodArguments arguments(in);
    arguments.requirePresent({"InstallOptions", "InstallOptionsValues", "Source", "Target", "Collection"});
    QUENX_DEBUG("All arguments are defined");
    if (const auto refused = checkTargetAndCollection(method, arguments)) return *refused;
    arguments.requireNotNull({"InstallOptions", "Source", "Target"});
    const core::CimPath source = arguments.path("Source");
    const core::CimPath target = arguments.path("Target");
    Order order{{}, {}, arguments.codes("InstallOptions"), arguments.texts("InstallOptionsValues")};
    QUENX_DEBUG("Starting arguments verification success");
    if (!areOptionsAccepted(order.options) || IsValueDefined(InstallOption::TargetTypes, order.options)) {
        QUENX_DEBUG("One of value of InstallOptions value is not supported");
        return MethodReturn::InvalidParameter;
    }
    return carryOut(method, &source, target, std::move(order),
                    [&job](Quenx_ConcreteJob* created) { job = created; });
}

unsigned int Quenx_SoftwareInstallationService::CheckSoftwareIdentity(CimPropertyList& in,
                                                                      CimPropertyList& out,
                                                                      core::CimInstance*&) {
    const MethodTraits& method = kCheckSoftwareIdentity;
    constexpr const char* kCharacteristics = "InstallCharacteristics";
    constexpr std::uint16_t kCharacteristic = 7;
    const utils::TimeStamp timing(method.name);
    const core::RequestScope scope;
    const MethodArguments arguments(in);
    const MethodArguments results(out);
    arguments.requirePresent({"Source", "Target", "Collection"});
    results.requirePresent({kCharacteristics});
    QUENX_DEBUG("All arguments are defined");
    if (const auto refused = checkTargetAndCollection(method, arguments)) return *refused;
    arguments.requireNotNull({"Source", "Target"});
    const core::CimPath source = arguments.path("Source");
    const core::CimPath target = arguments.path("Target");
    const std::vector<std::uint16_t> characteristics = results.codes(kCharacteristics);
    QUENX_DEBUG("Starting arguments verification success");
    if (!characteristics.empty()) {
        QUENX_DEBUG(
            "InstallCharacterisitcs argument is an output method's argument. Any input value is not "
            "supported.");
        return MethodReturn::InvalidParameter;
    }
    return carryOut(method, &source, target, {},
                    [&](Quenx_ConcreteJob*) { results.setCodes(kCharacteristics, {kCharacteristic}); });
}

unsigned int Quenx_SoftwareInstallationService::checkImage(const std::string& uri,
                                                           const core::CimPath& target,
                                                           const std::vector<std::uint16_t>& options,
                                                           const std::vector<std::string>& values) {
    const MethodTraits& method = kCheckImage;
    const utils::TimeStamp timing(method.name);
    const core::RequestScope scope;
    if (!areOptionsAccepted(options)) return MethodReturn::InvalidParameter;
    Order order{{}, uri, options, values};
    if (const auto refused = resolveSafely(method, nullptr, target, order)) return *refused;
    return returnValueOf(method, examine(order), target.toString());
}

void Quenx_SoftwareInstallationService::refresh() {
    // Asked before the lock, since the system may take its time.
    const std::string hostname = os::getHostname();
    const core::RecursiveLocker lock(getMutex());
    Caption = "Ethernet Firmware Update";
    Description = "Firmware Update Service for Tarvel(R) Ethernet Adapters";
    for (core::CimProperty* unknown : std::initializer_list<core::CimProperty*>{&ElementName,
                                                                                &InstanceID,
                                                                                &Generation,
                                                                                &InstallDate,
                                                                                &StatusDescriptions,
                                                                                &Status,
                                                                                &HealthState,
                                                                                &PrimaryStatus,
                                                                                &DetailedStatus,
                                                                                &OperatingStatus,
                                                                                &CommunicationStatus,
                                                                                &EnabledState,
                                                                                &OtherEnabledState,
                                                                                &RequestedState,
                                                                                &EnabledDefault,
                                                                                &TimeOfLastStateChange,
                                                                                &AvailableRequestedStates,
                                                                                &TransitioningToState,
                                                                                &StartMode,
                                                                                &Started}) {
        unknown->setNull();
    }
    OperationalStatus.clear();
    OperationalStatus.push_back(kOperationalStatusOk);
    SystemCreationClassName = getCreationClassName();
    SystemName = hostname;
    CreationClassName = getClassName();
    Name = fmt("Quenx:%s", getUniqId().c_str());
    PrimaryOwnerName = "Tarvel Corporation";
    PrimaryOwnerContact = "https://www.tarvel.example";
}

Quenx_SoftwareInstallationServiceClass::Quenx_SoftwareInstallationServiceClass()
    : SingletonClass("SoftwareInstallationService::getInstances", __FILE__, __LINE__) {}
