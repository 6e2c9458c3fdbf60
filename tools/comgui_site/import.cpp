#include "tools/comgui_site/import.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/SiteFiles.h"
#include "standin/server/site/SystemTicketMirror.h"
#include "standin/server/tickets/TicketXmlReader.h"
#include "tools/comgui_site/Progress.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/words.h"
#include <algorithm>

namespace comgui_site
{
using standin::Store;
using standin::TicketAddress;
using standin::TicketXml;

namespace
{
bool IsDocument(std::string const& text)
{
    pugi::xml_document document;
    document.load_buffer(text.data(), text.size(), pugi::parse_default, pugi::encoding_utf8);
    return document.document_element().name() == std::string_view("site");
}

// With the nodes from which the tickets come, for messages.
std::vector<TicketXml> ReadDocument(standin::TicketXmlReader const& reader)
{
    std::vector<TicketXml> tickets;
    pugi::xml_node const root = reader.Root("site");
    reader.ExpectAttributes(root, {"version"});
    for (pugi::xml_node const child : reader.Elements(root))
    {
        if (child.name() == std::string_view("users"))
            reader.Fail(child, "users cannot be imported; take them out, and make them with users add");
        if (child.name() != std::string_view("ticket"))
            reader.Fail(child, std::string("unknown element <") + child.name() + ">");
        tickets.push_back(reader.Ticket(child));
        if (!tickets.back().address)
            reader.Fail(child, "the ticket has no type and id; add the attributes type and id");
    }
    return tickets;
}

std::vector<TicketXml> ReadTicketsOf(std::string const& file)
{
    std::string const text = standin::ReadFile(file, TicketXml::SizeLimit + 1);
    standin::TicketXmlReader const reader(text, file);
    if (IsDocument(text))
        return ReadDocument(reader);
    pugi::xml_node const root = reader.Root("ticket");
    std::vector<TicketXml> ticket{reader.Ticket(root)};
    if (!ticket[0].address)
        reader.Fail(root, "the ticket has no type and id; add the attributes type and id");
    return ticket;
}

// For the mirror alone: nobody hears of a change, keeps a text or deletes a ticket.
class Nobody final : public standin::ChangeListener, public standin::TextKeeper, public standin::AfterChange
{
    bool Wants(TicketAddress) const override { return false; }
    bool HasRoom() const override { return true; }
    void Created(TicketAddress) noexcept override {}
    void Written(TicketAddress, standin::ChangedParameters&&) noexcept override {}
    void Deleted(TicketAddress) noexcept override {}
    void Keep(standin::TicketTexts) noexcept override {}
    void SystemTicketChanged() noexcept override {}
    std::function<void()> WhenDeleted(TicketAddress, standin::TicketSnapshot const&) override { return {}; }
};
}  // namespace

std::vector<TicketXml> ReadTickets(std::vector<std::string> const& files)
{
    struct Found
    {
        TicketXml ticket;
        std::string file;
    };
    std::vector<Found> found;
    for (std::string const& file : files)
        for (TicketXml& ticket : ReadTicketsOf(file))
            found.push_back({std::move(ticket), file});
    std::stable_sort(found.begin(), found.end(),
                     [](Found const& left, Found const& right)
                     { return *left.ticket.address < *right.ticket.address; });
    auto const twice = std::adjacent_find(found.begin(), found.end(),
                                          [](Found const& left, Found const& right)
                                          { return left.ticket.address == right.ticket.address; });
    if (twice != found.end())
        throw Trouble("the ticket " + TextOf(*twice->ticket.address) + " comes twice, from " + twice->file +
                      " and from " + std::next(twice)->file + "; leave one out");
    std::vector<TicketXml> tickets;
    tickets.reserve(found.size());
    for (Found& one : found)
        tickets.push_back(std::move(one.ticket));
    return tickets;
}

void Import(Store& store, std::vector<TicketXml> const& tickets, TicketCommits::Mode mode,
            std::function<void(TicketAddress, TicketCommits::Done const&)> const& tell)
{
    TicketCommits commits(store);
    Progress progress("writing tickets");
    unsigned long long done = 0;
    for (TicketXml const& ticket : tickets)
    {
        progress(done, tickets.size());
        try
        {
            tell(*ticket.address, commits.Bring(*ticket.address, ticket, mode));
        }
        catch (std::runtime_error const& error)
        {
            throw Trouble("ticket " + TextOf(*ticket.address) + " is not imported: " + error.what() + " (" +
                          std::to_string(done) + " of " + Counted(tickets.size(), "ticket") +
                          " before it are)");
        }
        ++done;
    }
}

void WriteMirror(Store& store, std::filesystem::path const& site)
{
    standin::MakePrivateFolders({site / "tickets"});
    Nobody nobody;
    standin::Feed feed(store, nobody, nobody);
    standin::TicketWriter writer(store, feed, nobody);
    standin::TicketService tickets(feed, writer);
    standin::SystemTicketMirror(store, tickets, site).Write();
    feed.Stop();
}
}  // namespace comgui_site
