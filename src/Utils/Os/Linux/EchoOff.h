// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <signal.h>
#include <termios.h>
#include <unistd.h>

#include <array>
#include <cstddef>

namespace os {

/// Nothing typed on the terminal of standard input is shown while one exists, and a signal that ends the
/// program gives the terminal back first; Ctrl-Z has to wait. Prompt after making it: what was typed before
/// is thrown away. Without a terminal nothing happens. One at a time.
class EchoOff {
  public:
    EchoOff() {
        if (tcgetattr(STDIN_FILENO, &m_saved) != 0) return;
        m_isTerminal = true;
        for (std::size_t i = 0; i < kSignals.size(); ++i)
            replace(kSignals[i], m_actions[i]);
        termios silent = m_saved;
        silent.c_lflag &= ~static_cast<tcflag_t>(ECHO);
        silent.c_lflag |= NOFLSH;  // Ctrl-Z does not drop half a password either
        tcsetattr(STDIN_FILENO, TCSAFLUSH, &silent);
    }
    ~EchoOff() {
        if (!m_isTerminal) return;
        tcsetattr(STDIN_FILENO, TCSADRAIN, &m_saved);
        for (std::size_t i = 0; i < kSignals.size(); ++i)
            sigaction(kSignals[i], &m_actions[i], nullptr);
    }
    EchoOff(const EchoOff&) = delete;
    EchoOff& operator=(const EchoOff&) = delete;

  private:
    static constexpr std::array<int, 5> kSignals = {SIGINT, SIGTERM, SIGHUP, SIGQUIT, SIGTSTP};

    /// What was typed of a password is not left to the program that reads next.
    static void restoreAndEnd(int number) {
        tcsetattr(STDIN_FILENO, TCSAFLUSH, &m_saved);
        (void)signal(number, SIG_DFL);
        (void)raise(number);
    }

    static void replace(int number, struct sigaction& before) {
        struct sigaction action = {};
        action.sa_handler = number == SIGTSTP ? SIG_IGN : &restoreAndEnd;
        sigaction(number, nullptr, &before);
        // One that is ignored, as under nohup, stays so.
        if (before.sa_handler != SIG_IGN) sigaction(number, &action, nullptr);
    }

    static inline termios m_saved{};  ///< where a signal handler finds it
    std::array<struct sigaction, kSignals.size()> m_actions{};
    bool m_isTerminal = false;
};

}  // namespace os
