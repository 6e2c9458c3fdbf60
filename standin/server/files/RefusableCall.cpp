#include "standin/server/files/RefusableCall.h"

#include "standin/server/files/Report.h"
#include <new>
#include <utility>

namespace standin
{
namespace
{
thread_local constinit RefusableCall* underWay = nullptr;
thread_local constinit bool isEnding = false;  // this thread: its reason is gone

struct Reason
{
    std::string text;

    ~Reason() { isEnding = true; }
};

// Null for a thread that comes to its end: a client may call then, too.
std::string* ReasonOfThisThread()
{
    if (isEnding)
        return nullptr;
    static thread_local Reason reason;
    return &reason.text;
}
}  // namespace

RefusableCall::RefusableCall() noexcept : m_outer(std::exchange(underWay, this)) {}

RefusableCall::~RefusableCall() { underWay = m_outer; }

void RefusableCall::Refuse() noexcept
{
    if (std::string* const reason = ReasonOfThisThread())
        *reason = std::exchange(m_line, {});
}

void RefusableCall::Note(std::initializer_list<std::string_view> parts) noexcept
{
    if (!underWay)
        return;
    try
    {
        underWay->m_line = ForMessages(Joined(parts));
    }
    catch (std::bad_alloc const&)
    {
        underWay->m_line.clear();  // no reason is better than a wrong one
    }
}

bool RefusableCall::IsUnderWay() noexcept { return underWay != nullptr; }

std::string RefusableCall::TakeReason() noexcept
{
    std::string* const reason = ReasonOfThisThread();
    return reason ? std::exchange(*reason, {}) : std::string();
}
}  // namespace standin
