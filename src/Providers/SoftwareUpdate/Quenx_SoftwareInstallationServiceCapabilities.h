// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <string>

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_SoftwareInstallationServiceCapabilities.h"

/// What the software installation service can do (DSP1025).
class Quenx_SoftwareInstallationServiceCapabilities : public CIM_SoftwareInstallationServiceCapabilities {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_SoftwareInstallationServiceCapabilities",
                                                  &CIM_SoftwareInstallationServiceCapabilities::classInfo};

    /// The names of the target types; the index is the utils::FirmwareType. Entry 0 is never published.
    static constexpr std::array<const char*, 6> TargetTypesDescription = {"",        "IMG_CLP",  "IMG_iSCSI",
                                                                          "IMG_PXE", "IMG_UEFI", "IMG_FCoE"};

    std::string getClassName() const override { return classInfo.name; }

    virtual std::string getUniqId();
    virtual void refresh();
};

class Quenx_SoftwareInstallationServiceCapabilitiesClass
    : public SingletonClass<Quenx_SoftwareInstallationServiceCapabilities> {
  public:
    Quenx_SoftwareInstallationServiceCapabilitiesClass();
};
