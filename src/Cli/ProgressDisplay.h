// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <functional>
#include <string>

#include "Cli/LinePrinter.h"
#include "Cli/ProgressText.h"
#include "Cli/UpdateObserver.h"

namespace cli {

/// Shows an update: a bar on a terminal, a line now and then elsewhere.
class ProgressDisplay : public UpdateObserver {
  public:
    using Clock = std::function<std::chrono::steady_clock::time_point()>;

    explicit ProgressDisplay(LinePrinter& printer, Clock clock = std::chrono::steady_clock::now);

    void started(const std::string& adapter, std::uint64_t bytes) override;
    void progressed(unsigned percent) override;
    void interrupted() override;
    void ended(const JobView& job) override;

  private:
    void showLine(std::chrono::steady_clock::time_point now);

    LinePrinter& printer_;
    Clock clock_;
    Progress progress_;
    std::chrono::steady_clock::time_point firstSeen_;
    bool moving_ = false;
    unsigned lastLine_ = 0;
    std::chrono::steady_clock::time_point lastLineAt_;
};

}  // namespace cli
