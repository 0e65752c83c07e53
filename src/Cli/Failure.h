// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <stdexcept>
#include <string>

#include "Cli/ExitStatus.h"

namespace cli {

/// What happened and what to do next, each one or two sentences.
struct Explanation {
    std::string message;
    std::string advice;
    ExitStatus status = ExitStatus::Failed;
};

/// Why a file could not be read: `error` is an errno. NotFound for one that is not there.
Explanation cannotRead(const std::string& file, int error);

/// The end of a verb that could not do its work: what happened, and what to do next.
class Failure : public std::runtime_error {
  public:
    /// @param advice  a full sentence that says what to do next; may be empty
    Failure(ExitStatus status, const std::string& what, std::string advice)
        : std::runtime_error(what), status_(status), advice_(std::move(advice)) {}

    ExitStatus status() const { return status_; }
    const std::string& advice() const { return advice_; }

  private:
    ExitStatus status_;
    std::string advice_;
};

}  // namespace cli
