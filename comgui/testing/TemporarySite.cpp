#include "comgui/testing/TemporarySite.h"

#include "comgui/testing/ShippedSeed.h"
#include "comgui/testing/TemporaryFolder.h"
#include "standin/server/sessions/Password.h"
#include "standin/server/site/RulesOfSite.h"
#include "standin/server/site/Server.h"
#include "standin/server/site/Site.h"
#include <algorithm>
#include <cstdlib>
#include <mutex>
#include <stdexcept>
#include <type_traits>

namespace comgui::test
{
namespace
{
using standin::TicketValue;
using standin::TicketWrite;

// Hashes that take next to no time to verify: a test is not about the price of a login.
constexpr std::string_view CheapHashes[][2] = {
    {"name=\"admin\"", "$y$j75$7rZBcwzpbEouIqNPGZuJm/$WJhdkDuxf1qM0qICvcS.ZjHHTU1Cf63C7XnC8mIneE3"},
    {"name=\"operator\"", "$y$j75$i8lkUJSX9wGJ78fnCsp.R1$kKwaSHQeS6sCCSmsmYtwzps0c/JMdgE0HHfPWiqV/f."},
};

std::string CheapSeed()
{
    std::string seed = ShippedSeed;
    for (auto const& [user, hash] : CheapHashes)
    {
        constexpr std::string_view Attribute = "hash=\"";
        std::size_t const begin = seed.find(Attribute, seed.find(user)) + Attribute.size();
        seed.replace(begin, seed.find('"', begin) - begin, hash);
    }
    return seed;
}

// Folders that go at the end of the process, behind whoever has them open: theirs are made later.
TemporaryFolder const& KeptFolder()
{
    static std::mutex lock;
    static std::vector<std::unique_ptr<TemporaryFolder>> folders;
    std::lock_guard const guard(lock);
    return *folders.emplace_back(std::make_unique<TemporaryFolder>());
}

std::string TextOf(Address ticket) { return std::to_string(ticket.type) + "/" + std::to_string(ticket.id); }

standin::TicketAddress Of(Address ticket) { return {ticket.type, ticket.id}; }

TicketValue Stored(Value const& value)
{
    return std::visit(
        [&](auto const& held) -> TicketValue
        {
            using Held = std::decay_t<decltype(held)>;
            if constexpr (std::is_same_v<Held, std::monostate>)
                return {};
            else if constexpr (std::is_same_v<Held, std::string>)
                return TicketValue::String(held);
            else if constexpr (std::is_same_v<Held, plugin::Bytes>)
                return TicketValue::Text(PARAM_BINSTRING, held.bytes);
            else if constexpr (std::is_arithmetic_v<Held>)
                return TicketValue::Number(TypeOf(value), &held);
            else
                throw std::runtime_error("a server stores no pointers");
        },
        value);
}

Value Read(standin::StoredValue const& stored)
{
    switch (stored.type)
    {
    case PARAM_INT:
        return static_cast<int>(stored.integer);
    case PARAM_INT64:
        return static_cast<long long>(stored.integer);
    case PARAM_UNSIGNED:
        return static_cast<unsigned int>(stored.integer);
    case PARAM_UNSIGNED64:
        return static_cast<unsigned long long>(stored.integer);
    case PARAM_DOUBLE:
        return stored.number;
    case PARAM_STRING:
        return std::string(stored.bytes);
    case PARAM_BINSTRING:
        return plugin::Bytes{std::string(stored.bytes)};
    default:
        return {};
    }
}

TemporaryFolder const& FolderOfNewSite()
{
    TemporaryFolder const& folder = KeptFolder();
    folder.Write("site/seed.xml", CheapSeed());
    return folder;
}
}  // namespace

class TemporarySite::Inside
{
public:
    explicit Inside(std::filesystem::path const& folder)
        : site(standin::SiteName::Of(folder.string()), {}), server(site.store(), site.folder())
    {
        site.PutInOrder(server);
        server.Troubles().Ignore();  // they are for clients
        session = server.Open({"admin", "", standin::AdministratorRole, 1});
    }
    ~Inside()
    {
        server.Logout(*session);
        server.Stop(std::chrono::seconds(10));
        site.Leave();
    }
    Inside(Inside const&) = delete;
    Inside& operator=(Inside const&) = delete;

