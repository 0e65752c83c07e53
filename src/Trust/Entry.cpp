// SPDX-License-Identifier: Apache-2.0
// What a front asks of the library that it has loaded by its name, and never unloads.
#include "Trust/Verifier.h"

extern "C" QUENX_EXPORT core::ImageVerifier* quenx_imageVerifier();

core::ImageVerifier* quenx_imageVerifier() {
    static trust::Verifier verifier;
    return &verifier;
}
