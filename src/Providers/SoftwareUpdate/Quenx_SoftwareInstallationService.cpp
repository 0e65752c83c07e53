#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationService.h"

#include <algorithm>
#include <optional>

#include "Framework/Classes/RequestScope.h"
#include "Providers/SoftwareUpdate/ImageExamination.h"
#include "Providers/SoftwareUpdate/InstallOptions.h"
#include "Providers/SoftwareUpdate/InstanceLookup.h"
#include "Providers/SoftwareUpdate/MethodArguments.h"
#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/UpdateExceptions.h"
#include "Providers/SoftwareUpdate/VerifyJobResult.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"

namespace {

using core::CimPropertyList;

/// What the registry is asked to do.
struct Order {
    std::string adapterName;
    std::string uri;
    std::vector<unsigned short> options;
    std::vector<std::string> values;
};

/// Options that nothing here can carry out. The identity method supplies the target types itself, so it
/// refuses them from the client, while InstallFromURI takes them (intended).
constexpr unsigned short kRefusedOptions[] = {2, 4, 6, 7, 8, 9, 10, 11, 12};

bool areOptionsAccepted(const std::vector<unsigned short>& options) {
    const auto isGiven = [&options](unsigned short option) {
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

bool isSuccess(unsigned int returnValue) {
    return returnValue == MethodReturn::JobStarted || returnValue == MethodReturn::Completed;
}

/// Has the registry carry out the order; onSuccess receives the job. Whatever is thrown on the way is
/// answered by "not enough memory".
template <class OnSuccess>
unsigned int carryOut(const MethodTraits& method, Order& order, const std::string& target,
                      OnSuccess&& onSuccess) {
    Quenx_ConcreteJobClass& registry = jobRegistry();
    try {
        Quenx_ConcreteJob* job = nullptr;
        const int result = registry.verifyOrCreateNewJob(order.adapterName, order.uri, order.options,
                                                         order.values, job, method.createsJob);
        const unsigned int returnValue = returnValueOf(method, result, target);
        if (isSuccess(returnValue)) onSuccess(job);
        return returnValue;
    } catch (...) {
        QUENX_DEBUG("Allocation error occured for '%s'", target.c_str());  // the spelling is intended
        return MethodReturn::InsufficientMemory;
    }
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
std::optional<unsigned int> checkTargetAndCollection(const MethodTraits& method, const CimPropertyList& in) {
    const bool noCollection = MethodArguments::isNull(in, "Collection");
    const bool noSource = MethodArguments::isNull(in, "Source");
    const bool noTarget = MethodArguments::isNull(in, "Target");
    QUENX_DEBUG("Target:%d, Source:%d, Collection:%d", noTarget, noSource, noCollection);
    if (!noTarget && !noCollection) throw utils::EUnspecifiedError(method.bothGiven);
    if (noTarget && noCollection) throw utils::EUnspecifiedError("Neither Target nor Collection are defined");
    if (noTarget) return MethodReturn::CollectionNotSupported;
    return std::nullopt;
}

/// Completes the order from the Source and the Target. Returns what the method returns at once, if anything.
std::optional<unsigned int> resolve(const MethodTraits& method, const core::CimPath& source,
                                    const core::CimPath& target, Order& order) {
    ResolvedSource image = resolveSource(method, source);
    if (image.returnValue != 0) return image.returnValue;
    order.uri = std::move(image.uri);
    order.options.insert(order.options.begin(), InstallOption::TargetTypes);
    order.values.insert(order.values.begin(), std::move(image.targetTypes));

    ResolvedTarget adapter = resolveTarget(method, target);
    if (adapter.returnValue != 0) return adapter.returnValue;
    order.adapterName = std::move(adapter.adapterName);
    return std::nullopt;
}

}  // namespace

constinit const core::CimClassInfo Quenx_SoftwareInstallationService::classInfo{
    "Quenx_SoftwareInstallationService", &CIM_SoftwareInstallationService::classInfo, false, {}, nullptr};

Quenx_SoftwareInstallationService::Quenx_SoftwareInstallationService() {
    addMethod("InstallFromSoftwareIdentity", &Quenx_SoftwareInstallationService::InstallFromSoftwareIdentity);
    addMethod("InstallFromURI", &Quenx_SoftwareInstallationService::InstallFromURI);
    addMethod("CheckSoftwareIdentity", &Quenx_SoftwareInstallationService::CheckSoftwareIdentity);
}

Quenx_SoftwareInstallationService::~Quenx_SoftwareInstallationService() = default;

std::string Quenx_SoftwareInstallationService::getClassName() const {
    return classInfo.name;
}

bool Quenx_SoftwareInstallationService::IsValueDefined(unsigned short value,
                                                       const std::vector<unsigned short>& values) {
    return std::find(values.begin(), values.end(), value) != values.end();
}

unsigned int Quenx_SoftwareInstallationService::InstallFromURI(CimPropertyList& in, CimPropertyList&,
                                                               core::CimInstance*& job) {
    const utils::TimeStamp timing(kInstallFromUri.name);
    const core::RequestScope scope;
    MethodArguments::requirePresent(in, {"URI", "Target", "InstallOptions", "InstallOptionsValues"});
    MethodArguments::requireNotNull(in, {"URI", "Target", "InstallOptions"});
    const core::CimPath target = MethodArguments::path(in, "Target");
    Order order{{},
                MethodArguments::text(in, "URI"),
                MethodArguments::codes(in, "InstallOptions"),
                MethodArguments::texts(in, "InstallOptionsValues")};
    if (!areOptionsAccepted(order.options)) return MethodReturn::InvalidParameter;

    ResolvedTarget adapter = resolveTarget(kInstallFromUri, target);
    if (adapter.returnValue != 0) return adapter.returnValue;
    order.adapterName = std::move(adapter.adapterName);
    return carryOut(kInstallFromUri, order, target.toString(),
                    [&job](Quenx_ConcreteJob* created) { job = created; });
}

unsigned int Quenx_SoftwareInstallationService::InstallFromSoftwareIdentity(CimPropertyList& in,
                                                                            CimPropertyList&,
                                                                            core::CimInstance*& job) {
    const MethodTraits& method = kInstallFromSoftwareIdentity;
    const utils::TimeStamp timing(method.name);
    const core::RequestScope scope;
    MethodArguments::requirePresent(
        in, {"InstallOptions", "InstallOptionsValues", "Source", "Target", "Collection"});
    QUENX_DEBUG("All arguments are defined");
    if (const auto refused = checkTargetAndCollection(method, in)) return *refused;
    MethodArguments::requireNotNull(in, {"InstallOptions", "Source", "Target"});
    const core::CimPath source = MethodArguments::path(in, "Source");
    const core::CimPath target = MethodArguments::path(in, "Target");
    Order order{{},
                {},
                MethodArguments::codes(in, "InstallOptions"),
                MethodArguments::texts(in, "InstallOptionsValues")};
    QUENX_DEBUG("Starting arguments verification success");
    if (!areOptionsAccepted(order.options) || IsValueDefined(InstallOption::TargetTypes, order.options)) {
        QUENX_DEBUG("One of value of InstallOptions value is not supported");
        return MethodReturn::InvalidParameter;
    }

    if (const auto refused = resolve(method, source, target, order)) return *refused;
    return carryOut(method, order, target.toString(), [&job](Quenx_ConcreteJob* created) { job = created; });
}

unsigned int Quenx_SoftwareInstallationService::CheckSoftwareIdentity(CimPropertyList& in,
                                                                      CimPropertyList& out,
                                                                      core::CimInstance*&) {
    const MethodTraits& method = kCheckSoftwareIdentity;
    constexpr const char* kCharacteristics = "InstallCharacteristics";
    constexpr unsigned short kCharacteristic = 7;
    const utils::TimeStamp timing(method.name);
    const core::RequestScope scope;
    MethodArguments::requirePresent(in, {"Source", "Target", "Collection"});
    MethodArguments::requirePresent(out, {kCharacteristics});
    QUENX_DEBUG("All arguments are defined");
    if (const auto refused = checkTargetAndCollection(method, in)) return *refused;
    MethodArguments::requireNotNull(in, {"Source", "Target"});
    const core::CimPath source = MethodArguments::path(in, "Source");
    const core::CimPath target = MethodArguments::path(in, "Target");
    std::vector<unsigned short> characteristics = MethodArguments::codes(out, kCharacteristics);
    Order order;
    QUENX_DEBUG("Starting arguments verification success");
    if (!characteristics.empty()) {
        // The spelling is intended.
        QUENX_DEBUG(
            "InstallCharacterisitcs argument is an output method's argument. Any input value is not "
            "supported.");
        return MethodReturn::InvalidParameter;
    }

    if (const auto refused = resolve(method, source, target, order)) return *refused;
    return carryOut(method, order, target.toString(), [&](Quenx_ConcreteJob*) {
        characteristics.push_back(kCharacteristic);
        MethodArguments::setCodes(out, kCharacteristics, std::move(characteristics));
    });
}

unsigned int Quenx_SoftwareInstallationService::checkImage(const std::string& uri,
                                                           const core::CimPath& target,
                                                           const std::vector<unsigned short>& options,
                                                           const std::vector<std::string>& values) {
    const utils::TimeStamp timing(kCheckImage.name);
    const core::RequestScope scope;
    if (!areOptionsAccepted(options)) return MethodReturn::InvalidParameter;
    ResolvedTarget adapter = resolveTarget(kCheckImage, target);
    if (adapter.returnValue != 0) return adapter.returnValue;
    const Order order{std::move(adapter.adapterName), uri, options, values};
    return returnValueOf(kCheckImage, examine(order), target.toString());
}
