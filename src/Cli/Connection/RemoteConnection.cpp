// SPDX-License-Identifier: Apache-2.0
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <iostream>
#include <iterator>
#include <utility>

#include "CimXml/Request.h"
#include "CimXml/Response.h"
#include "CimXml/WireError.h"
#include "Cli/Connection/HttpClient.h"
#include "Cli/Connection/ServerControl.h"
#include "Cli/Display/Messages.h"
#include "Cli/Display/Terminal.h"
#include "Utils/Os/Linux/EchoOff.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

using cimxml::ClassName;
using cimxml::IntrinsicResult;
using Parameters = std::vector<cimxml::Parameter>;

/// The form of names and paths in HTTP headers (DSP0200 6.2).
std::string percentEncoded(const std::string& text) {
    constexpr std::string_view kPlain = "._-=,";
    std::string result;
    for (const char c : text) {
        if (utils::isLetter(c) || utils::isDigit(c) || kPlain.find(c) != std::string_view::npos)
            result += c;
        else
            result += utils::formatStr("%%%02X", static_cast<unsigned char>(c));
    }
    return result;
}

Parameters withFilter(Parameters parameters, const core::PropertyFilter& filter) {
    if (filter) parameters.push_back({"PropertyList", *filter});
    return parameters;
}

Parameters associatorParameters(const core::CimPath& path, const core::AssociationFilter& by) {
    Parameters parameters = {{"ObjectName", path}};
    if (!by.associationClass.empty()) parameters.push_back({"AssocClass", ClassName{by.associationClass}});
    if (!by.resultClass.empty()) parameters.push_back({"ResultClass", ClassName{by.resultClass}});
    if (!by.role.empty()) parameters.push_back({"Role", by.role});
    if (!by.resultRole.empty()) parameters.push_back({"ResultRole", by.resultRole});
    return parameters;
}

/// To these operations the association is the result.
Parameters referenceParameters(const core::CimPath& path, const core::AssociationFilter& by) {
    const std::string& associationClass = by.associationClass.empty() ? by.resultClass : by.associationClass;
    return associatorParameters(path, {"", associationClass, by.role, ""});
}

[[noreturn]] void refuseAnswer(const std::string& why) {
    throw NoAnswer(ExitStatus::Failed, why, "Check that --server names a CIM-XML server.");
}

/// A server that confuses objects must not have the state of one taken for that of another. References are
/// left out: one object has many spellings.
void requireSameKeys(const core::InstanceValue& instance, const core::CimPath& path) {
    for (const core::CimKey& key : path.getKeys()) {
        const core::PropertyValue* property = instance.find(key.name);
        const core::CimScalar* value = property == nullptr ? nullptr : property->value.scalar();
        if (value == nullptr || std::holds_alternative<core::CimPath>(*value)) continue;
        if (core::scalarText(*value) != core::scalarText(key.value))
            refuseAnswer("The server's answer is about another object than " + path.toString() + ".");
    }
}

/// The most that a list in pieces may hold, and what a piece counts at least: a server could go on for ever
/// with empty ones.
constexpr std::size_t kLargestList = std::size_t{256} << 20;
constexpr std::size_t kLeastPiece = std::size_t{256} << 10;

/// An operation whose answer may be large: whole, and its form in pieces (DSP0200 5.4.2.24).
struct Listing {
    const char* whole;
    const char* open;
    const char* pull;
    bool hasLocalOnly = false;  ///< whole it leaves inherited properties out, unless told not to
};
constexpr Listing kInstances{"EnumerateInstances", "OpenEnumerateInstances", "PullInstancesWithPath", true};
constexpr Listing kNames{"EnumerateInstanceNames", "OpenEnumerateInstancePaths", "PullInstancePaths"};
constexpr Listing kAssociators{"Associators", "OpenAssociatorInstances", "PullInstancesWithPath"};
constexpr Listing kAssociatorNames{"AssociatorNames", "OpenAssociatorInstancePaths", "PullInstancePaths"};
constexpr Listing kReferences{"References", "OpenReferenceInstances", "PullInstancesWithPath"};
constexpr Listing kReferenceNames{"ReferenceNames", "OpenReferenceInstancePaths", "PullInstancePaths"};

/// Whether an error says that the server cannot give this list in pieces.
bool mustBeWhole(core::CimStatus status) {
    return status == core::CimStatus::NotSupported || status == core::CimStatus::MethodNotFound ||
           status == core::CimStatus::ServerLimitsExceeded;
}

/// The output as a text; empty where there is none.
std::string outputOf(const IntrinsicResult& result, std::string_view name) {
    const core::Argument* output = core::findByName(result.outputs, name);
    const core::CimScalar* value = output == nullptr ? nullptr : output->value.scalar();
    return value == nullptr ? "" : core::scalarText(*value);
}

