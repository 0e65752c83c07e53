// SPDX-License-Identifier: Apache-2.0
#pragma once

namespace test {

/// From here on a generic-netlink socket kills whatever process of the test program's opens it, and of those
/// that it starts: no test may reach the machine's own adapters. False where the system has no filter for
/// that, and for whom it would cost the right to start programs that gain rights: all but root. Socket calls
/// of 32-bit programs cannot be filtered.
bool forbidGenericNetlink();

}  // namespace test
