#include "tools/comgui_validate/Trial.h"

#include "tools/comgui_validate/Loader.h"
#include "tools/shared/text.h"
#include <algorithm>
#include <charconv>
#include <cstring>
#include <new>
#include <sys/mman.h>

namespace validate
{
LastCall::LastCall()
    : m_text(
          static_cast<char*>(mmap(nullptr, Size, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0)))
{
    if (m_text == MAP_FAILED)
        throw std::bad_alloc();
}

LastCall::~LastCall() { munmap(m_text, Size); }

void LastCall::Set(std::string const& call)
{
    std::size_t const length = std::min(call.size(), Size - 1);
    std::memcpy(m_text, call.data(), length);
    m_text[length] = '\0';
}

std::string LastCall::Get() const { return std::string(m_text, strnlen(m_text, Size)); }

std::string Trial::Option(char const* name, char const* otherwise) const
{
    auto const found = m_options.more.find(name);
    return found == m_options.more.end() ? otherwise : found->second;
}

Module& Trial::GetModule()
{
    if (!m_module)
    {
        Calling("the loading of the bundle");
        m_module = Load(m_options.bundle);
        if (!m_module)
            throw Skipped("the bundle cannot be loaded; see the checks bundle.*");
    }
    return *m_module;
}

void Trial::Calling(std::string call)
{
    std::lock_guard const lock(m_lock);
    m_call = std::move(call);
    m_lastCall.Set(m_call);
}

void Trial::Expect(char const* rule, bool holds, std::string const& came, std::string const& due) const
{
    std::lock_guard const lock(m_lock);
    if (!holds)
        throw Broken{rule, m_call, came, due};
}

void Trial::ExpectZero(char const* rule, int result) const
{
    Expect(rule, result == 0, std::to_string(result), "0");
}

void Trial::ExpectFailure(char const* rule, int code) const
{
    Expect(rule, code != 0, "0", "a code other than 0");
}

void Trial::ExpectSuccess(char const* rule, int result) const
{
    Expect(rule, result != 0, "0", "a value other than 0");
}

void Trial::ExpectRefusal(char const* rule, int result) const
{
    Expect(rule, result == 0, std::to_string(result), "0");
}

std::optional<int> NumberOf(std::string_view text)
{
    int number = 0;
    auto const [end, failure] = std::from_chars(text.data(), text.data() + text.size(), number);
    return failure == std::errc() && end == text.data() + text.size() ? std::optional(number) : std::nullopt;
}

std::string Quoted(std::string const& text) { return tools::Shown(text, 60); }
}  // namespace validate
