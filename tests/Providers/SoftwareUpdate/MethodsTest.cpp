// SPDX-License-Identifier: Apache-2.0
// The three methods on one inventory: the files of the test's folder are the identities.
#include <gtest/gtest.h>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/RequestScope.h"
#include "MidAPI/Image/RomFormat.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Support/TestRoms.h"

namespace {

using core::Argument;
using core::CimPath;
using test::CallResult;
using test::madeRom;
using utils::FirmwareType;
using Codes = std::vector<std::uint16_t>;
using Texts = std::vector<std::string>;

constexpr const char* kCheck = "CheckSoftwareIdentity";
constexpr std::uint32_t kJobStarted = 4096;
constexpr std::uint32_t kThrows = ~0U;

/// A call that is still to be made.
struct Call {
    std::string method;
    std::vector<Argument> arguments;
    std::function<unsigned int(update::ImageCheck&)> check{};  ///< the same without the installation

    Call without(const std::string& name) const {
        Call changed = *this;
        std::erase_if(changed.arguments, [&](const Argument& argument) { return argument.name == name; });
        return changed;
    }
    Call withNull(const std::string& name) const {
        Call changed = *this;
        for (Argument& argument : changed.arguments)
            if (argument.name == name) argument.value.data = std::monostate();
        return changed;
    }
};

/// An argument that is null where the path is none.
Argument optionalPath(const char* name, const CimPath& path) {
    if (path.isValid()) return test::pathArgument(name, path);
    return {name, core::CimValue::null(core::CimType::Reference)};
}

Call fromUri(const std::string& uri, const CimPath& target, const Codes& options = {5},
             const Texts& values = {}) {
    return {
        "InstallFromURI",
        {test::textArgument("URI", uri), test::pathArgument("Target", target),
         test::codesArgument("InstallOptions", options), test::textsArgument("InstallOptionsValues", values)},
        [=](update::ImageCheck& check) { return check.checkImage(uri, target, options, values); }};
}

Call check(const CimPath& source, const CimPath& target, const CimPath& collection = {}) {
    return {kCheck,
            {optionalPath("Source", source), optionalPath("Target", target),
             optionalPath("Collection", collection)}};
}

Call fromIdentity(const CimPath& source, const CimPath& target, const CimPath& collection = {},
                  const Codes& options = {5}) {
    return {"InstallFromSoftwareIdentity",
            {test::codesArgument("InstallOptions", options), test::textsArgument("InstallOptionsValues", {}),
             optionalPath("Source", source), optionalPath("Target", target),
             optionalPath("Collection", collection)}};
}

class MethodsTest : public test::UpdateTest {
  protected:
    struct Row {
        Call call;
        std::uint32_t returnValue;
        Texts lines{};          ///< what is logged, or the text of the exception; none when nothing is
        std::string claimed{};  ///< the adapter that was claimed before
    };
    std::vector<Row> argumentRows() const {
        const std::string error = "EUnspecifiedError:";
        const Texts neither = {error + "Neither Target nor Collection are defined"};
        const Texts both = {error + "Both Target and Collection are defined"};
        const Texts bothGiven = {error + "Target and Collection are defined"};
        const Texts wrongInput = {
            "InstallCharacterisitcs argument is an output method's argument. Any input value is not "
            "supported."};
        const Texts wrongOption = {"One of value of InstallOptions value is not supported"};
        const Call uriCall = fromUri(m_uri, m_port);
        Call given = check(m_image, m_port);
        given.arguments.push_back(test::codesArgument("InstallCharacteristics", {1}));
        std::vector<Row> rows = {
            {uriCall.without("InstallOptionsValues"), kJobStarted},
            {uriCall.withNull("InstallOptionsValues"), kJobStarted},
            {check(m_image, m_port, m_port), kThrows, both},
            {fromIdentity(m_image, m_port, m_port), kThrows, bothGiven},
            {check(m_image, {}), kThrows, neither},
            {fromIdentity(m_image, {}), kThrows, neither},
            {check(m_image, {}, m_port), 4108},
            {fromIdentity(m_image, {}, m_port), 4108},
            {given, 5, wrongInput},
            {fromIdentity(m_image, m_port, {}, {3}), 5, wrongOption},
        };
        for (const Codes& options : std::vector<Codes>{{}, {3}, {4, 5}})
            rows.push_back({fromUri("file:///nowhere", m_port, options), 5});
        const std::vector<std::pair<Call, Texts>> required = {
            {uriCall, {"URI", "Target", "InstallOptions"}},
            {check(m_image, m_port), {"Source"}},
            {fromIdentity(m_image, m_port), {"InstallOptions", "Source"}},
        };
        for (const auto& [complete, names] : required) {
            for (const std::string& name : names) {
                const Texts isNull = {error + name + " argument is set to NULL. It is not allowed"};
                rows.push_back({complete.without(name), kThrows, {error + "Expected " + name + " argument"}});
                rows.push_back({complete.withNull(name), kThrows, isNull});
            }
        }
        return rows;
    }
    std::vector<Row> uriRows() const {
        const std::string target = "'" + m_port.toString() + "'";
        const std::string invalid = "Invalid URI for " + target;
        const std::string missing = "URI does not exists for " + target;
        const std::string parameter = "Job creation returned Invalid Parameter for " + target;
        const std::string unsupported = "Target is not supported by service for " + target;
        const std::string wrongParameter = "EInvalidParameter:Invalid parameter detected for ";
        const std::string downgrade =
            "Downgrade is not supported by service for " + target + ". Execute with FORCE INSTALL flag.";
        auto cut = madeRom({{FirmwareType::PXE, 2}, {FirmwareType::UEFI, 1}});
        cut.resize(1500);
        const auto typed = [&](const char* types) { return fromUri(m_uri, m_port, {32768, 5}, {types}); };
        return {
            {fromUri("/no/scheme", m_port), 5, {invalid, "EInvalidUri:URI: /no/scheme is invalid"}},
            {fromUri("file:/one/slash", m_port), 5, {invalid}},
            {fromUri("https://host/image", m_port), 5, {invalid}},
            {fromUri("file://" + m_folder.path(), m_port),
             5,
             {missing, "The specyfied URI " + m_folder.path() + " points to a directory"}},
            {fromUri("file:///no", m_port),
             5,
             {missing, "Could not open the file /no", "EUriDoesNotExist:URI: file:///no is invalid"}},
            {fromUri(file("empty", {}), m_port), 5, {parameter}},
            {fromUri(file("cut", cut), m_port), 5, {parameter}},
            {fromUri("file://" + test::realRomPath("efi-rtl8139"), m_port), 4097, {unsupported}},
            {fromUri(m_older, m_port), 4099, {downgrade}},
            {fromUri(m_older, m_port, {5, 3}), kJobStarted},
            {typed("img_pxe"), 5, {parameter}},
            {typed("IMG_PXE+ IMG_NO"),
             5,
             {parameter, wrongParameter + "TargetTypes. IMG_NO is not recognized"}},
            {typed("IMG_FCoE"), 4106, {"Not applicable for target for " + target + " "}},
        };
    }
    std::vector<Row> resolutionRows() const {
        const CimPath missing(std::string("Quenx_SoftwareIdentity.InstanceID=\"Quenx:none\""));
        const CimPath nowhere(std::string("Quenx_EthernetPort.DeviceID=\"a \\\"quoted\\\\ one\""));
        const CimPath noPath(std::string("no path at all"));
        CimPath elsewhere = m_port;
        elsewhere.setNamespace("root/other");
        const CimPath installed(std::string("Quenx_SoftwareIdentity.InstanceID=\"Quenx:eth0:IMG_PXE\""));
        auto foreign = madeRom({{FirmwareType::PXE, 2}});
        foreign[foreign[ma::rom::kHeaderDataStructure] + ma::rom::kPcirCodeType] =
            ma::rom::CodeType::OpenFirmware;
        const CimPath typeless = identityOf(file("foreign.rom", foreign));
        const std::string noTypes = "Source '" + typeless.toString() + "' does not contain any TargetTypes";
        const Texts checkedLines = {"TargetTypes are: IMG_PXE+IMG_UEFI", "URI is: " + m_uri,
                                    "Verification of image returns: 0", "Target:0, Source:0, Collection:1"};
        const std::string notFound = "Firmware Update cannot find instance '";
        const std::string noSource = "Firmware Update does not support source '";
        const std::string noTarget = "Firmware Update does not support target '" + service().toString() + "'";
        std::vector<Row> rows = {
            {fromUri(m_uri, nowhere), 5, {notFound + nowhere.toString() + "'"}},
            {fromUri(m_uri, noPath), 5, {notFound + noPath.toString() + "'"}},
            {fromUri(m_uri, elsewhere), 5, {notFound + elsewhere.toString() + "'"}},
            {fromUri(m_uri, m_controller), kJobStarted, {"Output size of file: 2048"}},
            // For targets all speak alike.
            {fromUri(m_uri, service()), 4106, {noTarget}},
            {check(m_image, service()), 4106, {noTarget}},
            {fromIdentity(m_image, service()), 4106, {noTarget}},
            {check(typeless, m_port), 5, {noTypes}},
            {fromIdentity(typeless, m_port), 5, {noTypes}},
            {check(m_image, m_port), 0, checkedLines},
            {fromIdentity(m_image, m_port), kJobStarted, {"Creation of new job returns: 0"}},
        };
        for (const auto& [source, target, line] : std::vector<std::tuple<CimPath, CimPath, std::string>>{
                 {missing, m_port, notFound + missing.toString() + "'"},
                 {m_port, m_port, noSource + m_port.toString() + "'"},
                 {installed, m_port,
                  noSource + installed.toString() + "'. It is not a proper Firmware Image."},
                 {m_image, nowhere, notFound + nowhere.toString() + "'"},
                 {m_image, elsewhere, notFound + elsewhere.toString() + "'"},
             }) {
            rows.push_back({check(source, target), 5, {"Checking " + line}});
            rows.push_back({fromIdentity(source, target), 5, {line}});
        }
        const CimPath other = port("eth1");
        const std::string busy = "Other job is in progress '" + other.toString() + "'";
        const std::string inUse = "Target '" + m_port.toString() + "' is in update state at this moment";
        for (const Call& made :
             {fromUri(m_uri, m_port), check(m_image, m_port), fromIdentity(m_image, m_port)})
            rows.push_back({made, 6, {inUse}, "eth0"});
        for (const Call& made :
             {fromUri(m_uri, other), check(m_image, other), fromIdentity(m_image, other)}) {
            const std::string error = "EJobIsRunning:Other job for eth0 is running at this moment";
            rows.push_back({made, 2, {busy, error}, "eth0"});
        }
        return rows;
    }
    void expect(const Row& row) const {
        SCOPED_TRACE(row.call.method + (row.lines.empty() ? "" : ": " + row.lines[0]));
        const bool throws = row.returnValue == kThrows;
        if (row.call.check && !throws && row.claimed.empty()) expectOfCheckInProcess(row);
        test::SyslogCapture::clear();
        setClaim(row.claimed);
        const CallResult result = make(row.call);
        EXPECT_EQ(result.error, throws ? "SMASHv2:" + row.lines.at(0) : "");
        EXPECT_TRUE(throws || result.returnValue == row.returnValue) << result.returnValue;
        for (const std::string& line : row.lines)
            EXPECT_TRUE(test::SyslogCapture::contains("\"" + line + "\" (")) << line;
        const bool isSilent = row.lines.empty() && row.returnValue != kJobStarted;
        EXPECT_FALSE(isSilent && test::SyslogCapture::contains("Firmware Update"));

        const bool isGoodCheck = row.call.method == kCheck && row.returnValue == 0;
        EXPECT_EQ(result.characteristics, isGoodCheck ? "7" : "");
        EXPECT_EQ(result.job.has_value(), row.returnValue == kJobStarted);
        if (result.job) {
            EXPECT_EQ(state(waitForEnd(*result.job)), JobStateCompleted);
            m_requests.deleteInstance(*result.job);
        }
        EXPECT_EQ(claim(), isGoodCheck ? "eth0" : row.claimed);
        EXPECT_TRUE(m_requests.enumerateInstances("Quenx_ConcreteJob").empty());
    }
    void expectOfCheckInProcess(const Row& row) const {
        const std::string served = "root/cimv2";
        const core::RequestScope scope(served);
        CimPath path = service();
        auto* check = dynamic_cast<update::ImageCheck*>(core::GetCimBroker()->getInstanceByPath(path));
        ASSERT_NE(check, nullptr);
        setClaim("eth1");  // an update runs, and is not disturbed
        EXPECT_EQ(row.call.check(*check), row.returnValue == kJobStarted ? 0 : row.returnValue);
        EXPECT_EQ(claim(), "eth1");
    }

