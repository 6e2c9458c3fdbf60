// A ticket as one change left it: immutable, so that any number of threads read it without a lock, and a
// read of several keys sees the ticket of one moment. The next change makes the next snapshot, which takes
// over whatever the change did not touch; so of the snapshots of one ticket only the newest owns anything,
// and what an older one no longer shares with it goes to a Garbage.
//
// One block of memory for a ticket of a usual size: a header, a hash index, and 24 bytes a key. The keys of a
// large ticket are spread over segments by their hash, so that a change copies only the segments it touches.
#pragma once

#include "standin/server/tickets/KeyPool.h"
#include "standin/server/tickets/ParameterChange.h"
#include <cstdint>
#include <span>
#include <unordered_map>

namespace standin
{
// The largest position of a value; a write beyond is refused.
inline constexpr int LargestPosition = 0xFFFFFF;

// What a change took out of a ticket. Freed when no reader can see it any more.
struct Garbage
{
    struct Free
    {
        void operator()(void* piece) const noexcept { ::operator delete(piece); }
    };
    using Memory = std::unique_ptr<void, Free>;

    std::vector<Memory> memory;
    TicketTexts texts;
    std::vector<HeldKey> keys;

    bool IsEmpty() const { return memory.empty() && texts.empty() && keys.empty(); }
    void Append(Garbage&& more);
};

// A value at its position. Owned by a snapshot.
struct TicketElement
{
    int pos;
    PARAM_TYPE type;
    union
    {
        unsigned long long word;  // every type but the two below
        TicketText* text;         // STRING, BINSTRING
    };

    bool IsText() const { return type == PARAM_STRING || type == PARAM_BINSTRING; }
    StoredValue ToStored() const
    {
        return IsText() ? standin::ToStored(type, 0, text) : standin::ToStored(type, word, nullptr);
    }
};

// The values under one key: positions from 0 up, each with a type of its own, gaps allowed. A gap takes no
// memory.
class KeyValues
{
public:
    KeyValues(Key key, TicketElement only) : m_key(key), m_element(only) {}
    KeyValues(Key key, std::span<TicketElement const> several);

    Key Name() const { return m_key; }
    std::span<TicketElement const> Elements() const  // by ascending position, never none
    {
        if (m_element.type != PARAM_COUNT)
            return {&m_element, 1};
        return {reinterpret_cast<TicketElement const*>(m_element.word),
                static_cast<std::size_t>(m_element.pos)};
    }
    int Count() const { return Elements().back().pos + 1; }  // gaps count, too

    TicketElement const* At(int pos) const  // null in a gap and past the end
    {
        if (pos == 0 && m_element.type != PARAM_COUNT && m_element.pos == 0)
            return &m_element;
        TicketElement const* const found = From(pos);
        return found && found->pos == pos ? found : nullptr;
    }
    TicketElement const* From(int pos) const;  // the first at pos or behind, null past the end

private:
    Key m_key;
    TicketElement m_element;  // the only one, or with type PARAM_COUNT: their number and their address
};

class TicketSnapshot
{
public:
    struct Version
    {
        std::uint64_t incarnation = 0;
        std::uint64_t revision = 0;
    };
    Version const& Which() const { return m_version; }
    std::size_t Keys() const { return m_keys; }

    KeyValues const* Find(std::string_view key) const { return Find(key, HashOf(key)); }  // null for none
    KeyValues const* Find(Key key) const { return Find(key->Text(), key->Hash()); }

    // The keys that begin with the prefix, bytewise in order.
    std::vector<KeyValues const*> Sorted(std::string_view prefix = {}) const;

    // In no order.
    template <typename Take>
    void ForEachKey(Take const& take) const
    {
        for (std::size_t i = 0; i <= m_mask; ++i)
            for (KeyValues const& values : Segments()[i]->Values())
                take(values);
    }

private:
    friend class SnapshotEdit;

    struct Segment
    {
        std::uint32_t count;
        std::uint32_t mask;  // slots less one; there are twice as many as keys, and a power of two

        std::uint32_t* Slots() { return reinterpret_cast<std::uint32_t*>(this + 1); }
        std::uint32_t const* Slots() const { return reinterpret_cast<std::uint32_t const*>(this + 1); }
        std::span<KeyValues const> Values() const
        {
            return {reinterpret_cast<KeyValues const*>(Slots() + mask + 1), count};
        }
        static Segment* FillIn(void* room, std::vector<KeyValues> const& keys);  // room: of the right size
    };

