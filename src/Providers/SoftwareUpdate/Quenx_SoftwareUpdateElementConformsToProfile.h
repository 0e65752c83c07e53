// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_ElementConformsToProfile.h"

/// The service conforms to the Software Update profile.
class Quenx_SoftwareUpdateElementConformsToProfile : public CIM_ElementConformsToProfile {
  public:
    static const core::CimClassInfo classInfo;

    std::string getClassName() const override;
    ~Quenx_SoftwareUpdateElementConformsToProfile() override;
};

/// Rebuilt on every enumeration.
class Quenx_SoftwareUpdateElementConformsToProfileClass
    : public ListedClass<Quenx_SoftwareUpdateElementConformsToProfile> {
  public:
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;
};
