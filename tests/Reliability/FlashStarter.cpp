// SPDX-License-Identifier: Apache-2.0
// Loaded by a host of C, to start and call what the providers serve without the host's knowing of C++.
#include <string>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Requests/CimRequests.h"
#include "Utils/Os/Linux/LinuxOSLocker.h"
#include "Utils/Os/Linux/PolicyFile.h"

namespace {

// Never destroyed: a flash that still runs when the process ends needs it.
const os::OSLockerLinux& locker = *new os::OSLockerLinux;
core::CimRequests requests{"root/cimv2"};
// The machine's own must not matter.
[[maybe_unused]] const char* const policy = utils::systemPolicyFile = "/nonexistent";

/// Starts an update of the first port; 5 stands for "update". Throws when there is no job.
std::string install(const std::string& uri) {
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
        .outputs.at(0)
        .value.get<core::CimPath>()
        ->toString();
}

}  // namespace

extern "C" {

QUENX_EXPORT int agentCount() {
    return static_cast<int>(core::GetCimBroker()->useAgents().size());
}

/// The number of the job that has been made for the image at this URI; 0 for none.
QUENX_EXPORT int startFlash(const char* uri) {
    try {
        const std::string job = install(uri);
        return std::stoi(job.substr(job.find('#') + 1));
    } catch (const std::exception&) {
        return 0;
    }
}
}
