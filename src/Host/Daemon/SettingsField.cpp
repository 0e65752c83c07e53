// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/SettingsField.h"

#include <algorithm>
#include <stdexcept>

#include "Host/Daemon/IndicationSettings.h"
#include "Utils/Utils.h"

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

/// The key as the file has it: --listen-http-port is told as listen.http_port, which either reader finds.
[[noreturn]] void refuse(const SettingsField& field, const std::string& text, const std::string& right) {
    throw std::runtime_error(field.key + " is \"" + text + "\". It must be " + right + ".");
}

std::uint64_t numberIn(const SettingsField& field, const std::string& text) {
    const auto number = utils::parseNumber<std::uint64_t>(text);
    if (!number || *number < field.least || *number > field.most)
        refuse(field, text, "a number from " + field.range());
    return *number;
}

bool flagIn(const SettingsField& field, const std::string& text) {
    if (text != "true" && text != "false") refuse(field, text, "true or false");
    return text == "true";
}

}  // namespace

std::string SettingsField::range() const {
    return std::to_string(least) + " to " + std::to_string(most);
}

std::string SettingsField::option() const {
    std::string name = "--" + key;
    std::replace(name.begin(), name.end(), '.', '-');
    std::replace(name.begin(), name.end(), '_', '-');
    return name;
}