    // A slot has the index of a key plus one, and the upper bits of its hash beside it; 0 is free.
    static constexpr std::uint32_t IndexBits = 20;
    static constexpr std::uint32_t IndexMask = (1U << IndexBits) - 1;
    static constexpr std::uint32_t TagOf(std::size_t hash)
    {
        return static_cast<std::uint32_t>(hash >> 32) & ~IndexMask;
    }

    KeyValues const* Find(std::string_view key, std::size_t hash) const
    {
        Segment const& segment = m_mask == 0 ? OnlySegment() : *Segments()[SegmentOf(hash, m_mask)];
        std::uint32_t const* const slots = segment.Slots();
        for (std::size_t at = hash & segment.mask;; at = (at + 1) & segment.mask)
        {
            std::uint32_t const slot = slots[at];
            if (slot == 0)
                return nullptr;
            if ((slot & ~IndexMask) != TagOf(hash))
                continue;
            KeyValues const& found = segment.Values()[(slot & IndexMask) - 1];
            if (found.Name()->Text() == key)
                return &found;
        }
    }

    static constexpr std::size_t SegmentOf(std::size_t hash, std::size_t mask) { return (hash >> 16) & mask; }
    Segment const* const* Segments() const { return m_segments; }
    Segment const& OnlySegment() const { return *reinterpret_cast<Segment const*>(this + 1); }

    TicketSnapshot(Version version, std::uint32_t keys, std::uint32_t mask)
        : m_version(version), m_keys(keys), m_mask(mask)
    {
    }

    Version m_version;
    std::uint32_t m_keys;
    std::uint32_t m_mask;          // segments less one
    Segment const* m_segments[1];  // m_mask + 1 of them; a single one lies right behind
};

// Makes the next snapshot of a ticket: first the edits, in order, then Finish. What it is given to put in
// stays with its owner until Finish, after which the snapshot owns it; so an edit that is given up, for
// want of memory perhaps, has changed nothing. Meanwhile no key is taken out of the pool.
class SnapshotEdit
{
public:
    // before: null for a ticket that begins empty.
    explicit SnapshotEdit(TicketSnapshot const* before) : m_before(before) {}
    SnapshotEdit(SnapshotEdit const&) = delete;
    SnapshotEdit& operator=(SnapshotEdit const&) = delete;

    void Put(Key key, int pos, TicketValue const& value);  // in place of what was there
    void Erase(Key key, int pos);
    void Clear(Key key);
    void Make(Key key, ParameterChange const& change);

    std::size_t ReplacedTexts() const { return m_replaced.size(); }

    // The next snapshot, and what it does not share with the one before. From here on the texts that were
    // put belong to the snapshot or to the garbage: their owners must let go of them. Throws bad_alloc,
    // with nothing changed.
    TicketSnapshot const* Finish(TicketSnapshot::Version version, Garbage& garbage);

    // All that the snapshot owns, which is nothing for null. Its keys have a ticket less. Throws bad_alloc,
    // with nothing changed.
    static Garbage Dismantle(TicketSnapshot const* snapshot);

    // Frees all that the snapshot owns, for who knows that nobody sees any of it.
    static void Destroy(TicketSnapshot const* snapshot) noexcept;

private:
    using Segment = TicketSnapshot::Segment;
    struct Draft
    {
        Key key;
        std::vector<TicketElement> elements;
        KeyValues const* before;
    };

    using Bucket = std::vector<KeyValues>;

    template <typename TakeText, typename TakeMemory>
    static void ForEachPiece(TicketSnapshot const& snapshot, TakeText const& takeText,
                             TakeMemory const& takeMemory);
    Draft& DraftOf(Key key);
    void Discard(TicketElement const& element);
    std::size_t KeysAfter() const;
    void CountKeys() const;
    std::vector<Bucket> Buckets(std::size_t segments);
    std::vector<bool> TouchedSegments() const;
    KeyValues Settled(Draft const& draft);
    TicketSnapshot* InOneBlock(TicketSnapshot::Version version, Bucket const& keys);
    TicketSnapshot* InSegments(TicketSnapshot::Version version, std::vector<Bucket> const& buckets);
    void AddToOld(bool allSegments);
    bool IsSpreadAnew(std::size_t segments) const { return !m_before || m_before->m_mask + 1 != segments; }
    void* Allocate(std::size_t size);

    TicketSnapshot const* const m_before;
    std::vector<Draft> m_drafts;
    std::unordered_map<Key, std::size_t> m_indexOf;  // of m_drafts
    std::vector<TicketText*> m_replaced;
    std::vector<Garbage::Memory> m_fresh;  // of the next snapshot, until it is finished
    std::vector<void*> m_old;              // of the one before, and its own until the next is finished
};
}  // namespace standin
