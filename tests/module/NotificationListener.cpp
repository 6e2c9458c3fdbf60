#include "tests/module/NotificationListener.h"

#include "tests/module/ValueText.h"
#include <chrono>
#include <set>

void LISTENER::Call(void* user, int kind, int argA, int argB, int code, void* data)
{
    static_cast<LISTENER*>(user)->Take(kind, argA, argB, code, static_cast<SETMULTIPAR const*>(data));
}

void LISTENER::Take(int kind, int argA, int argB, int code, SETMULTIPAR const* records)
{
    if (++running > 1)
        overlapped = true;
    lastId = argB;
    std::string text = kind == 1   ? "changed "
                       : kind == 4 ? "created "
                       : kind == 5 ? "deleted "
                       : kind == 6 ? "ended "
                                   : "? ";
    text += std::to_string(code) + "/" + std::to_string(argA);
    std::set<std::string> keys;
    for (SETMULTIPAR const* record = records; record && record->key; ++record)
    {
        text += " " + std::string(record->key) + "@" + std::to_string(record->pos) + "=" +
                TextOf(record->type, record->value);
        bool const isNewKey = record == records || record->key != record[-1].key;
        if (isNewKey && !keys.insert(record->key).second)
            sharesKeys = false;
    }
    if (onCall)
        onCall();
    --running;
    std::lock_guard const lock(m_lock);
    m_calls.push_back(std::move(text));
    m_came.notify_all();
}

std::vector<std::string> LISTENER::Wait(std::size_t calls)
{
    std::unique_lock lock(m_lock);
    m_came.wait_for(lock, std::chrono::minutes(2), [&] { return m_calls.size() >= calls; });
    return m_calls;
}

std::vector<std::string> LISTENER::Calls() const
{
    std::lock_guard const lock(m_lock);
    return m_calls;
}

int CLIENT::Register(LISTENER* listener, int& id) const
{
    TICKET_FACTORY const factory;
    TICKET const request(factory, nullptr);
    request.Set("pGUI2Notification", PARAM_POINTER, reinterpret_cast<void*>(&LISTENER::Call));
    request.Set("pUser", PARAM_POINTER, listener);
    int const code =
        m_site.module->SendCommandEntry(m_site.module.Instance(), m_session, "local.set.callback", 0,
                                        const_cast<STICKET_ACCESS*>(request.Access()));
    id = request.Int("iGUINotificationID");
    return code;
}
