#include "fuzz/ModuleSite.h"

#include "tests/support/Files.h"
#include <algorithm>

namespace fs = std::filesystem;

namespace
{
std::string SeedText()
{
    // The cheapest hash that yescrypt knows, of "secret".
    std::string const hash = "$y$j75$k0xKNpTyyqUCI91fDe6.t/$AOpC.H0fgbhxHFr1JrsgxvC18fxDi2KoRtFQgKObcJ0";
    return "<site version=\"1\"><users><user name=\"admin\" role=\"16\" ticket=\"1\" hash=\"" + hash +
           "\"/><user name=\"operator\" role=\"1\" ticket=\"2\" hash=\"" + hash +
           "\"/></users><ticket type=\"0\" id=\"0\"><parameter key=\"System/MasterSOAPPort\" "
           "type=\"int\">50000"
           "</parameter></ticket><ticket type=\"17\" id=\"1\"/><ticket type=\"17\" id=\"2\"/></site>";
}

constexpr int Types[] = {0, 3, 7, 17, 99};

bool IsOfTheSeed(int type, int id) { return type == 0 || (type == 17 && (id == 1 || id == 2)); }
}  // namespace

MODULE_SITE& MODULE_SITE::Get()
{
    static MODULE_SITE site;
    return site;
}

MODULE_SITE::MODULE_SITE()
{
    m_folder.Write("site/seed.xml", SeedText());
    fs::create_directory(m_folder / "client");
    MODULE_AT_SITE::UseSite(m_folder / "site");
}

void* MODULE_SITE::LogIn(char const* user) const
{
    RECORD record(user, "secret");
    return module->LoginEntry(module.Instance(), &record) == 0 ? record.hSession : nullptr;
}

std::vector<int> MODULE_SITE::TicketsOf(int type) const
{
    std::vector<int> ids;
    auto const take = [](void* context, int, int id, STICKET_ACCESS const*)
    {
        auto& found = *static_cast<std::vector<int>*>(context);
        COMGUI_MUST(found.empty() || found.back() < id);
        found.push_back(id);
        return true;
    };
    m_observer->MWALKTICKETS(m_observer->Instance, take, &ids, type);
    return ids;
}

std::optional<MODEL_TICKET> MODULE_SITE::Content(int type, int id) const
{
    STICKET_ACCESS const* ticket = nullptr;
    if (!m_observer->MOPERATION(m_observer->Instance, type, id, MTICKET_OP_OPEN, &ticket))
        return std::nullopt;
    MODEL_TICKET content = Walked(*ticket, nullptr);
    bool flag = false;
    COMGUI_MUST(m_observer->MOPERATION(m_observer->Instance, type, id, MTICKET_OP_CLOSE, &flag) == 1);
    return content;
}

std::optional<std::string> MODULE_SITE::Data(int type, int id) const
{
    int size = 0;
    int const code = module->GetTicketDataEntry(module.Instance(), m_session, type, id, 0, &size, nullptr);
    COMGUI_MUST(code == 108 || (code == 110 && size > 0));
    if (code == 108)
        return std::nullopt;
    std::string data(static_cast<std::size_t>(size), '\0');
    COMGUI_MUST(module->GetTicketDataEntry(module.Instance(), m_session, type, id, 0, &size, data.data()) ==
                0);
    return data;
}

std::optional<std::string> MODULE_SITE::FileOf(std::string const& serverPath) const
{
    std::string from = serverPath;
    std::string to = Client("back");
    if (module->GetFileSyncEntry(module.Instance(), m_session, from.data(), to.data()) != 0)
        return std::nullopt;
    return ContentOf(to);
}

std::set<std::string> MODULE_SITE::NamesInSite() const
{
    auto const names = NamesIn(m_folder / "site");
    return {names.begin(), names.end()};
}

void MODULE_SITE::DeleteTickets(int type) const
{
    for (int const id : TicketsOf(type))
        if (!IsOfTheSeed(type, id))
            COMGUI_MUST(m_observer->MOPERATION(m_observer->Instance, type, id, MTICKET_OP_DELETE, nullptr) ==
                        1);
}

void MODULE_SITE::TurnOver() const
{
    for (int i = 0; i < 100; ++i)
        COMGUI_MUST(m_observer->MSETPARAMETER(m_observer->Instance, 17, 1, "Turn", PARAM_INT, &i, -1) == 1);
}

// In one table: with 0 for the use of variables all folders may go, and come in any order.
void MODULE_SITE::WriteValues(int type, int id) const
{
    MODEL_TICKET const content = Content(type, id).value();
    std::vector<SETMULTIPAR> table;
    auto const put = [&table](char const* key, PARAM_TYPE paramType, void const* value) {
        table.push_back({key, paramType, 0, value, -1, false, {}});
    };
    int const use[] = {0, 3};
    int const port = 50000;
    if (type == 0)
        put("System/UseFolderVariables", PARAM_INT, &use[0]);
    for (auto const& [key, values] : content)
        put(key.c_str(), PARAM_NONE, nullptr);
    std::string const site = m_folder / "site";
    if (type == 0)
    {
        put("System/MasterSOAPPort", PARAM_INT, &port);
        put("System/InstallFolder", PARAM_STRING, site.c_str());
        put("System/Folders/Temp", PARAM_STRING, "$(INSTALL)/temp");
        put("System/Folders/Job", PARAM_STRING, "$(INSTALL)/job");
        put("System/UseFolderVariables", PARAM_INT, &use[1]);
    }
    std::size_t const count = table.size();
    put(nullptr, PARAM_NONE, nullptr);
    COMGUI_MUST(m_observer->MSETMULTIPAR(m_observer->Instance, type, id, table.data()) == 1);
    COMGUI_MUST(std::all_of(table.begin(), table.begin() + static_cast<std::ptrdiff_t>(count),
                            [](SETMULTIPAR const& record) { return record.ok; }));
}

void MODULE_SITE::Reset()
{
    // Now and then anew, since the texts that it has read stay as long as the session.
    if (m_resets++ % 1000 == 0)
    {
        if (m_session)
            COMGUI_MUST(module->LogoutEntry(module.Instance(), m_session) == 0);
        m_session = LogIn("admin");
        m_observer = Container(m_session);
        COMGUI_MUST(m_observer);
    }
    for (int const type : Types)
        DeleteTickets(type);
    for (auto const& [type, id] : {std::pair(0, 0), {17, 1}, {17, 2}})
        WriteValues(type, id);
    bool flag = false;
    COMGUI_MUST(m_observer->MCREATETICKET(m_observer->Instance, 3, 1, nullptr));
    COMGUI_MUST(m_observer->MOPERATION(m_observer->Instance, 3, 1, MTICKET_OP_CLOSE, &flag) == 1);
    for (char const* const name : {"client", "site/temp"})
        for (auto const& entry : fs::directory_iterator(m_folder / name))
            fs::remove_all(entry);
    fs::create_directory(m_folder / "client/folder");
    m_folder.Write("client/a", "content");
    m_folder.Write("client/empty", "");
    m_folder.Write("client/ticket.xml", "<ticket version=\"1\" type=\"3\" id=\"1\"><parameter key=\"A\" "
                                        "type=\"int\">1</parameter></ticket>\n");
}
