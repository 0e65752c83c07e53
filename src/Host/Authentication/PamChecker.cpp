// SPDX-License-Identifier: Apache-2.0
#include <grp.h>
#include <pwd.h>
#include <security/pam_appl.h>

#include <algorithm>
#include <array>
#include <cstdlib>
#include <cstring>

#include "Host/Authentication/PasswordChecker.h"

namespace host {

namespace {

constexpr const char* kService = "quenx-cimd";
constexpr const char* kAdministrators = "quenx-admin";

/// Answers every prompt for a hidden text with the password, and the others with nothing.
int converse(int count, const pam_message** messages, pam_response** responses, void* data) {
    auto* answers =
        static_cast<pam_response*>(std::calloc(static_cast<std::size_t>(count), sizeof(pam_response)));
    if (answers == nullptr) return PAM_BUF_ERR;
    // A module may ask for more than a password, such as a code; without an answer it refuses.
    std::transform(messages, messages + count, answers, [data](const pam_message* message) {
        const char* password = static_cast<const Credentials*>(data)->password.c_str();
        return pam_response{message->msg_style == PAM_PROMPT_ECHO_OFF ? ::strdup(password) : nullptr, {}};
    });
    *responses = answers;  // PAM frees them
    return PAM_SUCCESS;
}

/// PAM's own delay after a failure would hold a place that others wait for; ours is elsewhere.
void noDelay(int, unsigned int, void*) {}

class PamSession {
  public:
    PamSession(const Credentials& credentials, const std::string& address)
        : m_conversation{converse, const_cast<Credentials*>(&credentials)} {
        m_status = ::pam_start(kService, credentials.user.c_str(), &m_conversation, &m_handle);
        if (m_status != PAM_SUCCESS) return;
        // For the logs, and for modules that lock an address out.
        ::pam_set_item(m_handle, PAM_RHOST, address.c_str());
        void (*delay)(int, unsigned int, void*) = noDelay;
        ::pam_set_item(m_handle, PAM_FAIL_DELAY, reinterpret_cast<const void*>(delay));
    }
    ~PamSession() {
        // Of none the library would complain to the system log.
        if (m_handle != nullptr) ::pam_end(m_handle, m_status);
    }
    PamSession(const PamSession&) = delete;
    PamSession& operator=(const PamSession&) = delete;

    bool authenticate() {
        constexpr int kFlags = PAM_SILENT | PAM_DISALLOW_NULL_AUTHTOK;
        if (m_status == PAM_SUCCESS) m_status = ::pam_authenticate(m_handle, kFlags);
        // Even if the password is right, the account may have expired or be locked.
        if (m_status == PAM_SUCCESS) m_status = ::pam_acct_mgmt(m_handle, kFlags);
        // Not PAM_AUTHINFO_UNAVAIL, which may mean that the user is unknown: that must not be told.
        constexpr std::array kBroken{PAM_BUF_ERR, PAM_SYSTEM_ERR, PAM_ABORT};
        if (std::ranges::find(kBroken, m_status) != kBroken.end())
            throw CheckFailed(::pam_strerror(m_handle, m_status));
        return m_status == PAM_SUCCESS;
    }

  private:
    pam_conv m_conversation;
    pam_handle_t* m_handle = nullptr;
    int m_status = PAM_SYSTEM_ERR;
};

/// The account's user and primary group; nothing for an unknown name.
std::optional<std::pair<uid_t, gid_t>> findAccount(const std::string& user) {
    passwd entry{};
    passwd* found = nullptr;
    std::array<char, 16'384> buffer{};
    // Not getpwnam(): requests are served on many threads.
    ::getpwnam_r(user.c_str(), &entry, buffer.data(), buffer.size(), &found);
    if (found == nullptr) return std::nullopt;
    return std::pair(entry.pw_uid, entry.pw_gid);
}

std::vector<gid_t> groupsOf(const std::string& user, gid_t first) {
    // The first call says how many there are.
    int count = 0;
    ::getgrouplist(user.c_str(), first, nullptr, &count);
    std::vector<gid_t> groups(static_cast<std::size_t>(count));
    ::getgrouplist(user.c_str(), first, groups.data(), &count);
    groups.resize(std::min(groups.size(), static_cast<std::size_t>(count)));
    return groups;
}

bool isMember(const std::vector<gid_t>& groups, const std::string& group) {
    struct group entry {};
    struct group* found = nullptr;
    std::array<char, 65'536> buffer{};
    ::getgrnam_r(group.c_str(), &entry, buffer.data(), buffer.size(), &found);
    if (found == nullptr) return false;
    return std::find(groups.begin(), groups.end(), entry.gr_gid) != groups.end();
}

/// What a user of the system may do.
User systemUser(const std::string& name, const std::vector<std::string>& readers) {
    User user{name};
    const auto account = findAccount(name);
    // PAM can know users that the system does not; without groups they may do nothing.
    if (!account) return user;
    const std::vector<gid_t> groups = groupsOf(name, account->second);
    user.isAdministrator = account->first == 0 || isMember(groups, kAdministrators);
    user.mayRead =
        user.isAdministrator || std::any_of(readers.begin(), readers.end(), [&](const std::string& reader) {
            if (reader.starts_with('@')) return isMember(groups, reader.substr(1));
            return reader == "*" || reader == name;
        });
    return user;
}

}  // namespace

std::optional<User> PamChecker::check(const Credentials& credentials, const std::string& address) {
    if (!PamSession(credentials, address).authenticate()) return std::nullopt;
    return systemUser(credentials.user, m_readers);
}

}  // namespace host
