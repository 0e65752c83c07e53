// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_ElementSoftwareIdentity.h"

/// What is installed (Antecedent) on a port (Dependent).
class Quenx_ElementSoftwareIdentity : public CIM_ElementSoftwareIdentity {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_ElementSoftwareIdentity",
                                                  &CIM_ElementSoftwareIdentity::classInfo, true};

    std::string getClassName() const override { return classInfo.name; }
};

/// Serves an association for each installed component, rebuilt on every call.
class Quenx_ElementSoftwareIdentityClass : public ListedClass<Quenx_ElementSoftwareIdentity> {
  public:
    core::InstanceList::Iterator getInstances() override;
};
