#pragma once

#include <string>
#include <vector>

#include "Host/Authentication/PasswordChecker.h"

namespace host {

/// Asks PAM, service "quenx-cimd". Administrators are root and the members of the group "quenx-admin".
class PamChecker : public PasswordChecker {
  public:
    /// Who else may read: user names, "@group", or "*" for everybody.
    explicit PamChecker(std::vector<std::string> readers) : m_readers(std::move(readers)) {}

    std::optional<Identity> check(const Credentials& credentials, const std::string& address) override;

  private:
    const std::vector<std::string> m_readers;
};

/// What a user of the system may do. An unknown one may do nothing.
Identity identityOf(const std::string& user, const std::vector<std::string>& readers);

}  // namespace host
