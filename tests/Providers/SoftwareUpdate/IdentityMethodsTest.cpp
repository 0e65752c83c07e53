#include <gtest/gtest.h>

#include <algorithm>
#include <set>

#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Support/TestRoms.h"

namespace {

using core::Argument;
using core::CimPath;
using test::CallResult;
using test::madeRom;
using utils::FirmwareType;

/// The three methods on one inventory: the files of the test's folder are the identities.
class IdentityMethodsTest : public test::UpdateTest {
  protected:
    CimPath identityOf(const std::string& uri) const {
        for (const core::InstanceValue& resource :
             m_requests.enumerateInstances("Quenx_SoftwareIdentityResource")) {
            if (text(resource, "AccessInfo") != uri) continue;
            const std::string id = text(resource, "InstanceID");
            for (const CimPath& identity : m_requests.enumerateInstanceNames("Quenx_SoftwareIdentity")) {
                if (id.starts_with(std::get<std::string>(identity.getKeys().at(0).value) + "@"))
                    return identity;
            }
        }
        ADD_FAILURE() << "no identity for " << uri;
        return {};
    }

    /// An argument that is null where the path is none.
    static Argument optionalPath(const char* name, const CimPath& path) {
        if (path.isValid()) return test::pathArgument(name, path);
        return {name, core::CimValue::null(core::CimType::Reference)};
    }

    CallResult check(const CimPath& source, const CimPath& target, const CimPath& collection = {}) const {
        return call("CheckSoftwareIdentity", {optionalPath("Source", source), optionalPath("Target", target),
                                              optionalPath("Collection", collection)});
    }

    CallResult installIdentity(const CimPath& source, const CimPath& target,
                               const std::vector<unsigned short>& options = {5},
                               const CimPath& collection = {}) const {
        return call("InstallFromSoftwareIdentity",
                    {test::codesArgument("InstallOptions", options),
                     test::textsArgument("InstallOptionsValues", {}), optionalPath("Source", source),
                     optionalPath("Target", target), optionalPath("Collection", collection)});
    }

