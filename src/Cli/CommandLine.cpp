// SPDX-License-Identifier: Apache-2.0
#include "Cli/CommandLine.h"

#include <unistd.h>

#include <chrono>
#include <iostream>
#include <memory>
#include <string_view>
#include <thread>

#include "Cli/Arguments.h"
#include "Cli/Credentials.h"
#include "Cli/Failure.h"
#include "Cli/Interruption.h"
#include "Cli/Json.h"
#include "Cli/ProgressDisplay.h"
#include "Cli/RemoteManagement.h"
#include "Framework/Model/CimError.h"

namespace cli {

namespace {

constexpr std::chrono::milliseconds LOOK_EVERY{50};
constexpr std::chrono::milliseconds ASK_SERVER_EVERY{500};
constexpr const char* ASK_LOG = "The system log has the details.";

std::unique_ptr<Management> openManagement(const Arguments& arguments) {
    if (!arguments.serverUrl) return std::make_unique<LocalManagement>(arguments.local);
    const ServerUrl& url = *arguments.serverUrl;
    ServerSettings server = arguments.server;
    if (!url.isEncrypted() && !url.isLoopback()) {
        std::cerr << "quenxctl: WARNING: http:// sends the password and everything else unencrypted. Use "
                     "https:// instead.\n";
    }
    if (server.insecure) {
        std::cerr << "quenxctl: WARNING: --insecure: the server's certificate is not checked. Anybody on the "
                     "network path can read the password and pose as the server.\n";
    }
    if (server.user.empty()) server.user = userName();
    server.password = passwordOf(server.user);
    return std::make_unique<RemoteManagement>(url, server);
}

std::string adviceFor(const core::CimError& error) {
    switch (error.status()) {
        case core::CimStatus::InvalidClass:
            return ASK_MOF;
        case core::CimStatus::InvalidParameter:
        case core::CimStatus::NotFound:
            return "\"quenxctl instances CLASS --names\" prints the paths of what there is.";
        case core::CimStatus::AccessDenied:
            return "Log in as a user who may do this: on quenx-cimd, an administrator.";
        case core::CimStatus::InvalidNamespace:
            return "Check --namespace, or the line \"Namespace=\" of the configuration file.";
        case core::CimStatus::ServerIsShuttingDown:
            return "Try again after its restart.";
        default:
            // The adapters then say what is wrong with their description.
            return std::string_view(error.what()).starts_with("QUENX_ADAPTERS")
                       ? "Correct QUENX_ADAPTERS or the file that it names."
                       : ASK_LOG;
    }
}

ExitStatus statusFor(core::CimStatus status) {
    const bool isMissing = status == core::CimStatus::NotFound || status == core::CimStatus::InvalidClass;
    return isMissing ? ExitStatus::NotFound : ExitStatus::Failed;
}

/// An error text of the model or a server, which may be no more than a few words, as a sentence.
std::string sentence(std::string text) {
    if (text.empty()) return "The service gave no reason.";
    if (text.front() >= 'a' && text.front() <= 'z')
        text.front() = static_cast<char>(text.front() - 'a' + 'A');
    if (std::string_view(".!?").find(text.back()) == std::string_view::npos) text += '.';
    return text;
}

ExitStatus report(bool json, ExitStatus status, const std::string& what, const std::string& advice) {
    if (json) {
        printJson(std::cout, {{"error", what}, {"advice", advice}, {"exitStatus", static_cast<int>(status)}});
        return status;
    }
    std::cerr << "quenxctl: " << printable(what) << '\n';
    if (!advice.empty()) std::cerr << printable(advice) << '\n';
    return status;
}

ExitStatus runVerb(const Arguments& arguments) {
    LinePrinter printer(arguments.json ? std::cerr : std::cout,
                        Terminal::of(arguments.json ? STDERR_FILENO : STDOUT_FILENO));
    ProgressDisplay display(printer);
    // Outlives the providers, which wait for a running update when they are unloaded.
    std::optional<Interruption> interruption;
    const std::unique_ptr<Management> management = openManagement(arguments);
    if (arguments.startsUpdate) interruption.emplace();
    const auto lookEvery = management->runsJobs() ? LOOK_EVERY : ASK_SERVER_EVERY;
    const Following following = {[lookEvery] { std::this_thread::sleep_for(lookEvery); },
                                 [&] { return interruption && interruption->take(); }};
    Context context{*management, std::cout, std::cerr, arguments.json, display, following};
    return arguments.verb(context);
}

/// @param arguments  set once they are read
ExitStatus runAndReport(int argc, char** argv, std::optional<Arguments>& arguments) {
    const bool json = asksForJson(argc, argv);
    try {
        arguments = readArguments(argc, argv);
        return arguments ? runVerb(*arguments) : ExitStatus::Done;
    } catch (const Failure& failure) {
        return report(json, failure.status(), failure.what(), failure.advice());
    } catch (const core::CimError& error) {
        return report(json, statusFor(error.status()), sentence(error.what()), adviceFor(error));
    } catch (const std::exception& error) {
        return report(json, ExitStatus::Failed, sentence(error.what()), ASK_LOG);
    }
}

}  // namespace

int runCommandLine(int argc, char** argv) {
    std::optional<Arguments> arguments;
    ExitStatus status = runAndReport(argc, argv, arguments);
    // A result that nobody could read is none; an update, though, is done whoever reads of it.
    const bool mayHaveUpdated = arguments && arguments->startsUpdate;
    if (!std::cout.flush() && !mayHaveUpdated && status == ExitStatus::Done) {
        std::cerr << "quenxctl: Cannot write the output.\n";
        status = ExitStatus::Failed;
    }
    return static_cast<int>(status);
}

}  // namespace cli
