#include "Framework/Model/CimError.h"

namespace core {

CimError::CimError(CimStatus status, const std::string& description)
    : std::runtime_error(description), m_status(status) {}

CimError::~CimError() = default;

}  // namespace core
