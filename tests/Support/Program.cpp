// SPDX-License-Identifier: Apache-2.0
#include "Support/Program.h"

#include <fcntl.h>
#include <poll.h>
#include <pty.h>
#include <signal.h>
#include <sys/wait.h>
#include <termios.h>
#include <unistd.h>

#include <array>
#include <cstdlib>
#include <system_error>

namespace test {

namespace {

constexpr int kSilenceMs = 60'000;

[[noreturn]] void become(const std::vector<std::string>& command,
                         const std::vector<std::string>& environment) {
    // Without "=" it removes the name.
    for (const std::string& one : environment)
        putenv(const_cast<char*>(one.c_str()));
    std::vector<char*> arguments;
    for (const std::string& one : command)
        arguments.push_back(const_cast<char*>(one.c_str()));
    arguments.push_back(nullptr);
    execv(arguments.front(), arguments.data());
    _exit(127);
}

/// Appends what can be read now; false at the end.
bool readInto(int descriptor, std::string& text) {
    std::array<char, 4096> buffer;
    const ssize_t count = read(descriptor, buffer.data(), buffer.size());
    // A terminal's other end answers EIO once the program has gone.
    if (count <= 0) return false;
    text.append(buffer.data(), static_cast<std::size_t>(count));
    return true;
}

void closeOnce(int& descriptor) {
    if (descriptor >= 0) close(descriptor);
    descriptor = -1;
}

}  // namespace

Program::Program(const std::vector<std::string>& command, Output output,
                 const std::vector<std::string>& environment) {
    if (output == Output::Terminal) {
        const winsize size{24, 100, 0, 0};
        m_child = forkpty(&m_out, nullptr, nullptr, &size);
        if (m_child == 0) {
            // Else Ctrl-C throws away what the program has just said and the test has not read yet.
            termios mode{};
            tcgetattr(STDIN_FILENO, &mode);
            mode.c_lflag |= NOFLSH;
            tcsetattr(STDIN_FILENO, TCSANOW, &mode);
            become(command, environment);
        }
        return;
    }
    std::array<int, 2> out{};
    std::array<int, 2> error{};
    if (pipe2(out.data(), O_CLOEXEC) != 0 || pipe2(error.data(), O_CLOEXEC) != 0) {
        throw std::system_error(errno, std::generic_category(), "pipe2");
    }
    m_child = fork();
    if (m_child == 0) {
        dup2(out[1], STDOUT_FILENO);
        dup2(error[1], STDERR_FILENO);
        become(command, environment);
    }
    close(out[1]);
    close(error[1]);
    m_out = out[0];
    m_error = error[0];
}

Program::~Program() {
    if (m_child > 0) {
        kill(m_child, SIGKILL);
        waitpid(m_child, nullptr, 0);
    }
    closeOnce(m_out);
    closeOnce(m_error);
}

bool Program::readSome() {
    std::array<pollfd, 2> watched = {{{m_out, POLLIN, 0}, {m_error, POLLIN, 0}}};
    if ((m_out < 0 && m_error < 0) || poll(watched.data(), watched.size(), kSilenceMs) <= 0) return false;
    if (watched[0].revents != 0 && !readInto(m_out, m_result.out)) closeOnce(m_out);
    if (watched[1].revents != 0 && !readInto(m_error, m_result.error)) closeOnce(m_error);
    return true;
}

bool Program::waitFor(const std::string& text) {
    while (!contains(m_result.out, text) && !contains(m_result.error, text)) {
        if (!readSome()) return false;
    }
    return true;
}

void Program::type(const std::string& keys) {
    if (write(m_out, keys.data(), keys.size()) < 0)
        throw std::system_error(errno, std::generic_category(), "write");
}

void Program::send(int signal) {
    // After finish() there is no child, and kill() would take -1 for every process there is.
    if (m_child > 0) kill(m_child, signal);
}

void Program::closeOutput() {
    closeOnce(m_out);
}

ProgramResult Program::finish() {
    while (readSome()) {
    }
    // Still open: the program hangs.
    if (m_out >= 0 || m_error >= 0) kill(m_child, SIGKILL);
    int status = 0;
    waitpid(m_child, &status, 0);
    m_child = -1;
    m_result.status = WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
    return m_result;
}

bool contains(const std::string& text, const std::string& part) {
    return text.find(part) != std::string::npos;
}

ProgramResult run(const std::vector<std::string>& command, const std::vector<std::string>& environment) {
    return Program(command, Program::Output::Pipes, environment).finish();
}

}  // namespace test