    standin::Site site;
    standin::Server server;
    std::shared_ptr<standin::Session> session;
};

TemporarySite::TemporarySite()
{
    auto const folder = FolderOfNewSite() / "site";
    setenv("COMGUI_SITE", folder.c_str(), 1);
    setenv("COMGUI_SITE_FOLDER", folder.c_str(), 1);
    m_inside = std::make_unique<Inside>(folder);
}

TemporarySite::~TemporarySite() = default;

std::filesystem::path const& TemporarySite::Folder() const { return m_inside->site.folder(); }

int TemporarySite::AddUser(std::string const& name, std::string const& password, int role)
{
    Address const own = Create(standin::UserTicketType, {{"User/Name", name}, {"User/Role", role}});
    m_inside->site.store().PutUser({name, standin::Password::Hash(password), role, own.id});
    return own.id;
}

Address TemporarySite::Create(int type, std::vector<Parameter> const& parameters)
{
    int const id = m_inside->server.Tickets().CreateNext(*m_inside->session, type);
    if (id < 0)
        throw std::runtime_error("no ticket of type " + std::to_string(type) + " can be made");
    Address const ticket{type, id};
    if (!parameters.empty())
        Write(ticket, parameters);
    return ticket;
}

void TemporarySite::Write(Address ticket, std::vector<Parameter> const& parameters)
{
    std::vector<TicketWrite> writes;
    writes.reserve(parameters.size());
    for (Parameter const& parameter : parameters)
        writes.push_back({parameter.key, parameter.pos, Stored(parameter.value)});
    bool const isWritten = m_inside->server.Tickets().Write(*m_inside->session, Of(ticket), 0, writes);
    auto const refused =
        std::find_if(writes.begin(), writes.end(), [](auto const& write) { return !write.ok; });
    if (refused != writes.end())
        throw std::runtime_error(TextOf(ticket) + ": " + std::string(refused->key) + " cannot be written");
    if (!isWritten)
        throw std::runtime_error(TextOf(ticket) + ": cannot be written");
}

void TemporarySite::Put(Address ticket, std::string const& key, Value const& value, int pos)
{
    Write(ticket, {{key, value, pos}});
}

void TemporarySite::Delete(Address ticket)
{
    if (!m_inside->server.Tickets().Delete(*m_inside->session, Of(ticket)))
        throw std::runtime_error(TextOf(ticket) + ": cannot be deleted");
}

Value TemporarySite::Read(Address ticket, std::string const& key, int pos) const
{
    Value found;
    m_inside->server.Tickets().LookAtKey(*m_inside->session, Of(ticket), 0, key,
                                         [&](standin::KeyValues const& values)
                                         {
                                             auto const* const element = values.At(pos);
                                             if (element)
                                                 found = test::Read(element->ToStored());
                                             return element != nullptr;
                                         });
    return found;
}

bool TemporarySite::Exists(Address ticket) const
{
    return m_inside->server.Tickets().IncarnationOf(Of(ticket)) != 0;
}

void TemporarySite::SetTrouble(std::vector<std::string> const& rules)
{
    std::vector<std::string> canonical;
    try
    {
        for (std::string const& rule : rules)
            canonical.push_back(standin::TroubleRule::Parse(rule).Text());
    }
    catch (standin::TroubleError const& error)
    {
        throw std::invalid_argument(error.what());
    }
    standin::ChangeRules(m_inside->site.store(), [&](auto& now) { now = canonical; });
}
}  // namespace comgui::test
