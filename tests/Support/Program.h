// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/types.h>

#include <string>
#include <vector>

namespace test {

/// How a program ended and what it said.
struct ProgramResult {
    int status = -1;    ///< exit status; minus the signal's number when one ended it
    std::string out;    ///< standard output; on a terminal, all that it showed
    std::string error;  ///< standard error; empty on a terminal
};

/// A program that is run from outside, as a person or a script runs it. What is still running at the end of
/// the scope is killed.
class Program {
  public:
    enum class Output { Pipes, Terminal };

    /// @param environment  "NAME=value" to set, "NAME" to unset, over this process's own
    Program(const std::vector<std::string>& command, Output output = Output::Pipes,
            const std::vector<std::string>& environment = {});
    Program(const Program&) = delete;
    Program& operator=(const Program&) = delete;
    ~Program();

    /// Reads until the text has been seen; false when the program ended, or was silent for long, without it.
    bool waitFor(const std::string& text);
    /// Types on the terminal.
    void type(const std::string& keys);
    void send(int signal);
    /// Closes the reading end of standard output.
    void closeOutput();
    pid_t id() const { return m_child; }
    /// What it has written to standard output so far, as far as it was waited for.
    const std::string& seen() const { return m_result.out; }

    /// Reads to the end, and returns what there was from the start.
    ProgramResult finish();

  private:
    bool readSome();

    pid_t m_child = -1;
    int m_out = -1;
    int m_error = -1;
    ProgramResult m_result;
};

bool contains(const std::string& text, const std::string& part);

/// Runs to the end, with pipes.
ProgramResult run(const std::vector<std::string>& command, const std::vector<std::string>& environment = {});

}  // namespace test
