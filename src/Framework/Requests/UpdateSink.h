// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <future>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "Framework/Requests/Caller.h"
#include "Framework/Requests/Reasons.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"

/// How providers tell a front of the updates that they are asked for. The providers need nothing but this
/// interface: what a front keeps of it, and with which libraries, is the front's affair.
namespace core {

/// What can be said of an image from its bytes. What is not known is empty.
struct ImageFacts {
    std::string sha256;  ///< of the whole file, in lower-case hexadecimal digits
    std::uint64_t bytes = 0;
    std::string versions;  ///< "IMG_PXE 2, IMG_UEFI 2"
};

/// One call of a method that installs, as far as it got.
struct UpdateAttempt {
    Caller caller;
    std::uint64_t time = 0;       ///< when it came, microseconds since the Unix epoch
    std::uint64_t monotonic = 0;  ///< the same moment, as os::getMonotonicuSeconds() has it
    std::string target;           ///< the path of the target
    std::string adapter;          ///< empty while the target has not led to one
    std::string uri;
    std::vector<std::uint16_t> options;
    std::vector<std::string> values;              ///< beside the options
    ImageFacts image;                             ///< empty while the image was not read
    std::string signedBy = {};                    ///< the key by which the image is trusted
    std::vector<utils::FirmwareType> types = {};  ///< to install; of an accepted update
    std::string job = {};                         ///< its id; of an accepted update
    std::int64_t mostRecords = 100'000;           ///< that the policy lets a history keep
    std::string keepFolder = {};                  ///< where the policy has images kept that were written
    bool mustBeKept = false;                      ///< the policy lets no update go on without its record
};

/// An update that was accepted, until its end.
class QUENX_EXPORT UpdateRecord {
  public:
    UpdateRecord() = default;
    UpdateRecord(const UpdateRecord&) = delete;
    UpdateRecord& operator=(const UpdateRecord&) = delete;
    /// Without an end() before, the update did not take place.
    virtual ~UpdateRecord();

    /// The flash has ended. Called once, before anybody can see the end.
    /// @param code,text  as the adapter API left them
    virtual void end(bool succeeded, std::uint32_t code, const std::string& text) noexcept = 0;
};

/// What takes note of updates. Operations are called from any thread, let no failure out, and take a bounded
/// time: an update waits for its record, but never for long.
class QUENX_EXPORT UpdateSink {
  public:
    UpdateSink() = default;
    UpdateSink(const UpdateSink&) = delete;
    UpdateSink& operator=(const UpdateSink&) = delete;
    virtual ~UpdateSink();

    /// Looks at an image, beside the caller's work where that pays. The bytes must stay until the result is
    /// there. An invalid future where that cannot be done.
    virtual std::future<ImageFacts> examine(std::span<const std::uint8_t> file) noexcept = 0;
    /// An attempt that came to nothing.
    /// @param returnValue  of the method; 0 for a call that ended in an error without one
    /// @param text  the reason in words, which may say more than its row
    virtual void refused(const UpdateAttempt& attempt, unsigned int returnValue, ReasonId reason,
                         const std::string& text) noexcept = 0;
    /// Why no record could be kept now; empty where one can, which has been tried.
    virtual std::string problem() = 0;
    /// An update that begins as soon as this returns. Null where nothing can be kept of it, and for one that
    /// must be kept where it is not safe yet: it does not begin then.
    virtual std::shared_ptr<UpdateRecord> begin(const UpdateAttempt& attempt) noexcept = 0;

    /// The sink of this process; null where the front has none. It outlives the providers' requests and
    /// updates.
    static UpdateSink* installed() noexcept;
};

/// Makes a sink the one of this process, as long as this lives.
class QUENX_EXPORT InstalledSink {
  public:
    /// @param sink  null for none
    explicit InstalledSink(std::shared_ptr<UpdateSink> sink);
    ~InstalledSink();
    InstalledSink(const InstalledSink&) = delete;
    InstalledSink& operator=(const InstalledSink&) = delete;

  private:
    const std::shared_ptr<UpdateSink> m_sink;
};

}  // namespace core
