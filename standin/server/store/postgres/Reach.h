// Whether the server can be reached, as the thread of the bell finds it out and everybody else may ask
// without waiting. For any thread.
#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>

namespace standin::postgres
{
class Reach
{
public:
    bool IsThere() const noexcept { return m_isThere; }

    // Goes up with every new connection of the bell: what could not be had before may be had now.
    std::uint64_t Returns() const noexcept { return m_returns; }

    // Why it could not be reached last; one line.
    std::string Reason() const
    {
        std::lock_guard const lock(m_lock);
        return m_reason;
    }

    // For the thread of the bell.
    void NoteAnswer() noexcept { m_isThere = true; }
    void NoteReturn() noexcept
    {
        m_isThere = true;
        ++m_returns;
    }
    void NoteLoss(std::string reason)
    {
        std::lock_guard const lock(m_lock);
        m_reason = std::move(reason);
        m_isThere = false;
    }

private:
    std::atomic<bool> m_isThere{true};
    std::atomic<std::uint64_t> m_returns{0};
    mutable std::mutex m_lock;
    std::string m_reason;
};
}  // namespace standin::postgres
