// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/IndicationSettings.h"

#include <stdexcept>

namespace host {

namespace {

indications::DestinationRule ruleOf(const std::vector<std::string>& destinations) {
    using Kind = indications::DestinationRule::Kind;
    if (destinations.empty()) return {};
    if (destinations.size() == 1 && destinations.front() == "subscriber") return {};
    if (destinations.size() == 1 && destinations.front() == "any") return {Kind::Any, {}};
    indications::DestinationRule rule{Kind::Listed, {}};
    for (const std::string& text : destinations) {
        const auto network = indications::networkIn(text);
        if (!network) {
            throw std::runtime_error("indications.destinations names \"" + text +
                                     "\". It must be \"subscriber\", \"any\", or a list of networks such as "
                                     "[\"10.0.0.0/8\", \"2001:db8::/32\"].");
        }
        rule.networks.push_back(*network);
    }
    return rule;
}

}  // namespace

indications::SubscriptionSettings subscriptionSettings(const Settings& settings) {
    const IndicationSettings& said = settings.indications;
    indications::SubscriptionSettings result;
    result.destinations = ruleOf(said.destinations);
    result.file = said.file;
    result.most = said.most;
    result.delivery.certificates = said.certificates;
    result.delivery.verifies = said.verify;
    result.delivery.retries = static_cast<int>(said.retries);
    result.delivery.retryPause = said.retryTime;
    result.delivery.perSecond = said.perSecond;
    return result;
}

}  // namespace host
