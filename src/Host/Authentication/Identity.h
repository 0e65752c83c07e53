#pragma once

#include <string>

namespace host {

/// A user whose password was right.
struct Identity {
    std::string user;
    bool isAdministrator = false;
    bool mayRead = false;  ///< false: known, but not admitted
};

/// A name and a password, as the client sent them.
struct Credentials {
    std::string user;
    std::string password;
};

}  // namespace host
