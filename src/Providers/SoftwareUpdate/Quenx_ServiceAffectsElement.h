// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_ServiceAffectsElement.h"

/// The service can update a port, its card, or a firmware image can be installed by it.
class Quenx_ServiceAffectsElement : public CIM_ServiceAffectsElement {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_ServiceAffectsElement",
                                                  &CIM_ServiceAffectsElement::classInfo, true};

    std::string getClassName() const override { return classInfo.name; }
};

/// Rebuilt on every enumeration. Throws the assertion unless there is one service. A card with several ports
/// that can be updated has one association for each.
class Quenx_ServiceAffectsElementClass : public ListedClass<Quenx_ServiceAffectsElement> {
  public:
    core::InstanceList::Iterator getInstances() override;
};
