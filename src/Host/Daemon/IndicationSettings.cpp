// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/IndicationSettings.h"

#include <gnutls/x509.h>

#include <span>
#include <stdexcept>

#include "Utils/Os/Linux/linux.h"

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

std::optional<std::string> contentOf(const std::string& file, const std::string& advice) try {
    return os::readTextFile(file);
} catch (const os::UnusableFile& error) {
    throw std::runtime_error(file + " " + error.what() + "." + advice);
}

/// libcurl would tell of it with each indication, and nobody would hear any.
void requireCertificates(const std::string& file) {
    if (file.empty()) return;
    const std::string advice =
        " Check indications.certificates, or set it to \"\" for the system's authorities.";
    auto text = contentOf(file, advice);
    if (!text)
        throw std::runtime_error("indications.certificates is " + file + ", which does not exist." + advice);
    const gnutls_datum_t bytes{reinterpret_cast<unsigned char*>(text->data()),
                               static_cast<unsigned int>(text->size())};
    gnutls_x509_crt_t* list = nullptr;
    unsigned int count{};
    const int status = ::gnutls_x509_crt_list_import2(&list, &count, &bytes, GNUTLS_X509_FMT_PEM, 0);
    if (status < 0)
        throw std::runtime_error("Cannot use " + file + ": " + ::gnutls_strerror(status) + advice);
    for (gnutls_x509_crt_t each : std::span(list, count))
        ::gnutls_x509_crt_deinit(each);
    ::gnutls_free(list);
}

}  // namespace

indications::SubscriptionSettings subscriptionSettings(const Settings& settings) {
    const IndicationSettings& said = settings.indications;
    indications::SubscriptionSettings result;
    result.destinations = ruleOf(said.destinations);
    result.file = said.file;
    result.most = said.most;
    requireCertificates(said.certificates);
    result.delivery.certificates = said.certificates;
    result.delivery.verifies = said.verify;
    result.delivery.retries = static_cast<int>(said.retries);
    result.delivery.retryPause = said.retryTime;
    result.delivery.abandonTime = said.abandonTime;
    result.delivery.perSecond = said.perSecond;
    return result;
}

}  // namespace host
