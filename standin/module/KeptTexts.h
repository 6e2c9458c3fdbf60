// How long texts live that clients have read: a text that leaves its ticket stays until every session that
// lived at that moment has ended, if any of them may have its address. For any thread.
#pragma once

#include "standin/server/feed/Epochs.h"
#include <deque>
#include <mutex>
#include <set>

namespace standin
{
class KeptTexts final : public TextKeeper
{
public:
    void Open(unsigned long long session);  // before the session reads; the numbers of sessions only rise
    void Close(unsigned long long session);

    void Keep(TicketTexts texts) override;

    std::size_t Count() const;  // of texts that still wait

private:
    struct Retired
    {
        unsigned long long newest;  // the newest session that can have seen it
        std::unique_ptr<TicketText> text;
    };
    mutable std::mutex m_lock;
    unsigned long long m_newest = 0;
    std::set<unsigned long long> m_open;
    std::deque<Retired> m_retired;  // newest never falls from front to back
};
}  // namespace standin