    static void freeClaim() { Quenx_ConcreteJob::m_servicedAdapter = std::string(); }
};

TEST_F(IdentityMethodsTest, ACheckSaysYesAndKeepsTheClaim) {
    const CimPath source = identityOf(goodImage());
    const CallResult result = check(source, port("eth0"));
    EXPECT_EQ(result.returnValue, 0U) << result.error;
    EXPECT_EQ(result.characteristics, std::vector<unsigned short>{7});
    EXPECT_FALSE(result.job);
    EXPECT_EQ(claim(), "eth0");
    EXPECT_TRUE(logged("TargetTypes are: IMG_PXE+IMG_UEFI"));
    EXPECT_TRUE(logged("URI is: " + goodImage()));
    EXPECT_TRUE(logged("Verification of image returns: 0"));
    EXPECT_TRUE(logged("Target:0, Source:0, Collection:1"));
    EXPECT_TRUE(
        test::SyslogCapture::contains("time(Quenx_SoftwareInstallationService::CheckSoftwareIdentity) = "));
    EXPECT_EQ(check(source, port("eth0")).returnValue, 6U);
    EXPECT_EQ(installIdentity(source, port("eth1")).returnValue, 2U);

    freeClaim();
    const CallResult started = installIdentity(source, port("eth0"));
    ASSERT_EQ(started.returnValue, 4096U) << started.error;
    EXPECT_EQ(state(waitForEnd(*started.job)), JobStateCompleted);
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 2, IMG_UEFI 1");
}

TEST_F(IdentityMethodsTest, ArgumentErrorsLeaveAsExceptions) {
    const CimPath source = identityOf(goodImage());
    const CimPath target = port("eth0");
    const std::string prefix = "SMASHv2:EUnspecifiedError:";
    const std::string null = " argument is set to NULL. It is not allowed";
    EXPECT_EQ(check(source, target, target).error, prefix + "Both Target and Collection are defined");
    EXPECT_EQ(installIdentity(source, target, {5}, target).error,
              prefix + "Target and Collection are defined");
    EXPECT_EQ(check(source, {}).error, prefix + "Neither Target nor Collection are defined");
    EXPECT_EQ(installIdentity(source, {}).error, prefix + "Neither Target nor Collection are defined");
    EXPECT_EQ(check({}, target).error, prefix + "Source" + null);
    EXPECT_EQ(installIdentity({}, target).error, prefix + "Source" + null);
    EXPECT_EQ(call("CheckSoftwareIdentity", {}).error, prefix + "Expected Source argument");
    EXPECT_EQ(call("InstallFromSoftwareIdentity", {}).error, prefix + "Expected InstallOptions argument");

    test::SyslogCapture::clear();
    EXPECT_EQ(check(source, {}, target).returnValue, 4108U);
    EXPECT_EQ(installIdentity(source, {}, {5}, target).returnValue, 4108U);
    EXPECT_FALSE(logged("Starting arguments verification success"));

    const CallResult given = call("CheckSoftwareIdentity",
                                  {test::pathArgument("Source", source), test::pathArgument("Target", target),
                                   test::codesArgument("InstallCharacteristics", {7})});
    EXPECT_EQ(given.returnValue, 5U);
    EXPECT_TRUE(
        logged("InstallCharacterisitcs argument is an output method's argument. Any input value is not "
               "supported."));
    EXPECT_EQ(claim(), "");
}

TEST_F(IdentityMethodsTest, SourcesAreResolvedWithTheWordsOfTheMethod) {
    const CimPath target = port("eth0");
    const CimPath missing(std::string("Quenx_SoftwareIdentity.InstanceID=\"Quenx:none\""));
    const CimPath good = identityOf(goodImage());
    const CimPath installed = [&] {
        for (const CimPath& path : m_requests.enumerateInstanceNames("Quenx_SoftwareIdentity")) {
            if (!path.names(good)) return path;
        }
        return CimPath();
    }();
    struct Row {
        CimPath source;
        CimPath target;
        unsigned returnValue;
        std::string line;
    };
    const CimPath nowhere(std::string("Quenx_EthernetPort.DeviceID=\"none\""));
    for (const Row& row : std::vector<Row>{
             {missing, target, 5, "Firmware Update cannot find instance '" + missing.toString() + "'"},
             {target, target, 5, "Firmware Update does not support source '" + target.toString() + "'"},
             {installed, target, 5,
              "Firmware Update does not support source '" + installed.toString() +
                  "'. It is not a proper Firmware Image."},
             {good, nowhere, 5, "Firmware Update cannot find instance '" + nowhere.toString() + "'"},
         }) {
        EXPECT_EQ(check(row.source, row.target).returnValue, row.returnValue);
        EXPECT_TRUE(logged("Checking " + row.line)) << row.line;
        EXPECT_EQ(installIdentity(row.source, row.target).returnValue, row.returnValue);
        EXPECT_TRUE(logged(row.line)) << row.line;
    }
    // For targets both speak alike.
    for (const bool checking : {true, false}) {
        test::SyslogCapture::clear();
        EXPECT_EQ((checking ? check(good, service()) : installIdentity(good, service())).returnValue, 4106U);
        EXPECT_TRUE(logged("Firmware Update does not support target '" + service().toString() + "'"));
    }
    EXPECT_EQ(claim(), "");
}

TEST_F(IdentityMethodsTest, WhatIsAdvertisedWorksAndWhatIsNotIsRefused) {
    const auto capabilities =
        m_requests.enumerateInstances("Quenx_SoftwareInstallationServiceCapabilities").at(0);
    const auto advertised = [&](const char* property) {
        std::vector<std::string> values;
        for (const auto& value : *capabilities.find(property)->value.elements()) {
            values.push_back(core::scalarText(core::CimType::String, value));
        }
        return values;
    };
    const std::string uri = goodImage();
    const CimPath source = identityOf(uri);
    const auto finished = [&](const CallResult& result) {
        if (result.job) waitForEnd(*result.job);
        freeClaim();
        return result.returnValue;
    };
    // Actions: from a URI (5) and from an identity (3). The scheme: file (3).
    EXPECT_EQ(advertised("SupportedAsynchronousActions"), (std::vector<std::string>{"5", "3"}));
    EXPECT_EQ(advertised("SupportedURISchemes"), std::vector<std::string>{"3"});
    EXPECT_EQ(finished(install(uri, "eth0")), 4096U);
    EXPECT_EQ(finished(installIdentity(source, port("eth0"))), 4096U);
    for (const char* scheme : {"data", "ftp", "http", "https", "nfs", "tftp"}) {
        EXPECT_EQ(finished(install(scheme + uri.substr(4), "eth0")), 5U) << scheme;
    }
    // Options, each together with 5.
    const auto options = advertised("SupportedInstallOptions");
    for (unsigned option = 0; option <= 40; ++option) {
        const unsigned short code = static_cast<unsigned short>(option == 40 ? 32768 : option);
        const bool isAdvertised =
            std::find(options.begin(), options.end(), std::to_string(code)) != options.end();
        const bool passes =
            isAdvertised || code == 0 || code == 1 || code >= 13;  // unknown codes pass unadvertised
        EXPECT_EQ(finished(install(uri, "eth0", {5, code}, {"", "IMG_PXE"})), passes ? 4096U : 5U) << code;
        // The identity method supplies 32768 itself and refuses it from the client.
        EXPECT_EQ(finished(installIdentity(source, port("eth0"), {5, code})),
                  passes && code != 32768 ? 4096U : 5U)
            << code;
    }
    EXPECT_EQ(finished(install(uri, "eth0", {3})), 5U);  // forcing alone is no update
    // Target types: each is known, though not each is in the image.
    for (const std::string& type : advertised("SupportedTargetTypes")) {
        const unsigned expected = type == "IMG_PXE" || type == "IMG_UEFI" ? 4096 : 4106;
        EXPECT_EQ(finished(install(uri, "eth0", {32768, 5}, {type})), expected) << type;
    }
    EXPECT_EQ(finished(install(uri, "eth0", {32768, 5}, {"IMG_OTHER"})), 5U);
}

TEST_F(IdentityMethodsTest, CheckAndInstallGiveTheSameVerdict) {
    const std::vector<std::string> uris = {
        goodImage(),
        file("old.rom", madeRom({{FirmwareType::PXE, 0}, {FirmwareType::UEFI, 0}})),
        file("pxe.rom", madeRom({{FirmwareType::PXE, 5}})),
        file("iscsi.rom", madeRom({{FirmwareType::iSCSI, 5}})),
        file("nic.rom", madeRom({{FirmwareType::PXE, 5}, {FirmwareType::UEFI, 5}}, 0x10ec, 0x8139)),
        file("real.rom", test::realRom("efi-vmxnet3")),
    };
    std::set<unsigned> verdicts;
    for (const std::string& uri : uris) {
        const CimPath source = identityOf(uri);
        for (const char* adapter : {"eth0", "eth1", "eth2", "eth3", "eth4"}) {
            const unsigned verdict = check(source, port(adapter)).returnValue;
            freeClaim();
            // The write is refused, so that the adapter stays as it is for the next row.
            m_backend->writeAnswer = test::HookedBackend::Refusal{1, "kept as it is"};
            const CallResult result = installIdentity(source, port(adapter));
            if (result.job) waitForEnd(*result.job);
            EXPECT_EQ(result.returnValue, verdict == 0 ? 4096 : verdict) << uri << " on " << adapter;
            EXPECT_EQ(claim(), "");
            verdicts.insert(verdict);
        }
    }
    EXPECT_GE(verdicts.size(), 3U);
}

}  // namespace
