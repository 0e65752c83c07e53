// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace cli {

/// The address of a CIM-XML server, whole: scheme, host, port and path.
class ServerUrl {
  public:
    /// Reads "https://host", with a port and a path that may be left out. Throws Failure that says how to
    /// write it: a user who mistypes it shall not send a password in clear, or to another host.
    explicit ServerUrl(const std::string& text);

    const std::string& text() const { return text_; }
    bool isEncrypted() const { return isEncrypted_; }
    /// True when the server is on this machine.
    bool isLoopback() const { return isLoopback_; }

  private:
    std::string text_;
    bool isEncrypted_ = false;
    bool isLoopback_ = false;
};

}  // namespace cli