/// What a server answers over CIM-XML.
class RemoteOperations : public core::CimOperations {
  public:
    RemoteOperations(const ServerSettings& settings, const std::string& user, const std::string& password,
                     std::function<bool()> isInterrupted)
        : m_client(settings, user, password, std::move(isInterrupted)),
          m_namespace(settings.namespaceName),
          m_url(settings.url->text()) {}

    const std::string& getNamespace() const override { return m_namespace; }

    std::vector<core::InstanceValue> enumerateInstances(const std::string& className,
                                                        const core::PropertyFilter& filter) override {
        return list(kInstances, withFilter({{"ClassName", ClassName{className}}}, filter)).instances;
    }
    std::vector<core::CimPath> enumerateInstanceNames(const std::string& className) override {
        return list(kNames, {{"ClassName", ClassName{className}}}).paths;
    }
    core::InstanceValue getInstance(const core::CimPath& path, const core::PropertyFilter& filter) override;

    std::vector<core::InstanceValue> associators(const core::CimPath& path, const core::AssociationFilter& by,
                                                 const core::PropertyFilter& filter) override {
        return list(kAssociators, withFilter(associatorParameters(path, by), filter)).instances;
    }
    std::vector<core::CimPath> associatorNames(const core::CimPath& path,
                                               const core::AssociationFilter& by) override {
        return list(kAssociatorNames, associatorParameters(path, by)).paths;
    }
    std::vector<core::InstanceValue> references(const core::CimPath& path, const core::AssociationFilter& by,
                                                const core::PropertyFilter& filter) override {
        return list(kReferences, withFilter(referenceParameters(path, by), filter)).instances;
    }
    std::vector<core::CimPath> referenceNames(const core::CimPath& path,
                                              const core::AssociationFilter& by) override {
        return list(kReferenceNames, referenceParameters(path, by)).paths;
    }

    core::MethodResult invokeMethod(const core::CimPath& path, const std::string& method,
                                    const std::vector<core::Argument>& arguments) override;
    void deleteInstance(const core::CimPath& path) override {
        call("DeleteInstance", {{"InstanceName", path}}, Sending::Once);
    }
    core::CimPath createInstance(const core::InstanceValue& instance) override;
    core::ClassChain getClass(const std::string& className) override;
    std::vector<core::ClassChain> enumerateClasses(const std::string& className, bool deep) override;

  private:
    /// Inherited properties, too: servers leave them out by default (DSP0200 5.4.2.3).
    static inline const cimxml::Parameter kWhole{"LocalOnly", std::string("FALSE")};

    IntrinsicResult call(const std::string& operation, Parameters parameters,
                         Sending sending = Sending::AsOftenAsNeeded);
    /// The whole list, read in pieces where the server can.
    IntrinsicResult list(const Listing& listing, const Parameters& parameters);
    IntrinsicResult pullAll(const Listing& listing, Parameters parameters);
    std::vector<core::ClassChain> allClasses();
    /// Some operations answer with host and namespace, some with neither: all paths read as those in process.
    void complete(core::CimPath& path) const;
    /// Sends the call; a CIM error in the answer is thrown as core::CimError.
    cimxml::Response send(cimxml::Request request, const std::string& object, Sending sending);

    HttpClient m_client;
    std::string m_namespace;
    std::string m_url;
    unsigned m_messages = 0;
    std::size_t m_received = 0;  ///< bytes of answers to the operation under way
    bool m_canPull = true;       ///< until the server says otherwise
};

cimxml::Response RemoteOperations::send(cimxml::Request request, const std::string& object, Sending sending) {
    // Tells to which request an answer belongs (DSP0201).
    request.messageId = std::to_string(++m_messages);
    // Without the empty "Expect:", a large body waits a second for servers that do not answer it.
    const HttpReply reply = m_client.post(
        {"Content-Type: application/xml; charset=\"utf-8\"", "Expect:", "CIMProtocolVersion: 1.0",
         "CIMOperation: MethodCall", "CIMMethod: " + percentEncoded(request.name()),
         "CIMObject: " + percentEncoded(object)},
        cimxml::writeRequest(request), sending);
    requireOk(reply);
    m_received += std::max(reply.body.size(), kLeastPiece);
    try {
        cimxml::Response response = cimxml::readResponse(reply.body);
        if (response.messageId != request.messageId || !core::sameName(response.name, request.name()))
            refuseAnswer("The server's answer belongs to another request.");
        if (const auto* error = std::get_if<cimxml::ErrorResult>(&response.content))
            throw core::CimError(error->status, error->description);
        return response;
    } catch (const cimxml::WireError& error) {
        refuseAnswer(std::string("The server's answer cannot be read: ") + error.what() + ".");
    }
}

