// SPDX-License-Identifier: Apache-2.0
#pragma once

/// Everything is compiled with hidden visibility; this marks what other libraries may link against.
#define QUENX_EXPORT __attribute__((visibility("default")))
