// The installed contract suites, over the fakes that come with them.
#include <comgui/testing/ContainerContract.h>
#include <comgui/testing/ContainerFake.h>
#include <comgui/testing/TicketContract.h>
#include <comgui/testing/TicketFake.h>

using comgui::test::ContainerContract;
using comgui::test::TicketContract;

namespace
{
class Ticket : public comgui::test::TICKET_SUBJECT
{
public:
    Ticket() { who = {7, 8}; }
    STICKET_ACCESS const* Access() override { return m_fake.Access(); }

private:
    comgui::test::TicketFake m_fake;
};

class Container : public comgui::test::CONTAINER_SUBJECT
{
public:
    Container() { m_fake.AddTicket(type, id); }
    MTICKET_ACCESS const* Access() override { return m_fake.Access(); }

private:
    comgui::test::ContainerFake m_fake;
};

template <typename Subject, typename Base>
std::unique_ptr<Base> Make()
{
    return std::make_unique<Subject>();
}
}  // namespace

INSTANTIATE_TEST_SUITE_P(Fakes, TicketContract,
                         testing::Values(comgui::test::TICKET_MAKER{
                             "Fake", &Make<Ticket, comgui::test::TICKET_SUBJECT>}));
INSTANTIATE_TEST_SUITE_P(Fakes, ContainerContract,
                         testing::Values(comgui::test::CONTAINER_MAKER{
                             "Fake", &Make<Container, comgui::test::CONTAINER_SUBJECT>}));
