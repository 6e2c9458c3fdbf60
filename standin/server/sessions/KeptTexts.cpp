#include "standin/server/sessions/KeptTexts.h"

#include <algorithm>
#include <bit>

namespace standin
{
namespace
{
constexpr std::chrono::minutes GroupTime(1);
}

KeptTexts::Lease KeptTexts::Open(TextReader& reader)
{
    {
        std::lock_guard const lock(m_lock);
        auto const mark = std::min(static_cast<std::size_t>(std::countr_one(m_open)), SharedMark);
        if (mark == SharedMark)
            ++m_sharing;
        else
            m_readers[mark] = &reader;
        m_open |= BitOf(mark);
        reader.SetMark(BitOf(mark));
    }
    auto const close = [kept = std::weak_ptr(m_self)](TextReader const* closing)
    {
        if (auto const still = kept.lock())
            still->Close(*closing);
    };
    return {&reader, close};
}

void KeptTexts::Close(TextReader const& reader)
{
    std::lock_guard const lock(m_lock);
    bool const isShared = reader.Mark() == BitOf(SharedMark);
    if (isShared && --m_sharing != 0)
        return;
    m_open &= ~reader.Mark();
    if (m_open == 0)
        DropUnaccounted();
    for (Group& group : m_groups)
        TakeAway(group, reader.Mark());
    std::erase_if(m_groups, [](Group const& group) { return group.texts.empty(); });
}

void KeptTexts::Keep(TicketTexts texts) noexcept
{
    std::lock_guard const lock(m_lock);
    Time const now = m_clock();
    if (now - m_lastLook >= GroupTime)
        Forget(now);
    std::erase_if(texts, [this](auto const& text)
                  { return (text->readers.load(std::memory_order_relaxed) & m_open) == 0; });
    try
    {
        Append(texts);
    }
    catch (std::bad_alloc const&)
    {
        KeepUnaccounted(texts);
    }
}

void KeptTexts::KeepUnaccounted(TicketTexts& texts) noexcept
{
    for (auto& text : texts)
        if (text)
        {
            text->readers.store(std::bit_cast<std::uintptr_t>(m_unaccounted), std::memory_order_relaxed);
            m_unaccounted = text.release();
        }
}

void KeptTexts::DropUnaccounted() noexcept
{
    while (m_unaccounted)
    {
        std::unique_ptr<TicketText> const text(m_unaccounted);
        auto const next = static_cast<std::uintptr_t>(text->readers.load(std::memory_order_relaxed));
        m_unaccounted = std::bit_cast<TicketText*>(next);
    }
}

void KeptTexts::Append(TicketTexts& texts)
{
    if (texts.empty())
        return;
    if (m_groups.empty() || m_groups.back().isClosed)
        m_groups.emplace_back();
    auto& newest = m_groups.back().texts;
    for (auto& text : texts)
    {
        newest.push_back({text->readers.load(std::memory_order_relaxed) & m_open, nullptr});
        newest.back().text = std::move(text);
    }
}

// Closes the newest group, and lets go of what is old enough for all.
void KeptTexts::Forget(Time now)
{
    m_lastLook = now;
    if (!m_groups.empty() && !m_groups.back().isClosed)
        CloseNewest(now);
    for (Group& group : m_groups)
        TakeAway(group, WhoIsPast(group, now));
    std::erase_if(m_groups, [](Group const& group) { return group.texts.empty(); });
}

void KeptTexts::CloseNewest(Time now)
{
    Group& newest = m_groups.back();
    newest.isClosed = true;
    newest.end = now;
    for (std::size_t mark = 0; mark < SharedMark; ++mark)
        if (m_open & BitOf(mark))
            newest.reads[mark] = m_readers[mark]->Reads();
}

std::uint64_t KeptTexts::WhoIsPast(Group const& group, Time now) const
{
    std::uint64_t past = 0;
    if (now - group.end >= KeptFor)
        for (std::size_t mark = 0; mark < SharedMark; ++mark)
        {
            bool const isOpen = (m_open & BitOf(mark)) != 0;
            if (isOpen && !m_readers[mark]->IsWalking() &&
                m_readers[mark]->Reads() - group.reads[mark] >= KeptReads)
                past |= BitOf(mark);
        }
    return past;
}

void KeptTexts::TakeAway(Group& group, std::uint64_t readers)
{
    if (!readers)
        return;
    std::erase_if(group.texts, [readers](Retired& text) { return (text.readers &= ~readers) == 0; });
}

std::size_t KeptTexts::Count() const
{
    std::lock_guard const lock(m_lock);
    std::size_t count = 0;
    for (Group const& group : m_groups)
        count += group.texts.size();
    return count;
}
}  // namespace standin
