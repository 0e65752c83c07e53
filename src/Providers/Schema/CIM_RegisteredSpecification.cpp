// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_RegisteredSpecification.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A published document that an implementation conforms to."},
    {"RegisteredOrganization", "Who published the document.",
     "1=Other;2=DMTF;3=CompTIA;4=Consortium for Service "
     "Innovation;5=FAST;6=GGF;7=INTAP;8=itSMF;9=NAC;10=Northwest Energy Efficiency Alliance;11=SNIA;12=TM "
     "Forum;13=The Open Group;14=ANSI;15=IEEE;16=IETF;17=INCITS;18=ISO;19=W3C;20=OGF;..=DMTF Reserved"},
    {"AdvertiseTypes", "How the profile is made known.", "1=Other;2=Not Advertised;3=SLP"},
};

}  // namespace

constinit const core::CimClassInfo CIM_RegisteredSpecification::classInfo{
    "CIM_RegisteredSpecification",
    &CIM_ManagedElement::classInfo,
    false,
    {},
    &core::makeSample<CIM_RegisteredSpecification>,
    kTexts};

CIM_RegisteredSpecification::CIM_RegisteredSpecification() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_RegisteredSpecification::~CIM_RegisteredSpecification() = default;
