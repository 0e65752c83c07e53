// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/UpdateTest.h"

#include "Framework/Classes/InstanceList.h"
#include "Support/TestRoms.h"

namespace test {

using core::Argument;
using core::CimType;
using core::CimValue;

namespace {

CimValue valueOf(CimType type, bool isArray, const std::string& text) {
    if (text == "null") return CimValue::null(type, isArray);
    if (type == CimType::Reference) return CimValue::of(type, core::CimPath(text));
    if (!isArray) return CimValue::of(type, text);
    std::vector<core::CimScalar> elements;
    for (const std::string& element : utils::split(text, ','))
        if (!text.empty()) elements.push_back(core::parseScalar(type, element).value());
    return CimValue::arrayOf(type, std::move(elements));
}

}  // namespace

UpdateTest::UpdateTest()
    : m_config(m_folder.write("quenx.conf", "FWFilePath=" + m_folder.path() + "\n")),
      m_locker(std::in_place),
      m_backend(std::make_shared<HookedBackend>(ma::setBackend(nullptr))),
      m_inventory(QUENX_INVENTORY_LIBRARY) {
    ma::setBackend(m_backend);
    m_agent = std::make_unique<core::SoftwareUpdateAgent>();
    setClaim("");
}

UpdateTest::~UpdateTest() {
    m_agent.reset();
}

core::CimPath UpdateTest::pathNamed(const std::string& className, const std::string& name) const {
    for (const core::InstanceValue& instance : m_requests.enumerateInstances(className)) {
        if (instance.text("Name") == name) return instance.path;
    }
    ADD_FAILURE() << "no " << className << " is named " << name;
    return {};
}

std::vector<Argument> UpdateTest::argumentsOf(const std::string& text) {
    std::vector<Argument> arguments;
    for (std::size_t begin = 0, end = 0; end != std::string::npos; begin = end + 2) {
        end = text.find("; ", begin);
        const std::string one = text.substr(begin, end - begin);
        const std::string name = one.substr(0, one.find('='));
        const bool isArray = name.starts_with("Install");
        const bool isText = name == "URI" || name == "InstallOptionsValues";
        const CimType type = isText ? CimType::String : isArray ? CimType::Uint16 : CimType::Reference;
        arguments.push_back({name, valueOf(type, isArray, one.substr(name.size() + 1))});
    }
    return arguments;
}

CallResult UpdateTest::call(const std::string& method, const std::string& arguments) const {
    CallResult result;
    const core::NotedCall noted;
    try {
        const core::MethodResult answer = m_requests.invokeMethod(service(), method, argumentsOf(arguments));
        result.returnValue = answer.returnValue;
        for (const Argument& output : answer.outputs) {
            if (output.name == "Job") result.job = std::get<core::CimPath>(*output.value.scalar());
            if (output.name == "InstallCharacteristics")
                result.characteristics = core::valueText(output.value);
        }
    } catch (const core::CimError& error) {
        result.error = error.what();
    }
    result.reason = noted.notes().reason;
    return result;
}

CallResult UpdateTest::install(const std::string& uri, const core::CimPath& target,
                               const std::string& options, const std::string& values) const {
    return call("InstallFromURI", "URI=" + uri + "; Target=" + target.toString() +
                                      "; InstallOptions=" + options + "; InstallOptionsValues=" + values);
}

core::InstanceValue UpdateTest::waitForEnd(const core::CimPath& job) const {
    while (true) {
        core::InstanceValue value = m_requests.getInstance(job);
        if (state(value) == JobStateCompleted || state(value) == JobStateException) return value;
        utils::Thread::msleep(2);
    }
}

std::string UpdateTest::text(const core::InstanceValue& instance, const char* property) {
    const core::PropertyValue* found = instance.find(property);
    return found == nullptr ? "" : core::valueText(found->value);
}

std::string UpdateTest::row(const core::InstanceValue& instance, const std::vector<const char*>& properties) {
    std::string texts;
    for (const char* property : properties)
        texts += (property == properties.front() ? "" : "; ") + text(instance, property);
    return texts;
}

std::vector<std::string> UpdateTest::table(const std::string& className,
                                           const std::vector<const char*>& properties) const {
    std::vector<std::string> rows;
    for (const core::InstanceValue& instance : m_requests.enumerateInstances(className))
        rows.push_back(row(instance, properties));
    return rows;
}

void UpdateTest::expectUpdateWorks() const {
    const CallResult result = install(goodImage(), "eth0");
    ASSERT_EQ(result.returnValue, 4096U) << result.error;
    EXPECT_EQ(state(waitForEnd(*result.job)), JobStateCompleted);
    EXPECT_EQ(claim(), "");
}

void UpdateTest::deleteJobs() const {
    for (const core::CimPath& job : m_requests.enumerateInstanceNames("Quenx_ConcreteJob")) {
        waitForEnd(job);
        m_requests.deleteInstance(job);
    }
    // Deleted while they ran: they end all the same.
    core::drainReaper([] {});
}

std::string UpdateTest::file(const std::string& name, const std::vector<std::uint8_t>& content) const {
    return "file://" + m_folder.write(name, std::span(content));
}

std::string UpdateTest::goodImage() const {
    return file("good.rom", madeRom({{utils::FirmwareType::PXE, 2}, {utils::FirmwareType::UEFI, 1}}));
}

}  // namespace test
