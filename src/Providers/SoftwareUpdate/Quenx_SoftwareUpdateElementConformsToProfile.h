// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_ElementConformsToProfile.h"

/// The service conforms to the Software Update profile.
class Quenx_SoftwareUpdateElementConformsToProfile : public CIM_ElementConformsToProfile {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_ElementConformsToProfile",
                                                  &CIM_ElementConformsToProfile::classInfo, true};

    std::string getClassName() const override { return classInfo.name; }
};

/// Rebuilt on every enumeration.
class Quenx_SoftwareUpdateElementConformsToProfileClass
    : public ListedClass<Quenx_SoftwareUpdateElementConformsToProfile> {
  public:
    core::InstanceList::Iterator getInstances() override;
};
