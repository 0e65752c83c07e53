#include "Providers/Schema/CIM_ServiceAffectsElement.h"

constinit const core::CimClassInfo CIM_ServiceAffectsElement::classInfo{
    "CIM_ServiceAffectsElement", nullptr, true, {}, &core::makeSample<CIM_ServiceAffectsElement>};

CIM_ServiceAffectsElement::CIM_ServiceAffectsElement() {
    AffectedElement.setKey();
    AffectingElement.setKey();
    declareClass(classInfo);
}

CIM_ServiceAffectsElement::~CIM_ServiceAffectsElement() = default;
