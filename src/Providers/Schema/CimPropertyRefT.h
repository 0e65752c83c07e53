// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Utils/Export.h"

class QUENX_EXPORT CIM_Capabilities;
class QUENX_EXPORT CIM_Job;
class QUENX_EXPORT CIM_ManagedElement;
class QUENX_EXPORT CIM_RegisteredProfile;
class QUENX_EXPORT CIM_RegisteredSpecification;
class QUENX_EXPORT CIM_Service;
class QUENX_EXPORT CIM_SoftwareIdentity;

namespace core {

/// A reference to an instance of class T: CimPropertyRef, and a typed assignment.
///
/// Instantiated for the classes below only, in the library of the bindings, so that its type information has
/// one home.
template <class T>
class QUENX_EXPORT CimPropertyRefT : public CimPropertyRef {
  public:
    CimPropertyRefT(const char* name, CimInstance* owner);
    ~CimPropertyRefT() override;

    /// Refers to the instance, as CimPropertyRef::assign(); a null pointer makes the property null.
    CimPropertyRefT& operator=(const T* target);
};

extern template class CimPropertyRefT<CIM_Capabilities>;
extern template class CimPropertyRefT<CIM_Job>;
extern template class CimPropertyRefT<CIM_ManagedElement>;
extern template class CimPropertyRefT<CIM_RegisteredProfile>;
extern template class CimPropertyRefT<CIM_RegisteredSpecification>;
extern template class CimPropertyRefT<CIM_Service>;
extern template class CimPropertyRefT<CIM_SoftwareIdentity>;

}  // namespace core
