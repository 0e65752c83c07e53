// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Utils/Utils.h"

namespace cli {

using utils::joined;

/// What the program tells the script that called it; the help text documents them.
enum class ExitStatus {
    Done = 0,
    Failed = 1,
    WrongUse = 2,
    AlreadyCurrent = 3,  ///< what was to be installed is what is installed
    NotFound = 4,        ///< what the command line names is not there: an adapter, a job, an image file
    Unknown = 5,         ///< whether an update began, or how it ended, cannot be told
    Interrupted = 6,     ///< by the user; an update that a server has begun goes on
    ResetPending = 7,    ///< adapters have firmware that waits for a reset
};

/// The advice where the program knows no better.
inline constexpr const char* kAskLog = "The system log may have the details.";

/// The advice where a policy cannot be obeyed, on this machine or another.
inline constexpr const char* kMendPolicy =
    "Whoever administers the machine with the adapters has to mend that file; until then nothing is "
    "installed "
    "there.";

/// What happened and what to do next, each one or two sentences. The advice may be empty.
struct Explanation {
    std::string message;
    std::string advice;
    ExitStatus status = ExitStatus::Failed;
};

/// The end of a verb that could not do its work.
class CommandError : public std::runtime_error {
  public:
    CommandError(ExitStatus status, const std::string& message, std::string advice)
        : std::runtime_error(message), m_status(status), m_advice(std::move(advice)) {}

    ExitStatus status() const { return m_status; }
    const std::string& advice() const { return m_advice; }

  private:
    ExitStatus m_status;
    std::string m_advice;
};

/// The server does not let the user in: asking again would be answered the same, and counts as guessing.
class LoginRefused : public CommandError {
  public:
    using CommandError::CommandError;
};

/// Why a file could not be read: `error` is an errno. NotFound for one that is not there.
Explanation cannotRead(const std::string& file, int error);

/// An error text of the model or a server, which may be no more than a few words, as a sentence. What begins
/// with a path or a name of code keeps its letters.
std::string sentence(std::string text);

/// "Did you mean eth0? " for a misspelt word: the one known word that it is nearest to, with a space for what
/// follows. Empty when none is near, or when several are equally near.
std::string didYouMean(std::string_view word, const std::vector<std::string>& known);

}  // namespace cli
