#include "standin/module/Handles.h"

#include <bit>

namespace standin
{
namespace
{
void* HandleOf(std::size_t number) { return std::bit_cast<void*>(number); }
}  // namespace

Handles& Handles::Get()
{
    static auto& handles = *new Handles;
    return handles;
}

void* Handles::NewInstance()
{
    std::lock_guard const lock(m_lock);
    return m_instances.try_emplace(HandleOf(m_instances.size() + 1)).first->first;
}

bool Handles::IsInstance(void* hInstance) const
{
    std::lock_guard const lock(m_lock);
    return m_instances.contains(hInstance);
}

void Handles::Initialize(void* hInstance, TLogin const* record)
{
    std::lock_guard const lock(m_lock);
    m_instances.at(hInstance).insert(record);
}

bool Handles::Uninitialize(void* hInstance, TLogin const* record)
{
    std::lock_guard const lock(m_lock);
    return m_instances.at(hInstance).erase(record) != 0;
}

void* Handles::NewSession(Server& server, std::shared_ptr<Session> session)
{
    auto container = std::make_unique<Container>(server, std::move(session));
    std::lock_guard const lock(m_lock);
    void* const handle = HandleOf(m_sessions.size() + 1);
    m_sessions.emplace(handle, std::move(container));
    return handle;
}

Container const* Handles::SessionOf(void* hSession) const
{
    std::lock_guard const lock(m_lock);
    auto const found = m_sessions.find(hSession);
    bool const lives = found != m_sessions.end() && !found->second->Session().Ended();
    return lives ? found->second.get() : nullptr;
}

bool Handles::EndSession(void* hSession)
{
    Container* container = nullptr;
    {
        std::lock_guard const lock(m_lock);
        auto const found = m_sessions.find(hSession);
        container = found == m_sessions.end() ? nullptr : found->second.get();
    }
    return container && container->EndSession();
}
}  // namespace standin
