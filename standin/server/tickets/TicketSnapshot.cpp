#include "standin/server/tickets/TicketSnapshot.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <new>
#include <stdexcept>

namespace standin
{
namespace
{
// A segment is divided when its ticket has more keys than that for each, and united when it has far fewer.
constexpr std::size_t KeysOfASegment = 96;

std::size_t SegmentsFor(std::size_t keys, std::size_t now)
{
    std::size_t const most = std::bit_ceil((keys + KeysOfASegment - 1) / KeysOfASegment);
    bool const isRoomy = now > most && keys * 4 >= now * KeysOfASegment;
    return isRoomy ? now : std::max<std::size_t>(most, 1);
}

// The first element at pos or behind.
std::vector<TicketElement>::iterator PlaceOf(int pos, std::vector<TicketElement>& elements)
{
    return std::partition_point(elements.begin(), elements.end(),
                                [pos](TicketElement const& element) { return element.pos < pos; });
}

std::size_t SlotsFor(std::size_t keys) { return std::bit_ceil(std::max<std::size_t>(keys, 1) * 2); }
}  // namespace

void Garbage::Append(Garbage&& more)
{
    memory.insert(memory.end(), std::move_iterator(more.memory.begin()),
                  std::move_iterator(more.memory.end()));
    texts.insert(texts.end(), std::move_iterator(more.texts.begin()), std::move_iterator(more.texts.end()));
    keys.insert(keys.end(), std::move_iterator(more.keys.begin()), std::move_iterator(more.keys.end()));
    more = {};
}

KeyValues::KeyValues(Key key, std::span<TicketElement const> several) : m_key(key), m_element{}
{
    m_element.type = PARAM_COUNT;
    m_element.pos = static_cast<int>(several.size());
    m_element.word = std::bit_cast<unsigned long long>(several.data());
}

// Positions never repeat, so no element is farther back than its position says; without gaps it is right
// there.
TicketElement const* KeyValues::From(int pos) const
{
    auto const elements = Elements();
    auto const limit = std::min(static_cast<std::size_t>(pos), elements.size());
    if (limit < elements.size() && elements[limit].pos == pos)
        return &elements[limit];
    auto const found = std::partition_point(
        elements.begin(), elements.end(), [pos](TicketElement const& element) { return element.pos < pos; });
    return found == elements.end() ? nullptr : &*found;
}

std::vector<KeyValues const*> TicketSnapshot::Sorted(std::string_view prefix) const
{
    std::vector<KeyValues const*> sorted;
    sorted.reserve(prefix.empty() ? m_keys : 0);
    ForEachKey(
        [&](KeyValues const& values)
        {
            if (values.Name()->Text().starts_with(prefix))
                sorted.push_back(&values);
        });
    std::sort(sorted.begin(), sorted.end(),
              [](auto const* left, auto const* right)
              { return left->Name()->Text() < right->Name()->Text(); });
    return sorted;
}

SnapshotEdit::Draft& SnapshotEdit::DraftOf(Key key)
{
    auto const [place, isNew] = m_indexOf.try_emplace(key, m_drafts.size());
    if (!isNew)
        return m_drafts[place->second];
    KeyValues const* const before = m_before ? m_before->Find(key) : nullptr;
    Draft& draft = m_drafts.emplace_back(Draft{key, {}, before});
    if (before)
        draft.elements.assign(before->Elements().begin(), before->Elements().end());
    return draft;
}

void SnapshotEdit::Discard(TicketElement const& element)
{
    if (element.IsText())
        m_replaced.push_back(element.text);
}

void SnapshotEdit::Put(Key key, int pos, TicketValue const& value)
{
    TicketElement element{pos, value.type, {}};
    if (value.text)
        element.text = value.text.get();
    else
        element.word = value.word;
    auto& elements = DraftOf(key).elements;
    auto const place = PlaceOf(pos, elements);
    if (place == elements.end() || place->pos != pos)
    {
        elements.insert(place, element);
        return;
    }
    Discard(*place);
    *place = element;
}

void SnapshotEdit::Erase(Key key, int pos)
{
    auto& elements = DraftOf(key).elements;
    auto const place = PlaceOf(pos, elements);
    if (place == elements.end() || place->pos != pos)
        return;
    Discard(*place);
    elements.erase(place);
}

void SnapshotEdit::Clear(Key key)
{
    auto& elements = DraftOf(key).elements;
    for (TicketElement const& element : elements)
        Discard(element);
    elements.clear();
}

void SnapshotEdit::Make(Key key, ParameterChange const& change)
{
    if (change.pos == -1)
        Clear(key);
    if (change.value.type != PARAM_NONE)
        Put(key, std::max(change.pos, 0), change.value);
    else if (change.pos >= 0)
        Erase(key, change.pos);
}

void* SnapshotEdit::Allocate(std::size_t size)
{
    Garbage::Memory memory(::operator new(size));  // owned before the list of them has to grow
    return m_fresh.emplace_back(std::move(memory)).get();
}

std::size_t SnapshotEdit::KeysAfter() const
{
    std::size_t keys = m_before ? m_before->Keys() : 0;
    for (Draft const& draft : m_drafts)
    {
        keys -= draft.before ? 1 : 0;
        keys += draft.elements.empty() ? 0 : 1;
    }
    return keys;
}

// The values of a draft as the snapshot has them.
KeyValues SnapshotEdit::Settled(Draft const& draft)
{
    if (draft.elements.size() == 1)
        return {draft.key, draft.elements.front()};
    auto const size = draft.elements.size() * sizeof(TicketElement);
    auto* const elements = static_cast<TicketElement*>(Allocate(size));
    std::memcpy(elements, draft.elements.data(), size);
    return {draft.key, std::span<TicketElement const>(elements, draft.elements.size())};
}

// Of the snapshot before.
std::vector<bool> SnapshotEdit::TouchedSegments() const
{
    std::vector<bool> touched(m_before->m_mask + std::size_t{1});
    for (Draft const& draft : m_drafts)
        touched[TicketSnapshot::SegmentOf(draft.key->Hash(), m_before->m_mask)] = true;
    return touched;
}

// The keys of each segment of the next snapshot; none of a segment that stays as it is.
std::vector<SnapshotEdit::Bucket> SnapshotEdit::Buckets(std::size_t segments)
{
    std::vector<Bucket> buckets(segments);
    auto const bucketOf = [&](Key key) -> Bucket&
    { return buckets[TicketSnapshot::SegmentOf(key->Hash(), segments - 1)]; };
    auto const touched = m_before ? TouchedSegments() : std::vector<bool>();
    for (std::size_t i = 0; i < touched.size(); ++i)
    {
        if (!touched[i] && segments > 1 && !IsSpreadAnew(segments))
            continue;
        for (KeyValues const& values : m_before->Segments()[i]->Values())
            if (!m_indexOf.contains(values.Name()))
                bucketOf(values.Name()).push_back(values);
    }
    for (Draft const& draft : m_drafts)
        if (!draft.elements.empty())
            bucketOf(draft.key).push_back(Settled(draft));
    return buckets;
}

namespace
{
std::size_t SizeOfSegment(std::size_t header, std::size_t keys)
{
    return header + SlotsFor(keys) * sizeof(std::uint32_t) + keys * sizeof(KeyValues);
}
}  // namespace

// In memory that has room for it.
static_assert(sizeof(KeyValues) == 24 && alignof(KeyValues) == 8);

TicketSnapshot::Segment* TicketSnapshot::Segment::FillIn(void* room, std::vector<KeyValues> const& keys)
{
    if (keys.size() >= IndexMask)
        throw std::length_error("too many keys of one hash in a ticket");
    auto* const segment = new (room) Segment{static_cast<std::uint32_t>(keys.size()),
                                             static_cast<std::uint32_t>(SlotsFor(keys.size()) - 1)};
    std::uint32_t* const slots = segment->Slots();
    std::memset(slots, 0, (segment->mask + 1) * sizeof *slots);
    auto* const values = reinterpret_cast<KeyValues*>(slots + segment->mask + 1);
    for (std::uint32_t i = 0; i < segment->count; ++i)
    {
        new (values + i) KeyValues(keys[i]);
        std::size_t const hash = keys[i].Name()->Hash();
        std::size_t at = hash & segment->mask;
        while (slots[at] != 0)
            at = (at + 1) & segment->mask;
        slots[at] = TagOf(hash) | (i + 1);
    }
    return segment;
}

TicketSnapshot* SnapshotEdit::InOneBlock(TicketSnapshot::Version version, Bucket const& keys)
{
    void* const room = Allocate(sizeof(TicketSnapshot) + SizeOfSegment(sizeof(Segment), keys.size()));
    auto* const snapshot = new (room) TicketSnapshot(version, static_cast<std::uint32_t>(keys.size()), 0);
    snapshot->m_segments[0] = Segment::FillIn(snapshot + 1, keys);
    return snapshot;
}

TicketSnapshot* SnapshotEdit::InSegments(TicketSnapshot::Version version, std::vector<Bucket> const& buckets)
{
    std::size_t const more = buckets.size() - 1;
    void* const room = Allocate(sizeof(TicketSnapshot) + more * sizeof(Segment const*));
    auto* const snapshot = new (room)
        TicketSnapshot(version, static_cast<std::uint32_t>(KeysAfter()), static_cast<std::uint32_t>(more));
    Segment const** const segments = snapshot->m_segments;
    auto const touched =
        IsSpreadAnew(buckets.size()) ? std::vector<bool>(buckets.size(), true) : TouchedSegments();
    for (std::size_t i = 0; i < buckets.size(); ++i)
        segments[i] =
            touched[i]
                ? Segment::FillIn(Allocate(SizeOfSegment(sizeof(Segment), buckets[i].size())), buckets[i])
                : m_before->Segments()[i];
    return snapshot;
}

// What the snapshot before does not share with the next one.
void SnapshotEdit::AddToOld(bool allSegments)
{
    if (!m_before)
        return;
    m_old.push_back(const_cast<TicketSnapshot*>(m_before));
    auto const touched = TouchedSegments();
    for (std::size_t i = 0; m_before->m_mask > 0 && i < touched.size(); ++i)
        if (allSegments || touched[i])
            m_old.push_back(const_cast<Segment*>(m_before->Segments()[i]));
    for (Draft const& draft : m_drafts)
        if (draft.before && draft.before->Elements().size() > 1)
            m_old.push_back(const_cast<TicketElement*>(draft.before->Elements().data()));
}

void SnapshotEdit::CountKeys() const
{
    for (Draft const& draft : m_drafts)
    {
        if (draft.before)
            draft.key->Lose();
        if (!draft.elements.empty())
            draft.key->Gain();
    }
}

TicketSnapshot const* SnapshotEdit::Finish(TicketSnapshot::Version version, Garbage& garbage)
{
    std::size_t const now = m_before ? m_before->m_mask + std::size_t{1} : 1;
    std::size_t const segments = SegmentsFor(KeysAfter(), now);
    auto const buckets = Buckets(segments);
    TicketSnapshot const* const next =
        segments == 1 ? InOneBlock(version, buckets.front()) : InSegments(version, buckets);
    AddToOld(IsSpreadAnew(segments));
    garbage.memory.reserve(garbage.memory.size() + m_old.size());
    garbage.texts.reserve(garbage.texts.size() + m_replaced.size());
    for (void* const memory : m_old)
        garbage.memory.emplace_back(memory);
    for (TicketText* const text : m_replaced)
        garbage.texts.emplace_back(text);
    for (Garbage::Memory& memory : m_fresh)
        static_cast<void>(memory.release());  // the snapshot's from now on
    CountKeys();
    return next;
}

// Calls takeText and takeMemory for every piece; what a piece refers to is taken before it.
template <typename TakeText, typename TakeMemory>
void SnapshotEdit::ForEachPiece(TicketSnapshot const& snapshot, TakeText const& takeText,
                                TakeMemory const& takeMemory)
{
    snapshot.ForEachKey(
        [&](KeyValues const& values)
        {
            auto const elements = values.Elements();
            for (TicketElement const& element : elements)
                if (element.IsText())
                    takeText(element.text);
            if (elements.size() > 1)
                takeMemory(const_cast<TicketElement*>(elements.data()));
        });
    for (std::size_t i = 0; snapshot.m_mask > 0 && i <= snapshot.m_mask; ++i)
        takeMemory(const_cast<Segment*>(snapshot.Segments()[i]));
    takeMemory(const_cast<TicketSnapshot*>(&snapshot));
}

Garbage SnapshotEdit::Dismantle(TicketSnapshot const* snapshot)
{
    Garbage garbage;
    if (!snapshot)
        return garbage;
    std::size_t texts = 0;
    std::size_t pieces = 0;
    ForEachPiece(
        *snapshot, [&](TicketText*) { ++texts; }, [&](void*) { ++pieces; });
    garbage.texts.reserve(texts);
    garbage.memory.reserve(pieces);
    ForEachPiece(
        *snapshot, [&](TicketText* text) { garbage.texts.emplace_back(text); },
        [&](void* memory) { garbage.memory.emplace_back(memory); });
    snapshot->ForEachKey([](KeyValues const& values) { values.Name()->Lose(); });
    return garbage;
}

void SnapshotEdit::Destroy(TicketSnapshot const* snapshot) noexcept
{
    if (!snapshot)
        return;
    // A key's values are read from its segment, and that from the snapshot: they go behind them.
    ForEachPiece(
        *snapshot, [](TicketText* text) { delete text; }, [](void* memory) { ::operator delete(memory); });
}
}  // namespace standin
