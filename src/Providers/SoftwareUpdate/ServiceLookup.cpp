#include "Providers/SoftwareUpdate/ServiceLookup.h"

#include "Framework/Classes/CimBroker.h"
#include "Utils/Exception.h"

utils::SafeList<core::CimInstance*>::Iterator allServices() {
    return core::GetCimBroker()->getInstances("Quenx_SoftwareInstallationService", "");
}

const core::CimInstance* onlyService(core::InstanceRange& services) {
    QUENX_ASSERT_TEXT(services.size() == 1, __FILE__, __LINE__, "(int)services.size() == 1");
    return *services.begin();
}
