#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>

#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Support/ChildProcess.h"
#include "Support/TestRoms.h"

namespace {

using test::CallResult;
using test::madeRom;
using utils::FirmwareType;

class InstallFromUriTest : public test::UpdateTest {};

TEST_F(InstallFromUriTest, FlashesARealImageFromEndToEnd) {
    const std::string uri = "file://" + test::realRomPath("efi-virtio");
    const CallResult result = install(uri, "eth0", {5, 32768}, {"", "IMG_UEFI + IMG_PXE"});
    ASSERT_EQ(result.returnValue, 4096U) << result.error;
    ASSERT_TRUE(result.job);
    EXPECT_EQ(result.job->toString(),
              "root/cimv2:Quenx_ConcreteJob.InstanceID=\"Quenx:FirmwareUpdate@Job#1\"");

    const core::InstanceValue job = waitForEnd(*result.job);
    EXPECT_EQ(state(job), JobStateCompleted);
    EXPECT_EQ(number(job, "PercentComplete"), 100U);
    EXPECT_EQ(number(job, "ErrorCode"), 0U);
    EXPECT_EQ(text(job, "ErrorDescription"), "");
    EXPECT_EQ(text(job, "Caption"), "Firmware Update Job 1");
    EXPECT_EQ(text(job, "Name"), "Firmware Update Job 1");
    EXPECT_EQ(text(job, "TimeBeforeRemoval"), "00000000000500.000000:000");
    EXPECT_EQ(text(job, "StartTime").substr(21), "+000");
    EXPECT_TRUE(job.find("Owner")->value.isNull());
    EXPECT_EQ(claim(), "");
    EXPECT_EQ(m_adapters->flashContent("eth0"), test::realRom("efi-virtio"));
    EXPECT_EQ(m_adapters->getFlashImageUpdateProgress("eth0"), 100);

    m_requests.deleteInstance(*result.job);
    EXPECT_TRUE(m_requests.enumerateInstances("Quenx_ConcreteJob").empty());
    EXPECT_THROW(m_requests.deleteInstance(*result.job), core::CimError);
    EXPECT_TRUE(
        test::SyslogCapture::contains("Quenx_ConcreteJobe_Provider.DeleteInstance: instance not found '" +
                                      result.job->toString() + "' (%s)"));
    const CallResult next = install(goodImage(), "eth0");
    EXPECT_EQ(waitForEnd(*next.job).path.toString(),
              "root/cimv2:Quenx_ConcreteJob.InstanceID=\"Quenx:FirmwareUpdate@Job#2\"");
}

TEST_F(InstallFromUriTest, MissingAndNullArgumentsAreErrors) {
    const std::vector<core::Argument> all = {
        test::textArgument("URI", "file:///x"), test::pathArgument("Target", port("eth0")),
        test::codesArgument("InstallOptions", {5}), test::textsArgument("InstallOptionsValues", {})};
    for (std::size_t i = 0; i < 3; ++i) {
        auto without = all;
        without.erase(without.begin() + static_cast<std::ptrdiff_t>(i));
        EXPECT_EQ(call("InstallFromURI", without).error,
                  "SMASHv2:EUnspecifiedError:Expected " + all[i].name + " argument");
        auto null = all;
        null[i].value.data = std::monostate();
        EXPECT_EQ(call("InstallFromURI", null).error,
                  "SMASHv2:EUnspecifiedError:" + all[i].name + " argument is set to NULL. It is not allowed");
        EXPECT_TRUE(
            test::SyslogCapture::contains("\"EUnspecifiedError:" + all[i].name + " argument is set to NULL"));
    }
    // The values may be null, or left out.
    auto null = all;
    null[3].value.data = std::monostate();
    null[0] = test::textArgument("URI", goodImage());
    const CallResult started = call("InstallFromURI", null);
    EXPECT_EQ(started.returnValue, 4096U);
    waitForEnd(*started.job);
    null.pop_back();
    const CallResult again = call("InstallFromURI", null);
    EXPECT_EQ(again.returnValue, 4096U);
    waitForEnd(*again.job);
}

TEST_F(InstallFromUriTest, OptionsAreRefusedWithoutALine) {
    for (const std::vector<unsigned short>& options : std::vector<std::vector<unsigned short>>{{},
                                                                                               {3},
                                                                                               {32768},
                                                                                               {5, 2},
                                                                                               {4, 5},
                                                                                               {5, 6},
                                                                                               {5, 7},
                                                                                               {5, 8},
                                                                                               {5, 9},
                                                                                               {5, 10},
                                                                                               {5, 11},
                                                                                               {5, 3, 12}}) {
        test::SyslogCapture::clear();
        EXPECT_EQ(install("file:///nowhere", "eth0", options).returnValue, 5U);
        EXPECT_FALSE(logged("Here"));
        EXPECT_FALSE(test::SyslogCapture::contains("Firmware Update"));
    }
    // Codes that nothing here knows pass through.
    const CallResult result = install(goodImage(), "eth0", {5, 0, 1, 13, 65535});
    EXPECT_EQ(result.returnValue, 4096U);
    waitForEnd(*result.job);
}

TEST_F(InstallFromUriTest, EveryRefusalHasItsValueAndItsLine) {
    const std::string rom =
        m_folder.write("rom", std::span<const uint8_t>(madeRom({{FirmwareType::PXE, 1}})));
    const std::string fifo = m_folder / "fifo";
    ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
    const std::string huge = m_folder.write("huge", std::string_view("x"));
    std::filesystem::resize_file(huge, 1ULL << 31);
    auto cut = madeRom({{FirmwareType::PXE, 2}, {FirmwareType::UEFI, 1}});
    cut.resize(1500);
    const auto roms = [&](const char* name, const std::vector<uint8_t>& content) {
        return file(name, content);
    };

    struct Row {
        std::string uri;
        unsigned returnValue;
        std::string line;
        std::string values = "";
    };
    for (const Row& row : std::vector<Row>{
             {"/no/scheme", 5, "Invalid URI for '%'"},
             {"file:/one/slash", 5, "Invalid URI for '%'"},
             {"https://host/image", 5, "Invalid URI for '%'"},
             {"file://" + m_folder.path(), 5, "URI does not exists for '%'"},
             {"file:///missing", 5, "URI does not exists for '%'"},
             {"file://" + fifo, 5, "URI does not exists for '%'"},
             {"file:///dev/zero", 5, "URI does not exists for '%'"},
             {"file://" + huge, 5, "URI does not exists for '%'"},
             {roms("empty", {}), 5, "Job creation returned Invalid Parameter for '%'"},
             {roms("cut", cut), 5, "Job creation returned Invalid Parameter for '%'"},
             {"file://" + test::realRomPath("efi-rtl8139"), 4097,
              "Target is not supported by service for '%'"},
             {"file://" + test::realRomPath("efi-ne2k_pci"), 4097,
              "Target is not supported by service for '%'"},
             {roms("older", madeRom({{FirmwareType::PXE, 0}, {FirmwareType::UEFI, 0}})), 4099,
              "Downgrade is not supported by service for '%'. Execute with FORCE INSTALL flag."},
             {goodImage(), 5, "Job creation returned Invalid Parameter for '%'", "img_pxe"},
             {goodImage(), 5, "Job creation returned Invalid Parameter for '%'", "IMG_PXE+IMG_NO"},
             {goodImage(), 4106, "Not applicable for target for '%' ", "IMG_FCoE"},
         }) {
        test::SyslogCapture::clear();
        const CallResult result = row.values.empty() ? install(row.uri, "eth0")
                                                     : install(row.uri, "eth0", {32768, 5}, {row.values});
        EXPECT_EQ(result.error, "");
        EXPECT_EQ(result.returnValue, row.returnValue) << row.uri << row.values;
        EXPECT_FALSE(result.job);
        std::string line = row.line;
        line.replace(line.find('%'), 1, port("eth0").toString());
        EXPECT_TRUE(logged(line)) << row.uri << ": " << line;
        EXPECT_EQ(claim(), "") << row.uri;
    }
    EXPECT_TRUE(m_requests.enumerateInstances("Quenx_ConcreteJob").empty());
    expectUpdateWorks();
}

TEST_F(InstallFromUriTest, TargetsAreResolved) {
    const auto to = [&](const core::CimPath& target) {
        return call(
            "InstallFromURI",
            {test::textArgument("URI", goodImage()), test::pathArgument("Target", target),
             test::codesArgument("InstallOptions", {5}), test::textsArgument("InstallOptionsValues", {})});
    };
    const auto path = [](const char* text) { return core::CimPath(std::string(text)); };
    const core::CimPath nowhere = path("Quenx_EthernetPort.DeviceID=\"a \\\"quoted\\\\ one\"");
    EXPECT_EQ(to(nowhere).returnValue, 5U);
    EXPECT_TRUE(logged("Firmware Update cannot find instance '" + nowhere.toString() + "'"));
    EXPECT_EQ(to(path("no path at all")).returnValue, 5U);
    EXPECT_TRUE(logged("Firmware Update cannot find instance 'no path at all'"));
    EXPECT_EQ(to(service()).returnValue, 4106U);
    EXPECT_TRUE(logged("Firmware Update does not support target '" + service().toString() + "'"));

    const auto controllers = m_requests.enumerateInstanceNames("Quenx_PortController");
    ASSERT_FALSE(controllers.empty());
    const CallResult result = to(controllers.front());
    ASSERT_EQ(result.returnValue, 4096U);
    EXPECT_EQ(state(waitForEnd(*result.job)), JobStateCompleted);
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 2, IMG_UEFI 1");
    EXPECT_EQ(test::componentsOf("eth1"), "IMG_PXE 1, IMG_UEFI 0");

    // A controller whose ports have all gone stands for nothing.
    m_backend->hook = [](const std::string& operation, const std::string&) {
        if (operation == "enumerateAdapters") throw std::runtime_error("no adapters");
    };
    EXPECT_EQ(to(controllers.front()).returnValue, 5U);  // a look-up that throws finds nothing
}

TEST_F(InstallFromUriTest, AFileThatShrinksOrCannotBeOpenedIsRefused) {
    const std::string uri = goodImage();
    const std::string path = uri.substr(7);
    std::filesystem::permissions(path, std::filesystem::perms::none);
    EXPECT_EQ(test::runAsNobody([&] {
                  std::vector<unsigned short> options = {5};
                  std::vector<std::string> values;
                  std::unique_ptr<std::uint8_t[]> image;
                  std::uint32_t size = 0;
                  std::vector<FirmwareType> types;
                  std::string text = uri;
                  try {
                      Quenx_ConcreteJob::checkAndVerifyImage("eth0", text, options, values, image, size,
                                                             types);
                  } catch (const utils::Exception& exception) {
                      const std::string expected = "SMASHv2:EUriDoesNotExist:URI: " + uri + " is invalid";
                      return exception.what() == expected && claim().empty() ? std::string()
                                                                             : std::string(exception.what());
                  }
                  return std::string("accepted");
              }),
              "");
}

TEST_F(InstallFromUriTest, ASecondInstallIsRefusedWhileOneRuns) {
    m_backend->hook = [](const std::string& operation, const std::string&) {
        if (operation == "writeFlashImage") utils::Thread::msleep(300);
    };
    const CallResult first = install(goodImage(), "eth0");
    ASSERT_EQ(first.returnValue, 4096U);
    EXPECT_EQ(install(goodImage(), "eth0").returnValue, 6U);
    EXPECT_TRUE(logged("Target '" + port("eth0").toString() + "' is in update state at this moment"));
    EXPECT_EQ(install(goodImage(), "eth1").returnValue, 2U);
    EXPECT_TRUE(logged("Other job is in progress '" + port("eth1").toString() + "'"));
    EXPECT_TRUE(test::SyslogCapture::contains("EJobIsRunning:Other job for eth0 is running at this moment"));
    EXPECT_EQ(state(waitForEnd(*first.job)), JobStateCompleted);
    expectUpdateWorks();
}

}  // namespace
