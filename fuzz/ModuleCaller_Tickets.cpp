#include "fuzz/ModuleCaller.h"

#include "comgui/ticket/TICKET_ID.h"
#include "comgui/ticket/clFOLDER_VARIABLES.h"
#include "standin/server/tickets/TicketXml.h"
#include <climits>

int CALLER::Operate(CLIENT_SESSION const& session, ADDRESS address, int code, void* arg) const
{
    TICKET_OP operation(MTICKET_OP_OPEN);
    operation.SetInt(code);
    MTICKET_ACCESS const& access = *session.access;
    int const result = access.MOPERATION(access.Instance, address.type, address.id, operation, arg);
    COMGUI_MUST(result == 0 || result == 1);
    return result;
}

void CALLER::Create()
{
    CLIENT_SESSION& session = NextSession();
    ADDRESS address = NextAddress(m_input);
    bool const isNext = m_input.Among(2) == 1;
    if (address.type == 0)
        address.type = 99;
    bool const mayBe =
        !session.hasEnded && address.type >= 0 && address.type < 100 && session.MayWrite(address);
    if (isNext)
        return CreateNext(session, address.type, mayBe && address.type != 17);
    char const* const* const keys = m_keys.NextTable(m_input);
    bool const wasThere = Content(address).has_value();
    MTICKET_ACCESS const& access = *session.access;
    auto const* const ticket = access.MCREATETICKET(access.Instance, address.type, address.id, keys);
    if (ticket)
        m_opened.emplace_back(&session, ticket);
    if (!m_clients.isCompared)
        return;
    COMGUI_MUST((ticket != nullptr) == (mayBe && address.IsValid() && !wasThere));
    if (!ticket)
        return;
    session.limits.Set(address, keys);
    COMGUI_MUST(Content(address) == MODEL_TICKET());
}

void CALLER::CreateNext(CLIENT_SESSION& session, int type, bool mayBe)
{
    auto const before = m_clients.isCompared && mayBe ? m_site.TicketsOf(type) : std::vector<int>();
    int id = -7;
    MTICKET_ACCESS const& access = *session.access;
    int const result = access.MOPERATION(access.Instance, type, TICKET_ID_NEXT, MTICKET_OP_CREATE_NEXT, &id);
    COMGUI_MUST(result ? id >= 0 && id <= LastId : id == -7);
    if (!m_clients.isCompared || !mayBe)
        return;
    COMGUI_MUST(result);
    session.limits.Set({type, id}, nullptr);
    COMGUI_MUST(before.empty() ? id == 1 : before.back() == LastId || id == before.back() + 1);
    COMGUI_MUST(Content({type, id}) == MODEL_TICKET());
}

void CALLER::Delete()
{
    CLIENT_SESSION const& session = NextSession();
    ADDRESS const address = NextAddress(m_input);
    bool const isSeeds = address.type == 17 && (address.id == 1 || address.id == 2);
    if (isSeeds)
        return;  // its user would be without one
    bool const wasThere = Content(address).has_value();
    int const result = Operate(session, address, MTICKET_OP_DELETE, nullptr);
    if (!m_clients.isCompared)
        return;
    bool const mayBe =
        !session.hasEnded && address.type != 0 && (session.isAdministrator || address.type != 17);
    COMGUI_MUST(result == (mayBe && wasThere ? 1 : 0));
    COMGUI_MUST(Content(address).has_value() == (wasThere && !result));
}

void CALLER::Open()
{
    CLIENT_SESSION const& session = NextSession();
    ADDRESS const address = NextAddress(m_input);
    STICKET_ACCESS const* ticket = nullptr;
    int const result = Operate(session, address, MTICKET_OP_OPEN, &ticket);
    COMGUI_MUST((result == 1) == (ticket != nullptr));
    COMGUI_MUST(!Operate(session, address, MTICKET_OP_OPEN, nullptr));
    if (m_clients.isCompared)
        COMGUI_MUST((result == 1) == (!session.hasEnded && Content(address)));
    if (ticket)
        m_opened.emplace_back(&session, ticket);
}

void CALLER::Close()
{
    bool flag = m_input.Among(2) == 1;
    CLIENT_SESSION const& session = NextSession();
    Operate(session, NextAddress(m_input), MTICKET_OP_CLOSE, &flag);
    // Codes that mean nothing, and such as are missing their argument.
    constexpr int codes[] = {0, 2, 7, 98, 99, 105, 108, 109, 111, -1, INT_MAX};
    COMGUI_MUST(!Operate(session, NextAddress(m_input), codes[m_input.Among(11)], nullptr));
}

void CALLER::UseOpened()
{
    if (m_opened.empty())
        return;
    auto const& opened = m_opened[m_input.Among(static_cast<unsigned>(m_opened.size()))];
    STICKET_ACCESS const& ticket = *opened.second;
    STICKET_OPTION_WHOAMI who = {~0ull, ~0ull};
    int const isThere = ticket.SOPTION(ticket.Instance, STICKET_OP_WHOAMI, &who);
    COMGUI_MUST(isThere || (who.word0 == ~0ull && who.word8 == ~0ull));
    COMGUI_MUST(!ticket.SOPTION(ticket.Instance, STICKET_OP_WHOAMI, nullptr));
    TEXTS texts;
    ADDRESS const address{static_cast<int>(who.word0), static_cast<int>(who.word8)};
    if (m_clients.isCompared)
    {
        MODEL_TICKET content = isThere ? Content(address).value() : MODEL_TICKET();
        std::erase_if(content,
                      [&](auto const& key) { return !opened.first->limits.Selects(address, key.first); });
        COMGUI_MUST(Walked(ticket, &texts) == content);
    }
    UseSlots(ticket, m_clients.isCompared ? &texts : nullptr);
    texts.MustStand();
}

