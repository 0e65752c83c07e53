// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <map>
#include <mutex>
#include <stop_token>
#include <string>
#include <vector>

namespace host {

/// How fast passwords can be tried.
struct LoginPace {
    std::chrono::milliseconds firstDelay{
        100};  ///< after the first failure; twice that after each further one
    std::chrono::milliseconds longestOfPlace{2000};  ///< between the attempts from one place
    std::chrono::milliseconds longestOfUser{1000};   ///< between the attempts on one user, from all places
    std::chrono::milliseconds leastAnswer{500};      ///< from the check of a wrong password to its answer
    std::chrono::seconds patience{60};               ///< how long an attempt waits for its turn
};

/// What delays the failures of a place, or those on a user, earn: the first a short one, each further one
/// twice that. Forgotten a quarter of an hour after the last. Not for use by two threads at once.
class FailureDelays {
  public:
    using Clock = std::chrono::steady_clock;

    FailureDelays(Clock::duration first, Clock::duration longest) : m_first(first), m_longest(longest) {}

    /// When the next attempt may be looked at; a time of the past where there was no failure.
    Clock::time_point nextOf(const std::string& key) const;
    /// When the last one was looked at; the beginning of time for none.
    Clock::time_point lastOf(const std::string& key) const;

    /// An attempt is looked at. Without memory, neither is remembered: a queue that has begun to call
    /// somebody must go on.
    void admitted(const std::string& key, Clock::time_point now) noexcept;
    void failed(const std::string& key, Clock::time_point now) noexcept;
    void succeeded(const std::string& key);

  private:
    struct Record {
        unsigned int failures = 0;
        Clock::time_point next;
        Clock::time_point last;
    };

    /// Null without memory.
    Record* recordOf(const std::string& key, Clock::time_point now) noexcept;
    Clock::duration delayAfter(unsigned int failures) const;

    const Clock::duration m_first;
    const Clock::duration m_longest;
    std::map<std::string, Record> m_records;
};

/// Whose password is checked next. Those who have sent the right one before go first, and without delay. Of
/// the others, the place whose last turn is longest ago; of a place, whoever came first. So a crowd that
/// guesses delays itself, and keeps nobody else out: neither a user whose password it guesses, nor a newcomer
/// in its midst. Thread-safe.
class LoginQueue {
  public:
    using Clock = std::chrono::steady_clock;

    struct Attempt {
        std::string user;
        std::string place;     ///< as placeOf() has it
        bool isKnown = false;  ///< the same credentials were right before, from there
    };

    explicit LoginQueue(const LoginPace& pace);

    /// The right to have a password checked, for the scope; false when none was to be had. Waits for it.
    class Turn {
      public:
        Turn(LoginQueue& queue, const Attempt& attempt, const std::stop_token& stop)
            : m_queue(queue), m_attempt(attempt), m_isHeld(queue.enter(attempt, stop)) {}
        ~Turn() {
            if (m_isHeld) m_queue.leave();
        }
        Turn(const Turn&) = delete;
        Turn& operator=(const Turn&) = delete;

        explicit operator bool() const { return m_isHeld; }
        void succeeded() { m_queue.succeeded(m_attempt); }
        void failed() { m_queue.failed(m_attempt); }

      private:
        LoginQueue& m_queue;
        const Attempt& m_attempt;
        const bool m_isHeld;
    };

    /// How long after its beginning a check that failed is answered, given what it took: as long for an
    /// unknown user as for a known one, however different their checks are.
    Clock::duration answerAfter(Clock::duration took);

  private:
    struct Waiter {
        const Attempt& attempt;
        bool isCalled = false;
        bool keepsTime = false;  ///< has to look again when it may go, and to call whoever goes then
        std::condition_variable_any called{};
    };

    bool enter(const Attempt& attempt, const std::stop_token& stop);
    void leave();
    void succeeded(const Attempt& attempt);
    void failed(const Attempt& attempt);
    Clock::time_point readyAt(const Attempt& attempt) const;
    std::vector<Waiter*>::iterator next(Clock::time_point now);
    void callNext() noexcept;
    void chooseTimekeeper() noexcept;

    const LoginPace m_pace;
    std::mutex m_mutex;
    FailureDelays m_places;
    FailureDelays m_users;
    std::vector<Waiter*> m_waiting;  ///< in the order in which they came
    unsigned int m_running = 0;
    Clock::duration m_slowest{};
};

}  // namespace host
