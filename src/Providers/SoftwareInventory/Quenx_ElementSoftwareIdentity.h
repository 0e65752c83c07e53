// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_ElementSoftwareIdentity.h"

/// What is installed (Antecedent) on a port (Dependent).
class Quenx_ElementSoftwareIdentity : public CIM_ElementSoftwareIdentity {
  public:
    static const core::CimClassInfo classInfo;

    Quenx_ElementSoftwareIdentity();
    std::string getClassName() const override;
    ~Quenx_ElementSoftwareIdentity() override;
};

/// Serves an association for each installed component, rebuilt on every call.
class Quenx_ElementSoftwareIdentityClass : public ListedClass<Quenx_ElementSoftwareIdentity> {
  public:
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;
};
