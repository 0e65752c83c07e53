// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_RegisteredProfile.h"

/// Says that this provider implements the DMTF Software Update profile (DSP1025, registered as in DSP1033).
class Quenx_SoftwareUpdateRegisteredProfile : public CIM_RegisteredProfile {
  public:
    /// Named "Quenx_RegisteredProfile": every provider serves its profile under this class.
    static constexpr core::CimClassInfo classInfo{"Quenx_RegisteredProfile",
                                                  &CIM_RegisteredProfile::classInfo};

    std::string getClassName() const override { return classInfo.name; }

    virtual void refresh();
};

class Quenx_SoftwareUpdateRegisteredProfileClass
    : public SingletonClass<Quenx_SoftwareUpdateRegisteredProfile> {
  public:
    Quenx_SoftwareUpdateRegisteredProfileClass();
};
