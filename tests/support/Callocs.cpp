#include "tests/support/Callocs.h"

#include "tests/support/sanitizers.h"
#include <cstddef>
#include <cstdint>
#include <cstring>

// A sanitizer has to know each block that is given back to it.
#if COMGUI_SANITIZED
#    define COMGUI_REAL_CALLOC __interceptor_calloc
#else
#    define COMGUI_REAL_CALLOC __libc_calloc
#endif

extern "C"
{
    void* COMGUI_REAL_CALLOC(std::size_t count, std::size_t size);
    __attribute__((visibility("default"))) void* calloc(std::size_t count, std::size_t size) noexcept;
}

namespace
{
thread_local int calls = 0;
thread_local int failIn = -1;
constexpr std::size_t Behind = 16;
}  // namespace

// A new thread calls it before the thread sanitizer knows that thread, so it must not be instrumented.
#if defined(__clang__)
__attribute__((disable_sanitizer_instrumentation))
#else
__attribute__((no_sanitize("thread")))
#endif
void* calloc(std::size_t count, std::size_t size) noexcept
{
    ++calls;
    bool const isTooLarge = size != 0 && count > (PTRDIFF_MAX - Behind) / size;
    if (isTooLarge || (failIn >= 0 && failIn-- == 0))
        return nullptr;
#if COMGUI_SANITIZED
    return COMGUI_REAL_CALLOC(count, size);
#else
    // Behind a block is what is no end of any text.
    std::size_t const room = count * size;
    auto* const block = static_cast<unsigned char*>(COMGUI_REAL_CALLOC(1, room + Behind));
    if (block)
        std::memset(block + room, 0xDD, Behind);
    return block;
#endif
}

CountedCallocs::CountedCallocs() : m_before(calls) {}

int CountedCallocs::Count() const { return calls - m_before; }

FailingCalloc::FailingCalloc(int n) { failIn = n; }

FailingCalloc::~FailingCalloc() { failIn = -1; }
