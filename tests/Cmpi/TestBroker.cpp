// SPDX-License-Identifier: Apache-2.0
#include "Cmpi/TestBroker.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <sstream>

namespace test {

namespace {

using cmpi::ReturnCode;
using cmpi::Status;
using cmpi::Type;
using cmpi::Value;
using core::CimScalar;
using core::CimType;
using core::CimValue;

constexpr auto kDone = [](auto...) { return Status{ReturnCode::Ok, nullptr}; };
thread_local Call* currentCall = nullptr;

[[noreturn]] void die(const char* rule) {
    std::fprintf(stderr, "broken rule: %s\n", rule);
    std::abort();
}

Call& now() {
    if (currentCall == nullptr) die("called outside of a call, or on another thread");
    return *currentCall;
}

template <class Handle>
Node& at(const Handle* handle) {
    auto& node = *static_cast<Node*>(handle->hdl);
    if (!node.isAlive || node.ft != handle->ft) die("used after the call, or as something else");
    return node;
}

// By CimType: the code, and the bytes of a number.
constexpr Type kCodes[] = {0x02, 0x1600, 0x03, 0x80, 0x90, 0xa0,   0xb0,  0xc0,
                           0xd0, 0xe0,   0xf0, 0x08, 0x0c, 0x1800, 0x1100};
constexpr std::size_t kBytes[] = {1, 0, 2, 1, 2, 4, 8, 1, 2, 4, 8, 4, 8, 0, 0};
/// By what a key holds, which is all that is known of its type.
constexpr CimType kKinds[] = {CimType::Boolean, CimType::Uint64,   CimType::Sint64,   CimType::Real64,
                              CimType::String,  CimType::Datetime, CimType::Reference};

core::CimPath pathOf(const Node& node, const std::vector<Entry>& entries) {
    std::vector<core::CimKey> keys;
    for (const Entry& key : entries)
        keys.push_back({key.name, *key.value.scalar()});
    core::CimPath path(node.className, std::move(keys));
    path.setNamespace(node.text);
    return path;
}

CimScalar scalarOf(CimType type, const Value& value) {
    const std::size_t bytes = kBytes[static_cast<int>(type)];
    const auto unused = static_cast<int>(64 - 8 * bytes);
    std::uint64_t bits = 0;
    std::memcpy(&bits, &value, bytes);
    if (core::isUnsigned(type)) return bits;
    if (core::isSigned(type)) return static_cast<std::int64_t>(bits << unused) >> unused;
    if (core::isReal(type)) return type == CimType::Real32 ? double{value.real32} : value.real64;
    if (type == CimType::Boolean) return bits != 0;
    if (type == CimType::Char16) {
        const std::u16string unit(1, static_cast<char16_t>(bits));
        return std::filesystem::path(unit).string();  // as UTF-8
    }
    if (type == CimType::Reference) return pathOf(at(value.ref), at(value.ref).entries);
    if (type == CimType::Datetime) return *core::parseDatetime(at(value.dateTime).text);
    return at(value.string).text;
}

/// What a setter was given.
CimValue valueOf(const Value* value, Type type) {
    const bool isArray = (type & cmpi::kArray) != 0;
    if (type == cmpi::kChars) return CimValue::of(CimType::String, reinterpret_cast<const char*>(value));
    const auto* known = std::ranges::find(kCodes, type & ~cmpi::kArray);
    if (known == std::end(kCodes)) die("an unknown type");
    const auto kind = static_cast<CimType>(known - kCodes);
    if (value == nullptr) return CimValue::null(kind, isArray);
    if (!isArray) return CimValue::of(kind, scalarOf(kind, *value));
    std::vector<CimScalar> elements;
    for (const Entry& element : at(value->array).entries)
        elements.push_back(*element.value.scalar());
    return CimValue::arrayOf(kind, std::move(elements));
}

template <class Object>
Object* make(const void* table, const std::string& text = {}) {
    return now().make(table, text).as<Object>();
}

cmpi::String* newString(const std::string& text) {
    return make<cmpi::String>(&now().broker.strings, text);
}

Value valueOf(CimType type, const CimScalar& scalar) {
    const TestBroker& broker = now().broker;
    if (const auto* text = std::get_if<std::string>(&scalar)) return {.string = newString(*text)};
    if (const auto* path = std::get_if<core::CimPath>(&scalar))
        return {.ref = now().makePath(*path).as<cmpi::ObjectPath>()};
    if (const auto* time = std::get_if<utils::Time>(&scalar))
        return {.dateTime = make<cmpi::DateTime>(&broker.dateTimes, core::datetimeText(*time))};
    Value value{};  // numbers begin with their lowest byte
    std::visit([&](const auto& n) { std::memcpy(&value, &n, kBytes[static_cast<int>(type)]); }, scalar);
    return value;
}

/// What a getter gives.
cmpi::Data dataOf(const Entry& entry) {
    const auto& [name, value, state, type] = entry;
    if (value.scalar() != nullptr) return {type, state, valueOf(value.type, *value.scalar())};
    if (value.elements() == nullptr) return {type, state, {}};
    Node& list = now().make(&now().broker.arrays);
    for (const CimScalar& each : *value.elements())
        list.entries.emplace_back("", CimValue::of(value.type, each));
    return {type, state, {.array = list.as<cmpi::Array>()}};
}

/// How a dialect says that something is not there.
cmpi::Data absent(Status* status) {
    const bool isSfcb = now().broker.isSfcb;
    if (status != nullptr) status->rc = isSfcb ? ReturnCode::NotFound : ReturnCode::NoSuchProperty;
    return {cmpi::kNull, static_cast<cmpi::State>(isSfcb ? 0x0400 : 0x0500), {}};
}

constexpr auto kGet = [](auto* object, const char* name, Status* status) {
    const Entry* found = core::findByName(at(object).entries, name);
    return found == nullptr ? absent(status) : dataOf(*found);
};
constexpr auto kGetAt = [](auto* object, cmpi::Count index, cmpi::String** name, Status* status) {
    const std::vector<Entry>& entries = at(object).entries;
    if (index >= entries.size()) return absent(status);
    if (name != nullptr) *name = newString(entries[index].name);
    return dataOf(entries[index]);
};
constexpr auto kCount = [](auto* object, Status*) { return cmpi::Count(at(object).entries.size()); };
constexpr auto kSet = [](auto* object, const char* name, const Value* value, Type type) {
    Node& node = at(object);
    std::erase_if(node.entries, [&](const Entry& entry) { return core::sameName(entry.name, name); });
    node.entries.emplace_back(name, valueOf(value, type));
    return kDone();
};

/// The front keeps nothing beyond a call, so it has nothing to clone, and nothing to release.
template <class Table, class Object>
void forbidClones(Table& table, Status (*Table::*release)(Object*)) {
    table.*release = [](Object*) -> Status { die("released what is the manager's"); };
    table.clone = [](const Object*, Status*) -> Object* { die("cloned"); };
}

/// Older object managers give the keys, too.
core::PropertyFilter filterOf(const Node& instance) {
    const auto& [properties, keys] = instance.filter;
    if (properties == nullptr) return std::nullopt;
    std::vector<std::string> filter;
    for (const char** names : {properties, now().broker.isSfcb ? keys : nullptr}) {
        for (; names != nullptr && *names != nullptr; ++names)
            filter.emplace_back(*names);
    }
    return filter;
}

core::InstanceValue instanceOf(const Node& instance) {
    core::InstanceValue value{pathOf(instance, instance.keys), {}};
    const core::PropertyFilter filter = filterOf(instance);
    const core::WantedProperties wanted(filter);
    for (const Entry& property : instance.entries) {
        if (wanted.includes(property.name))
            value.properties.push_back({property.name, property.value, false, {}});
    }
    return value;
}

void giveNumber(const CimValue& value) {
    const auto number = static_cast<std::uint32_t>(*value.get<std::uint64_t>());
    now().answers.called = {number, {}, value.type};
}

// Threads of the front's own. What they make is theirs until they detach.

thread_local std::unique_ptr<Call> attachedCall;

Deliveries& deliveriesOf(const cmpi::Broker* broker) {
    return static_cast<TestBroker*>(broker->hdl)->deliveries;
}

cmpi::Context* prepareThread(const cmpi::Broker* broker, const cmpi::Context* from) {
    at(from);
    Deliveries& deliveries = deliveriesOf(broker);
    const std::lock_guard lock(deliveries.mutex);
    Node& node = *deliveries.prepared.emplace_back(std::make_unique<Node>(Node{nullptr, from->ft, ""}));
    node.hdl = &node;
    return node.as<cmpi::Context>();
}

Status attachThread(const cmpi::Broker* broker, const cmpi::Context* context) {
    at(context);
    attachedCall = std::make_unique<Call>(*static_cast<TestBroker*>(broker->hdl));
    attachedCall->attachedAs = context;
    attachedCall->firstOwn = attachedCall->nodes.size();
    return kDone();
}

Status detachThread(const cmpi::Broker* broker, const cmpi::Context* context) {
    if (attachedCall == nullptr || attachedCall->attachedAs != context) die("detached as somebody else");
    // An enumeration among what is left would be freed twice.
    const cmpi::BrokerMemTable* memory = broker->mft;
    const bool hasMarks = memory != nullptr && memory->mark != nullptr && memory->release != nullptr;
    if (hasMarks && now().nodes.size() != now().firstOwn) die("a thread without a mark");
    const std::lock_guard lock(deliveriesOf(broker).mutex);
    at(context).isAlive = false;
    attachedCall.reset();
    return kDone();
}

Status deliverIndication(const cmpi::Broker* broker, const cmpi::Context* context, const char* nameSpace,
                         const cmpi::Instance* indication) {
    if (now().attachedAs != context) die("a context that is not the thread's");
    const ReturnCode code = deliveriesOf(broker).whileDelivering();
    if (code == ReturnCode::Ok)
        deliveriesOf(broker).add({nameSpace, instanceOf(at(indication)), at(indication).embedded});
    return {code, nullptr};
}

/// Looked at when the instance is given, as managers may.
void setFilter(Node& instance, const char** properties, const char** keys) {
    if (!instance.entries.empty()) die("a filter after a property");
    instance.filter = {properties, keys};
}

}  // namespace

Entry::Entry(std::string itsName, const CimValue& itsValue, cmpi::State itsState)
    : name(std::move(itsName)),
      value(itsValue),
      state(value.isNull() ? cmpi::kNullValue : itsState),
      type(static_cast<Type>(kCodes[static_cast<int>(value.type)] | (value.isArray ? cmpi::kArray : 0))) {}

Call::Call(const TestBroker& manager, Request asked, std::string from)
    : broker(manager),
      request(std::move(asked)),
      nameSpace(std::move(from)),
      context(makeEntries(&broker.contexts,
                          {{"CMPIPrincipal", CimValue::of(CimType::String, "root")},
                           {"sfcbProviderParameters", CimValue::of(CimType::String, broker.parameters)}})),
      result(make(&broker.results)),
      path(makePath(request.path)),
      in(makeEntries(&broker.args, request.arguments)),
      out(make(&broker.args)) {
    if (currentCall != nullptr) die("a call within a call");
    currentCall = this;
}

Call::~Call() {
    // Freed after the next call of the thread: what is used in between is seen to be dead.
    thread_local std::deque<std::unique_ptr<Node>> dead;
    for (const auto& node : nodes)
        node->isAlive = false;
    dead = std::move(nodes);
    currentCall = nullptr;
}

Node& Call::make(const void* table, const std::string& text) {
    Node& node = *nodes.emplace_back(std::make_unique<Node>(Node{nullptr, table, text}));
    node.hdl = &node;
    return node;
}

Node& Call::makePath(const core::CimPath& named) {
    Node& node = make(&broker.paths, named.getNamespace().empty() ? nameSpace : named.getNamespace());
    node.className = named.getClassName();
    const cmpi::State state = broker.isSfcb ? 0 : cmpi::kKeyValue;
    for (const core::CimKey& key : named.getKeys())
        node.entries.emplace_back(key.name, CimValue::of(kKinds[key.value.index()], key.value), state);
    return node;
}

Node& Call::makeEntries(const void* table, const std::vector<core::Argument>& entries) {
    Node& node = make(table);
    for (const core::Argument& each : entries)
        node.entries.emplace_back(each.name, each.value);
    return node;
}

Answers Call::finish(Status status) {
    const bool isDone = status.rc == ReturnCode::Ok;
    if (answers.done != (isDone ? 1 : 0)) die("returnDone once, after a success");
    for (const Entry& output : out.entries)
        answers.called.outputs.push_back({output.name, output.value});
    if (isDone) return std::move(answers);
    const std::string text = status.msg == nullptr ? "" : at(status.msg).text;
    const std::string code = std::to_string(static_cast<int>(status.rc));
    // A failure of the provider is of high severity, and an error of the software.
    const char* const grade = status.rc == ReturnCode::Failed ? " 4 46 " : " 2 0 ";
    if (answers.error != (broker.isSfcb ? "" : "Quenx QUENX" + code + grade + code + ' ' + text + " 4"))
        die("a CIM_Error where there are such");
    throw core::CimError(static_cast<core::CimStatus>(status.rc), text);
}

// What is not set here is null: a call of it ends the program.
TestBroker::TestBroker(Dialect dialect) : isSfcb(dialect == Dialect::Sfcb) {
    broker = {this, &table, &factories, nullptr, isSfcb ? &memory : nullptr};
    table.brokerVersion = isSfcb ? 0 : cmpi::kLevel;
    table.brokerName = isSfcb ? "RequestHandler" : "Pegasus";
    table.prepareAttachThread = prepareThread;
    table.attachThread = attachThread;
    table.detachThread = detachThread;
    table.deliverIndication = deliverIndication;
    factories.ftVersion = isSfcb ? 1 : cmpi::kLevel;
    results.ftVersion = cmpi::kLevel;
    const auto all = [](auto&... tables) {
        (forbidClones(tables, &std::remove_reference_t<decltype(tables)>::release), ...);
    };
    all(contexts, results, strings, arrays, instances, paths, args, dateTimes, errors);

    factories.newInstance = [](auto, auto* path, auto) {
        Node& instance = now().make(&now().broker.instances, at(path).text);
        instance.className = at(path).className;
        instance.keys = at(path).entries;
        return instance.as<cmpi::Instance>();
    };
    factories.newObjectPath = [](auto, auto* nameSpace, auto* className, auto) {
        Node& path = now().makePath(core::CimPath(className, {}));
        path.text = nameSpace;
        return path.as<cmpi::ObjectPath>();
    };
    factories.newString = [](auto, auto* text, auto) { return newString(text); };
    factories.newArray = [](auto, auto size, auto type, auto) {
        Node& list = now().make(&now().broker.arrays);
        list.entries.assign(size, Entry("", valueOf(nullptr, type)));
        return list.as<cmpi::Array>();
    };
    factories.newDateTimeFromChars = [](auto, auto* text, auto) {
        return make<cmpi::DateTime>(&now().broker.dateTimes, text);
    };
    memory.mark = [](auto, auto) { return reinterpret_cast<void*>(now().nodes.size()); };
    memory.release = [](auto, auto* mark) {
        return now().nodes.resize(reinterpret_cast<std::size_t>(mark)), kDone();
    };
    contexts.getEntry = kGet;
    results.returnData = [](auto, auto* value, auto type) {
        return giveNumber(valueOf(value, type)), kDone();
    };
    results.returnInstance = [](auto, auto* instance) {
        return now().answers.instances.push_back(instanceOf(at(instance))), kDone();
    };
    results.returnObjectPath = [](auto, auto* path) {
        return now().answers.paths.push_back(pathOf(at(path), at(path).entries)), kDone();
    };
    results.returnDone = [](auto) { return ++now().answers.done, kDone(); };
    strings.getCharPtr = [](auto* text, auto) { return at(text).text.c_str(); };
    arrays.getSize = kCount;
    arrays.getElementAt = [](auto* array, auto index, auto* rc) { return kGetAt(array, index, nullptr, rc); };
    arrays.setElementAt = [](auto* array, auto index, auto* value, auto type) {
        return at(array).entries.at(index) = Entry("", valueOf(value, type)), kDone();
    };
    instances.setProperty = [](auto* instance, auto* name, auto* value, auto type) {
        if (type != cmpi::kInstance) return kSet(instance, name, value, type);
        return at(instance).embedded[name] = instanceOf(at(value->inst)), kDone();
    };
    instances.setPropertyFilter = [](auto* instance, auto properties, auto keys) {
        return setFilter(at(instance), properties, keys), kDone();
    };
    paths.getNameSpace = [](auto* path, auto) { return newString(at(path).text); };
    paths.getClassName = [](auto* path, auto) { return newString(at(path).className); };
    paths.addKey = kSet;
    paths.getKeyAt = kGetAt;
    paths.getKeyCount = kCount;
    args.addArg = kSet;
    args.getArg = kGet;
    args.getArgAt = kGetAt;
    args.getArgCount = kCount;
    dateTimes.getBinaryFormat = [](auto* time, auto) {
        return core::parseDatetime(at(time).text)->getMiliseconds() * 1000ULL;
    };
    dateTimes.isInterval = [](auto* time, auto) -> cmpi::Boolean { return at(time).text[21] == ':'; };
    if (isSfcb) return;
    factories.newCMPIError = [](auto, auto* owner, auto* id, auto* text, int severity, int cause, auto code,
                                auto) {
        std::ostringstream whole;
        whole << owner << ' ' << id << ' ' << severity << ' ' << cause << ' ' << static_cast<int>(code) << ' '
              << text;
        return make<cmpi::Error>(&now().broker.errors, whole.str());
    };
    results.returnError = [](auto, auto* error) { return now().answers.error = at(error).text, kDone(); };
    errors.setErrorType = [](auto* error, int type) {
        at(error).text += ' ' + std::to_string(type);
        return kDone();
    };
}

}  // namespace test
