// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimError.h"

#include <new>

namespace core {

CimError::CimError(CimStatus status, const std::string& description)
    : std::runtime_error(description), m_status(status) {}

CimError::~CimError() = default;

void rethrowAsCimError() {
    try {
        throw;
    } catch (const CimError&) {
        throw;
    } catch (const std::bad_alloc&) {
        // The front answers it in a few fixed words.
        throw;
    } catch (const std::exception& failure) {
        throw CimError(CimStatus::Failed, failure.what());
    } catch (...) {
        throw CimError(CimStatus::Failed, "the provider failed without saying why");
    }
}

}  // namespace core
