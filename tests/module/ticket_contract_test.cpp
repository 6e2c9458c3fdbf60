// Runs TicketContract for every maker of a STICKET_ACCESS: the fake, the factory (in memory and from a file)
// and a container's opened ticket. The container's own slots for values run it, too.
#include "comgui/testing/TicketContract.h"
#include "comgui/testing/TicketFake.h"
#include "tests/module/LocalTicketUnderTest.h"
#include "tests/module/NotificationListener.h"
#include <stdexcept>

using comgui::test::TemporaryFolder;
using comgui::test::TICKET_MAKER;
using comgui::test::TICKET_SUBJECT;
using comgui::test::TicketContract;
using comgui::test::TicketFake;

namespace
{
class FAKE_SUBJECT : public TICKET_SUBJECT
{
public:
    FAKE_SUBJECT() { who = {7, 8}; }
    STICKET_ACCESS const* Access() override { return m_fake.Access(); }

private:
    TicketFake m_fake;
};

// A ticket of the factory.
class LOCAL_SUBJECT : public TICKET_SUBJECT
{
public:
    LOCAL_SUBJECT(char const* path, STICKET_OPTION_WHOAMI const& words) : m_ticket(m_factory, path)
    {
        if (!m_ticket.Access())
            throw std::runtime_error("the factory makes no ticket");
        who = words;
    }
    STICKET_ACCESS const* Access() override { return m_ticket.Access(); }

private:
    TICKET_FACTORY m_factory;
    TICKET m_ticket;
};

class MEMORY_SUBJECT : public LOCAL_SUBJECT
{
public:
    MEMORY_SUBJECT() : LOCAL_SUBJECT(nullptr, {ULLONG_MAX, ULLONG_MAX}) {}
};

struct FOLDER_WITH_A_TICKET
{
    TemporaryFolder folder;
    std::string path = folder.Write("ticket.xml", "<ticket version='1' type='3' id='9'/>");
};

class FILE_SUBJECT : private FOLDER_WITH_A_TICKET, public LOCAL_SUBJECT
{
public:
    FILE_SUBJECT() : LOCAL_SUBJECT(path.c_str(), {3, 9}) {}
};

// A ticket of a container, opened.
class OPENED_SUBJECT : public TICKET_SUBJECT
{
public:
    OPENED_SUBJECT() : m_ticket(m_client.Open(Type, m_client.CreateNext(Type)))
    {
        if (!m_ticket)
            throw std::runtime_error("the container makes no ticket");
        who = {Type, 1};
    }
    STICKET_ACCESS const* Access() override { return m_ticket; }

protected:
    static constexpr int Type = 50;  // a new site has no ticket of it
    MTICKET_ACCESS const& Container() const { return *m_client.Access(); }

private:
    MODULE_AT_SITE m_module;
    CLIENT m_client{m_module, m_module.LogIn()};
    STICKET_ACCESS const* m_ticket;
};

// The same ticket, read and written through the slots of the container. A container has no slot for walks
// over values and for options: those remain the ticket's.
class CONTAINER_SLOTS_SUBJECT : public OPENED_SUBJECT
{
public:
    CONTAINER_SLOTS_SUBJECT()
    {
        m_access.Instance = this;
        m_access.SGETPARAMETER = [](void* instance, char const* key, PARAM_TYPE type, void* value, int pos)
        {
            MTICKET_ACCESS const& container = Of(instance).Container();
            return container.MGETPARAMETER(container.Instance, Type, 1, key, type, value, pos);
        };
        m_access.SGETMULTIPAR = [](void* instance, GETMULTIPAR* table)
        {
            MTICKET_ACCESS const& container = Of(instance).Container();
            return container.MGETMULTIPAR(container.Instance, Type, 1, table);
        };
        m_access.SSETPARAMETER =
            [](void* instance, char const* key, PARAM_TYPE type, void const* value, int pos)
        {
            MTICKET_ACCESS const& container = Of(instance).Container();
            return container.MSETPARAMETER(container.Instance, Type, 1, key, type, value, pos);
        };
        m_access.SSETMULTIPAR = [](void* instance, SETMULTIPAR* table)
        {
            MTICKET_ACCESS const& container = Of(instance).Container();
            return container.MSETMULTIPAR(container.Instance, Type, 1, table);
        };
        m_access.SWALKPARAMETERS =
            [](void* instance, SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit)
        {
            STICKET_ACCESS const* const ticket = Of(instance).OPENED_SUBJECT::Access();
            return ticket->SWALKPARAMETERS(ticket->Instance, action, context, prefix, limit);
        };
        m_access.SOPTION = [](void* instance, int code, void* out)
        {
            STICKET_ACCESS const* const ticket = Of(instance).OPENED_SUBJECT::Access();
            return ticket->SOPTION(ticket->Instance, code, out);
        };
    }
    STICKET_ACCESS const* Access() override { return &m_access; }

private:
    static CONTAINER_SLOTS_SUBJECT& Of(void* instance)
    {
        return *static_cast<CONTAINER_SLOTS_SUBJECT*>(instance);
    }

    STICKET_ACCESS m_access{};
};

template <typename Subject>
std::unique_ptr<TICKET_SUBJECT> New()
{
    return std::make_unique<Subject>();
}
}  // namespace

INSTANTIATE_TEST_SUITE_P(Tickets, TicketContract,
                         testing::Values(TICKET_MAKER{"Fake", New<FAKE_SUBJECT>},
                                         TICKET_MAKER{"InMemory", New<MEMORY_SUBJECT>},
                                         TICKET_MAKER{"InAFile", New<FILE_SUBJECT>},
                                         TICKET_MAKER{"Opened", New<OPENED_SUBJECT>},
                                         TICKET_MAKER{"ThroughTheContainer", New<CONTAINER_SLOTS_SUBJECT>}),
                         [](auto const& maker) { return std::string(maker.param.name); });
