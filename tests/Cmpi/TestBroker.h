// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <condition_variable>
#include <deque>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <ostream>

#include "Cmpi/Cmpi.h"
#include "Framework/Requests/CimOperations.h"

/// An object manager's side of the interface, in the manners of two real ones. What breaks a rule of
/// ownership ends the program with a message.
namespace test {

/// What is missing and how absence is said: as sfcb 1.4, and as OpenPegasus 2.14.
enum class Dialect { Sfcb, Pegasus };
inline constexpr Dialect kDialects[] = {Dialect::Sfcb, Dialect::Pegasus};
inline void PrintTo(Dialect dialect, std::ostream* out) {
    *out << (dialect == Dialect::Sfcb ? "sfcb" : "pegasus");
}

/// A property, key, argument, element of an array or entry of a context. State and type are what the front is
/// told, so a test can lie.
struct Entry {
    Entry(std::string itsName, const core::CimValue& itsValue, cmpi::State itsState = 0);
    std::string name;
    core::CimValue value;
    cmpi::State state;
    cmpi::Type type;
};

/// Any object of the interface; begins as all of them do. It is of the call that it was made in.
struct Node {
    void* hdl;
    const void* ft;
    std::string text;  ///< of a string or a datetime; the namespace of a path, also of an instance's
    std::string className = {};
    std::vector<Entry> entries = {};
    std::vector<Entry> keys = {};                       ///< of an instance
    std::pair<const char**, const char**> filter = {};  ///< of an instance: what is wanted, and its keys
    std::map<std::string, core::InstanceValue> embedded = {};  ///< in an instance
    bool isAlive = true;

    template <class Handle>
    Handle* as() {
        return reinterpret_cast<Handle*>(this);
    }
};

/// One indication as the manager gets it.
struct Delivered {
    std::string nameSpace;
    core::InstanceValue indication;
    std::map<std::string, core::InstanceValue> embedded;
};

/// The manager's side of indications. Thread-safe.
class Deliveries {
  public:
    void add(Delivered delivered);
    std::vector<Delivered> waitFor(std::size_t count);
    std::vector<Delivered> all() { return waitFor(0); }
    /// Contexts of threads that are prepared, and not detached.
    int contexts();
    /// Contexts that have been prepared: for a thread, and for each indication.
    std::size_t attempts();

    /// Runs within each delivery, on the thread that makes it; set before there is any.
    std::function<cmpi::ReturnCode()> whileDelivering = [] { return cmpi::ReturnCode::Ok; };

    std::mutex mutex;
    std::condition_variable changed;
    std::vector<Delivered> delivered = {};
    std::deque<std::unique_ptr<Node>> prepared = {};  ///< a dead one has been attached, and detached
};

/// The tables of one dialect; public, so that a test can take a slot away.
struct TestBroker {
    explicit TestBroker(Dialect dialect);
    bool isSfcb;
    TestBroker(const TestBroker&) = delete;
    std::string parameters = {};  ///< of the registration
    Deliveries deliveries = {};
    cmpi::Broker broker{};
    cmpi::BrokerTable table{};
    cmpi::BrokerEncTable factories{};
    cmpi::BrokerMemTable memory{};
    cmpi::ContextTable contexts{};
    cmpi::ResultTable results{};
    cmpi::StringTable strings{};
    cmpi::ArrayTable arrays{};
    cmpi::InstanceTable instances{};
    cmpi::ObjectPathTable paths{};
    cmpi::ArgsTable args{};
    cmpi::DateTimeTable dateTimes{};
    cmpi::ErrorTable errors{};
};

/// What came back.
struct Answers {
    std::vector<core::InstanceValue> instances = {};
    std::vector<core::CimPath> paths = {};
    core::MethodResult called = {};
    int done = 0;
    std::string error = {};  ///< the CIM_Error: owner, id, severity, cause, code, message, type
};

/// A request of a client, by the name of its operation.
struct Request {
    std::string op = {};
    core::CimPath path = {};
    core::AssociationFilter by = {};
    core::PropertyFilter filter = {};
    std::string method = {};
    std::vector<core::Argument> arguments = {};
};

/// One call of an MI function, on the thread that makes it. What was made for it dies with it.
struct Call {
    explicit Call(const TestBroker& manager, Request asked = {}, std::string from = "root/cimv2");
    Call(const Call&) = delete;
    ~Call();
    Node& make(const void* table, const std::string& text = {});
    Node& makePath(const core::CimPath& path);
    Node& makeEntries(const void* table, const std::vector<core::Argument>& entries);
    /// Checks the end of the call, and throws its failure as CimError.
    Answers finish(cmpi::Status status);

    const TestBroker& broker;
    const Request request;
    const std::string nameSpace;
    std::deque<std::unique_ptr<Node>> nodes = {};
    // What the function is given; a test may change it.
    Node& context;
    Node& result;
    Node& path;
    Node& in;
    Node& out;
    Answers answers = {};
    const cmpi::Context* attachedAs = nullptr;  ///< of a thread of the front's own
    std::size_t firstOwn = 0;                   ///< the nodes from here on were made by that thread
};

}  // namespace test
