// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <map>
#include <nlohmann/json_fwd.hpp>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "Cli/Connection/HttpClient.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Utils/Time.h"

namespace cli {

/// The hold of a server on an adapter.
struct HeldAdapter {
    std::string adapter;      ///< empty while none is held
    std::string holder = {};  ///< "check", "verification" or "job"
    std::string user = {};    ///< who had it claimed; empty where the server does not tell
    std::string job = {};     ///< InstanceID; empty where it is for no job
    std::optional<utils::Time> since = {};
    bool isNeeded = false;  ///< false for what a check has left behind

    /// "a check of admin"
    std::string text() const;
};
void to_json(nlohmann::ordered_json& json, const HeldAdapter& held);

/// What quenx-cimd serves beside the model, see Control/Interface.h. Of any other server every operation
/// gives nothing. Failures are CommandError, for one who may not core::CimError. Used from one thread.
class ServerControl {
  public:
    ServerControl(const ServerSettings& settings, const std::string& user, const std::string& password,
                  const std::function<bool()>& isInterrupted)
        : m_client(settings, user, password, isInterrupted) {}

    std::optional<HeldAdapter> held();
    /// Whether something was freed.
    std::optional<bool> release(const std::string& adapter);
    /// What InstallFromURI would return for these arguments, 0 for an image that could be installed. Claims
    /// nothing, and notes the key by which the image is trusted.
    std::optional<std::uint32_t> checkImage(const std::string& uri, const std::string& target,
                                            const std::vector<std::uint16_t>& options,
                                            const std::vector<std::string>& values);
    /// What the policy of the server says of each of these images.
    std::optional<std::vector<update::ImageTrust>> trustOf(const std::vector<std::string>& uris);
    /// Sends an image, and beside it the files that belong to it. Returns its URI there.
    std::optional<std::string> upload(const std::string& file);

  private:
    std::optional<nlohmann::json> call(const ControlRequest& request);
    std::optional<nlohmann::json> post(const char* path, const nlohmann::json& body);
    std::optional<std::string> sendFile(const std::string& file, const std::string& image);

    HttpClient m_client;
    /// Where a file is on the server, by the place that was asked for and the sum of its content.
    std::map<std::pair<std::string, std::string>, std::string> m_sent;
};

}  // namespace cli
