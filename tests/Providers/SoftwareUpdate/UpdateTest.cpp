// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/UpdateTest.h"

#include <chrono>
#include <thread>

#include "Framework/Classes/InstanceList.h"
#include "Support/TestRoms.h"

namespace test {

using core::Argument;
using core::CimScalar;
using core::CimType;
using core::CimValue;

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

CallResult UpdateTest::call(const std::string& method, const std::vector<Argument>& arguments) const {
    CallResult result;
    try {
        const core::MethodResult answer = m_requests.invokeMethod(service(), method, arguments);
        result.returnValue = answer.returnValue;
        for (const Argument& output : answer.outputs) {
            if (output.name == "Job") result.job = std::get<core::CimPath>(*output.value.scalar());
            if (output.name == "InstallCharacteristics")
                result.characteristics = core::valueText(output.value);
        }
    } catch (const core::CimError& error) {
        result.error = error.what();
    }
    return result;
}

CallResult UpdateTest::install(const std::string& uri, const core::CimPath& target,
                               std::vector<std::uint16_t> options, std::vector<std::string> values) const {
    return call("InstallFromURI",
                {textArgument("URI", uri), pathArgument("Target", target),
                 codesArgument("InstallOptions", options), textsArgument("InstallOptionsValues", values)});
}

core::InstanceValue UpdateTest::waitForEnd(const core::CimPath& job) const {
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(60);
    while (true) {
        core::InstanceValue value = m_requests.getInstance(job);
        if (state(value) == JobStateCompleted || state(value) == JobStateException) return value;
        if (std::chrono::steady_clock::now() > deadline) {
            ADD_FAILURE() << job.toString() << " does not end; it is in state " << state(value);
            return value;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
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

Argument pathArgument(const char* name, const core::CimPath& path) {
    return {name, CimValue::of(CimType::Reference, CimScalar(path))};
}

Argument textArgument(const char* name, const std::string& text) {
    return {name, CimValue::of(CimType::String, CimScalar(text))};
}

Argument codesArgument(const char* name, const std::vector<std::uint16_t>& codes) {
    std::vector<CimScalar> values;
    for (const std::uint16_t code : codes)
        values.emplace_back(std::uint64_t{code});
    return {name, CimValue::arrayOf(CimType::Uint16, std::move(values))};
}

Argument textsArgument(const char* name, const std::vector<std::string>& texts) {
    return {name, CimValue::arrayOf(CimType::String, {texts.begin(), texts.end()})};
}

}  // namespace test
