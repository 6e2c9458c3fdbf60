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
    bool IsThere() const noexcept { return m_isThere && !m_isOver; }

    // It will never be there again for this store.
    bool IsOver() const noexcept { return m_isOver; }

    // Whether it also serves this program: one that is there may let nobody in.
    bool IsServing() const noexcept { return IsThere() && m_isServing; }

    // Goes up with every new connection of the bell: what could not be had before may be had now.
    std::uint64_t Returns() const noexcept { return m_returns; }

    // Why it could not be reached last; one line.
    std::string Reason() const
    {
        std::lock_guard const lock(m_lock);
        return m_reason;
    }

    // For who works with it. After a loss it serves again only when that is said.
    void NoteService(bool isServing) noexcept { m_isServing = isServing; }

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
        if (!m_isOver)
            m_reason = std::move(reason);
        m_isThere = m_isServing = false;
    }

    // For any thread. Once and for all.
    void NoteEnd(std::string reason)
    {
        std::lock_guard const lock(m_lock);
        if (!m_isOver)
            m_reason = std::move(reason);
        m_isOver = true;
    }

private:
    std::atomic<bool> m_isThere{true}, m_isServing{true}, m_isOver{false};
    std::atomic<std::uint64_t> m_returns{0};
    mutable std::mutex m_lock;
    std::string m_reason;
};
}  // namespace standin::postgres
