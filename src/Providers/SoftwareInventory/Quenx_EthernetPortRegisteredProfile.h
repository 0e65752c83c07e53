// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_RegisteredProfile.h"

/// Says that the ports are modelled as DMTF DSP1014 has it. Served as "Quenx_RegisteredProfile", a class that
/// other providers serve too.
class Quenx_EthernetPortRegisteredProfile : public CIM_RegisteredProfile {
  public:
    static const core::CimClassInfo classInfo;

    Quenx_EthernetPortRegisteredProfile();
    std::string getClassName() const override;
    ~Quenx_EthernetPortRegisteredProfile() override;

    virtual std::string getUniqId() const;
    virtual void refresh();
};

class Quenx_EthernetPortRegisteredProfileClass : public SingletonClass<Quenx_EthernetPortRegisteredProfile> {
  public:
    Quenx_EthernetPortRegisteredProfileClass();
};
