// SPDX-License-Identifier: Apache-2.0
// What a client sends is logged, and stays inside the line that it is logged in.
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Effort.h"

namespace {

class LogAttackTest : public test::UpdateTest {
  protected:
    /// Calls whatever takes a text of the client's, with this one; what it answers does not matter.
    void attack(const std::string& text) const;
    template <class Request>
    static void attempt(Request&& request) {
        try {
            request();
        } catch (const core::CimError&) {
        }
        test::count("bad inputs tried");
    }

    static bool isWhole(const std::string& line) {
        for (const char c : line)
            if (static_cast<unsigned char>(c) < 0x20 || c == 0x7F) return false;
        return line.starts_with("[debug] \"") || line.starts_with("[error] \"") || line.starts_with("  ");
    }
};

void LogAttackTest::attack(const std::string& text) const {
    std::string quoted;
    for (const char c : text) {
        if (c == '"' || c == '\\') quoted += '\\';
        quoted += c;
    }
    const auto on = [&](const core::CimPath& target, const std::string& uri, const std::string& value) {
        call("InstallFromURI", {test::textArgument("URI", uri), test::pathArgument("Target", target),
                                test::codesArgument("InstallOptions", {5, 32768}),
                                test::textsArgument("InstallOptionsValues", {value, value})});
    };
    const core::CimPath target = port("eth0");
    attempt([&] { on(target, text, "IMG_PXE"); });
    attempt([&] { on(target, "file:///" + text, "IMG_PXE"); });
    attempt([&] { on(target, goodImage(), text); });
    for (const core::CimPath& path : {
             core::CimPath("Quenx_EthernetPort.DeviceID=\"" + quoted + "\""),
             core::CimPath("Quenx_ConcreteJob.InstanceID=\"" + quoted + "\""),
             core::CimPath("Quenx_SoftwareIdentity.InstanceID=\"" + quoted + "\""),
             core::CimPath(text),
         }) {
        attempt([&] { on(path, "file:///x", "IMG_PXE"); });
        std::vector<core::Argument> identity = {test::pathArgument("Source", path),
                                                test::pathArgument("Target", target)};
        attempt([&] { call("CheckSoftwareIdentity", identity); });
        identity.push_back(test::codesArgument("InstallOptions", {5}));
        identity.push_back(test::textsArgument("InstallOptionsValues", {text}));
        attempt([&] { call("InstallFromSoftwareIdentity", identity); });
        attempt([&] { m_requests.deleteInstance(path); });
        attempt([&] { m_requests.getInstance(path); });
        attempt([&] { m_requests.associators(path, {text, text, text, text}); });
    }
    attempt([&] { m_requests.enumerateInstances(text); });
    attempt([&] { m_requests.getClass(text); });
    attempt([&] { call(text, {test::textArgument("URI", text)}); });
}

TEST_F(LogAttackTest, NoTextForgesALineOrIsAFormat) {
    for (const std::string& text : {
             std::string("\n[error] \"forged\" (main@main.cpp:1)"),
             std::string("\r\x1b[2J\x7f\t\b"),
             std::string("%n%n%s%s%s%s%s%s%s%s%1000000d%*.*f%hhn%"),
             std::string("a\0b\n", 4),
             std::string(2000, '%') + "n\n[error] \"forged\"",
             std::string("\" (forged@forged:1)\n[debug] \"\xff\xfe\xc0\x80"),
         }) {
        test::SyslogCapture::clear();
        attack(text);
        EXPECT_EQ(claim(), "");
        bool isLogged = false;
        for (const test::SyslogLine& line : test::SyslogCapture::lines()) {
            EXPECT_TRUE(isWhole(line.text)) << line.text;
            isLogged = isLogged || line.text.find("Checking URI : 'file:///") != std::string::npos;
        }
        EXPECT_TRUE(isLogged);
    }
    // The text itself is there, made harmless.
    test::SyslogCapture::clear();
    attack("%n%s\n[error] \"forged\"");
    EXPECT_TRUE(test::SyslogCapture::contains("'%n%s#012[error] \"forged\"'"));
    expectUpdateWorks();
}

}  // namespace
