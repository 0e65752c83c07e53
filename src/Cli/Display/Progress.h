// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>

#include "Cli/Display/Terminal.h"

/// The progress of an update in three layers: ProgressDisplay is told what happens, the texts say it in
/// words, and a LinePrinter puts them on this terminal.
namespace cli {

/// How far an update is.
struct UpdateProgress {
    std::string adapter;
    unsigned percent = 0;
    std::uint64_t bytes = 0;               ///< of the whole image; 0 when that is not known
    std::chrono::milliseconds elapsed{0};  ///< since the first progress was seen
    unsigned percentAtStart = 0;           ///< what that first progress was
};

/// "eth0  [=======>      ]  52 %  128.3 KiB of 246.8 KiB  41.2 KiB/s  0:03 left", for a line of that width.
std::string barText(const UpdateProgress& progress, std::size_t width);
/// The same without a bar, for a log: "eth0: 52 %, 128.3 KiB of 246.8 KiB, 41.2 KiB/s, 0:03 left".
std::string lineText(const UpdateProgress& progress);
/// "512 B", "41.2 KiB", "3.0 MiB".
std::string byteText(std::uint64_t bytes);
/// "0:03", "12:40", "1:02:03".
std::string durationText(std::chrono::seconds duration);

/// Shows an update: a bar on a terminal, a line now and then elsewhere.
class ProgressDisplay {
  public:
    using Clock = std::function<std::chrono::steady_clock::time_point()>;

    explicit ProgressDisplay(LinePrinter& printer, Clock clock = std::chrono::steady_clock::now);

    /// @param bytes  size of what is written; 0 when that is not known
    void started(const std::string& adapter, std::uint64_t bytes);
    /// At every look at the job that shows how far it is; never less than before, and 100 only when the job
    /// completed.
    void progressed(unsigned percent);
    /// The user wants to stop, which an update cannot.
    void interrupted();
    void ended();

  private:
    void showLine(std::chrono::steady_clock::time_point now);

    LinePrinter& m_printer;
    Clock m_clock;
    UpdateProgress m_progress;
    std::optional<std::chrono::steady_clock::time_point> m_movesSince;
    unsigned m_lastLine = 0;
    std::chrono::steady_clock::time_point m_lastLineAt;
};

}  // namespace cli
