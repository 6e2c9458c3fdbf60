// What every object behind a CF reference is: something with a count of its owners, that goes with the
// last of them. Retained and released from any thread.
#pragma once

#include <atomic>
#include <memory>

namespace comgui::detail
{
class CountedObject
{
public:
    CountedObject(CountedObject const&) = delete;
    CountedObject& operator=(CountedObject const&) = delete;

    void Retain() const { m_owners.fetch_add(1, std::memory_order_relaxed); }

    void Release() const
    {
        if (m_owners.fetch_sub(1, std::memory_order_acq_rel) == 1)
            delete this;
    }

    // For whoever keeps a pointer without owning it: false if the last owner has gone already and only the
    // destructor has not come that far yet.
    bool RetainUnlessGone() const
    {
        long owners = m_owners.load(std::memory_order_relaxed);
        while (owners > 0)
        {
            if (m_owners.compare_exchange_weak(owners, owners + 1, std::memory_order_relaxed))
                return true;
        }
        return false;
    }

protected:
    CountedObject() = default;
    virtual ~CountedObject() = default;

private:
    mutable std::atomic<long> m_owners{1};
};

struct Releaser
{
    void operator()(CountedObject const* object) const { object->Release(); }
};
template <class T>
using Owned = std::unique_ptr<T, Releaser>;

// A call that no correct program makes: says so on stderr and ends the process, as nothing can be answered.
[[noreturn]] void ProgramError(char const* what);
}  // namespace comgui::detail
