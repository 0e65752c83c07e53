// A program of its own, since it replaces the global allocation function by one that fails on demand.
#include <gtest/gtest.h>

#include <cstdlib>
#include <new>

#include "Support/SyslogCapture.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"

namespace {

thread_local long allocationsLeft = -1;  // negative: no limit

}  // namespace

void* operator new(std::size_t size) {
    if (allocationsLeft == 0) throw std::bad_alloc();
    if (allocationsLeft > 0) --allocationsLeft;
    if (void* const memory = std::malloc(size == 0 ? 1 : size)) return memory;
    throw std::bad_alloc();
}
void operator delete(void* memory) noexcept {
    std::free(memory);
}
void operator delete(void* memory, std::size_t) noexcept {
    std::free(memory);
}

TEST(LogMemory, ALineThatCannotBeBuiltIsDroppedAndNothingElseHappens) {
    const test::LogLevelGuard guard(2);
    const std::string text(300, 'x');
    bool sawDropped = false;
    bool sawWhole = false;
    for (long limit = 0; !sawWhole && limit < 10000; ++limit) {
        test::SyslogCapture::clear();
        {
            const utils::TimeStamp timer("a name too long for the string's own buffer");
            allocationsLeft = limit;
            QUENX_DEBUG("debug %s", text.c_str());
            QUENX_ERROR("error %s", text.c_str());
            QUENX_DEBUG_TEXT(text);
            vpddbg("outside %s", text.c_str());
            // The timer's destructor logs before the limit ends.
        }
        allocationsLeft = -1;
        sawWhole = test::SyslogCapture::contains("[debug] \"time(");
        sawDropped = sawDropped || !test::SyslogCapture::contains("[error] \"error");
    }
    EXPECT_TRUE(sawDropped);
    EXPECT_TRUE(sawWhole);
}
