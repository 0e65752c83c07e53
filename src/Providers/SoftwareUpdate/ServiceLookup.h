#pragma once

#include "Framework/Classes/InstanceList.h"

/// Enumerates the installation services, whoever provides them.
utils::SafeList<core::CimInstance*>::Iterator allServices();

/// The one among them, which the range holds. Throws the assertion "(int)services.size() == 1" when there is
/// not exactly one.
const core::CimInstance* onlyService(core::InstanceRange& services);
