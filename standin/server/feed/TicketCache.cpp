#include "standin/server/feed/TicketCache.h"

#include <algorithm>
#include <cstdlib>
#include <new>

namespace standin
{
namespace
{
// The texts belong to the snapshot from now on.
template <typename Values>
void LetGo(Values& values)
{
    for (auto& each : values)
        static_cast<void>(each.value.text.release());
}
}  // namespace

TicketCache::~TicketCache()
{
    for (Type& type : m_types)
    {
        auto* const leaves = type.leaves.load();
        for (std::size_t i = 0; i < type.end.load(); ++i)
        {
            Leaf* const leaf = leaves[i].load();
            if (!leaf)
                continue;
            for (Entry& entry : leaf->entries)
                Epochs::Get().Retire(SnapshotEdit::Dismantle(entry.snapshot), m_texts);
            delete leaf;
        }
        std::free(leaves);
    }
    Epochs::Get().Drain();
}

int TicketCache::NextId(int type, int after) const
{
    if (!IsValid({type, 0}))
        return -1;
    Type const& ids = m_types[static_cast<std::size_t>(type)];
    auto const end = static_cast<int>(ids.end.load(std::memory_order_acquire) * Fan);
    for (int id = after + 1; id < end;)
    {
        Leaf const* const leaf = LeafOf({type, id});
        bool const isEmpty = !leaf || leaf->tickets.load(std::memory_order_acquire) == 0;
        if (!isEmpty && In(*leaf, id).incarnation.load(std::memory_order_acquire))
            return id;
        id = isEmpty ? (id | static_cast<int>(Fan - 1)) + 1 : id + 1;
    }
    return -1;
}

int TicketCache::LargestId(int type) const
{
    Type const& ids = m_types[static_cast<std::size_t>(type)];
    for (int id = static_cast<int>(ids.end.load(std::memory_order_acquire) * Fan) - 1; id >= 0;)
    {
        Leaf const* const leaf = LeafOf({type, id});
        bool const isEmpty = !leaf || leaf->tickets.load(std::memory_order_acquire) == 0;
        if (!isEmpty && In(*leaf, id).incarnation.load(std::memory_order_acquire))
            return id;
        id = isEmpty ? (id & ~static_cast<int>(Fan - 1)) - 1 : id - 1;
    }
    return 0;
}

TicketCache::Leaf& TicketCache::MakeLeaf(TicketAddress address)
{
    Type& type = m_types[static_cast<std::size_t>(address.type)];
    auto* leaves = type.leaves.load(std::memory_order_relaxed);
    if (!leaves)
    {
        // As zero bytes from the system, of which only the touched ones take memory; null pointers are zero.
        leaves = static_cast<std::atomic<Leaf*>*>(std::calloc(Leaves, sizeof(std::atomic<Leaf*>)));
        if (!leaves)
            throw std::bad_alloc();
        type.leaves.store(leaves, std::memory_order_release);
    }
    auto const index = static_cast<std::size_t>(address.id) / Fan;
    if (Leaf* const leaf = leaves[index].load(std::memory_order_relaxed))
        return *leaf;
    auto* const leaf = new Leaf;
    leaves[index].store(leaf, std::memory_order_release);
    type.end.store(std::max(type.end.load(std::memory_order_relaxed), index + 1), std::memory_order_release);
    return *leaf;
}

void TicketCache::Note(TicketAddress address, TicketState const& state)
{
    if (!IsValid(address))
        return;  // no slot can name it
    Leaf& leaf = MakeLeaf(address);
    Entry& entry = In(leaf, address.id);
    Garbage garbage = SnapshotEdit::Dismantle(entry.snapshot);
    Incarnation const before = entry.incarnation.load(std::memory_order_relaxed);
    Replace(entry, nullptr, std::move(garbage));
    entry.revision.store(state.revision, std::memory_order_release);
    entry.incarnation.store(state.incarnation, std::memory_order_release);
    if (!before)
        leaf.tickets.fetch_add(1, std::memory_order_release);
}

void TicketCache::Forget(TicketAddress address)
{
    auto* const leaf = const_cast<Leaf*>(LeafOf(address));
    if (!leaf)
        return;
    Entry& entry = In(*leaf, address.id);
    Garbage garbage = SnapshotEdit::Dismantle(entry.snapshot);
    if (entry.incarnation.exchange(0, std::memory_order_acq_rel) == 0)
        return;
    leaf->tickets.fetch_sub(1, std::memory_order_release);
    Replace(entry, nullptr, std::move(garbage));
}

void TicketCache::Replace(Entry& entry, TicketSnapshot const* snapshot, Garbage&& garbage) noexcept
{
    entry.snapshot.store(snapshot, std::memory_order_release);
    Epochs::Get().Retire(std::move(garbage), m_texts);
}

bool TicketCache::Publish(TicketAddress address, TicketState const& state, std::vector<LoadedValue>& values)
{
    auto* const entry = const_cast<Entry*>(EntryOf(address));
    bool const isAsLoaded = entry &&
                            entry->incarnation.load(std::memory_order_relaxed) == state.incarnation &&
                            entry->revision.load(std::memory_order_relaxed) == state.revision;
    if (!isAsLoaded)
        return false;
    if (entry->snapshot.load(std::memory_order_relaxed))
        return true;
    ForgetUnusedKeys();
    SnapshotEdit edit(nullptr);
    for (LoadedValue const& each : values)
        edit.Put(m_keys.Intern(each.key), each.pos, each.value);
    Garbage none;
    entry->snapshot.store(edit.Finish({state.incarnation, state.revision}, none), std::memory_order_release);
    LetGo(values);
    return true;
}

void TicketCache::Make(TicketChange& change, Sequence sequence)
{
    if (!IsValid(change.address))
        return;
    if (change.kind == TicketChange::Delete)
        return Forget(change.address);
    if (change.kind == TicketChange::Create)
    {
        Note(change.address, {change.incarnation, sequence});
        return MakeSnapshot(In(MakeLeaf(change.address), change.address.id), change,
                            {change.incarnation, sequence});
    }
    auto* const entry = const_cast<Entry*>(EntryOf(change.address));
    if (!entry || !entry->incarnation.load(std::memory_order_relaxed))
        return;
    TicketState const state{entry->incarnation.load(std::memory_order_relaxed), sequence};
    if (entry->snapshot.load(std::memory_order_relaxed))
        MakeSnapshot(*entry, change, state);
    entry->revision.store(sequence, std::memory_order_release);
}

void TicketCache::ForgetUnusedKeys()
{
    if (!m_keys.IsFull())
        return;
    Garbage garbage;
    garbage.keys = m_keys.TakeUnused();
    Epochs::Get().Retire(std::move(garbage), m_texts);
}

void TicketCache::MakeSnapshot(Entry& entry, TicketChange& change, TicketState const& state)
{
    ForgetUnusedKeys();
    SnapshotEdit edit(entry.snapshot.load(std::memory_order_relaxed));
    for (ParameterChange const& each : change.parameters)
        edit.Make(m_keys.Intern(each.key), each);
    Garbage garbage;
    TicketSnapshot const* const next = edit.Finish({state.incarnation, state.revision}, garbage);
    LetGo(change.parameters);
    Replace(entry, next, std::move(garbage));
}
}  // namespace standin
