// The folders by variable. Any values: they can be read just when a client that goes step by step comes to an
// end, and then the server, that client and the library's translator agree about every folder. Any tables of
// writes to the system ticket: each record is judged as if it came alone, and none takes away that clients
// come to an end.
#include "standin/server/tickets/FolderTable.h"

#include "fuzz/fuzz.h"
#include "standin/server/tickets/OwnedTicket.h"
#include "tests/folders/FolderServer.h"
#include "tests/server/FolderClient.h"

using namespace standin;

namespace
{
std::string NextFolder(INPUT& input)
{
    std::string folder;
    for (unsigned pieces = input.Among(4); pieces > 0; --pieces)
        if (input.Among(2) == 0)
            folder += std::string("$(") + FolderRows[input.Among(FolderRows.size())].variable + ")";
        else
            folder += input.Text(input.Among(12));
    return folder;
}

void MustTranslateAlike(FolderSettings const& settings)
{
    FolderServer server(settings.use);
    for (std::size_t row = 0; row < FolderRows.size(); ++row)
        if (!settings.values[row].empty())
            server.SetFolder(FolderRows[row].key, settings.values[row]);
    auto const translator = server.Translator();  // comes to an end
    COMGUI_MUST(translator->IsEnabled() == ((settings.use & 3) != 0));
    if ((settings.use & 1) == 0)
        return;
    FolderTable const table(settings.values);
    for (FolderRow const row : FolderRows)
    {
        std::string const path = std::string("$(") + row.variable + ")";
        COMGUI_MUST(translator->Decode(path, false) == table.FolderOf(row.variable).value_or(path));
    }
}

void MustBeAsToAClient(FolderSettings const& settings)
{
    auto const folders = FoldersOfAClient(settings);
    COMGUI_MUST(settings.CanBeRead() == folders.has_value());
    FolderTable const table(settings.values);
    COMGUI_MUST(!table.FolderOf("") && !table.FolderOf("install"));
    for (std::size_t const row : table.Unresolved())
        COMGUI_MUST(!table.FolderOf(FolderRows[row].variable) && !settings.values[row].empty());
    if (!folders)
        return;
    for (auto const& [variable, folder] : *folders)
        COMGUI_MUST((settings.use & 1) == 0 || table.FolderOf(variable) == folder);
    MustTranslateAlike(settings);
}

void AsValues(INPUT& input)
{
    FolderSettings settings;
    settings.use = input.Take<std::int8_t>();
    for (unsigned count = input.Among(8); count > 0; --count)
        settings.values[input.Among(FolderRows.size())] = NextFolder(input);
    MustBeAsToAClient(settings);
}

TicketWrite NextWrite(INPUT& input)
{
    TicketWrite write;
    unsigned const row = input.Among(FolderRows.size() + 4);
    write.key = row < FolderRows.size() ? FolderRows[row].key : UseFolderVariablesKey;
    constexpr int positions[] = {-1, 0, -1, 0, -2, 1, -3, 0xFFFFFF + 1};
    write.pos = positions[input.Among(8)];
    switch (input.Among(4))
    {
    case 0:
        write.value = TicketValue();
        break;
    case 1:
        write.value = TicketValue::Int(static_cast<int>(input.Among(6)));
        break;
    default:
        write.value = TicketValue::String(NextFolder(input));
    }
    return write;
}

std::vector<TicketWrite> CopyOf(TicketWrite const& write)
{
    std::vector<TicketWrite> copy;
    copy.push_back({write.key, write.pos, write.value->Copy()});
    return copy;
}

// Carries out the write unless it can not be, or takes away that clients come to an end.
bool IsDoneAlone(TicketXml& content, TicketWrite const& write)
{
    OwnedTicket ticket(content);
    bool const couldBeRead = FoldersOfAClient(FoldersOf(&ticket.Now())).has_value();
    auto copy = CopyOf(write);
    ticket.Write(copy);
    if (!copy[0].ok || (couldBeRead && !FoldersOfAClient(FoldersOf(&ticket.Now()))))
        return false;
    content = ticket.Content();
    return true;
}

void AsWrites(INPUT& input)
{
    OwnedTicket ticket;
    for (int tables = 0; tables < 6 && !input.IsEmpty(); ++tables)
    {
        std::vector<TicketWrite> writes;
        for (unsigned count = input.Among(6); count > 0; --count)
            writes.push_back(NextWrite(input));
        WritePlan const plan(&ticket.Now(), writes, nullptr, FoldersOf(&ticket.Now()));
        TicketXml expected = ticket.Content();
        for (TicketWrite const& write : writes)
            COMGUI_MUST(write.ok == IsDoneAlone(expected, write));
        std::erase_if(writes, [](TicketWrite const& write) { return !write.ok; });
        ticket.Write(writes);
        COMGUI_MUST(ticket.Content().Text() == expected.Text());
        COMGUI_MUST(FoldersOf(&ticket.Now()).CanBeRead());
    }
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    INPUT input(data, size);
    AsValues(input);
    AsWrites(input);
    return 0;
}
