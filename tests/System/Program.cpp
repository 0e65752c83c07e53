// SPDX-License-Identifier: Apache-2.0
#include "System/Program.h"

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

constexpr int SILENCE_MS = 60'000;

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
        child_ = forkpty(&out_, nullptr, nullptr, &size);
        if (child_ == 0) {
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
    child_ = fork();
    if (child_ == 0) {
        dup2(out[1], STDOUT_FILENO);
        dup2(error[1], STDERR_FILENO);
        become(command, environment);
    }
    close(out[1]);
    close(error[1]);
    out_ = out[0];
    error_ = error[0];
}

Program::~Program() {
    if (child_ > 0) {
        kill(child_, SIGKILL);
        waitpid(child_, nullptr, 0);
    }
    closeOnce(out_);
    closeOnce(error_);
}

bool Program::readSome() {
    std::array<pollfd, 2> watched = {{{out_, POLLIN, 0}, {error_, POLLIN, 0}}};
    if ((out_ < 0 && error_ < 0) || poll(watched.data(), watched.size(), SILENCE_MS) <= 0) return false;
    if (watched[0].revents != 0 && !readInto(out_, result_.out)) closeOnce(out_);
    if (watched[1].revents != 0 && !readInto(error_, result_.error)) closeOnce(error_);
    return true;
}

bool Program::waitFor(const std::string& text) {
    while (!contains(result_.out, text) && !contains(result_.error, text)) {
        if (!readSome()) return false;
    }
    return true;
}

void Program::type(const std::string& keys) {
    if (write(out_, keys.data(), keys.size()) < 0)
        throw std::system_error(errno, std::generic_category(), "write");
}

void Program::send(int signal) {
    // After finish() there is no child, and kill() would take -1 for every process there is.
    if (child_ > 0) kill(child_, signal);
}

void Program::closeOutput() {
    closeOnce(out_);
}

ProgramResult Program::finish() {
    while (readSome()) {
    }
    // Still open: the program hangs.
    if (out_ >= 0 || error_ >= 0) kill(child_, SIGKILL);
    int status = 0;
    waitpid(child_, &status, 0);
    child_ = -1;
    result_.status = WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
    return result_;
}

bool contains(const std::string& text, const std::string& part) {
    return text.find(part) != std::string::npos;
}

ProgramResult run(const std::vector<std::string>& command, const std::vector<std::string>& environment) {
    return Program(command, Program::Output::Pipes, environment).finish();
}

}  // namespace test
