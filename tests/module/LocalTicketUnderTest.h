// The factory of single tickets in the bundle's own executable, and a ticket that gives itself back.
#pragma once

#include "tests/module/ModuleUnderTest.h"
#include <string>

// What a new ticket file begins as.
inline constexpr char const* EmptyTicket = "<ticket version=\"1\"/>\n";

class TICKET_FACTORY
{
public:
    STICKET_ACCESS const* Create(char const* path) const { return (*this)->CreateTicket(path); }
    void Destroy(STICKET_ACCESS const*& ticket) const { (*this)->DestroyTicket(&ticket); }

    STicketFactory const* operator->() const { return m_module->STicketFactory; }

private:
    MODULE m_module;
};

class TICKET
{
public:
    TICKET(TICKET_FACTORY const& factory, char const* path)
        : m_factory(factory), m_access(factory.Create(path))
    {
    }
    TICKET(TICKET_FACTORY const& factory, std::string const& path) : TICKET(factory, path.c_str()) {}
    ~TICKET() { m_factory.Destroy(m_access); }
    TICKET(TICKET const&) = delete;
    TICKET& operator=(TICKET const&) = delete;

    STICKET_ACCESS const* Access() const { return m_access; }
    STICKET_ACCESS const* operator->() const { return m_access; }
    void* Instance() const { return m_access->Instance; }

    int Get(char const* key, PARAM_TYPE type, void* value, int pos = -1) const
    {
        return m_access->SGETPARAMETER(Instance(), key, type, value, pos);
    }
    int Set(char const* key, PARAM_TYPE type, void const* value, int pos = -1) const
    {
        return m_access->SSETPARAMETER(Instance(), key, type, value, pos);
    }
    int Set(char const* key, int value, int pos = -1) const { return Set(key, PARAM_INT, &value, pos); }
    int Set(char const* key, char const* text, int pos = -1) const
    {
        return Set(key, PARAM_STRING, text, pos);
    }
    int Delete(char const* key, int pos = -1) const { return Set(key, PARAM_NONE, nullptr, pos); }

    // -1 or "none" for what cannot be read.
    int Int(char const* key, int pos = -1) const
    {
        int value = -1;
        Get(key, PARAM_INT, &value, pos);
        return value;
    }
    std::string Text(char const* key, int pos = -1) const
    {
        char const* text = "none";
        Get(key, PARAM_STRING, &text, pos);
        return text;
    }

private:
    TICKET_FACTORY const& m_factory;
    STICKET_ACCESS const* m_access;
};

// What local.get.reason gives to this thread; "none" for nothing.
inline std::string TakeReason(MODULE const& module)
{
    TICKET_FACTORY const factory;
    TICKET const ticket(factory, nullptr);
    EXPECT_EQ(module->SendCommandEntry(module.Instance(), nullptr, "local.get.reason", 0,
                                       const_cast<STICKET_ACCESS*>(ticket.Access())),
              0);
    return ticket.Text("Reason/Text");
}
