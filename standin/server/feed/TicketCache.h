// The tickets of a site as this program knows them: the newest snapshot of each, for readers without a lock.
// Its owner, the feed, changes it under a lock of its own; a reader looks inside an Epochs::Guard, and what
// it finds there lives as long as the guard.
//
// The ids of a type are spread over leaves of 256, which stay where they are once they are made. So a look-up
// is three loads, and the tickets of a type are in order.
#pragma once

#include "standin/server/feed/Epochs.h"
#include "standin/server/store/Store.h"
#include <array>

namespace standin
{
class TicketCache
{
public:
    explicit TicketCache(TextKeeper& texts) : m_texts(texts) {}
    TextKeeper& Texts() const { return m_texts; }
    ~TicketCache();  // no reader looks any more
    TicketCache(TicketCache const&) = delete;
    TicketCache& operator=(TicketCache const&) = delete;

    // --- for any thread

    // Null for a ticket that does not exist, and for one whose parameters nobody has read yet.
    TicketSnapshot const* Find(TicketAddress address) const
    {
        Entry const* const entry = EntryOf(address);
        return entry ? entry->snapshot.load(std::memory_order_acquire) : nullptr;
    }

    // 0 for a ticket that does not exist.
    Incarnation IncarnationOf(TicketAddress address) const
    {
        Entry const* const entry = EntryOf(address);
        return entry ? entry->incarnation.load(std::memory_order_acquire) : 0;
    }
    Sequence RevisionOf(TicketAddress address) const
    {
        Entry const* const entry = EntryOf(address);
        return entry ? entry->revision.load(std::memory_order_acquire) : 0;
    }

    // The smallest id above after among the tickets of a type, -1 if there is none. Starts at after -1.
    int NextId(int type, int after) const;
    int LargestId(int type) const;  // 0 if there is no ticket of the type

    // --- for the feed, one call at a time. A change of an address that no ticket can have is ignored.

    // There is a ticket, whose parameters are not loaded; what was known of the address is forgotten.
    void Note(TicketAddress address, TicketState const& state);
    void Forget(TicketAddress address);

    // Publishes the parameters of a ticket as a load has found them, unless they are known or the ticket has
    // changed since. False in the latter case: load it again.
    struct LoadedValue
    {
        std::string key;
        int pos;
        TicketValue value;
    };
    bool Publish(TicketAddress address, TicketState const& state, std::vector<LoadedValue>& values);

    // What a change makes of the ticket. Of a ticket whose parameters are not loaded only the state is noted.
    // Takes over the change's texts, if it keeps them.
    void Make(TicketChange& change, Sequence sequence);

    // Good until the next call of Make or Publish, unless a ticket has it or it is held.
    Key Intern(std::string_view key) { return m_keys.Intern(key); }
    std::size_t Keys() const { return m_keys.Size(); }  // that it knows

    // Every ticket, in ascending order.
    template <typename Take>
    void ForEach(Take const& take) const
    {
        for (int type = 0; type < Types; ++type)
            for (int id = NextId(type, -1); id >= 0; id = NextId(type, id))
                take(TicketAddress{type, id}, TicketState{IncarnationOf({type, id}), RevisionOf({type, id})});
    }

private:
    static constexpr int Types = 100;
    static constexpr std::size_t Fan = 256;                                             // ids of a leaf
    static constexpr std::size_t Leaves = (std::size_t{standin::LargestId} + 1) / Fan;  // of a type

    struct Entry
    {
        std::atomic<TicketSnapshot const*> snapshot{nullptr};
        std::atomic<Incarnation> incarnation{0};
        std::atomic<Sequence> revision{0};
    };
    struct Leaf
    {
        std::array<Entry, Fan> entries;
        std::atomic<unsigned> tickets{0};
    };
    // The leaves of a type. Most are not there: of the memory only touched pages are.
    struct Type
    {
        std::atomic<std::atomic<Leaf*>*> leaves{nullptr};
        std::atomic<std::size_t> end{0};  // behind the last leaf that was made
    };

    Leaf const* LeafOf(TicketAddress address) const
    {
        if (!IsValid(address))
            return nullptr;
        auto const* const leaves =
            m_types[static_cast<std::size_t>(address.type)].leaves.load(std::memory_order_acquire);
        return leaves ? leaves[static_cast<std::size_t>(address.id) / Fan].load(std::memory_order_acquire)
                      : nullptr;
    }
    static Entry const& In(Leaf const& leaf, int id)
    {
        return leaf.entries[static_cast<std::size_t>(id) % Fan];
    }
    static Entry& In(Leaf& leaf, int id) { return leaf.entries[static_cast<std::size_t>(id) % Fan]; }
    Entry const* EntryOf(TicketAddress address) const
    {
        Leaf const* const leaf = LeafOf(address);
        return leaf ? &In(*leaf, address.id) : nullptr;
    }
    Leaf& MakeLeaf(TicketAddress address);
    void Replace(Entry& entry, TicketSnapshot const* snapshot, Garbage&& garbage) noexcept;
    void ForgetUnusedKeys();
    void MakeSnapshot(Entry& entry, TicketChange& change, TicketState const& state);

    TextKeeper& m_texts;
    KeyPool m_keys;
    std::array<Type, Types> m_types{};
};
}  // namespace standin