void SettingsField::set(const std::string& value) const {
    std::visit(
        Overloaded{[&](bool* flag) { *flag = flagIn(*this, value); },
                   [&](std::string* text) {
                       if (value.size() < least) refuse(*this, value, "a text of at least one character");
                       *text = value;
                   },
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

namespace {

// The texts are what `quenx-cimd --help` prints. The bounds keep one zero too many from using up the memory,
// and one too few from refusing every client.
std::vector<SettingsField> limitFields(Settings& s) {
    return {{"limits.body_bytes", &s.limits.bodyBytes, "largest request body", 1024, kGibibyte},
            {"limits.anonymous_body_bytes", &s.limits.anonymousBodyBytes,
             "how much is read of a request that is refused", 0, kGibibyte},
            {"limits.header_bytes", &s.limits.headerBytes, "largest request headers", 4096, 1U << 20},
            {"limits.connections", &s.limits.connections, "most connections at a time; each has a thread", 1,
             4096},
            {"limits.connections_per_address", &s.limits.connectionsPerAddress,
             "most connections from one address", 1, 4096},
            {"limits.workers", &s.limits.workers, "most requests carried out at a time", 1, 4096},
            {"limits.requests_per_user", &s.limits.requestsPerUser,
             "most requests of one user carried out at a time; further ones wait", 1, 4096},
            {"limits.answer_bytes", &s.limits.answerBytes,
             "most memory for large answers that clients have not read yet", 1U << 20, kGibibyte * 64},
            {"limits.header_seconds", &s.limits.headerTime, "time for the headers to arrive", 1, kDay},
            {"limits.request_seconds", &s.limits.requestTime,
             "time for a body to arrive, and for the client to take the answer", 1, kDay},
            {"limits.idle_seconds", &s.limits.idleTime, "time between two requests on a connection", 1, kDay},
            {"limits.enumerations", &s.pulls.open, "most open pull enumerations", 1, 100000},
            {"limits.enumerations_per_user", &s.pulls.openPerUser, "most open pull enumerations of one user",
             1, 100000},
            {"limits.enumeration_seconds", &s.pulls.timeout,
             "time between two pulls, unless the client asks for another", 1, kDay},
            {"limits.enumeration_most_seconds", &s.pulls.maxTimeout,
             "longest time between two pulls that a client may ask for", 1, kDay}};
}

std::vector<SettingsField> otherFields(Settings& s) {
    return {
        {"jobs.keep", &s.jobs.keep,
         "how many jobs that have ended are kept; 0 for all, until a client deletes them", 0, 1000000},
        {"jobs.keep_seconds", &s.jobs.keepFor, "how many seconds a job is kept after its end; 0 for ever", 0,
         kDay * 366},
        {"uploads.directory", &s.uploads.directory,
         "directory for images that administrators send; empty to take none"},
        {"uploads.image_bytes", &s.uploads.imageBytes, "largest image that is sent", 1024, 2 * kGibibyte - 1},
        {"uploads.total_bytes", &s.uploads.totalBytes,
         "most for all images that were sent; beyond it the oldest are removed", 1024, kGibibyte * 1024},
        {"indications.destinations", &s.indications.destinations,
         "where indications may go: subscriber, the machine that subscribed; any; or networks, such as "
         "10.0.0.0/8",
         1, 0, true},
        {"indications.file", &s.indications.file,
         "file that keeps subscriptions over restarts; empty to keep none"},
        {"indications.most", &s.indications.most, "most destinations, and most subscriptions", 1, 1000},
        {"indications.certificates", &s.indications.certificates,
         "file with authorities for certificates of listeners, beside the system's"},
        {"indications.verify", &s.indications.verify, "check the certificates of listeners"},
        {"indications.retries", &s.indications.retries, "further tries after one that failed", 0, 100},
        {"indications.retry_seconds", &s.indications.retryTime, "time between two tries", 1, kDay},
        {"indications.abandon_seconds", &s.indications.abandonTime,
         "time after which transient destinations that take nothing are removed; 0 for never", 0, 366 * kDay},
        {"indications.per_second", &s.indications.perSecond,
         "most indications in a second to one address, on average; 0 for no bound", 0, 100000},
        {"providers.directory", &s.providers, "directory of the provider libraries"},
        {"providers.configuration", &s.providerConfiguration,
         "the providers' own configuration file, instead of /etc/quenx-cimprovider.conf"},
        {"providers.policy", &s.policy,
         "file that says who may install and delete, instead of /etc/quenx/policy.toml"},
        {"adapters.backend", &s.backend,
         "which adapters: devlink for this machine's own, simulator or auto; instead of QUENX_BACKEND", 1},
        {"adapters.description", &s.adapters,
         "file that describes simulated adapters, instead of /etc/quenx-adapters.toml", 1},
        {"adapters.state", &s.adapterState,
         "directory in which they keep their flash, instead of /var/lib/quenx/adapters", 1},
        {"daemon.lock_file", &s.lockFile, "file that is locked while quenx-cimd runs"}};
}

}  // namespace

std::vector<SettingsField> fieldsOf(Settings& s) {
    std::vector<SettingsField> fields{
        {"listen.address", &s.listen.address, "address to listen on"},
        {"listen.https", &s.listen.https, "serve HTTPS"},
        {"listen.https_port", &s.listen.httpsPort, "port for HTTPS; 0 picks a free one", 0, 65535},
        {"listen.http", &s.listen.http, "serve plain HTTP too; it sends passwords in clear text"},
        {"listen.http_port", &s.listen.httpPort, "port for plain HTTP; 0 picks a free one", 0, 65535},
        {"listen.socket", &s.listen.socket,
         "Unix socket on which root of this machine is served without a password; empty for none"},
        {"tls.certificate", &s.tls.certificate, "file with the certificate chain (PEM)"},
        {"tls.key", &s.tls.key, "file with the private key (PEM)"},
        {"tls.generate", &s.tls.generate,
         "make a missing certificate and key, self-signed; those at the default paths are always made"},
        {"auth.method", &s.authentication.method, "how passwords are checked: pam or users"},
        {"auth.users_file", &s.authentication.usersFile,
         "file with users and password hashes, for method users"},
        {"auth.readers", &s.authentication.readers,
         "who may read besides administrators, for method pam: user names, @group, or * for everybody"},
        {"auth.remember_seconds", &s.authentication.rememberFor,
         "how long a verified password is remembered; 0 for not at all", 0, 3600}};
    for (auto* more : {&limitFields, &otherFields}) {
        for (SettingsField& field : more(s))
            fields.push_back(std::move(field));
    }
    return fields;
}

void checkSettings(const Settings& s) {
    const auto refuseIf = [](bool isWrong, const std::string& text) {
        if (isWrong) throw std::runtime_error(text);
    };
    const std::string& method = s.authentication.method;
    refuseIf(!s.listen.https && !s.listen.http,
             "listen.https and listen.http are both false. Set one of them to true.");
    const bool isSamePort = s.listen.httpsPort == s.listen.httpPort && s.listen.httpPort != 0;
    refuseIf(s.listen.https && s.listen.http && isSamePort,
             "listen.https_port and listen.http_port are both " + std::to_string(s.listen.httpPort) +
                 ". Set one of them to another port.");
    refuseIf(method != "pam" && method != "users",
             "auth.method is \"" + method + "\". It must be \"pam\" or \"users\".");
    refuseIf(s.limits.anonymousBodyBytes > s.limits.bodyBytes,
             "limits.anonymous_body_bytes is larger than limits.body_bytes. Lower it, or raise "
             "limits.body_bytes.");
    refuseIf(s.pulls.timeout > s.pulls.maxTimeout,
             "limits.enumeration_seconds is larger than limits.enumeration_most_seconds. Lower it, or raise "
             "limits.enumeration_most_seconds.");
    refuseIf(s.uploads.imageBytes > s.uploads.totalBytes,
             "uploads.image_bytes is larger than uploads.total_bytes. Lower it, or raise "
             "uploads.total_bytes.");
    subscriptionSettings(s);
    refuseIf(s.adapters.empty() != s.adapterState.empty(),
             "Only one of adapters.description and adapters.state is set. Set both, or neither.");
}

}  // namespace host
