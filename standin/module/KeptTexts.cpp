#include "standin/module/KeptTexts.h"

#include <algorithm>

namespace standin
{
void KeptTexts::Open(unsigned long long session)
{
    std::lock_guard const lock(m_lock);
    m_newest = std::max(m_newest, session);
    m_open.insert(session);
}

void KeptTexts::Close(unsigned long long session)
{
    std::lock_guard const lock(m_lock);
    m_open.erase(session);
    while (!m_retired.empty() && (m_open.empty() || *m_open.begin() > m_retired.front().newest))
        m_retired.pop_front();
}

void KeptTexts::Keep(TicketTexts texts)
{
    std::lock_guard const lock(m_lock);
    for (auto& text : texts)
        if (!m_open.empty())
            m_retired.push_back({m_newest, std::move(text)});
}

std::size_t KeptTexts::Count() const
{
    std::lock_guard const lock(m_lock);
    return m_retired.size();
}
}  // namespace standin
