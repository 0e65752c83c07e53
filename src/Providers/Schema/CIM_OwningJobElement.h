// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimInstance.h"
#include "Providers/Schema/CimPropertyRefT.h"
#include "Utils/Export.h"

/// DMTF CIM_OwningJobElement: the element that created a job.
class QUENX_EXPORT CIM_OwningJobElement : public core::CimInstance {
  public:
    static const core::CimClassInfo classInfo;

    CIM_OwningJobElement();
    ~CIM_OwningJobElement() override;

    core::CimPropertyRefT<CIM_ManagedElement> OwningElement{"OwningElement", this};
    core::CimPropertyRefT<CIM_Job> OwnedElement{"OwnedElement", this};
};
