// What a client gets to hear through its callback, and what registering and switching take, through the
// table of the bundle.
#pragma once

#include "comgui/ticket/TICKET_ID.h"
#include "tests/module/LocalTicketUnderTest.h"
#include <atomic>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <vector>

// A client's end: its address is the pUser. Calls are kept as texts such as "changed 3/1 A@-1=7 B@0='x'",
// with the records in their order, and "created 3/4".
class LISTENER
{
public:
    static void Call(void* user, int kind, int argA, int argB, int code, void* data);

    // Waits until that many calls have come and gives all there are; fewer only if they never come.
    std::vector<std::string> Wait(std::size_t calls);
    std::vector<std::string> Calls() const;

    std::function<void()> onCall;  // on the thread of the callback, before the call is counted
    std::atomic<int> running{0};   // callbacks of this listener at the moment
    std::atomic<bool> overlapped{false};
    std::atomic<int> lastId{0};          // the notification id of the last call
    std::atomic<bool> sharesKeys{true};  // records of one key had one key pointer and were neighbours

private:
    void Take(int kind, int argA, int argB, int code, SETMULTIPAR const* records);

    mutable std::mutex m_lock;
    std::condition_variable m_came;
    std::vector<std::string> m_calls;
};

// A session with a container that can be written to in a word.
class CLIENT
{
public:
    CLIENT(MODULE_AT_SITE const& site, void* hSession)
        : m_site(site), m_session(hSession), m_access(site.Container(hSession))
    {
    }

    MTICKET_ACCESS const* Access() const { return m_access; }
    void* Session() const { return m_session; }

    // The code of the command; id gets what it wrote, -1 for nothing.
    int Register(LISTENER* listener, int& id) const;
    int Register(LISTENER& listener) const  // the id
    {
        int id = -1;
        EXPECT_EQ(Register(&listener, id), 0);
        return id;
    }
    int Enable(int type, int id, int notification, std::vector<char const*> keys = {}) const
    {
        keys.push_back(nullptr);
        return m_access->MENDISNOTIF(m_access->Instance, type, id, notification, true, keys.data());
    }
    int Disable(int type, int id, int notification) const
    {
        return m_access->MENDISNOTIF(m_access->Instance, type, id, notification, false, nullptr);
    }
    int Logout() const { return m_site.module->LogoutEntry(m_site.module.Instance(), m_session); }

    int Write(int type, int id, char const* key, int value, int pos = -1) const
    {
        return m_access->MSETPARAMETER(m_access->Instance, type, id, key, PARAM_INT, &value, pos);
    }
    int Delete(int type, int id, char const* key, int pos = -1) const
    {
        return m_access->MSETPARAMETER(m_access->Instance, type, id, key, PARAM_NONE, nullptr, pos);
    }
    int Read(int type, int id, char const* key, int pos = -1) const  // -1 for what cannot be read
    {
        int value = -1;
        m_access->MGETPARAMETER(m_access->Instance, type, id, key, PARAM_INT, &value, pos);
        return value;
    }
    int Operate(int type, int id, int code, void* arg = nullptr) const
    {
        TICKET_OP op(MTICKET_OP_OPEN);
        op.SetInt(code);
        return m_access->MOPERATION(m_access->Instance, type, id, op, arg);
    }
    STICKET_ACCESS const* Open(int type, int id) const
    {
        STICKET_ACCESS const* ticket = nullptr;
        return Operate(type, id, MTICKET_OP_OPEN, &ticket) ? ticket : nullptr;
    }
    int Close(int type, int id) const
    {
        bool flag = false;
        return Operate(type, id, MTICKET_OP_CLOSE, &flag);
    }
    int CreateNext(int type) const
    {
        int id = -1;
        return Operate(type, TICKET_ID_NEXT, MTICKET_OP_CREATE_NEXT, &id) ? id : -1;
    }
    STICKET_ACCESS const* Create(int type, int id, std::vector<char const*> keys = {}) const
    {
        keys.push_back(nullptr);
        return m_access->MCREATETICKET(m_access->Instance, type, id, keys.data());
    }
    int Limit(int type, int id, std::vector<char const*> keys) const
    {
        keys.push_back(nullptr);
        return Operate(type, id, STICKET_OP_SET_PARTIAL, keys.data());
    }

private:
    MODULE_AT_SITE const& m_site;
    void* m_session;
    MTICKET_ACCESS const* m_access;
};

// A site with an administrator and an operator logged in.
class ClientTest : public ModuleTest
{
protected:
    CLIENT const admin{*this, LogIn()};
    CLIENT const other{*this, LogIn("operator", "operator")};
};
