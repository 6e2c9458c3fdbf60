// When to try again what was refused: at once, after a second, then ever later, up to a minute.
#pragma once

#include <algorithm>
#include <chrono>

namespace comgui::detail
{
class Attempts
{
public:
    // If it says so, the next pause begins.
    bool IsDue()
    {
        auto const now = std::chrono::steady_clock::now();
        if (now < m_next)
            return false;
        m_next = now + m_pause;
        m_pause = std::min<std::chrono::seconds>(2 * m_pause, std::chrono::minutes(1));
        return true;
    }

private:
    std::chrono::steady_clock::time_point m_next{};
    std::chrono::seconds m_pause{1};
};
}  // namespace comgui::detail
