// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <stdexcept>
#include <string>

#include "MidAPI/AdapterTypes.h"
#include "Utils/Log.h"

namespace ma {

/// An operation failed, or was refused: how code and text travel inside a backend.
class OperationFailure : public std::runtime_error {
  public:
    OperationFailure(std::uint32_t code, const std::string& text) : std::runtime_error(text), m_code(code) {}
    std::uint32_t code() const { return m_code; }

  private:
    std::uint32_t m_code;
};

/// The code of a failure that has an errno value: that value, unless it is one of the adapter API's own
/// numbers, which mean other things.
inline std::uint32_t codeOf(int error) {
    return error <= static_cast<int>(WriteError::DeviceFailed) ? WriteError::DeviceFailed
                                                               : static_cast<std::uint32_t>(error);
}

/// How long a writer waits for the lock of an adapter or a card: for somebody who looks whether it is free,
/// not for another update.
inline constexpr std::chrono::milliseconds kWriterPatience{1000};

/// @param what  "adapter eth0"
/// @param writer  who is writing to it; see os::FileLock::holder()
[[noreturn]] inline void refuseAsBusy(const std::string& what, const std::string& writer) {
    throw OperationFailure(WriteError::Busy,
                           what + " is being written to by " + writer + "; wait until it is done");
}

/// For an image that was held against versions which are no longer there: it may be older than what another
/// process has installed meanwhile.
[[noreturn]] inline void refuseAsOutdated(const std::string& adapter) {
    throw OperationFailure(WriteError::Busy, "adapter " + adapter +
                                                 " has other firmware than when the image was checked: "
                                                 "somebody else has updated it; check the image again");
}

/// Runs an operation and turns what it throws into the adapter API's code and text. The log has
/// it, too. AdapterError passes through.
/// @param subject  what the log calls the adapter: "adapter 0000:05:00.0"
template <typename Action>
bool runReporting(const std::string& subject, std::uint32_t& errorCode, std::string& errorText,
                  Action action) {
    errorCode = WriteError::NoError;
    errorText.clear();
    try {
        action();
        return true;
    } catch (const OperationFailure& failure) {
        errorCode = failure.code();
        errorText = failure.what();
    } catch (const std::runtime_error& error) {
        errorCode = WriteError::DeviceFailed;
        errorText = error.what();
    }
    QUENX_ERROR("%s: %s", subject.c_str(), errorText.c_str());
    return false;
}

}  // namespace ma
