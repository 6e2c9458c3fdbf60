#include "standin/server/sessions/SessionRegister.h"

namespace standin
{
unsigned long long SessionRegister::Open()
{
    std::lock_guard const lock(m_lock);
    m_open.insert(++m_newest);
    return m_newest;
}

void SessionRegister::Close(unsigned long long number)
{
    std::lock_guard const lock(m_lock);
    m_open.erase(number);
    while (!m_retired.empty() && (m_open.empty() || *m_open.begin() > m_retired.front().newest))
        m_retired.pop_front();
}

void SessionRegister::Retire(TicketTexts texts)
{
    std::lock_guard const lock(m_lock);
    for (auto& text : texts)
        if (!m_open.empty() && text->handedOut.load(std::memory_order_relaxed))
            m_retired.push_back({m_newest, std::move(text)});
}

std::size_t SessionRegister::Kept() const
{
    std::lock_guard const lock(m_lock);
    return m_retired.size();
}
}  // namespace standin
