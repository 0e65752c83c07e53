// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_ReferencedProfile.h"

/// The Ethernet port profile refers to the Software Update profile.
class Quenx_SoftwareUpdateReferencedProfile : public CIM_ReferencedProfile {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_ReferencedProfile",
                                                  &CIM_ReferencedProfile::classInfo, true};

    std::string getClassName() const override { return classInfo.name; }
};

/// Rebuilt on every enumeration; empty where one of the two profiles is not registered.
class Quenx_SoftwareUpdateReferencedProfileClass : public ListedClass<Quenx_SoftwareUpdateReferencedProfile> {
  public:
    core::InstanceList::Iterator getInstances() override;
};
