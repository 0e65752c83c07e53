// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <microhttpd.h>

#include "Host/Server/HttpRequest.h"

namespace host {

/// A response of the HTTP library with the body of the answer, which is taken over without a copy; its charge
/// is given back when the library has sent it, or cannot. Null without memory.
MHD_Response* makeResponse(HttpAnswer& answer);

}  // namespace host