IntrinsicResult RemoteOperations::call(const std::string& operation, Parameters parameters, Sending sending) {
    cimxml::Request request;
    request.call = cimxml::IntrinsicCall{operation, m_namespace, std::move(parameters)};
    cimxml::Response response = send(std::move(request), m_namespace, sending);
    auto* result = std::get_if<IntrinsicResult>(&response.content);
    if (result == nullptr) refuseAnswer("The server's answer is not that of an operation.");
    for (core::InstanceValue& instance : result->instances)
        complete(instance.path);
    for (core::CimPath& path : result->paths)
        complete(path);
    return std::move(*result);
}

IntrinsicResult RemoteOperations::list(const Listing& listing, const Parameters& parameters) {
    const auto* source = std::get_if<core::CimPath>(&parameters.front().value);
    // The associations of classes can only be had whole.
    if (m_canPull && (source == nullptr || source->isInstancePath())) {
        try {
            return pullAll(listing, parameters);
        } catch (const core::CimError& error) {
            if (!mustBeWhole(error.status())) throw;
            // Limits pass, but a server that knows no such operation will not learn it.
            m_canPull = error.status() == core::CimStatus::ServerLimitsExceeded;
        }
    }
    Parameters whole = parameters;
    if (listing.hasLocalOnly) whole.push_back(kWhole);
    return call(listing.whole, whole);
}

IntrinsicResult RemoteOperations::pullAll(const Listing& listing, Parameters parameters) {
    // With few enough objects in each that any class's fit into what a reader takes of one answer.
    const cimxml::Parameter count{"MaxObjectCount", std::string("250")};
    // As the operations that open an enumeration call it.
    for (cimxml::Parameter& parameter : parameters)
        if (parameter.name == "ObjectName") parameter.name = "InstanceName";
    parameters.push_back(count);
    m_received = 0;
    IntrinsicResult all = call(listing.open, std::move(parameters));
    IntrinsicResult part{.outputs = all.outputs};
    std::size_t built = bytesOf(all);
    while (!core::sameName(outputOf(part, "EndOfSequence"), "TRUE")) {
        const std::string context = outputOf(part, "EnumerationContext");
        if (context.empty()) refuseAnswer("The server's answer has neither an end nor a way to go on.");
        if (std::max(m_received, built) > kLargestList) refuseLargeAnswer(m_url, kLargestList);
        // A piece that was sent and lost would be missing from the list without a word.
        part = call(listing.pull, {{"EnumerationContext", context}, count}, Sending::Once);
        built += bytesOf(part);
        std::move(part.instances.begin(), part.instances.end(), std::back_inserter(all.instances));
        std::move(part.paths.begin(), part.paths.end(), std::back_inserter(all.paths));
    }
    return all;
}

void RemoteOperations::complete(core::CimPath& path) const {
    if (!path.isValid()) return;
    path.setHost("");
    path.completeNamespace(m_namespace);
}

core::InstanceValue RemoteOperations::getInstance(const core::CimPath& path,
                                                  const core::PropertyFilter& filter) {
    auto instances = call("GetInstance", withFilter({{"InstanceName", path}, kWhole}, filter)).instances;
    if (instances.empty()) throw core::CimError(core::CimStatus::NotFound, path.toString());
    requireSameKeys(instances.front(), path);
    // The answer does not repeat the path.
    instances.front().path = path;
    return std::move(instances.front());
}

core::CimPath RemoteOperations::createInstance(const core::InstanceValue& instance) {
    const cimxml::InstanceBody body{instance.path.getClassName(), std::nullopt, instance.properties};
    const auto paths = call("CreateInstance", {{"NewInstance", body}}, Sending::Once).paths;
    if (paths.empty()) refuseAnswer("The server does not say what it has made.");
    return paths.front();
}

core::MethodResult RemoteOperations::invokeMethod(const core::CimPath& path, const std::string& method,
                                                  const std::vector<core::Argument>& arguments) {
    core::CimPath object = path;
    object.completeNamespace(m_namespace);
    cimxml::Request request;
    request.call = cimxml::MethodCall{method, object, arguments};
    cimxml::Response response = send(std::move(request), object.toString(), Sending::Once);
    auto* result = std::get_if<core::MethodResult>(&response.content);
    if (result == nullptr) refuseAnswer("The server's answer is not that of a method.");
    return std::move(*result);
}

/// A class comes without its superclasses, so all are fetched to build its chain.
std::vector<core::ClassChain> RemoteOperations::allClasses() {
    return core::chainsOf(call("EnumerateClasses",
                               {{"DeepInheritance", std::string("TRUE")}, {"LocalOnly", std::string("TRUE")}})
                              .classes);
}

