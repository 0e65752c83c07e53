// SPDX-License-Identifier: Apache-2.0
// What a server tells of its jobs, as it happens.
#include <unistd.h>

#include <random>

#include "CimXml/Export.h"
#include "CimXml/WireError.h"
#include "Cli/Display/Output.h"
#include "Cli/Display/Terminal.h"
#include "Cli/Verbs/Listener.h"
#include "Cli/Verbs/Verbs.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

using core::CimPath;
using core::CimType;
using core::CimValue;
using core::InstanceValue;

constexpr const char* kQuery = "SELECT * FROM CIM_InstIndication WHERE SourceInstance ISA CIM_ConcreteJob";
/// How often the server is asked whether it is still there.
constexpr std::chrono::seconds kLook{5};

core::CimOperations& requireInterop(const Connection& connection) {
    if (!connection.isInProcess) return *connection.operations;
    throw CommandError(
        ExitStatus::WrongUse, "A server tells of its jobs, and none was named: there is nobody to listen to.",
        "Name the server with --server. Root needs none on a machine on which quenx-cimd runs.");
}

/// No other listener's, and nothing that anybody could guess who wants to send us lies.
std::string uniqueName() {
    std::random_device random;
    return utils::formatStr("quenxctl-%ld-%08x%08x", static_cast<long>(::getpid()), random(), random());
}

core::PropertyValue text(const char* name, const std::string& value) {
    return {name, CimValue::of(CimType::String, value), false, ""};
}
core::PropertyValue reference(const char* name, const CimPath& path) {
    return {name, CimValue::of(CimType::Reference, path), true, path.getClassName()};
}

InstanceValue named(const char* className, const std::string& name,
                    std::vector<core::PropertyValue> properties) {
    properties.insert(properties.begin(),
                      {text("SystemCreationClassName", "CIM_ComputerSystem"), text("SystemName", "localhost"),
                       text("CreationClassName", className), text("Name", name)});
    return {CimPath(className, {}), std::move(properties)};
}

/// A subscription of our own, as long as this lives.
class OwnSubscription {
  public:
    OwnSubscription(core::CimOperations& operations, const std::string& name, const std::string& url)
        : m_operations(operations) {
        constexpr std::uint64_t kTransient = 3;
        try {
            InstanceValue destination =
                named("CIM_ListenerDestinationCIMXML", name, {text("Destination", url)});
            destination.properties.push_back(
                {"PersistenceType", CimValue::of(CimType::Uint16, kTransient), false, ""});
            m_made.push_back(m_operations.createInstance(destination));
            m_made.push_back(m_operations.createInstance(named(
                "CIM_IndicationFilter", name, {text("Query", kQuery), text("QueryLanguage", "DMTF:CQL")})));
            m_made.push_back(m_operations.createInstance(
                {CimPath("CIM_IndicationSubscription", {}),
                 {reference("Filter", m_made[1]), reference("Handler", m_made[0])}}));
        } catch (...) {
            takeAway();
            throw;
        }
    }
    ~OwnSubscription() { takeAway(); }
    OwnSubscription(const OwnSubscription&) = delete;
    OwnSubscription& operator=(const OwnSubscription&) = delete;

    /// Whether what the server tells gets here, as far as it knows. Throws where the server is gone, or has
    /// the subscription no more.
    bool isReached() try {
        constexpr std::uint64_t kDegraded = 3;
        const std::vector<std::string> wanted{"SubscriptionState"};
        return m_operations.getInstance(m_made.back(), wanted).number(wanted.front()) != kDegraded;
    } catch (const core::CimError& error) {
        if (error.status() != core::CimStatus::NotFound) throw;
        m_made.pop_back();  // the others are still there
        throw CommandError(
            ExitStatus::Failed, "The server has this subscription no more.",
            "An administrator has deleted it, or the server has begun anew without it. Listen again.");
    }

