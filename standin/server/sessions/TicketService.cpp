#include "standin/server/sessions/TicketService.h"

#include "standin/server/files/RefusableCall.h"

namespace standin
{
namespace
{
bool OnlyForAdministrators(Session const& session, char const* what)
{
    RefusableCall::Note({session.Who().name, " may not ", what, ": only administrators may"});
    return false;
}

void HandOut(KeyValues const& values, TextReader& reader)
{
    for (TicketElement const& element : values.Elements())
        if (element.IsText())
        {
            element.text->HandOut(reader.Mark());
            reader.NoteRead();
        }
}
}  // namespace

bool TicketService::MayWrite(Session const& session, TicketAddress address)
{
    if (session.Ended())
        return false;
    if (session.IsAdministrator())
        return true;
    if (address.type == SystemTicket.type)
        return OnlyForAdministrators(session, "write the system's tickets");
    if (address.type == UserTicketType && address.id != session.Who().ticketId)
        return OnlyForAdministrators(session, "write other users' tickets");
    return true;
}

void WalkedValues::Add(KeyValues const& values)
{
    std::size_t const key = m_keys.size();
    m_keys.append(values.Name()->CStr(), values.Name()->Text().size() + 1);
    for (TicketElement const& element : values.Elements())
        m_values.push_back({key, element});
}

std::optional<WalkedValues> TicketService::Values(Session const& session, TicketAddress address,
                                                  Incarnation incarnation, std::string_view prefix)
{
    WalkedValues walked;
    bool const isThere = Look(session, address, incarnation,
                              [&](TicketSnapshot const& ticket, KeyFilter const* limit)
                              {
                                  for (KeyValues const* const values : ticket.Sorted(prefix))
                                  {
                                      if (limit && !limit->Selects(values->Name()->Text()))
                                          continue;
                                      standin::HandOut(*values, session.Reader());
                                      walked.Add(*values);
                                  }
                                  return true;
                              });
    return isThere ? std::optional(std::move(walked)) : std::nullopt;
}

char const* TicketService::HandOut(Session const& session, std::string_view text)
{
    TicketTexts texts;
    texts.push_back(std::make_unique<TicketText>(text));
    char const* const handedOut = texts.back()->bytes.c_str();
    texts.back()->HandOut(session.Reader().Mark());
    m_feed.Texts().Keep(std::move(texts));
    return handedOut;
}

bool TicketService::Write(Session const& session, TicketAddress address, Incarnation incarnation,
                          std::span<TicketWrite> writes)
{
    if (MayWrite(session, address))
        return m_writer.Write({address, incarnation}, writes, {session.LimitOf(address).get()});
    for (TicketWrite& write : writes)
        write.ok = false;
    return false;
}

std::optional<Incarnation> TicketService::Create(Session const& session, TicketAddress address)
{
    if (!IsValid(address) || !MayWrite(session, address))
        return std::nullopt;
    auto const made = m_writer.Create({address});
    return made ? std::optional(made->incarnation) : std::nullopt;
}

int TicketService::CreateNext(Session const& session, int type)
{
    // Of users' tickets nobody's own is a new one, so the id does not matter to the right.
    if (!IsValid({type, 0}) || !MayWrite(session, {type, TicketChange::NextId}))
        return -1;
    auto const made = m_writer.Create({{type, TicketChange::NextId}});
    return made ? made->address.id : -1;
}

bool TicketService::Delete(Session const& session, TicketAddress address)
{
    if (address.type == SystemTicket.type)
    {
        RefusableCall::Note({"the system's tickets are never deleted"});
        return false;
    }
    if (!MayWrite(session, address))
        return false;
    // A user's ticket goes with the user, and that is not the user's to decide.
    if (address.type == UserTicketType && !session.IsAdministrator())
        return OnlyForAdministrators(session, "delete users' tickets");
    return m_writer.Delete({address, 0});
}

std::optional<int> TicketService::Int(TicketAddress address, std::string_view key)
{
    std::optional<int> number;
    LookAt(address, 0,
           [&](TicketSnapshot const& ticket)
           {
               KeyValues const* const values = ticket.Find(key);
               TicketElement const* const element = values ? values->At(0) : nullptr;
               if (element && element->type == PARAM_INT)
                   number = static_cast<int>(element->word);
               return true;
           });
    return number;
}

FolderSettings TicketService::Folders(TicketSnapshot::Version* which)
{
    FolderSettings folders;
    LookAt(SystemTicket, 0,
           [&](TicketSnapshot const& ticket)
           {
               folders = FoldersOf(&ticket);
               if (which)
                   *which = ticket.Which();
               return true;
           });
    return folders;
}

std::string TextOf(TicketSnapshot const& ticket, std::string_view key)
{
    KeyValues const* const values = ticket.Find(key);
    TicketElement const* const element = values && values->Count() == 1 ? values->At(0) : nullptr;
    return element && element->type == PARAM_STRING ? element->text->bytes : std::string();
}
}  // namespace standin
