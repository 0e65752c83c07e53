// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/UpdateTest.h"

#include "Framework/Classes/InstanceList.h"
#include "Support/TestRoms.h"

namespace test {

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

void UpdateTest::expectUpdateWorks() const {
    const CallResult result = install(goodImage(), "eth0");
    ASSERT_EQ(result.returnValue, 4096U) << result.error;
    EXPECT_EQ(state(waitForEnd(*result.job)), JobStateCompleted);
    EXPECT_EQ(claim(), "");
}

void UpdateTest::deleteJobs() const {
    for (const core::CimPath& job : m_requests.enumerateInstanceNames("Quenx_ConcreteJob")) {
        EXPECT_TRUE(hasEnded(waitForEnd(job)));
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
