#pragma once

namespace test {

/// Refuses every new thread of the process with EAGAIN, for a scope.
class ThreadRefusal {
  public:
    ThreadRefusal();
    ~ThreadRefusal();
    ThreadRefusal(const ThreadRefusal&) = delete;
    ThreadRefusal& operator=(const ThreadRefusal&) = delete;

    /// How many were refused since the last scope began.
    static int count();
};

}  // namespace test
