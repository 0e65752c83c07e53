#include "Support/ChildProcess.h"

#include <grp.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <exception>

namespace test {

namespace {

constexpr uid_t nobody = 65534;

[[noreturn]] void runChild(int output, const std::function<std::string()>& body) {
    std::string outcome;
    if (geteuid() == 0 && (setgroups(0, nullptr) != 0 || setgid(nobody) != 0 || setuid(nobody) != 0)) {
        outcome = "could not drop to nobody";
    } else {
        try {
            outcome = body();
        } catch (const std::exception& failure) {
            outcome = std::string("unexpected exception: ") + failure.what();
        }
    }
    const bool isWritten =
        write(output, outcome.data(), outcome.size()) == static_cast<ssize_t>(outcome.size());
    // Not exit: the parent's static objects are not the child's to destroy.
    _exit(isWritten ? 0 : 1);
}

}  // namespace

std::string runAsNobody(const std::function<std::string()>& body) {
    std::array<int, 2> ends{};
    if (pipe(ends.data()) != 0) return "no pipe";
    const pid_t child = fork();
    if (child == 0) runChild(ends[1], body);
    close(ends[1]);
    std::string outcome = child < 0 ? "no child" : "";
    for (char next = 0; read(ends[0], &next, 1) == 1;)
        outcome += next;
    close(ends[0]);
    int status = 0;
    if (child > 0 && (waitpid(child, &status, 0) != child || status != 0)) {
        outcome += "(child ended with status " + std::to_string(status) + ")";
    }
    return outcome;
}

}  // namespace test
