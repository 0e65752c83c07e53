// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/UpdateInterfaces.h"

namespace update {

// Here, in a library below all providers, so that the type's information has one home.
ImageCheck::~ImageCheck() = default;

}  // namespace update
