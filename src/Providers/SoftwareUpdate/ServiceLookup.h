#pragma once

#include <memory>

#include "Framework/CimInstance.h"

/// The one installation service, held. Throws the assertion "(int)services.size() == 1" when there is not
/// exactly one.
std::shared_ptr<const core::CimInstance> theService();
