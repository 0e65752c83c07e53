// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_AffectedJobElement.h"

/// A job updates a port, and so the card that carries it.
class Quenx_AffectedJobElement : public CIM_AffectedJobElement {
  public:
    static const core::CimClassInfo classInfo;

    std::string getClassName() const override;
    ~Quenx_AffectedJobElement() override;
};

/// Rebuilt on every enumeration.
class Quenx_AffectedJobElementClass : public ListedClass<Quenx_AffectedJobElement> {
  public:
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;
};
