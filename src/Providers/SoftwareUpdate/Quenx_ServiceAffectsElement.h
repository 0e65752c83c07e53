// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_ServiceAffectsElement.h"

/// The service can update a port, its card, or a firmware image can be installed by it.
class Quenx_ServiceAffectsElement : public CIM_ServiceAffectsElement {
  public:
    static const core::CimClassInfo classInfo;

    std::string getClassName() const override;
    ~Quenx_ServiceAffectsElement() override;
};

/// Rebuilt on every enumeration. Throws the assertion unless there is one service. A card with several ports
/// that can be updated has one association for each.
class Quenx_ServiceAffectsElementClass : public ListedClass<Quenx_ServiceAffectsElement> {
  public:
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;
};
