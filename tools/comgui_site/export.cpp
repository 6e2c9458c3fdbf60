#include "tools/comgui_site/export.h"

#include "standin/server/files/SiteFiles.h"
#include "tools/comgui_site/Progress.h"
#include "tools/comgui_site/TicketCommits.h"
#include "tools/comgui_site/Trouble.h"
#include <algorithm>

namespace comgui_site
{
using standin::Store;
using standin::TicketAddress;
using standin::TicketXml;

namespace
{
std::string NameOf(TicketChoice const& choice)
{
    return choice.id ? "ticket " + TextOf(TicketAddress{choice.type, *choice.id})
                     : "ticket of type " + std::to_string(choice.type);
}

bool Chooses(TicketChoice const& choice, TicketAddress address)
{
    return choice.type == address.type && (!choice.id || *choice.id == address.id);
}

std::filesystem::path FileOf(std::filesystem::path const& folder, TicketAddress address)
{
    return folder / (std::to_string(address.type) + "_" + std::to_string(address.id) + ".xml");
}

// The element alone: each text begins with a declaration of its own.
std::string ElementOf(TicketXml const& ticket)
{
    std::string const text = ticket.Text();
    return text.substr(text.find("<ticket"));
}

void MustBeFree(std::filesystem::path const& folder, std::vector<TicketAddress> const& tickets)
{
    for (TicketAddress const address : tickets)
    {
        auto const file = FileOf(folder, address);
        if (std::filesystem::exists(std::filesystem::symlink_status(file)))
            throw Trouble(file.string() + ": is there already; choose another folder, or say --force");
    }
}
}  // namespace

std::vector<TicketAddress> Chosen(Store& store, std::vector<TicketChoice> const& choices)
{
    std::vector<TicketAddress> all;
    store.Tickets([&](TicketAddress address, auto const&) { all.push_back(address); });
    for (TicketChoice const& choice : choices)
        if (std::none_of(all.begin(), all.end(),
                         [&](TicketAddress address) { return Chooses(choice, address); }))
            throw Trouble("there is no " + NameOf(choice) + "; info lists the types");
    std::erase_if(all,
                  [&](TicketAddress address)
                  {
                      return !choices.empty() && std::none_of(choices.begin(), choices.end(),
                                                              [&](TicketChoice const& choice)
                                                              { return Chooses(choice, address); });
                  });
    return all;
}

std::size_t ExportToFolder(Store& store, std::vector<TicketAddress> const& tickets,
                           std::filesystem::path const& folder, bool mayReplace)
{
    if (!mayReplace)
        MustBeFree(folder, tickets);
    if (!std::filesystem::is_directory(folder))
        standin::MakePrivateFolders({std::filesystem::absolute(folder / "").parent_path()});
    Progress progress("writing tickets");
    std::size_t written = 0;
    for (TicketAddress const address : tickets)
    {
        progress(written, tickets.size());
        auto const ticket = Load(store, address);
        if (!ticket)
            continue;
        ticket->values.Write(FileOf(folder, address));
        ++written;
    }
    return written;
}

Document ExportOne(Store& store, TicketAddress ticket)
{
    auto const loaded = Load(store, ticket);
    if (!loaded)
        throw Trouble("there is no ticket " + TextOf(ticket) + " any more");
    Document document{loaded->values.Text(), 1};
    if (document.text.size() > TicketXml::SizeLimit)
        throw Trouble("the ticket " + TextOf(ticket) +
                      " makes more than 64 MiB of XML, which cannot be read again; "
                      "use backup");
    return document;
}

Document ExportToDocument(Store& store, std::vector<TicketAddress> const& tickets)
{
    Document document{"<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<site version=\"1\">\n"};
    Progress progress("reading tickets");
    for (TicketAddress const address : tickets)
    {
        progress(document.tickets, tickets.size());
        if (auto const ticket = Load(store, address))
        {
            document.text += ElementOf(ticket->values);
            ++document.tickets;
        }
        if (document.text.size() + 16 > TicketXml::SizeLimit)
            throw Trouble(
                "the tickets make more than 64 MiB of XML, which cannot be read again; choose fewer, or "
                "export them to a folder: -o FOLDER/");
    }
    document.text += "</site>\n";
    return document;
}
}  // namespace comgui_site
