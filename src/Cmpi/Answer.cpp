// SPDX-License-Identifier: Apache-2.0
// How requests end.
#include <pthread.h>

#include "BuildId.h"
#include "Cmpi/Request.h"
#include "Cmpi/Slots.h"
#include "Framework/Requests/Audit.h"
#include "Utils/Build.h"

/// Only the libraries of this build have it. Where they are of another one, nothing of theirs may be used.
extern "C" [[gnu::weak]] QUENX_EXPORT const char QUENX_BUILD_SYMBOL;

namespace cmpi {

namespace {

using core::CimStatus;

/// Object managers cancel threads of theirs that last too long. A cancelled one would unwind through code
/// that turns every exception into an answer, which ends the process.
class CancellationBan {
  public:
    CancellationBan() { ::pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &m_before); }
    ~CancellationBan() { ::pthread_setcancelstate(m_before, nullptr); }
    CancellationBan(const CancellationBan&) = delete;
    CancellationBan& operator=(const CancellationBan&) = delete;

  private:
    int m_before = 0;
};

/// Object managers of this level know the codes up to 17.
ReturnCode codeOf(CimStatus status) {
    return status > CimStatus::MethodNotFound ? ReturnCode::Failed : static_cast<ReturnCode>(status);
}

/// The error as an instance of CIM_Error (DSP0004 5.2, DMTF CIM schema), where the object manager knows such.
void giveError(const Broker& broker, const Result* result, ReturnCode code, const std::string& text) {
    const bool isKnown = broker.eft != nullptr && broker.eft->ftVersion >= kLevel && result != nullptr &&
                         result->ft != nullptr && result->ft->ftVersion >= kLevel;
    if (!isKnown) return;
    constexpr int kTypeSoftware = 4;
    constexpr int kSeverityLow = 2;
    constexpr int kSeverityHigh = 4;
    constexpr int kCauseUnknown = 0;
    constexpr int kCauseSoftwareError = 46;
    const bool isOurFault = code == ReturnCode::Failed;
    const std::string id = "QUENX" + std::to_string(static_cast<int>(code));
    Error* error = call(broker, broker.eft, &BrokerEncTable::newCMPIError, "Quenx", id.c_str(), text.c_str(),
                        isOurFault ? kSeverityHigh : kSeverityLow,
                        isOurFault ? kCauseSoftwareError : kCauseUnknown, code, nullptr);
    if (error == nullptr) return;
    call(error, &ErrorTable::setErrorType, kTypeSoftware);
    call(result, &ResultTable::returnError, error);
}

Status failure(const Sender& sender, CimStatus status, const std::string& text) {
    const Broker& broker = Front::theOne().broker();
    const ReturnCode code = codeOf(status);
    giveError(broker, sender.result, code, text);
    return {code, newString(broker, text)};
}

Status refuseForBuild(const Sender& sender) {
    return failure(
        sender, CimStatus::Failed,
        std::string("libQuenx_Cmpi.so is of build " QUENX_BUILD_ID ", the other libraries are of build ") +
            utils::buildId() + ". Install all of them from one build, and restart the object manager.");
}

Status carryOut(const Sender& sender, const std::function<void()>& body) {
    try {
        body();
        return {ReturnCode::Ok, nullptr};
    } catch (const core::CimError& error) {
        return failure(sender, error.status(), core::shownText(error));
    } catch (const std::bad_alloc&) {
        return failure(sender, CimStatus::Failed, "out of memory");
    } catch (const std::exception& error) {
        return failure(sender, CimStatus::Failed, core::shownText(error));
    }
}

}  // namespace

Status statusOf(const Sender& sender, const std::function<void()>& body) noexcept {
    const CancellationBan ban;
    try {
        if (&QUENX_BUILD_SYMBOL == nullptr) return refuseForBuild(sender);
        return carryOut(sender, body);
    } catch (...) {
        // Not even the text could be built.
        return {ReturnCode::Failed, nullptr};
    }
}

Status answerWith(const Sender& sender, const std::function<void(Request&)>& body) noexcept {
    const auto whole = [&] {
        Request request(sender);
        body(request);
        if (call(sender.result, &ResultTable::returnDone).rc != ReturnCode::Ok)
            throw core::CimError(CimStatus::Failed, "the object manager did not take the end of the results");
    };
    return statusOf(sender, std::cref(whole));
}

}  // namespace cmpi
