#pragma once

#include <string>

#include "Utils/Exception.h"
#include "Utils/Export.h"

namespace ma {

/// What an operation throws that has no other way to report a failure. The text is a whole sentence for
/// people; at most 511 characters are kept.
class QUENX_EXPORT AdapterError : public utils::Exception {
  public:
    explicit AdapterError(const std::string& text);
    ~AdapterError() override;
};

}  // namespace ma
