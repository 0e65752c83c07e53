// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_ReferencedProfile.h"

/// The Ethernet port profile refers to the Software Update profile.
class Quenx_SoftwareUpdateReferencedProfile : public CIM_ReferencedProfile {
  public:
    static const core::CimClassInfo classInfo;

    std::string getClassName() const override;
    ~Quenx_SoftwareUpdateReferencedProfile() override;
};

/// Rebuilt on every enumeration; empty where one of the two profiles is not registered.
class Quenx_SoftwareUpdateReferencedProfileClass : public ListedClass<Quenx_SoftwareUpdateReferencedProfile> {
  public:
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;
};