void CALLER::UseSlots(STICKET_ACCESS const& ticket, TEXTS* texts)
{
    char const* const key = m_keys.Next(m_input);
    PARAM_TYPE const type = NextType(m_input);
    int const pos = NextPosition(m_input);
    ::Read([&](void* out) { return ticket.SGETPARAMETER(ticket.Instance, key, type, out, pos); }, type,
           texts);
    RECORD const record(m_keys, m_input);
    int const result = ticket.SSETPARAMETER(ticket.Instance, record.key, record.value.Type(),
                                            record.value.Word(), record.pos);
    COMGUI_MUST(!result || CanBeWritten(record.key, record.value, record.pos));
}

void CALLER::Limit()
{
    CLIENT_SESSION& session = NextSession();
    ADDRESS const address = NextAddress(m_input);
    char const* const* const keys = m_keys.NextTable(m_input);
    bool const mayBe = !session.hasEnded && Content(address);
    int const result = Operate(session, address, STICKET_OP_SET_PARTIAL, const_cast<char const**>(keys));
    if (!m_clients.isCompared)
        return;
    COMGUI_MUST((result == 1) == mayBe);
    if (result)
        session.limits.Set(address, keys);
}

void CALLER::WalkTickets()
{
    constexpr int types[] = {3, 7, 0, 17, 99, -1, 100};
    CLIENT_SESSION const& session = NextSession();
    MTICKET_ACCESS const& access = *session.access;
    int const type = types[m_input.Among(7)];
    COMGUI_MUST(!access.MWALKTICKETS(access.Instance, nullptr, this, type));
    auto const take = [](void* context, int foundType, int id, STICKET_ACCESS const* ticket)
    {
        auto& caller = *static_cast<CALLER*>(context);
        COMGUI_MUST(ticket && ADDRESS({foundType, id}).IsValid());
        STICKET_OPTION_WHOAMI who{};
        if (ticket->SOPTION(ticket->Instance, STICKET_OP_WHOAMI, &who))
            COMGUI_MUST(who.word0 == static_cast<unsigned long long>(foundType) &&
                        who.word8 == static_cast<unsigned long long>(id));
        if (caller.m_depth < 2 && !caller.m_input.IsEmpty())
            caller.Step();
        return caller.m_input.Among(8) != 7;
    };
    ++m_depth;
    int const result = access.MWALKTICKETS(access.Instance, take, this, type);
    --m_depth;
    COMGUI_MUST(result == 0 || (type >= 0 && type < 100));
}

void CALLER::GetData()
{
    CLIENT_SESSION const& session = NextSession();
    ADDRESS const address = NextAddress(m_input);
    int const format = m_input.Among(4) == 3 ? -1 : 0;
    int const room = m_input.Take<std::uint16_t>() % 600;
    std::string buffer(static_cast<std::size_t>(room), '\x7F');
    int size = room;
    auto const& module = m_site.module;
    int const code = module->GetTicketDataEntry(module.Instance(), session.handle, address.type, address.id,
                                                format, &size, buffer.data());
    MustBeACode(code);
    COMGUI_MUST(module->GetTicketDataEntry(module.Instance(), session.handle, address.type, address.id,
                                           format, nullptr, buffer.data()) != 0);
    COMGUI_MUST(code == 0 ? size <= room : code == 110 ? size > room : size == room);
    auto const behind = buffer.begin() + (code == 0 ? size : 0);
    COMGUI_MUST(std::all_of(behind, buffer.end(), [](char byte) { return byte == '\x7F'; }));
    if (code == 0)
        MustBeXmlOf(address, std::string_view(buffer).substr(0, static_cast<std::size_t>(size)), session);
}

void CALLER::MustBeXmlOf(ADDRESS address, std::string_view text, CLIENT_SESSION const& session) const
{
    auto const ticket = standin::TicketXml::Parse(text, "data.xml");
    auto const content = Content(address);
    if (!content)
        return COMGUI_MUST(!m_clients.isCompared);
    std::size_t found = 0;
    ticket.Walk(
        [&](std::string_view key, int pos, standin::StoredValue const& value)
        {
            COMGUI_MUST(session.limits.Selects(address, std::string(key)));
            COMGUI_MUST(content->at(std::string(key)).at(pos).first == value.type);
            ++found;
        });
    std::size_t expected = 0;
    for (auto const& [key, values] : *content)
        for (auto const& [pos, value] : values)
            expected += session.limits.Selects(address, key) && value.first != PARAM_POINTER ? 1 : 0;
    COMGUI_MUST(found == expected);
}

void CALLER::Translate()
{
    CLIENT_SESSION const& session = NextSession();
    clFOLDER_VARIABLES* folders = nullptr;
    ADDRESS const address = m_input.Among(4) == 3 ? NextAddress(m_input) : ADDRESS{-1, -1};
    int const result = Operate(session, address, MTICKET_OP_FOLDER_VARIABLES, &folders);
    COMGUI_MUST((result == 1) == (folders != nullptr));
    if (!folders)
        return;
    std::string const path = NextServerPath();
    std::string const decoded = folders->Decode(path, false);
    std::string const encoded = folders->Encode(path);
    if (m_clients.isCompared && !folders->IsEnabled())
        COMGUI_MUST(decoded == path && encoded == path);
}
