#include "Providers/SoftwareUpdate/VerifyJobResult.h"

#include "Providers/SoftwareUpdate/UpdateExceptions.h"
#include "Utils/Log.h"

namespace {

template <class T>
bool is(const utils::Exception& exception) {
    return dynamic_cast<const T*>(&exception) != nullptr;
}

struct Handler {
    bool (*handles)(const utils::Exception&);
    int code;
};

constexpr Handler kHandlers[] = {
    {is<EJobIsRunning>, VerifyJobResult::JobIsRunning},
    {is<ETargetInUse>, VerifyJobResult::TargetInUse},
    {is<EInvalidUri>, VerifyJobResult::InvalidUri},
    {is<EUriDoesNotExist>, VerifyJobResult::UriDoesNotExist},
    {is<EImageReadError>, VerifyJobResult::ImageReadError},
    {is<EAdapterNotSupported>, VerifyJobResult::AdapterNotSupported},
    {is<utils::EInvalidParameter>, VerifyJobResult::InvalidParameter},
    {is<utils::EUnspecifiedError>, VerifyJobResult::UnspecifiedError},
    {is<EDowngradeDetected>, VerifyJobResult::DowngradeDetected},
    {is<ENotApplicableForTarget>, VerifyJobResult::NotApplicableForTarget},
};

/// Null when the exception is no refusal.
const Handler* handlerOf(const utils::Exception& exception) {
    for (const Handler& handler : kHandlers) {
        if (handler.handles(exception)) return &handler;
    }
    return nullptr;
}

}  // namespace

bool isRefusal(const utils::Exception& exception) {
    return handlerOf(exception) != nullptr;
}

int verifyJobResultOfCurrentException() noexcept {
    try {
        throw;
    } catch (const utils::Exception& exception) {
        if (const Handler* handler = handlerOf(exception)) {
            QUENX_ERROR("Exception: '%s'", exception.what());
            return handler->code;
        }
    } catch (...) {
        // Not a refusal: nothing to say beyond what it logged itself.
    }
    return VerifyJobResult::UnspecifiedError;
}
