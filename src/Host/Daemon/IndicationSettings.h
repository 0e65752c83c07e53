// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Host/Settings.h"
#include "Indications/Subscriptions/Subscriptions.h"

namespace host {

/// What the settings say of subscriptions. Throws std::runtime_error where destinations name no networks, or
/// the file of authorities holds none.
indications::SubscriptionSettings subscriptionSettings(const Settings& settings);

}  // namespace host
