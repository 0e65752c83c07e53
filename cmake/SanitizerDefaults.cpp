// SPDX-License-Identifier: Apache-2.0
// What the address sanitizer does in programs, however they are started.

// Clang 14's takes the bytes before a library's thread-local storage for a header of an older C library's,
// and the search for leaks then reads wherever they point. Without that it finds these blocks all the same,
// by the thread's table. NOLINTNEXTLINE(bugprone-reserved-identifier): the sanitizer calls it
extern "C" __attribute__((visibility("default"))) const char* __asan_default_options();
// NOLINTNEXTLINE(bugprone-reserved-identifier)
const char* __asan_default_options() {
    return "intercept_tls_get_addr=0";
}
