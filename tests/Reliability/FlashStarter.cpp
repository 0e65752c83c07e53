// SPDX-License-Identifier: Apache-2.0
// Loaded by a host of C, to start and call what the providers serve without the host's knowing of C++.
#include <string>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Requests/CimRequests.h"
#include "Utils/Os/Linux/LinuxOSLocker.h"

namespace {

// For as long as this library is loaded.
const os::OSLockerLinux locker;
core::CimRequests requests{"root/cimv2"};

/// Starts an update of the first port; 5 stands for "update".
std::uint32_t install(const std::string& uri) {
    using core::CimType;
    using core::CimValue;
    const core::CimPath service = requests.enumerateInstanceNames("Quenx_SoftwareInstallationService").at(0);
    const core::CimPath port = requests.enumerateInstanceNames("Quenx_EthernetPort").at(0);
    return requests
        .invokeMethod(service, "InstallFromURI",
                      {{"URI", CimValue::of(CimType::String, uri)},
                       {"Target", CimValue::of(CimType::Reference, port)},
                       {"InstallOptions", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{5}})},
                       {"InstallOptionsValues", CimValue::arrayOf(CimType::String, {})}})
        .returnValue;
}

}  // namespace

extern "C" {

QUENX_EXPORT int agentCount() {
    return static_cast<int>(core::GetCimBroker()->useAgents().size());
}

/// 1 when a job has been made for the image at this URI.
QUENX_EXPORT int startFlash(const char* uri) {
    try {
        return install(uri) == 4096U ? 1 : 0;
    } catch (const std::exception&) {
        return 0;
    }
}
}
