// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <nlohmann/json_fwd.hpp>
#include <stdexcept>
#include <string>

#include "Host/Server/HttpRequest.h"

namespace host {

/// Why one of the daemon's own paths does not do what it was asked for. what() is for a person: what
/// happened, and what would be right.
class ControlRefusal : public std::runtime_error {
  public:
    ControlRefusal(unsigned int status, const std::string& text)
        : std::runtime_error(text), m_status(status) {}

    /// Of the HTTP answer.
    unsigned int status() const { return m_status; }

  private:
    unsigned int m_status;
};

/// An answer of these paths, which a client knows by its header.
HttpAnswer controlAnswer(unsigned int status, const nlohmann::json& body);
/// The answer to an exception: what it says, and the status that fits it.
HttpAnswer controlAnswer(const std::exception& error);

}  // namespace host
