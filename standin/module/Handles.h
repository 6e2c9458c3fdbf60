// The handles that the module has given out: instances, sessions, and the records that are initialised. A
// session's handle is a number that no other session of this process ever gets, so a stale or made-up one
// is known for what it is and never followed as an address. For any thread.
#pragma once

#include "standin/module/Container.h"
#include "standin/module/SiteServer.h"
#include <map>
#include <mutex>
#include <set>

struct TLogin;

namespace standin
{
class Handles
{
public:
    static Handles& Get();  // never destroyed

    void* NewInstance();
    bool IsInstance(void* hInstance) const;

    // An instance keeps account of its records; both need one that IsInstance knows.
    void Initialize(void* hInstance, TLogin const* record);
    bool Uninitialize(void* hInstance, TLogin const* record);  // false if it was not initialised

    void* NewSession(Server& server, std::shared_ptr<Session> session);
    Container const* SessionOf(void* hSession) const;  // null for a handle that is none, or no longer
    bool EndSession(void* hSession);                   // false for such a handle

private:
    mutable std::mutex m_lock;
    std::map<void*, std::set<TLogin const*>> m_instances;    // with the records that are initialised
    std::map<void*, std::unique_ptr<Container>> m_sessions;  // ended ones, too: their tables stay
};
}  // namespace standin
