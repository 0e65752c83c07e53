// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Cmpi/Front.h"

/// What object managers look up in the library, and nothing else is exported. Each may be called any number
/// of times, from any thread.
extern "C" {
QUENX_EXPORT cmpi::InstanceMI* Quenx_Create_InstanceMI(const cmpi::Broker*, const cmpi::Context*,
                                                       cmpi::Status*);
QUENX_EXPORT cmpi::AssociationMI* Quenx_Create_AssociationMI(const cmpi::Broker*, const cmpi::Context*,
                                                             cmpi::Status*);
QUENX_EXPORT cmpi::MethodMI* Quenx_Create_MethodMI(const cmpi::Broker*, const cmpi::Context*, cmpi::Status*);
QUENX_EXPORT cmpi::IndicationMI* Quenx_Create_IndicationMI(const cmpi::Broker*, const cmpi::Context*,
                                                           cmpi::Status*);
}

namespace cmpi {

/// As the entry points have it in front of _Create_.
inline constexpr const char* kProviderName = "Quenx";

/// For the entry points: nothing is loaded before the first request, whose answer can say what is missing.
template <class MI>
MI* create(Interface interface, MI& theInterface, const Broker* broker, Status* status) {
    const ReturnCode code = broker == nullptr ? ReturnCode::Failed : ReturnCode::Ok;
    if (status != nullptr) *status = {code, nullptr};
    if (broker == nullptr) return nullptr;
    Front::theOne().create(interface, broker);
    return &theInterface;
}

/// For the tables' cleanup. Whether the process is about to end makes no difference: the object manager does
/// not wait for the answer then, and the end of the process waits for updates.
inline Status cleanUp(Interface interface) {
    return {Front::theOne().cleanup(interface), nullptr};
}

}  // namespace cmpi
