#include "MidAPI/AdapterError.h"

namespace ma {

AdapterError::AdapterError(const std::string& text) : utils::Exception("%s", text.c_str()) {}

AdapterError::~AdapterError() = default;

}  // namespace ma
