// The tables that the kit makes keep the contracts that all makers of such tables share.
#include "comgui/testing/ContainerContract.h"
#include "comgui/testing/TicketContract.h"
#include "comgui/ticket/TICKET_OP.h"
#include "tests/module_kit/FakePlugIn.h"

using comgui::test::CONTAINER_MAKER;
using comgui::test::CONTAINER_SUBJECT;
using comgui::test::ContainerContract;
using comgui::test::TICKET_MAKER;
using comgui::test::TICKET_SUBJECT;
using comgui::test::TicketContract;

namespace
{
class HOST
{
public:
    HOST()
    {
        EXPECT_EQ(table.Open(&hInstance), 0);
        EXPECT_EQ(table.LoginEntry(hInstance, &record), 0);
        container = table.GetClientContainerEntry(hInstance, record.hSession);
    }
    ~HOST() { EXPECT_EQ(table.LogoutEntry(hInstance, record.hSession), 0); }
    HOST(HOST const&) = delete;
    HOST& operator=(HOST const&) = delete;

    int NewTicket() const
    {
        int id = -1;
        EXPECT_EQ(container->MOPERATION(container->Instance, 3, -4, MTICKET_OP_CREATE_NEXT, &id), 1);
        return id;
    }

    ComGUIModuleInterface& table = comgui::plugin::PlugIn<fake::Module>::Table();
    void* hInstance = nullptr;
    RECORD record;
    MTICKET_ACCESS const* container = nullptr;
};

class MEMORY_TICKET : public TICKET_SUBJECT
{
public:
    MEMORY_TICKET() { who.word0 = who.word8 = static_cast<unsigned long long>(-1); }
    ~MEMORY_TICKET() override { m_table.STicketFactory->DestroyTicket(&m_access); }
    MEMORY_TICKET(MEMORY_TICKET const&) = delete;
    MEMORY_TICKET& operator=(MEMORY_TICKET const&) = delete;

    STICKET_ACCESS const* Access() override { return m_access; }

private:
    ComGUIModuleInterface& m_table = comgui::plugin::PlugIn<fake::Module>::Table();
    STICKET_ACCESS const* m_access = m_table.STicketFactory->CreateTicket(nullptr);
};

class OPENED_TICKET : public TICKET_SUBJECT
{
public:
    OPENED_TICKET()
    {
        int const id = m_host.NewTicket();
        MTICKET_ACCESS const& container = *m_host.container;
        EXPECT_EQ(container.MOPERATION(container.Instance, 3, id, MTICKET_OP_OPEN, &m_access), 1);
        who.word0 = 3;
        who.word8 = static_cast<unsigned long long>(id);
    }

    STICKET_ACCESS const* Access() override { return m_access; }

private:
    HOST m_host;
    STICKET_ACCESS const* m_access = nullptr;
};

class CONTAINER : public CONTAINER_SUBJECT
{
public:
    CONTAINER()
    {
        id = m_host.NewTicket();
        missingId = 99'999;
    }

    MTICKET_ACCESS const* Access() override { return m_host.container; }

private:
    HOST m_host;
};

template <typename Subject, typename Made>
std::unique_ptr<Subject> Make()
{
    return std::make_unique<Made>();
}
}  // namespace

INSTANTIATE_TEST_SUITE_P(OfTheKit, TicketContract,
                         testing::Values(TICKET_MAKER{"InMemory", Make<TICKET_SUBJECT, MEMORY_TICKET>},
                                         TICKET_MAKER{"Opened", Make<TICKET_SUBJECT, OPENED_TICKET>}),
                         [](auto const& maker) { return std::string(maker.param.name); });
INSTANTIATE_TEST_SUITE_P(OfTheKit, ContainerContract,
                         testing::Values(CONTAINER_MAKER{"Container", Make<CONTAINER_SUBJECT, CONTAINER>}),
                         [](auto const& maker) { return std::string(maker.param.name); });
