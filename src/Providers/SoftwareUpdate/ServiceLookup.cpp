#include "Providers/SoftwareUpdate/ServiceLookup.h"

#include "Framework/CimBroker.h"
#include "Framework/InstanceRange.h"
#include "Utils/Exception.h"

std::shared_ptr<const core::CimInstance> theService() {
    auto services = core::GetCimBroker()->getInstances("Quenx_SoftwareInstallationService", "");
    QUENX_ASSERT_TEXT(services.size() == 1, __FILE__, __LINE__, "(int)services.size() == 1");
    return services.first()->weak_from_this().lock();
}
