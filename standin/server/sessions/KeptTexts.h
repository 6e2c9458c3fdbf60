// How long texts live that clients have read. A text that leaves its ticket stays for each session that has
// read it, until that session has ended, or until ten minutes have passed and the session has read 10,000
// texts more; a walk that is under way keeps its texts to its end. So the memory of a session that lives for
// months stays bounded. For any thread.
#pragma once

#include "standin/server/feed/Epochs.h"
#include "standin/server/tickets/TextReader.h"
#include <array>
#include <chrono>
#include <deque>
#include <functional>
#include <mutex>

namespace standin
{
class KeptTexts final : public TextKeeper
{
public:
    using Time = std::chrono::steady_clock::time_point;
    using Clock = std::function<Time()>;
    using Lease = std::shared_ptr<TextReader const>;

    static constexpr std::chrono::minutes KeptFor{10};  // at least, and up to two minutes longer
    static constexpr std::uint64_t KeptReads = 10'000;

    explicit KeptTexts(Clock clock = std::chrono::steady_clock::now) : m_clock(std::move(clock)) {}
    ~KeptTexts() override { DropUnaccounted(); }
    KeptTexts(KeptTexts const&) = delete;
    KeptTexts& operator=(KeptTexts const&) = delete;

    // Gives the reader his mark. What he reads is kept for him until the last copy of the lease has gone, as
    // above. He outlives it.
    Lease Open(TextReader& reader);

    // What is old enough goes on the way. Texts that there is no memory to keep account of stay until nobody
    // reads any more.
    void Keep(TicketTexts texts) noexcept override;

    std::size_t Count() const;  // of texts that still wait

private:
    // Readers have a mark of their own as long as there are marks; all others share the last, and what they
    // read stays until they all have ended.
    static constexpr std::size_t Marks = 64;
    static constexpr std::size_t SharedMark = Marks - 1;
    static constexpr std::uint64_t BitOf(std::size_t mark) { return std::uint64_t{1} << mark; }

    struct Retired
    {
        std::uint64_t readers;  // by their marks: for whom it waits
        std::unique_ptr<TicketText> text;
    };

    // What was retired within a while.
    struct Group
    {
        std::vector<Retired> texts{};
        bool isClosed = false;
        Time end{};
        std::array<std::uint64_t, Marks> reads{};  // of each reader, at its end
    };

    void Close(TextReader const& reader);
    void Append(TicketTexts& texts);
    void KeepUnaccounted(TicketTexts& texts) noexcept;
    void DropUnaccounted() noexcept;
    void Forget(Time now);
    void CloseNewest(Time now);
    std::uint64_t WhoIsPast(Group const& group, Time now) const;
    static void TakeAway(Group& group, std::uint64_t readers);

    // What leases know this by, since sessions may outlive their server.
    std::shared_ptr<KeptTexts> const m_self{this, [](KeptTexts*) {}};

    Clock const m_clock;
    mutable std::mutex m_lock;
    std::array<TextReader const*, Marks> m_readers{};
    std::uint64_t m_open = 0;  // the marks in use
    std::size_t m_sharing = 0;
    std::deque<Group> m_groups;  // the oldest first
    TicketText* m_unaccounted =
        nullptr;  // leads to the next by the word of its marks, which nobody needs any more
    Time m_lastLook{};
};
}  // namespace standin