core::ClassChain RemoteOperations::getClass(const std::string& className) {
    for (core::ClassChain& chain : allClasses()) {
        if (core::sameName(chain.front()->name, className)) return std::move(chain);
    }
    return {};
}

std::vector<core::ClassChain> RemoteOperations::enumerateClasses(const std::string& className, bool deep) {
    std::vector<core::ClassChain> chains = allClasses();
    const auto isIt = [&](const auto& chain) { return core::sameName(chain.front()->name, className); };
    if (!className.empty() && std::none_of(chains.begin(), chains.end(), isIt))
        throw core::CimError(core::CimStatus::InvalidClass, "There is no class " + className);
    std::erase_if(chains, [&](const auto& chain) { return !core::isBelow(chain, className, deep); });
    return chains;
}

/// The line that the user answers with. Throws CommandError with these texts where nobody can answer.
std::string ask(const std::string& prompt, const std::string& missing, const std::string& advice) {
    if (const auto line = askOnTerminal(prompt, {}); line && !line->empty()) return *line;
    throw CommandError(ExitStatus::WrongUse, missing, advice);
}

std::string userName() {
    const char* given = std::getenv("QUENXCTL_USER");
    if (given != nullptr && *given != '\0') return given;
    return ask("User: ", "No user name was given.",
               "Name the user with --user or the environment variable QUENXCTL_USER.");
}

std::string passwordOf(const std::string& user) {
    // No option takes it: every user of the machine can read the command lines of the others.
    const char* given = std::getenv("QUENXCTL_PASSWORD");
    if (given != nullptr) return given;
    const os::EchoOff silence;
    std::string password =
        ask("Password for " + user + ": ", "No password was given for " + user + ".",
            "Put it into the environment variable QUENXCTL_PASSWORD, or type it on a terminal.");
    std::cerr << '\n';  // the user's own was not echoed
    return password;
}

/// Whoever can make a socket elsewhere must not be taken for the server: a command that it answers would seem
/// to be done.
void requireOwnSocket(const std::string& path) {
    struct stat status {};
    if (::stat(path.c_str(), &status) != 0 || ::access(path.c_str(), W_OK) != 0) {
        const bool isDenied = errno == EACCES;
        throw CommandError(isDenied ? ExitStatus::Failed : ExitStatus::NotFound,
                           isDenied ? "Only root may use " + path + "."
                                    : "There is no socket " + path +
                                          ": quenx-cimd does not run, or not with "
                                          "this listen.socket.",
                           isDenied ? "Run as root, or name an https:// address with --server."
                                    : "Start it, or name its socket: --server unix:PATH.");
    }
    if (S_ISSOCK(status.st_mode) && (status.st_uid == 0 || status.st_uid == ::geteuid())) return;
    throw CommandError(ExitStatus::WrongUse, path + " is not a socket of root or of your own.",
                       "Name the socket of quenx-cimd: --server unix:PATH.");
}

/// Of a user who names himself, or a certificate, one that believes in a password or in encryption.
void requireNoLogin(const ServerSettings& settings) {
    if (settings.user.empty() && settings.caFile.empty() && !settings.insecure) return;
    throw CommandError(ExitStatus::WrongUse,
                       "--user, --cacert and --insecure cannot be used with --server unix:.",
                       "Leave them out: on a Unix socket the system itself says who you are.");
}

}  // namespace

Connection openServer(const ServerSettings& settings, const std::function<bool()>& isInterrupted) {
    if (!settings.url->socket().empty()) {
        requireNoLogin(settings);
        requireOwnSocket(settings.url->socket());
        return {.operations = std::make_shared<RemoteOperations>(settings, "", "", isInterrupted),
                .control = std::make_shared<ServerControl>(settings, "", "", isInterrupted),
                .isInProcess = false,
                .sharesFiles = true};
    }
    if (!settings.url->isEncrypted() && !settings.url->isLoopback()) {
        std::cerr << "quenxctl: WARNING: http:// sends the password and everything else unencrypted. Use "
                     "https:// instead.\n";
    }
    if (settings.insecure) {
        std::cerr << "quenxctl: WARNING: --insecure: the server's certificate is not checked. Anybody on the "
                     "network path can read the password and pose as the server.\n";
    }
    const std::string user = settings.user.empty() ? userName() : settings.user;
    const std::string password = passwordOf(user);
    return {.operations = std::make_shared<RemoteOperations>(settings, user, password, isInterrupted),
            .control = std::make_shared<ServerControl>(settings, user, password, isInterrupted),
            .isInProcess = false,
            .sharesFiles = settings.url->isLoopback()};
}

}  // namespace cli
