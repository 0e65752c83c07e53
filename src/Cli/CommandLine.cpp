#include "Cli/CommandLine.h"

#include <unistd.h>

#include <chrono>
#include <iostream>
#include <memory>
#include <thread>

#include "Cli/Arguments.h"
#include "Cli/Credentials.h"
#include "Cli/Failure.h"
#include "Cli/Interruption.h"
#include "Cli/Json.h"
#include "Cli/ProgressDisplay.h"
#include "Cli/RemoteManagement.h"
#include "Framework/CimError.h"

namespace cli {

namespace {

constexpr std::chrono::milliseconds LOOK_EVERY{50};
constexpr std::chrono::milliseconds ASK_SERVER_EVERY{500};

std::unique_ptr<Management> openManagement(const Arguments& arguments) {
    if (arguments.server.url.empty()) return std::make_unique<LocalManagement>(arguments.local);
    ServerSettings server = arguments.server;
    if (server.insecure) {
        std::cerr << "quenxctl: WARNING: --insecure: the server's certificate is not checked. Anybody on the "
                     "way can "
                     "read the password and answer in the server's place.\n";
    }
    if (!server.user.empty()) server.password = passwordOf(server.user);
    return std::make_unique<RemoteManagement>(server);
}

std::string adviceFor(core::CimStatus status) {
    switch (status) {
        case core::CimStatus::InvalidClass:
            return "\"quenxctl mof\" prints the classes that are served.";
        case core::CimStatus::NotFound:
            return "\"quenxctl instances CLASS --names\" prints the paths of what there is.";
        default:
            return "The system log has the details.";
    }
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

ExitStatus runAndReport(const Arguments& arguments) {
    try {
        return runVerb(arguments);
    } catch (const Failure& failure) {
        return report(arguments.json, failure.status(), failure.what(), failure.advice());
    } catch (const core::CimError& error) {
        return report(arguments.json, ExitStatus::Failed, error.what(), adviceFor(error.status()));
    } catch (const std::exception& error) {
        return report(arguments.json, ExitStatus::Failed, error.what(), "The system log has the details.");
    }
}

}  // namespace

int runCommandLine(int argc, char** argv) {
    ExitStatus status = ExitStatus::Done;
    const std::optional<Arguments> arguments = readArguments(argc, argv, status);
    if (!arguments) return static_cast<int>(status);
    status = runAndReport(*arguments);
    // A result that nobody could read is none; an update, though, is done whoever reads of it.
    if (!std::cout.flush() && !arguments->startsUpdate && status == ExitStatus::Done) {
        std::cerr << "quenxctl: the output could not be written.\n";
        status = ExitStatus::Failed;
    }
    return static_cast<int>(status);
}

}  // namespace cli
