// SPDX-License-Identifier: Apache-2.0
// quenxctl: reads the arguments, opens the way to the model, runs the verb, says what went wrong.
#include <unistd.h>

#include <array>
#include <atomic>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstring>
#include <iostream>
#include <optional>
#include <string_view>
#include <thread>

#include "Cli/Arguments/Arguments.h"
#include "Cli/Display/Output.h"
#include "Framework/Requests/NotedCall.h"
#include "Framework/Requests/PolicyDecision.h"
#include "Utils/Os/Linux/linux.h"

namespace cli {

namespace {

std::atomic<bool> interruptionAsked{false};
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler stores it");

constexpr std::array kInterruptions = {SIGINT, SIGTERM, SIGHUP};

/// What the signals did before they were noted; "nohup", for one, has SIGHUP ignored.
std::array<struct sigaction, kInterruptions.size()> usualActions = {};

/// For the time when nothing can be harmed: nobody may ever read what is printed then.
void letInterruptionsEnd() {
    for (std::size_t i = 0; i < kInterruptions.size(); ++i)
        sigaction(kInterruptions[i], &usualActions[i], nullptr);
}

/// An update in this process would die with it, and one on a server goes on unseen: so Ctrl-C is only noted,
/// as long as this lives.
class NotedInterruptions {
  public:
    /// @param isOnServer  then a second one ends the program, wherever it waits
    explicit NotedInterruptions(bool isOnServer) {
        struct sigaction action = {};
        action.sa_handler = [](int) { interruptionAsked = true; };
        // A read or write under way is not what the user wants to stop.
        action.sa_flags = SA_RESTART | (isOnServer ? static_cast<int>(SA_RESETHAND) : 0);
        for (std::size_t i = 0; i < kInterruptions.size(); ++i)
            sigaction(kInterruptions[i], &action, &usualActions[i]);
        // If the reader of a pipe has gone, writing fails, and the update goes on.
        os::ignoreOtherSignals();
    }
    ~NotedInterruptions() { letInterruptionsEnd(); }
    NotedInterruptions(const NotedInterruptions&) = delete;
    NotedInterruptions& operator=(const NotedInterruptions&) = delete;
};

/// Where the adapters cannot be had for what a variable says, their error begins with its name.
std::string adviceForVariable(std::string_view error) {
    const std::string_view name = error.substr(0, error.find(':'));
    if (name == "QUENX_BACKEND") return "Correct QUENX_BACKEND.";
    return name.starts_with("QUENX_") ? "Correct " + std::string(name) + " or the file that it names."
                                      : kAskLog;
}

std::string adviceFor(const core::CimError& error) {
    switch (error.status()) {
        case core::CimStatus::InvalidClass:
            return kAskMof;
        case core::CimStatus::InvalidParameter:
        case core::CimStatus::NotFound:
            return "\"quenxctl instances CLASS --names\" prints the paths of what there is.";
        case core::CimStatus::AccessDenied:
            return std::string_view(error.what()).starts_with(core::kBadPolicy)
                       ? kMendPolicy
                       : "Use a name that may do this: on quenx-cimd that of an administrator, and where "
                         "there "
                         "is a policy one that it has.";
        case core::CimStatus::InvalidNamespace:
            return "Check --namespace, or the line \"Namespace=\" of the configuration file.";
        case core::CimStatus::ServerIsShuttingDown:
            return "Try again after its restart.";
        default:
            return adviceForVariable(error.what());
    }
}

ExitStatus statusFor(core::CimStatus status) {
    const bool isMissing = status == core::CimStatus::NotFound || status == core::CimStatus::InvalidClass;
    return isMissing ? ExitStatus::NotFound : ExitStatus::Failed;
}

/// @param reason  of a refusal that has one
ExitStatus report(bool json, ExitStatus status, const std::string& what, const std::string& advice,
                  core::ReasonId reason = core::ReasonId::None) {
    // On standard output: a script reads its one document there, however the verb ended.
    if (json) {
        Json error = {{"error", what}, {"advice", advice}, {"exitStatus", static_cast<int>(status)}};
        if (reason != core::ReasonId::None) error["reasonId"] = core::reasonCode(reason);
        printJson(std::cout, error);
        return status;
    }
    printFailure(std::cerr, what, advice);
    return status;
}

ExitStatus runVerb(const Arguments& arguments) {
    std::ostream nowhere(nullptr);
    std::ostream& out = arguments.isSilent() ? nowhere : std::cout;
    // Standard output is for the document then.
    LinePrinter printer(
        arguments.json ? std::cerr : out,
        arguments.isSilent() ? Terminal() : Terminal::of(arguments.json ? STDERR_FILENO : STDOUT_FILENO));
    ProgressDisplay progress(printer);
    // Outlives the connection, which waits for the updates of this process.
    std::optional<NotedInterruptions> interruptions;
    // What was subscribed is taken away again after an interruption, by requests that go on.
    const bool mayEndRequests = arguments.verb != listen;
    const auto isInterrupted = [mayEndRequests] { return mayEndRequests && interruptionAsked.load(); };
    const Connection connection = arguments.server.url ? openServer(arguments.server, isInterrupted)
                                                       : openProviders(arguments.providers);
    // Only now: at the prompt for the password, Ctrl-C still ends the program.
    if (arguments.startsUpdate() || arguments.verb == listen) interruptions.emplace(!connection.isInProcess);
    // Polling costs a server a request each time; in process it is free.
    const std::chrono::milliseconds pause(connection.isInProcess ? 50 : 500);
    const Following following = {.pause = [pause] { std::this_thread::sleep_for(pause); },
                                 .interrupted =
                                     [untilTheEnd = connection.isInProcess] {
                                         return untilTheEnd ? interruptionAsked.exchange(false)
                                                            : interruptionAsked.load();
                                     },
                                 .untilTheEnd = connection.isInProcess,
                                 .over = letInterruptionsEnd};
    Context context{.connection = connection,
                    .out = out,
                    .error = std::cerr,
                    .json = arguments.json,
                    .progress = progress,
                    .following = following};
    return arguments.verb(context, arguments.options);
}

/// @param arguments  set once they are read
ExitStatus runAndReport(int argc, char** argv, std::optional<Arguments>& arguments) {
    const bool json = asksFor("--json", argc, argv);
    // Who reads a document, or as little as there can be, is a script, also where it runs on a terminal.
    if (!json && !asksFor("--quiet", argc, argv)) {
        allowColours(std::cout, Terminal::of(STDOUT_FILENO));
        allowColours(std::cerr, Terminal::of(STDERR_FILENO));
    }
    const core::NotedCall noted;
    try {
        arguments = readArguments(argc, argv);
        return arguments ? runVerb(*arguments) : ExitStatus::Done;
    } catch (const PolicyRefusal& error) {
        return report(json, error.status(), error.what(), error.advice(), core::ReasonId::PolicyUnreadable);
    } catch (const CommandError& error) {
        return report(json, error.status(), error.what(), error.advice());
    } catch (const core::CimError& error) {
        return report(json, statusFor(error.status()), sentence(error.what()), adviceFor(error),
                      noted.notes().reason);
    } catch (const std::exception& error) {
        return report(json, ExitStatus::Failed, sentence(error.what()), kAskLog);
    }
}

}  // namespace

}  // namespace cli

int main(int argc, char** argv) {
    os::openStandardDescriptors();
    std::optional<cli::Arguments> arguments;
    cli::ExitStatus status = cli::runAndReport(argc, argv, arguments);
    // A result that nobody can read is a failure; an update, though, has happened whether or not anybody
    // reads about it.
    const bool mayHaveUpdated = arguments && arguments->startsUpdate();
    errno = 0;
    if (!std::cout.flush()) {
        const std::string reason = errno == 0 ? "" : std::string(": ") + std::strerror(errno);
        std::cerr << "quenxctl: Cannot write the output" << reason << ".\n";
        if (!mayHaveUpdated && status == cli::ExitStatus::Done) status = cli::ExitStatus::Failed;
    }
    return static_cast<int>(status);
}
