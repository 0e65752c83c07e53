#pragma once

#include <string_view>

#include "Host/Authentication/Identity.h"
#include "Host/Operations/Dispatcher.h"
#include "Host/Server/HttpMessage.h"

namespace host {

/// Answers the body of an authenticated request: reads it, has it carried out, writes the response.
/// Thread-safe.
HttpAnswer answerBody(Dispatcher& dispatcher, const HttpHead& head, const Identity& identity,
                      std::string_view body);

}  // namespace host