    /// Whether the server has nothing of it any more.
    bool takeAway() noexcept {
        bool isGone = true;
        while (!m_made.empty()) {
            try {
                m_operations.deleteInstance(m_made.back());
            } catch (const std::exception&) {
                isGone = false;
            }
            m_made.pop_back();
        }
        return isGone;
    }

  private:
    core::CimOperations& m_operations;
    std::vector<CimPath> m_made;
};

const char* eventOf(const std::string& className) {
    if (core::sameName(className, "CIM_InstCreation")) return "created";
    return core::sameName(className, "CIM_InstDeletion") ? "deleted" : "changed";
}

std::string percentText(const InstanceValue& job) {
    return std::to_string(job.number("PercentComplete")) + " %";
}

void print(Context& context, const cimxml::ReceivedIndication& received) {
    const InstanceValue& job = received.source;
    const auto time = received.indication.get<utils::Time>("IndicationTime");
    JobView view;
    view.state = static_cast<std::uint16_t>(job.number("JobState"));
    const std::string moment = time ? core::datetimeText(*time) : "-";
    const std::string id = job.text("InstanceID");
    if (context.json) {
        context.out << jsonLine(
                           {{"time", moment},
                            {"event", eventOf(received.indication.path.getClassName())},
                            {"number", received.indication.get<std::int64_t>("SequenceNumber").value_or(-1)},
                            {"job", id},
                            {"state", view.stateName()},
                            {"percent", job.number("PercentComplete")},
                            {"errorCode", job.number("ErrorCode")},
                            {"errorDescription", job.text("ErrorDescription")}})
                    << std::endl;
        return;
    }
    context.out << momentText(time) << "  " << printable(id) << "  "
                << eventOf(received.indication.path.getClassName()) << "  " << view.stateName() << "  "
                << percentText(job);
    const std::string error = job.text("ErrorDescription");
    if (!error.empty()) context.out << "  " << printable(error);
    context.out << std::endl;
}

}  // namespace

ExitStatus listen(Context& context, const VerbOptions& options) {
    core::CimOperations& operations = requireInterop(context.connection);
    const std::string name = uniqueName();
    std::string address = options.listening.address;
    if (address.empty() && !context.connection.sharesFiles) {
        throw CommandError(ExitStatus::WrongUse, "A server elsewhere has to know where to send.",
                           "Name the address at which it reaches this machine, with --address.");
    }
    if (address.empty()) address = "127.0.0.1";
    Listener listener(address, options.listening.port, "/" + name);
    OwnSubscription subscription(operations, name, listener.url());
    context.error << "Listening at " << listener.url() << " until it is interrupted.\n";
    auto looked = std::chrono::steady_clock::now();
    bool wasReached = true;
    for (std::uint32_t count = 0; options.listening.count == 0 || count < options.listening.count;) {
        if (context.following.interrupted()) break;
        if (const auto delivered = listener.next(std::chrono::milliseconds(200))) {
            try {
                const auto received = cimxml::readExport(delivered->body);
                Listener::answer(*delivered, cimxml::writeExportAnswer(received.messageId));
                print(context, received);
                if (!context.out) break;  // nobody reads it any more
                ++count;
            } catch (const cimxml::WireError&) {
                Listener::answer(*delivered, "");
            }
        }
        if (std::chrono::steady_clock::now() - looked < kLook) continue;
        looked = std::chrono::steady_clock::now();
        const bool isReached = subscription.isReached();
        if (wasReached && !isReached) {
            context.error << "quenxctl: The server cannot reach " << listener.url() << "; its log says why.\n"
                          << "Name an address of this machine with --address that it can reach, and that its "
                             "setting indications.destinations allows.\n";
        }
        wasReached = isReached;
    }
    if (subscription.takeAway()) return ExitStatus::Done;
    throw CommandError(ExitStatus::Failed, "The server still has the subscription " + name + ".",
                       "Nothing arrives there any more; it stays until an administrator deletes it.");
}

}  // namespace cli
