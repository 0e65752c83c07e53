// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>

#include "Framework/Requests/CimOperations.h"

namespace core {

/// The bytes that a value takes, as its real buffers have them.
QUENX_EXPORT std::size_t bytesOf(const CimPath& path);
QUENX_EXPORT std::size_t bytesOf(const InstanceValue& instance);

/// Told what the answer to a request takes while the request layer builds it, so that a front can give up an
/// answer before the memory is gone. Used from the thread of the request.
class QUENX_EXPORT AnswerMeter {
  public:
    AnswerMeter() = default;
    AnswerMeter(const AnswerMeter&) = delete;
    AnswerMeter& operator=(const AnswerMeter&) = delete;
    virtual ~AnswerMeter();

    /// So many bytes more. What this throws ends the request; of all exceptions only CimError and those
    /// derived from std::bad_alloc leave the request layer as they are.
    virtual void add(std::size_t bytes) = 0;

    /// Measures the requests of the calling thread for the length of a scope.
    class QUENX_EXPORT Scope {
      public:
        explicit Scope(AnswerMeter& meter);
        ~Scope();
        Scope(const Scope&) = delete;
        Scope& operator=(const Scope&) = delete;
    };

    /// For the request layer: adds the value to the answer's list, and tells the thread's meter if it has
    /// one.
    template <class Value>
    static void append(std::vector<Value>& answer, Value value) {
        if (current() != nullptr) tell(bytesOf(value));
        answer.push_back(std::move(value));
    }
    /// For what is written down at once: tells the thread's meter if it has one.
    static void tell(std::size_t bytes) {
        if (AnswerMeter* meter = current()) meter->add(bytes);
    }

  private:
    static AnswerMeter* current();
};

}  // namespace core
