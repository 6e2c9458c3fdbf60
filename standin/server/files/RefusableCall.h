// Why a call of a client's was refused, kept for the client's thread until it asks. It is the last line that
// was noted in the last call of the thread that was refused; a call that is refused without one clears it,
// and one that succeeds leaves it. Each thread has its own.
#pragma once

#include <initializer_list>
#include <optional>
#include <string>
#include <string_view>

namespace standin
{
// A call on this thread, from its beginning to its end. One may be made within another, as by the action of a
// walk; each has lines of its own.
class RefusableCall
{
public:
    RefusableCall() noexcept;
    ~RefusableCall();
    RefusableCall(RefusableCall const&) = delete;
    RefusableCall& operator=(RefusableCall const&) = delete;

    // Gives the result back.
    template <typename Result>
    Result Ended(Result result, bool isDone) noexcept
    {
        if (!isDone)
            Refuse();
        return result;
    }
    void Refuse() noexcept;

    // Why the call that is under way on this thread is refused, if it is. Nothing happens without one.
    // Control characters are replaced.
    static void Note(std::initializer_list<std::string_view> parts) noexcept;

    static bool IsUnderWay() noexcept;

    // The reason of this thread, which is forgotten; empty for none.
    static std::string TakeReason() noexcept;

private:
    RefusableCall* const m_outer;
    std::string m_line;
};

// A read is none of these calls: to keep account of it would take longer than to read. It becomes one where
// it has failed or has to wait for the store; within a call it is a part of that.
class RefusableRead
{
public:
    RefusableRead() noexcept
    {
        if (!RefusableCall::IsUnderWay())
            m_call.emplace();
    }

    void Refuse() noexcept
    {
        if (m_call)
            m_call->Refuse();
    }

private:
    std::optional<RefusableCall> m_call;
};
}  // namespace standin
