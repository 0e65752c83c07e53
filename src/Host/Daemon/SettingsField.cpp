#include "Host/Daemon/SettingsField.h"

#include <algorithm>
#include <charconv>
#include <stdexcept>

namespace host {

namespace {

constexpr std::uint64_t kDay = 86400;
constexpr std::uint64_t kGibibyte = 1ULL << 30;

template <class... Cases>
struct Overloaded : Cases... {
    using Cases::operator()...;
};
template <class... Cases>
Overloaded(Cases...) -> Overloaded<Cases...>;

[[noreturn]] void refuse(const SettingsField& field, const std::string& text, const std::string& right) {
    throw std::runtime_error(field.key + " is \"" + text + "\"; it must be " + right);
}

std::uint64_t numberIn(const SettingsField& field, const std::string& text) {
    std::uint64_t number = 0;
    const char* end = text.data() + text.size();
    const auto result = std::from_chars(text.data(), end, number);
    if (result.ec != std::errc() || result.ptr != end || number < field.least || number > field.most) {
        refuse(field, text,
               "a number from " + std::to_string(field.least) + " to " + std::to_string(field.most));
    }
    return number;
}

bool flagIn(const SettingsField& field, const std::string& text) {
    if (text != "true" && text != "false") refuse(field, text, "true or false");
    return text == "true";
}

}  // namespace

std::string SettingsField::option() const {
    std::string name = "--" + key;
    std::replace(name.begin(), name.end(), '.', '-');
    std::replace(name.begin(), name.end(), '_', '-');
    return name;
}

void SettingsField::set(const std::string& value) const {
    std::visit(
        Overloaded{[&](bool* flag) { *flag = flagIn(*this, value); },
                   [&](std::string* text) { *text = value; },
                   [&](std::vector<std::string>* list) { list->push_back(value); },
                   [&](std::chrono::seconds* time) { *time = std::chrono::seconds(numberIn(*this, value)); },
                   [&](auto* number) {
                       using Number = std::remove_pointer_t<decltype(number)>;
                       *number = static_cast<Number>(numberIn(*this, value));
                   }},
        target);
}

std::string SettingsField::text() const {
    return std::visit(
        Overloaded{[](bool* flag) -> std::string { return *flag ? "true" : "false"; },
                   [](std::string* text) { return *text; },
                   [](std::vector<std::string>* list) { return list->empty() ? "" : list->front() + " ..."; },
                   [](std::chrono::seconds* time) { return std::to_string(time->count()); },
                   [](auto* number) { return std::to_string(*number); }},
        target);
}

std::vector<SettingsField> fieldsOf(Settings& s) {
    return {
        {"listen.address", &s.listen.address, 0, 0, "address to listen on"},
        {"listen.https", &s.listen.https, 0, 0, "serve HTTPS"},
        {"listen.https_port", &s.listen.httpsPort, 0, 65535, "its port; 0 takes a free one"},
        {"listen.http", &s.listen.http, 0, 0, "serve plain HTTP too: passwords can be read on the way"},
        {"listen.http_port", &s.listen.httpPort, 0, 65535, "its port; 0 takes a free one"},
        {"tls.certificate", &s.tls.certificate, 0, 0,
         "certificate chain (PEM); made if it and the key are missing"},
        {"tls.key", &s.tls.key, 0, 0, "private key (PEM)"},
        {"auth.method", &s.authentication.method, 0, 0, "pam or users"},
        {"auth.users_file", &s.authentication.usersFile, 0, 0, "users and password hashes, for method users"},
        {"auth.readers", &s.authentication.readers, 0, 0,
         "who may read besides administrators, for method pam: names, @group, or * for all"},
        {"auth.remember_seconds", &s.authentication.rememberFor, 0, 3600,
         "how long verified credentials are remembered"},
        {"limits.body_bytes", &s.limits.bodyBytes, 1024, kGibibyte, "body of a request"},
        {"limits.anonymous_body_bytes", &s.limits.anonymousBodyBytes, 0, kGibibyte,
         "body that is read of a request that is refused"},
        {"limits.header_bytes", &s.limits.headerBytes, 4096, 1U << 20, "headers of a request"},
        {"limits.connections", &s.limits.connections, 1, 4096, "connections, each with a thread"},
        {"limits.connections_per_address", &s.limits.connectionsPerAddress, 1, 4096,
         "connections from one address"},
        {"limits.workers", &s.limits.workers, 1, 4096, "requests carried out at a time"},
        {"limits.header_seconds", &s.limits.headerTime, 1, kDay, "for the headers of a request to arrive"},
        {"limits.request_seconds", &s.limits.requestTime, 1, kDay,
         "for a body to arrive, and for an answer to be taken"},
        {"limits.idle_seconds", &s.limits.idleTime, 1, kDay, "between two requests on a connection"},
        {"limits.enumerations", &s.pulls.open, 1, 100000, "enumerations that are open at a time"},
        {"limits.enumeration_seconds", &s.pulls.timeout, 1, kDay, "between two pulls on an enumeration"},
        {"limits.enumeration_most_seconds", &s.pulls.maxTimeout, 1, kDay,
         "what a client may ask for instead"},
        {"providers.directory", &s.providers, 0, 0, "where the provider libraries are"},
        {"providers.configuration", &s.providerConfiguration, 0, 0,
         "the providers' configuration, if not /etc/quenx-cimprovider.conf"},
        {"adapters.description", &s.adapters, 0, 0, "description of simulated adapters"},
        {"adapters.state", &s.adapterState, 0, 0, "directory in which they keep their flash"},
        {"daemon.lock_file", &s.lockFile, 0, 0, "held while running, so that no second daemon starts"}};
}

void checkSettings(const Settings& settings) {
    if (!settings.listen.https && !settings.listen.http) {
        throw std::runtime_error("listen.https and listen.http are both false: nothing would be served");
    }
    if (settings.authentication.method != "pam" && settings.authentication.method != "users") {
        throw std::runtime_error("auth.method is \"" + settings.authentication.method +
                                 "\"; it must be \"pam\" or \"users\"");
    }
    if (settings.limits.anonymousBodyBytes > settings.limits.bodyBytes) {
        throw std::runtime_error("limits.anonymous_body_bytes is larger than limits.body_bytes");
    }
    if (settings.pulls.timeout > settings.pulls.maxTimeout) {
        throw std::runtime_error("limits.enumeration_seconds is larger than limits.enumeration_most_seconds");
    }
    if (settings.adapters.empty() != settings.adapterState.empty()) {
        throw std::runtime_error("adapters.description and adapters.state go together");
    }
}

}  // namespace host