    CimPath identityOf(const std::string& uri) const {
        for (const core::InstanceValue& resource :
             m_requests.enumerateInstances("Quenx_SoftwareIdentityResource")) {
            if (text(resource, "AccessInfo") != uri) continue;
            const std::string id =
                text(resource, "InstanceID");  // with @ and more behind that of the identity
            return CimPath("Quenx_SoftwareIdentity", {{"InstanceID", id.substr(0, id.find('@'))}});
        }
        ADD_FAILURE() << "no identity for " << uri;
        return {};
    }
    CallResult make(const Call& made) const { return call(made.method, made.arguments); }
    /// The return value, with the job ended and the claim given back.
    std::uint32_t outcome(const Call& made) const {
        const CallResult result = make(made);
        if (result.job) waitForEnd(*result.job);
        setClaim("");
        return result.returnValue;
    }

    const std::string m_uri = goodImage();
    const std::string m_older = file("older", madeRom({{FirmwareType::PXE, 0}, {FirmwareType::UEFI, 0}}));
    const CimPath m_image = identityOf(m_uri);
    const CimPath m_port = port("eth0");
    const CimPath m_controller = m_requests.enumerateInstanceNames("Quenx_PortController").at(0);
};

TEST_F(MethodsTest, AnswerEachCallWithItsValueLineJobAndClaim) {
    for (const std::vector<Row>& rows : {argumentRows(), uriRows(), resolutionRows()}) {
        for (const Row& row : rows)
            expect(row);
    }
    // The controller stood for the first of its ports.
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 2, IMG_UEFI 1");
    EXPECT_EQ(test::componentsOf("eth1"), "IMG_PXE 1, IMG_UEFI 0");
}

TEST_F(MethodsTest, DecideByTheStatusOfThePreparation) {
    const std::string downgrade =
        "EDowngradeDetected:Downgrade was detected for " + m_uri + ". Try to use FORCE_INSTALL option.";
    const std::string types =
        "EDowngradeDetected:The selected flash image cannot be used because it does not contain the same "
        "image types. Please select a flash file with matching image types.";
    const Codes forced{5, 3};
    const char* const ban = "OEMCustomizeable=5\n";
    const std::tuple<int, Codes, const char*, std::uint32_t, Texts> table[] = {
        {1, forced, "", 5, {"EInvalidParameter:Invalid parameter detected for " + m_uri}},
        {2, forced, "", 4097, {"EAdapterNotSupported:Image " + m_uri + " is not supported for adapter eth0"}},
        {3, {5}, "", 4099, {downgrade}},
        {3, forced, ban, kJobStarted, {}},
        {4, {5}, "", 4099, {downgrade}},
        {4, forced, "", kJobStarted, {}},
        {4, forced, ban, 4099, {types}},
        {4, {5}, ban, 4099, {types}},
        {5, forced, "", 4106, {"ENotApplicableForTarget:Not applicable for " + m_uri}},
        {6, forced, "", 2, {"EUnspecifiedError:Unspecified error occurred for " + m_uri}},
        {7, {5}, "", kJobStarted, {}},
        {-1, {5}, "", kJobStarted, {}},
    };
    for (const auto& [status, options, policy, returnValue, lines] : table) {
        const utils::SMASHv2Config config(m_folder.write("policy.conf", policy));
        m_backend->prepareStatus = status;
        expect({fromUri(m_uri, m_port, options), returnValue, lines});
    }
}

TEST_F(MethodsTest, ACheckGivesTheClaimBackWhereTheConfigurationSaysSo) {
    m_folder.write("quenx.conf", "ReleaseClaimAfterCheck = 1\nFWFilePath=" + m_folder.path() + "\n");
    EXPECT_EQ(make(check(m_image, m_port)).returnValue, 0U);
    EXPECT_EQ(claim(), "");
    // A refusal never gives back what another request has taken.
    setClaim("eth0");
    EXPECT_EQ(make(check(m_image, m_port)).returnValue, 6U);
    EXPECT_EQ(make(check(m_image, port("eth1"))).returnValue, 2U);
    EXPECT_EQ(claim(), "eth0");
}

TEST_F(MethodsTest, WhatCannotBeLookedUpIsNotFound) {
    // The controller is found, and then its ports are not.
    int enumerations = 0;
    m_backend->hook = [&](const std::string& operation) {
        if (operation == "enumerateAdapters" && ++enumerations == 2) throw std::runtime_error("gone");
    };
    EXPECT_EQ(outcome(fromUri(m_uri, m_controller)), 5U);
    EXPECT_TRUE(test::SyslogCapture::contains("Firmware Update does not support instance '"));
    // The identity is found, and then its file is gone.
    test::SyslogCapture::observe([this](const std::string& line) {
        if (line.find("@Quenx_SoftwareIdentityResource.cpp") != std::string::npos)
            std::filesystem::remove(m_folder / "good.rom");
    });
    EXPECT_EQ(outcome(fromIdentity(m_image, m_port)), 5U);
    test::SyslogCapture::observe(nullptr);
    EXPECT_TRUE(test::SyslogCapture::contains("\"Could not obtain URI from the SoftwareIdentityResource ("));
}

TEST_F(MethodsTest, WhatIsAdvertisedWorksAndWhatIsNotIsRefused) {
    const auto capabilities =
        m_requests.enumerateInstances("Quenx_SoftwareInstallationServiceCapabilities").at(0);
    // Options, each together with 5.
    const std::string advertised = "," + text(capabilities, "SupportedInstallOptions") + ",";
    for (std::uint16_t step = 0; step <= 20; ++step) {
        const std::uint16_t option = step == 20 ? 32768 : step;
        const bool isAdvertised = advertised.find("," + std::to_string(option) + ",") != std::string::npos;
        // Unknown codes pass unadvertised.
        const bool passes = isAdvertised || option == 0 || option == 1 || option >= 13;
        EXPECT_EQ(outcome(fromUri(m_uri, m_port, {5, option}, {"", "IMG_PXE"})), passes ? kJobStarted : 5U)
            << option;
        // The identity method supplies 32768 itself and refuses it from the client.
        EXPECT_EQ(outcome(fromIdentity(m_image, m_port, {}, {5, option})),
                  passes && option != 32768 ? kJobStarted : 5U)
            << option;
    }
    // Target types: each is known, though not each is in the image.
    for (const std::string& name : capabilities.texts("SupportedTargetTypes")) {
        const std::uint32_t expected = name == "IMG_PXE" || name == "IMG_UEFI" ? kJobStarted : 4106;
        EXPECT_EQ(outcome(fromUri(m_uri, m_port, {32768, 5}, {name})), expected) << name;
    }
}

}  // namespace
