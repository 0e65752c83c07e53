#pragma once

#include <termios.h>
#include <unistd.h>

namespace os {

/// Nothing typed on the terminal of standard input is shown while one exists. Prompt after making it: what
/// was typed before is thrown away.
class EchoOff {
  public:
    EchoOff() {
        tcgetattr(STDIN_FILENO, &m_saved);
        termios silent = m_saved;
        silent.c_lflag &= ~static_cast<tcflag_t>(ECHO);
        tcsetattr(STDIN_FILENO, TCSAFLUSH, &silent);
    }
    ~EchoOff() { tcsetattr(STDIN_FILENO, TCSADRAIN, &m_saved); }
    EchoOff(const EchoOff&) = delete;
    EchoOff& operator=(const EchoOff&) = delete;

  private:
    termios m_saved{};
};

}  // namespace os
