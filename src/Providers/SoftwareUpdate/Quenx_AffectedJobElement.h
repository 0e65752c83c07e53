// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_AffectedJobElement.h"

/// A job updates a port, and so the card that carries it.
class Quenx_AffectedJobElement : public CIM_AffectedJobElement {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_AffectedJobElement",
                                                  &CIM_AffectedJobElement::classInfo, true};

    std::string getClassName() const override { return classInfo.name; }
};

/// Rebuilt on every enumeration.
class Quenx_AffectedJobElementClass : public ListedClass<Quenx_AffectedJobElement> {
  public:
    core::InstanceList::Iterator getInstances() override;
};
