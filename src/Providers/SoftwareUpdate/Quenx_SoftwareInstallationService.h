// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_SoftwareInstallationService.h"
#include "Providers/Schema/ProviderInterfaces.h"

/// The one software installation service (DSP1025), with its extrinsic methods. The methods return the values
/// of the DMTF value map; only argument errors, a missing job registry and failed assertions leave them as
/// exceptions.
class Quenx_SoftwareInstallationService : public CIM_SoftwareInstallationService, public update::ImageCheck {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_SoftwareInstallationService",
                                                  &CIM_SoftwareInstallationService::classInfo};

    Quenx_SoftwareInstallationService();
    std::string getClassName() const override { return classInfo.name; }

    virtual void refresh();
    /// Verifies the image at a URI and starts a job that installs it. 4096 and the job on success.
    virtual unsigned int InstallFromURI(core::CimPropertyList& in, core::CimPropertyList& out,
                                        core::CimInstance*& job);
    /// The same for an image that the inventory knows.
    virtual unsigned int InstallFromSoftwareIdentity(core::CimPropertyList& in, core::CimPropertyList& out,
                                                     core::CimInstance*& job);
    /// Only verifies; 0 on success. No job is created, but the adapter stays claimed.
    virtual unsigned int CheckSoftwareIdentity(core::CimPropertyList& in, core::CimPropertyList& out,
                                               core::CimInstance*& job);

    unsigned int checkImage(const std::string& uri, const core::CimPath& target,
                            const std::vector<std::uint16_t>& options,
                            const std::vector<std::string>& values) override;
    update::ImageTrust trustOf(const std::string& uri) override;
    std::string claimedAdapter() const override;
    update::Claim claim() const override;
    update::ClaimRelease releaseClaim(const std::string& adapter) override;

    /// "FirmwareUpdate", for every instance.
    static std::string getUniqId() { return "FirmwareUpdate"; }
    static bool IsValueDefined(std::uint16_t value, const std::vector<std::uint16_t>& values);

  private:
    // What clients call: the methods, with a report of how they went.
    unsigned int reportFromUri(core::CimPropertyList& in, core::CimPropertyList& out,
                               core::CimInstance*& job);
    unsigned int reportFromSoftwareIdentity(core::CimPropertyList& in, core::CimPropertyList& out,
                                            core::CimInstance*& job);
};

class Quenx_SoftwareInstallationServiceClass : public SingletonClass<Quenx_SoftwareInstallationService> {
  public:
    Quenx_SoftwareInstallationServiceClass();
};
