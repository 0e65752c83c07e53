// SPDX-License-Identifier: Apache-2.0
// quenxctl: reads the arguments, opens the way to the model, runs the verb, says what went wrong.
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstring>
#include <iostream>
#include <string_view>
#include <thread>

#include "Cli/Arguments.h"
#include "Cli/Display/Output.h"
#include "Utils/Os/Linux/linux.h"

namespace cli {

namespace {

constexpr const char* kAskLog = "The system log has the details.";

std::atomic<bool> interruptionAsked{false};
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler stores it");

/// An update in this process would die with it, and one on a server goes on unseen: so Ctrl-C is only noted.
void noteInterruptions() {
    struct sigaction action = {};
    action.sa_handler = [](int) { interruptionAsked = true; };
    action.sa_flags = SA_RESTART;  // a read or write under way is not what the user wants to stop
    for (const int signal : {SIGINT, SIGTERM, SIGHUP})
        sigaction(signal, &action, nullptr);
    // If the reader of a pipe has gone, or a file may not grow, writing fails, and the update goes on; so it
    // does after a signal that means nothing here.
    action.sa_handler = SIG_IGN;
    for (const int signal : {SIGPIPE, SIGXFSZ, SIGUSR1, SIGUSR2, SIGALRM, SIGVTALRM, SIGPROF, SIGIO, SIGPWR})
        sigaction(signal, &action, nullptr);
}

std::string adviceFor(const core::CimError& error) {
    switch (error.status()) {
        case core::CimStatus::InvalidClass:
            return kAskMof;
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
                       : kAskLog;
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
    // On standard output: a script reads its one document there, however the verb ended.
    if (json) {
        printJson(std::cout, {{"error", what}, {"advice", advice}, {"exitStatus", static_cast<int>(status)}});
        return status;
    }
    std::cerr << "quenxctl: " << printable(what) << '\n';
    if (!advice.empty()) std::cerr << printable(advice) << '\n';
    return status;
}

ExitStatus runVerb(const Arguments& arguments) {
    // Standard output is for the document then.
    LinePrinter printer(arguments.json ? std::cerr : std::cout,
                        Terminal::of(arguments.json ? STDERR_FILENO : STDOUT_FILENO));
    ProgressDisplay progress(printer);
    const Connection connection = arguments.server.url
                                      ? openServer(arguments.server, [] { return interruptionAsked.load(); })
                                      : openProviders(arguments.providers);
    // Only now: at the prompt for the password, Ctrl-C still ends the program.
    if (arguments.startsUpdate()) noteInterruptions();
    // Polling costs a server a request each time; in process it is free.
    const std::chrono::milliseconds pause(connection.isInProcess ? 50 : 500);
    const Following following = {.pause = [pause] { std::this_thread::sleep_for(pause); },
                                 .interrupted =
                                     [untilTheEnd = connection.isInProcess] {
                                         return untilTheEnd ? interruptionAsked.exchange(false)
                                                            : interruptionAsked.load();
                                     },
                                 .untilTheEnd = connection.isInProcess};
    Context context{.connection = connection,
                    .out = std::cout,
                    .error = std::cerr,
                    .json = arguments.json,
                    .progress = progress,
                    .following = following};
    return arguments.verb(context, arguments.options);
}

/// @param arguments  set once they are read
ExitStatus runAndReport(int argc, char** argv, std::optional<Arguments>& arguments) {
    const bool json = asksForJson(argc, argv);
    try {
        arguments = readArguments(argc, argv);
        return arguments ? runVerb(*arguments) : ExitStatus::Done;
    } catch (const CommandError& error) {
        return report(json, error.status(), error.what(), error.advice());
    } catch (const core::CimError& error) {
        return report(json, statusFor(error.status()), sentence(error.what()), adviceFor(error));
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
