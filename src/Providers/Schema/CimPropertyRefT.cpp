// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CimPropertyRefT.h"

#include "Framework/Model/CimClassInfo.h"
#include "Providers/Schema/CIM_Capabilities.h"
#include "Providers/Schema/CIM_Job.h"
#include "Providers/Schema/CIM_ManagedElement.h"
#include "Providers/Schema/CIM_RegisteredProfile.h"
#include "Providers/Schema/CIM_RegisteredSpecification.h"
#include "Providers/Schema/CIM_Service.h"
#include "Providers/Schema/CIM_SoftwareIdentity.h"

namespace core {

template <class T>
CimPropertyRefT<T>::CimPropertyRefT(const char* name, CimInstance* owner) : CimPropertyRef(name, owner) {
    setReferenceClass(T::classInfo.name);
}

template <class T>
CimPropertyRefT<T>::~CimPropertyRefT() = default;

template <class T>
CimPropertyRefT<T>& CimPropertyRefT<T>::operator=(const T* target) {
    assign(target);
    return *this;
}

template class CimPropertyRefT<CIM_Capabilities>;
template class CimPropertyRefT<CIM_Job>;
template class CimPropertyRefT<CIM_ManagedElement>;
template class CimPropertyRefT<CIM_RegisteredProfile>;
template class CimPropertyRefT<CIM_RegisteredSpecification>;
template class CimPropertyRefT<CIM_Service>;
template class CimPropertyRefT<CIM_SoftwareIdentity>;

}  // namespace core
