// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "Framework/Requests/ProviderLibraries.h"

namespace host {

/// Loads the provider libraries of a directory. One that does not load is reported, and the others serve.
/// Throws std::runtime_error when the directory cannot be read, or none of its libraries is a provider.
void loadProviders(core::ProviderLibraries& providers, const std::string& directory);

}  // namespace host
