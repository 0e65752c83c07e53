// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/ProviderSession.h"

#include "Framework/Requests/CimRequests.h"

namespace core {

ProviderSession::ProviderSession(const std::string& configurationFile) {
    // Constructed first, since whoever asks for the current configuration from here on gets this one.
    if (!configurationFile.empty()) m_configuration.emplace(configurationFile);
    m_operations = std::make_shared<CimRequests>(utils::SMASHv2Config::getInstance()->getNamespace());
}

ProviderSession::~ProviderSession() = default;

}  // namespace core
