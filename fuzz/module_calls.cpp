// The module through its table: entries and slots in any order, with good and bad arguments. Half of the
// inputs are compared: every write with a plain model of the ticket, and every read, walk and copy of a
// ticket with the same ticket, whoever asks. In the others, from one thread or from several at once, what
// holds anyway must hold: results and codes are such as are documented, a refused read leaves its place
// alone, and texts that were read stand until their session logs out. Nothing calls a client back that has
// logged out.
#include "fuzz/ModuleCaller.h"

#include "standin/server/tickets/TicketXml.h"
#include <thread>

namespace
{
// The three ways to ask for a whole ticket agree.
void MustAgree(MODULE_SITE const& site)
{
    for (int const type : {0, 3, 7, 17, 99})
        for (int const id : site.TicketsOf(type))
        {
            MODEL_TICKET content = site.Content(type, id).value();
            MODEL_TICKET fromXml;
            standin::TicketXml::Parse(site.Data(type, id).value(), "data.xml")
                .Walk([&fromXml](std::string_view key, int pos, standin::StoredValue const& value)
                      { fromXml[std::string(key)][pos].first = value.type; });
            for (auto& [key, values] : content)
            {
                std::erase_if(values, [](auto const& entry) { return entry.second.first == PARAM_POINTER; });
                for (auto& [pos, value] : values)
                    value.second.clear();
            }
            std::erase_if(content, [](auto const& entry) { return entry.second.empty(); });
            COMGUI_MUST(content == fromXml);
        }
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    INPUT input(data, size);
    unsigned const choice = input.Among(8);
    bool const isCompared = choice < 4;  // by reads, which hand out all texts, and so keep them
    std::size_t const count = choice < 6 ? 1 : choice - 4;
    MODULE_SITE& site = MODULE_SITE::Get();
    site.Reset();
    auto const names = site.NamesInSite();
    CLIENTS clients(isCompared);
    std::deque<CALLER> callers;
    std::string const choices = input.Bytes(size);
    std::size_t const part = choices.size() / count;
    for (std::size_t i = 0; i < count; ++i)
        callers.emplace_back(clients, INPUT(data + (size - choices.size()) + i * part, part));
    std::vector<std::thread> threads;
    for (std::size_t i = 1; i < count; ++i)
        threads.emplace_back([&callers, i] { callers[i].Run(); });
    callers[0].Run();
    for (std::thread& thread : threads)
        thread.join();
    MustAgree(site);
    if (!isCompared &&
        std::any_of(callers.begin(), callers.end(), [](CALLER const& caller) { return caller.HasTexts(); }))
        site.TurnOver();
    for (CALLER& caller : callers)
    {
        caller.MustHoldItsTexts();
        caller.DestroyTickets();
    }
    for (CLIENT_SESSION& session : clients.sessions)
        clients.LogOut(session);
    COMGUI_MUST(site.NamesInSite() == names);
    return 0;
}
