// A child that was made by fork has none of its parent's threads, and may have locks of theirs which nobody
// releases any more.
#pragma once

#include <atomic>

namespace standin
{
// Whether this process is such a child, of one that had a site open.
bool IsForkedChild() noexcept;

// Called in the child by the handler of fork.
void NoteForkedChild() noexcept;

// While one lives, a site is open: a child that is made by fork is noted.
class ForkWatch
{
public:
    ForkWatch();
    ~ForkWatch();
    ForkWatch(ForkWatch const&) = delete;
    ForkWatch& operator=(ForkWatch const&) = delete;
};

// The descriptor of something of which nobody else may have a copy, since its end is to be seen when this
// process ends. In a child that is made by fork the number leads nowhere.
class KeptFromChildren
{
public:
    // numberOf: gives the descriptor of an owner, -1 for none; called in a child by the handler of fork.
    explicit KeptFromChildren(int (*numberOf)(void const* owner));
    ~KeptFromChildren();
    KeptFromChildren(KeptFromChildren const&) = delete;
    KeptFromChildren& operator=(KeptFromChildren const&) = delete;

    // Whose it is from now on; null: there is none. An owner has to be taken back before it goes.
    void Set(void const* owner) noexcept { m_owner = owner; }

private:
    class Registry;

    int (*const m_numberOf)(void const* owner);
    std::atomic<void const*> m_owner{nullptr};
    KeptFromChildren* m_next = nullptr;
};
}  // namespace standin
